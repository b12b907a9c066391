// Reads the history page by page.
#include "Versions.h"

#include "ostcore/utility/StringConversion.h"

namespace zo {
namespace {

using ostcore::utility::ToUTF8;

constexpr std::size_t kMaximumPages = 100000;

Version Describe(const ZOCL::InterfaceRef<ZOCL::IZOCHistoryVersion>& inVersion) {
    ZOCL::UString date, user, title, message, shortCommit;
    inVersion->GetInfo(date, user, title, message, shortCommit);
    Version version;
    version.commit = inVersion->GetRevision().str();
    version.shortCommit = ToUTF8(shortCommit);
    version.time = inVersion->GetTime();
    version.committer = inVersion->GetUserID().str();
    version.committerName = ToUTF8(user);
    version.title = ToUTF8(title);
    version.message = ToUTF8(message);
    ZOCL::CommitMetadata metadata;
    if (ZOCL::GetCommitMetadataFromHistoryVersion(inVersion, metadata)) {
        version.metadata = metadata.metadata;
    }
    return version;
}

}  // namespace

std::string Version::Origin() const {
    const std::string application = metadata.applicationName.str();
    const std::string machine = metadata.machineName.str();
    return application + (application.empty() || machine.empty() ? "" : " on ") + machine;
}

std::vector<Version> LoadVersions(Context& ioContext, const LoadedProduction& inProduction,
                                  std::uint64_t inCount, const std::string& inUntilCommit) {
    std::vector<Version> versions;
    auto page = inProduction.production->GetProductionHistory();
    for (std::size_t pages = 0; pages == 0 || (page && pages < kMaximumPages); ++pages) {
        LoadResource(ioContext, page, "loading the history of " + inProduction.name);
        for (int index = 0; index < page->GetHistoryVersionCount(); ++index) {
            Version version = Describe(page->GetHistoryVersion(index));
            if (versions.size() >= inCount || version.commit == inUntilCommit) {
                return versions;
            }
            versions.push_back(std::move(version));
        }
        page = versions.size() < inCount ? page->GetNextPage() : nullptr;
    }
    return versions;
}

Json VersionJson(const char* inType, const Version& inVersion) {
    Json json(inType);
    json.Set("commit", inVersion.commit).Set("time", inVersion.time).Set("committer", inVersion.committer);
    json.Set("committerName", inVersion.committerName)
        .Set("title", inVersion.title)
        .Set("message", inVersion.message);
    const auto& metadata = inVersion.metadata;
    json.Set("application", metadata.applicationName)
        .Set("applicationBuild", metadata.applicationBuildNumber)
        .Set("machine", metadata.machineName)
        .Set("machineIP", metadata.machineIP);
    return json.Set("transactionType", metadata.transactionType);
}

}  // namespace zo
