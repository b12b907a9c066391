// Answers conflicts of a session, one after the other.
#pragma once

#include <vector>

#include "Collaboration/ProductionItemData.h"
#include "Collaboration/WorkflowOperation.h"
#include "ZOClient/Publish.h"

namespace ZOCL {

/// Each answer names the session's commit that the one before came back with, so they run strictly in
/// sequence. The first that fails ends the loop; what was answered before stays so. A cancel lets the answer
/// under way finish and starts no further one; the result is kResultCancelled then.
/// kResultHTTPPreconditionFailed: the session was changed elsewhere; GetRecentCommitMetadata has by whom,
/// when that is known.
///
/// Posts UpdateOperationDescriptionMessage before each item and UpdateOperationProgressMessage behind it.
class ZOResolveOperation final : public WorkflowOperation {
public:
    /// inCommitId is the session's commit that the conflicts were read at; without one the first answer goes
    /// out unguarded. That a copy of mine is kept is the host's business: it looks like taking theirs.
    ZOResolveOperation(const ImmutableString& inSessionURL, const std::vector<ConflictItemData>& inItems,
                       Publish::ResolveType inResolveType, const ImmutableString& inCommitId);

    UString GetDescription() override { return u"ZOResolveOperation"; }
    void Abort() override;
    void Run() override;

    Publish::ResolveType GetResolveType() const noexcept { return mResolveType; }
    /// How many of the items, from the first on, were answered.
    std::size_t GetResolvedCount() const;
    /// The URL of the asset of each answered item, in order.
    std::vector<ImmutableString> GetResolvedAssetURLs() const;
    /// Whether something that is no property of the production took the shared version.
    bool AssetsReplaced() const;
    bool ProductionPropertiesReplaced() const;
    // What the differences say after the last answer; true while that is not known.
    bool ConflictsRemain() const;
    bool HasChanges() const;
    /// The session's commit after the last answer; names it in the next resolve.
    ImmutableString GetCommitId() const;

private:
    struct State {
        std::vector<ImmutableString> resolvedAssetURLs;
        bool assetsReplaced = false;
        bool productionPropertiesReplaced = false;
        bool conflictsRemain = true;
        bool hasChanges = true;
        ImmutableString commitId;
    };

    ~ZOResolveOperation() override = default;
    State GetState() const;
    int ProcessNextItem();
    int ResolveItem(const ConflictItemData& inItem);
    void OnItemResolved(const ConflictItemData& inItem, const shared_ptr<ostnet::Response>& inResponse);
    void FinishResolve(int inResult);
    void OnDifferencesLoaded(const InterfaceRef<IZOCDifferences>& inDifferences);

    const ImmutableString mSessionURL;
    const std::vector<ConflictItemData> mItems;
    const Publish::ResolveType mResolveType;
    // Of Run and what follows it.
    std::size_t mIndex = 0;
    InterfaceRef<IZOCDataServer> mServer;
    InterfaceRef<IZOCEditingSession> mSession;
    State mState ZO_GUARDED_BY(mMutex);
};

}  // namespace ZOCL
