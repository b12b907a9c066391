// Commits as the history tells of them.
#pragma once

#include <string>
#include <vector>

#include "Sessions.h"
#include "ZOClient/CommitMetadata.h"

namespace zo {

struct Version {
    std::string commit;
    std::string shortCommit;
    ZOCL::ptime time;
    std::string committer;
    std::string committerName;
    std::string title;
    /// Out of a title that tells of its origin, else the title.
    std::string message;
    /// All empty for a title that does not.
    ZOCL::ClientMetadata metadata;

    /// "zo on workstation7"; empty when it is not known.
    std::string Origin() const;
};

/// Newest first: at most so many, and none from a known commit on.
std::vector<Version> LoadVersions(Context& ioContext, const LoadedProduction& inProduction,
                                  std::uint64_t inCount, const std::string& inUntilCommit);

Json VersionJson(const char* inType, const Version& inVersion);

}  // namespace zo
