// What an ingest has to do: which files of a folder the production has already, and what it has not got.
#pragma once

#include <map>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "Assets.h"
#include "MediaFolder.h"

namespace zo {

/// How the files of one folder are named in one production. The same file gets the same document each time,
/// for the same user, production and label.
class IngestNames {
public:
    IngestNames(const std::string& inProductionID, const std::string& inUser, std::string inLabel);

    ZOCL::Guid DocumentOf(const std::string& inPath) const;
    static ZOCL::Guid ContentStateOf(const std::string& inFingerprint);
    std::string HRefOf(const std::string& inPath) const;

private:
    std::string mLabel;
    std::string mSeed;
};

/// The bins of folders, by the folder's path; the root is the bin that all goes into, or the top.
using BinIDs = std::map<std::string, ZOCL::ImmutableString>;

enum class FileTask { Add, AddSidecar, ReplaceSidecar, Nothing };

struct PlannedFile {
    FolderFile file;
    FileTask task = FileTask::Add;
    /// Of the asset that is there; empty when there is none.
    std::string assetID = {};
    ZOCL::ImmutableString locator = {};
};

struct IngestPlan {
    /// In the order of their paths.
    std::vector<PlannedFile> files;
    /// Of the folders that have a bin already.
    BinIDs bins;
    /// Folders that have none, parents before children.
    std::vector<std::string> newFolders;
};

/// What is to be done with sidecars that differ from the packet that is there.
enum class Sidecars { AddMissing, ReplaceChanged };

/// Nothing comes of an empty sidecar. Compares a folder with the assets of a production. An asset is taken
/// for a file when its locator has the file's document, else when it is a clip of the file's name in the bin
/// of the file's folder. Loads the enclosures of assets whose file has a sidecar, and with ReplaceChanged
/// their packets.
IngestPlan PlanIngest(Context& ioContext, const LoadedProduction& inView, const MediaFolder& inFolder,
                      const FolderReader& inReader, const IngestNames& inNames,
                      const ZOCL::ImmutableString& inParent, Sidecars inSidecars);

}  // namespace zo
