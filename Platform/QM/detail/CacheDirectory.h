// The files of a cache: one level of 256 directories below a directory that was looked at before it is used.
#pragma once

#include <atomic>
#include <string>
#include <vector>

#include "ostcore/utility/ImmutableString.h"
#include "ostcore/utility/RecycledMemory.h"
#include "QM/detail/CacheEntry.h"
#include "QM/detail/FileOperations.h"

namespace QM {
namespace detail {

using ostcore::shared_ptr;
using ostcore::utility::RecycledMemory;

/// Reads, writes and lists the files; knows nothing of bounds.
///
/// Nothing is reached by a path: every directory is opened from the one above it, and no link is followed. A
/// file is written under a name of its own and renamed when it is whole, so a process that is killed leaves
/// at most a file that nobody reads, which a later look at the directory sweeps. Files are not synced: what a
/// power failure damages is found by its checksum. Threads: any.
class ZOPLATFORM_EXPORT CacheDirectory {
public:
    enum class Outcome {
        kRead,
        kMissing,
        /// The file is not what was written; it has been dropped.
        kDamaged,
        /// The system refused.
        kFailed
    };
    struct Found {
        EntryKey key;
        std::uint64_t size = 0;
        std::int64_t lastUse = 0;
    };

    static constexpr std::uint64_t kMaximumPayloadSize = 512ull << 20;
    static constexpr std::int64_t kStampSeconds = 60;

    /// Null with the reason when the directory cannot be used.
    static shared_ptr<CacheDirectory> Open(const std::string& inPath, bool inCreate,
                                           const shared_ptr<FileOperations>& inOperations,
                                           std::string& outError);
    CacheDirectory(shared_ptr<FileOperations> inOperations, int inRoot);
    ~CacheDirectory();
    CacheDirectory(const CacheDirectory&) = delete;
    CacheDirectory& operator=(const CacheDirectory&) = delete;

    /// The time of the file's last change, by which processes tell what was used last, follows the reads from
    /// afar: it is set when it is more than kStampSeconds old. Who knows that it is not gives the size of the
    /// file alone, and spares the system the question. With size 0 both are told.
    Outcome Read(const EntryKey& inKey, FileState& ioState, shared_ptr<RecycledMemory>& outPayload) const;
    bool Write(const EntryKey& inKey, std::string_view inPayload) const;
    bool Exists(const EntryKey& inKey) const;
    /// The stored names of a key, whose name does not count.
    std::vector<std::string> ListNames(const EntryKey& inKey) const;
    /// True when it is gone.
    bool Remove(const EntryKey& inKey) const;
    /// All files, oldest use first. On the way, what others have left half-written an hour ago or earlier is
    /// removed. False when it was asked to stop, or the system refused: then some are missing.
    bool ListAll(const std::atomic<bool>& inStop, std::vector<Found>& outFound) const;

    static std::uint64_t FileSizeOf(std::uint64_t inPayloadSize) noexcept {
        return inPayloadSize + kHeaderSize;
    }

private:
    OpenFile OpenShard(const std::string& inName, int inFlags) const;
    OpenFile MakeShard(const std::string& inName) const;
    Outcome ReadStepByStep(const EntryKey& inKey, FileState& outState,
                           shared_ptr<RecycledMemory>& outPayload) const;
    Outcome ReadContent(int inFile, const EntryKey& inKey, std::uint64_t inSize,
                        shared_ptr<RecycledMemory>& outPayload) const;
    Outcome ReadOpened(int inFile, const EntryKey& inKey, FileState& outState,
                       shared_ptr<RecycledMemory>& outPayload) const;
    bool WriteWhole(int inFile, const EntryKey& inKey, std::string_view inPayload) const;
    bool ReadWhole(int inFile, Header& outHeader, RecycledMemory& outPayload) const;
    bool ListShard(const std::string& inName, std::vector<Found>& outFound) const;

    const shared_ptr<FileOperations> mOperations;
    const int mRoot;
};

}  // namespace detail
}  // namespace QM
