// Turns a folder of media with XMP sidecars into a production, or brings a production up to date with one.
#pragma once

#include <functional>
#include <string>
#include <vector>

#include "Commands/MediaFolder.h"
#include "Model/Repository.h"

namespace zohub {

struct ImportRequest {
    std::string directory;
    std::string production;  ///< name
    std::string owner;
    std::vector<std::string> grants;
    std::string mount;  ///< label of the mount point in the locators; empty: made from the directory's name
    bool isTemplate = false;
    std::uint64_t maxRendition = 64ull << 20;
};

struct ImportReport {
    std::string productionId;
    std::string commitId;
    bool isNewProduction = false;
    std::size_t added = 0;
    std::size_t changed = 0;
    std::size_t unchanged = 0;
    std::vector<std::string> notes;
};

/// inProgress gets the number of files done and of all. Throws std::runtime_error or Failure; then nothing
/// has become visible. Payloads go in by batches, everything that makes them visible in one last transaction.
ImportReport Import(Storage& inStorage, ImportRequest const& inRequest, Micros inNow,
                    std::function<void(std::size_t, std::size_t)> const& inProgress);

/// The line of that name, kind and owner, or nothing. Throws std::runtime_error when there are several.
std::optional<LineRecord> FindLineByName(Transaction& inTransaction, std::string const& inKind,
                                         std::string const& inName, std::string const& inOwner);

}  // namespace zohub
