// Writes files of a folder into a transaction: in bulk where it can be, else by single requests.
#pragma once

#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "BulkSend.h"
#include "IngestPlan.h"
#include "NewClip.h"

namespace zo {

/// What became of one file.
struct FileOutcome {
    const PlannedFile* planned = nullptr;
    bool isWritten = false;
    std::string assetID;
    std::string locator;
    std::string href;
    bool hasSidecar = false;
    std::string renditionType;
    /// Why it, or a part of it, was not written; empty when all of it was.
    std::string reason;
    /// Whether that is a failure; else it is as it should be.
    bool hasFailed = false;
};

struct NewBin {
    std::string folder;
    std::string assetID;
};

struct IngestOutcome {
    std::vector<FileOutcome> files;
    std::vector<NewBin> newBins;
    /// Of files, and of sidecars whose file was written without it.
    std::vector<Failure> failures;
    std::size_t written = 0;
};

enum class Way { Bulk, Single };

/// How many files of how many are on their way; shown as progress.
struct IngestCount {
    std::size_t done = 0;
    std::size_t total = 0;
    std::uint64_t bytes = 0;
};

/// Reads what is to be written of a file's sidecar. Null when the sidecar is empty. Throws a Failure when it
/// cannot be read, is too large or is no XMP packet.
Payload ReadSidecar(const FolderReader& inReader, const FolderFile& inFile);

/// Holds the payloads of a bounded number of bytes at a time. Used once for a transaction.
class IngestWriter {
public:
    IngestWriter(Context& ioContext, const OpenTransaction& inTransaction, const FolderReader& inReader,
                 const IngestNames& inNames, Way inWay, IngestCount& ioCount)
        : mContext(ioContext),
          mTransaction(inTransaction),
          mReader(inReader),
          mNames(inNames),
          mWay(inWay),
          mCount(ioCount) {}

    /// Makes the bins that are missing and writes the files. What is wrong with single files is in the
    /// outcome; throws a Failure for what ends the whole transaction.
    IngestOutcome Write(const std::vector<const PlannedFile*>& inFiles, BinIDs& ioBins);

private:
    /// A file that has been read.
    struct Prepared {
        std::size_t index = 0;
        NewClip clip;
    };

    void MakeBins(const std::vector<const PlannedFile*>& inFiles, BinIDs& ioBins);
    void MakeBinsOfLevel(const std::vector<std::string>& inFolders, BinIDs& ioBins);
    bool Prepare(Prepared& ioFile, const BinIDs& inBins);
    void ReadMedia(Prepared& ioFile);
    void Send(std::vector<Prepared>& ioFiles);
    void StoreLocators(std::vector<Prepared>& ioFiles);
    void StoreLocator(const Prepared& inFile, const std::function<void()>& inEnded);
    bool SendAll(const std::vector<Prepared>& inFiles);
    void SendOneByOne(const std::vector<Prepared>& inFiles);
    void SendClip(const Prepared& inFile, const std::function<void()>& inEnded);
    void WriteSidecar(const Prepared& inFile);
    void ForEach(const std::vector<Prepared>& inFiles, std::size_t inAtOnce,
                 const std::function<void(const Prepared&, const std::function<void()>&)>& inStep);
    void OnWritten(const Prepared& inFile, const std::string& inAssetID);
    void OnFailed(std::size_t inIndex, const Failure& inFailure);
    void Count(const Prepared& inFile);
    bool IsNew(const Prepared& inFile) const {
        return mOutcome.files[inFile.index].planned->task == FileTask::Add;
    }

    Context& mContext;
    const OpenTransaction mTransaction;
    const FolderReader& mReader;
    const IngestNames& mNames;
    Way mWay;
    IngestCount& mCount;
    IngestOutcome mOutcome;
    /// The first failure that no other file would escape.
    std::unique_ptr<Failure> mFatal;
};

}  // namespace zo
