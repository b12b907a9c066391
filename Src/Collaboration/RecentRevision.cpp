// Finds the newest commit that tells of its origin.
#include "ZOClient/CommitMetadata.h"
#include "ZOClient/IZOCProduction.h"
#include "ZOClient/IZOCProductionHistory.h"
#include "ZOClient/ResultCodes.h"

namespace ZOCL {

bool FindRecentRevisionWithCommitMetadata(const InterfaceRef<IZOCProduction>& inProduction,
                                          const ImmutableString& inCommitId,
                                          const HistoryWalkCompletion& inCompletion) {
    if (!inProduction) {
        return false;
    }
    const HistoryVisitor visit = [inCommitId](const InterfaceRef<IZOCHistoryVersion>& inVersion,
                                              int& outResult) {
        if (!inVersion) {
            outResult = kResultFailure;
            return true;
        }
        if (inVersion->GetRevision() == inCommitId) {
            outResult = kResultAlreadyThere;
            return true;
        }
        CommitMetadata metadata;
        return GetCommitMetadataFromHistoryVersion(inVersion, metadata);
    };
    return inProduction->LoadHistoryWith(visit, inCompletion);
}

}  // namespace ZOCL
