// For operations that tell their user whose commit got in the way.
#pragma once

#include "ZOClient/IZOCDataServer.h"
#include "ZOClient/IZOCProductionHistory.h"

namespace ZOCL {

/// Keeps the metadata of the newest foreign commit. Threads: any.
class RecentCommitMetadataBase {
public:
    /// Empty when none was found.
    CommitMetadata GetRecentCommitMetadata() const;
    bool HasRecentCommitMetadata() const;

protected:
    ~RecentCommitMetadataBase() = default;
    /// The completion of FindRecentRevisionWithCommitMetadata.
    void ProcessRecentRevisionResult(int inResult, const InterfaceRef<IZOCHistoryVersion>& inVersion);

private:
    CommitMetadata mRecentCommitMetadata ZO_GUARDED_BY(IZOCDataServer::GetLock());
    bool mIsFound ZO_GUARDED_BY(IZOCDataServer::GetLock()) = false;
};

}  // namespace ZOCL
