// Whose commit got in the way.
#include "Collaboration/RecentCommitMetadataBase.h"

namespace ZOCL {

using ostcore::threads::ScopedLock;

CommitMetadata RecentCommitMetadataBase::GetRecentCommitMetadata() const {
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::RecentCommitMetadataBase::GetRecentCommitMetadata");
    return mRecentCommitMetadata;
}

bool RecentCommitMetadataBase::HasRecentCommitMetadata() const {
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::RecentCommitMetadataBase::HasRecentCommitMetadata");
    return mIsFound;
}

void RecentCommitMetadataBase::ProcessRecentRevisionResult(
    int inResult, const InterfaceRef<IZOCHistoryVersion>& inVersion) {
    CommitMetadata metadata;
    if (inResult < 0 || !GetCommitMetadataFromHistoryVersion(inVersion, metadata)) {
        return;
    }
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::RecentCommitMetadataBase::ProcessRecentRevisionResult");
    std::swap(mRecentCommitMetadata, metadata);
    mIsFound = true;
}

}  // namespace ZOCL
