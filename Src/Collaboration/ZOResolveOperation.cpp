// The loop over the conflicts, on the operation's executor; each answer is waited for before the next leaves.
#include "Collaboration/ZOResolveOperation.h"

#include "Collaboration/FreshLoad.h"
#include "ostcore/config/ZString.h"
#include "ostcore/serialization/JSON.h"
#include "ostnet/HeaderConstants.h"

namespace ZOCL {

using ostcore::threads::MutexLock;

namespace {

const char kResolving[] = "$$$/ZOCL/ZOResolveProgressCaption=Resolving \"@0\"...";
const char kCancelling[] = "$$$/ZOCL/ZOResolveProgressCaptionCancel=Cancelling...";
constexpr const char* kKey_CommitID = ":commitId";

shared_ptr<RecycledMemory const> MakeBody(const ImmutableString& inCommitId) {
    auto body = ostcore::serialization::JSONValue::EmptyObject();
    ostcore::serialization::AddToObject(body, kKey_CommitID, inCommitId);
    return RecycledMemory::CreateFromBytes(ostcore::serialization::GetJSONUTF8String(body));
}

}  // namespace

ZOResolveOperation::ZOResolveOperation(const ImmutableString& inSessionURL,
                                       const std::vector<ConflictItemData>& inItems,
                                       Publish::ResolveType inResolveType, const ImmutableString& inCommitId)
    : WorkflowOperation("resolve operation"),
      mSessionURL(inSessionURL),
      mItems(inItems),
      mResolveType(inResolveType) {
    mState.commitId = inCommitId;
}

ZOResolveOperation::State ZOResolveOperation::GetState() const {
    MutexLock lock(mMutex);
    return mState;
}

std::size_t ZOResolveOperation::GetResolvedCount() const {
    return GetState().resolvedAssetURLs.size();
}
std::vector<ImmutableString> ZOResolveOperation::GetResolvedAssetURLs() const {
    return GetState().resolvedAssetURLs;
}
bool ZOResolveOperation::AssetsReplaced() const {
    return GetState().assetsReplaced;
}
bool ZOResolveOperation::ProductionPropertiesReplaced() const {
    return GetState().productionPropertiesReplaced;
}
bool ZOResolveOperation::ConflictsRemain() const {
    return GetState().conflictsRemain;
}
bool ZOResolveOperation::HasChanges() const {
    return GetState().hasChanges;
}
ImmutableString ZOResolveOperation::GetCommitId() const {
    return GetState().commitId;
}

void ZOResolveOperation::Abort() {
    WorkflowOperation::Abort();
    PostDescription(ostcore::ZString(kCancelling).AsString());
}

void ZOResolveOperation::Run() {
    mServer = IZOCDataServer::GetLoggedInServerRef();
    if (mServer && !mSessionURL.empty()) {
        mSession = RFL::QueryInterface<IZOCEditingSession>(mServer->GetProductionFromURL(mSessionURL));
    }
    if (!mSession) {
        return Finish(kResultFailure);
    }
    int result = kResultSuccess;
    while (result >= 0 && mIndex < mItems.size()) {
        result = ProcessNextItem();
    }
    if (result == kResultHTTPPreconditionFailed) {
        return FinishAfterForeignCommit(RFL::QueryInterface<IZOCProduction>(mSession), GetCommitId());
    }
    FinishResolve(result);
}

int ZOResolveOperation::ProcessNextItem() {
    const ConflictItemData& item = mItems[mIndex++];
    // A cancel has said what it does.
    if (!IsCanceled()) {
        PostDescription(ostcore::ZString(kResolving, {U8String(item.displayName.view())}).AsString());
    }
    return ResolveItem(item);
}

int ZOResolveOperation::ResolveItem(const ConflictItemData& inItem) {
    const ImmutableString& link =
        mResolveType == Publish::kResolveType_AcceptYours ? inItem.acceptYoursURL : inItem.acceptTheirsURL;
    if (link.empty()) {
        return kResultFailure;
    }
    if (IsCanceled()) {
        return kResultCancelled;
    }
    ostnet::Headers headers;
    headers.emplace(ostnet::kHEADER_CONTENT_TYPE, ostnet::kHEADER_CONTENT_TYPE_APPLICATION_JSON_UTF_8);
    const auto response =
        mServer->BlockingPOST(link, headers, MakeBody(GetCommitId()), ostnet::http::kWaitForever);
    if (!response || !response->IsSuccess()) {
        return GetResultFromResponse(response, kResultNoResponseObject);
    }
    OnItemResolved(inItem, response);
    return kResultSuccess;
}

void ZOResolveOperation::OnItemResolved(const ConflictItemData& inItem,
                                        const shared_ptr<ostnet::Response>& inResponse) {
    const ImmutableString commit = GetCommitIdFromResponse(inResponse);
    std::size_t count = 0;
    {
        MutexLock lock(mMutex);
        mState.resolvedAssetURLs.push_back(inItem.assetURL);
        count = mState.resolvedAssetURLs.size();
        if (mResolveType != Publish::kResolveType_AcceptYours) {
            (inItem.type == kConflictType_ProductionProperties ? mState.productionPropertiesReplaced
                                                               : mState.assetsReplaced) = true;
        }
        // Without a new one the former stays, so that the next answer is refused rather than unguarded.
        if (!commit.empty()) {
            mState.commitId = commit;
        }
    }
    PostProgress(count, mItems.size());
}

void ZOResolveOperation::FinishResolve(int inResult) {
    const InterfaceRef<IZOCDifferences> differences = mSession->GetOutgoingChanges();
    const InterfaceRef<ZOResolveOperation> self(this);
    const RequestCompletion onLoaded = [self, differences, inResult](const Guid&, int inLoadResult,
                                                                     const InterfaceRef<IZOCServerResource>&,
                                                                     const shared_ptr<ostnet::Response>&) {
        if (inLoadResult >= 0) {
            self->OnDifferencesLoaded(differences);
        }
        self->Finish(inResult);
    };
    if (!LoadFresh(RFL::QueryInterface<IZOCServerResource>(differences), Guid::CreateUnique(), onLoaded)) {
        Finish(inResult);
    }
}

void ZOResolveOperation::OnDifferencesLoaded(const InterfaceRef<IZOCDifferences>& inDifferences) {
    const bool conflictsRemain = inDifferences->HasConflicts();
    const bool hasChanges = inDifferences->HasDifferences();
    MutexLock lock(mMutex);
    mState.conflictsRemain = conflictsRemain;
    mState.hasChanges = hasChanges;
}

}  // namespace ZOCL
