// The loads, one after the other: the session's assets, its outgoing changes, and side by side what neither
// of them holds.
#include "Collaboration/PrepareChangesOperation.h"

#include "Collaboration/FreshLoad.h"

namespace ZOCL {

using ostcore::threads::MutexLock;

namespace {

/// Requests that have come back before any asset is fetched.
constexpr unsigned kListLoads = 2;

}  // namespace

PrepareChangesOperation::PrepareChangesOperation(const ImmutableString& inProductionURL,
                                                 const InterfaceRef<IZOCEditingSession>& inSession)
    : mProductionURL(inProductionURL), mSession(inSession) {}
PrepareChangesOperation::~PrepareChangesOperation() = default;

InterfaceRef<IZOCDifferences> PrepareChangesOperation::GetOutgoingChanges() const {
    MutexLock lock(mMutex);
    return mOutgoingChanges;
}

InterfaceRef<IZOCEditingSession> PrepareChangesOperation::GetSession() const {
    MutexLock lock(mMutex);
    return mSession;
}

void PrepareChangesOperation::Run() {
    const InterfaceRef<IZOCDataServer> server = IZOCDataServer::GetLoggedInServerRef();
    if (IsCanceled() || !server || mProductionURL.empty()) {
        return Finish();
    }
    const InterfaceRef<IZOCProduction> production = server->GetProductionFromURL(mProductionURL);
    const auto session = RFL::QueryInterface<IZOCEditingSession>(production);
    {
        MutexLock lock(mMutex);
        if (!mSession) {
            mSession = session;
        }
    }
    const InterfaceRef<IZOCAssetList> list = production ? production->GetAssets() : nullptr;
    const InterfaceRef<PrepareChangesOperation> self(this);
    StartLoad(RFL::QueryInterface<IZOCServerResource>(list),
              [self, list](int inResult) { self->OnAssetsLoaded(inResult, list); });
}

void PrepareChangesOperation::StartLoad(const InterfaceRef<IZOCServerResource>& inResource,
                                        const AfterLoad& inNext) {
    const Guid requestID = Guid::CreateUnique();
    AddPendingRequest(requestID);
    const InterfaceRef<PrepareChangesOperation> self(this);
    const RequestCompletion onLoaded = [self, inNext](const Guid& inID, int inResult,
                                                      const InterfaceRef<IZOCServerResource>&,
                                                      const shared_ptr<ostnet::Response>&) {
        self->RemovePendingRequest(inID);
        inNext(inResult);
    };
    if (IsCanceled() || !LoadFresh(inResource, requestID, onLoaded)) {
        return Finish();
    }
    OnRequestStarted(requestID);
}

void PrepareChangesOperation::OnAssetsLoaded(int inResult, const InterfaceRef<IZOCAssetList>& inList) {
    const InterfaceRef<IZOCEditingSession> session = GetSession();
    if (IsCanceled() || inResult < 0 || !session) {
        return Finish();
    }
    OnAssetList(inList->GetAllItems());
    const InterfaceRef<IZOCDifferences> changes = session->GetOutgoingChanges();
    const InterfaceRef<PrepareChangesOperation> self(this);
    StartLoad(RFL::QueryInterface<IZOCServerResource>(changes),
              [self, changes](int inLoadResult) { self->OnOutgoingChangesLoaded(inLoadResult, changes); });
}

void PrepareChangesOperation::OnOutgoingChangesLoaded(int inResult,
                                                      const InterfaceRef<IZOCDifferences>& inChanges) {
    if (IsCanceled() || inResult < 0) {
        return Finish();
    }
    {
        MutexLock lock(mMutex);
        mOutgoingChanges = inChanges;
    }
    const std::vector<AssetToFetch> requests = OnChanges(inChanges);
    mExpectedAssets = static_cast<unsigned>(requests.size());
    SetStoredResult(kResultSuccess);
    if (requests.empty()) {
        return Finish();
    }
    for (const AssetToFetch& request : requests) {
        FetchAsset(request);
    }
}

void PrepareChangesOperation::FetchAsset(const AssetToFetch& inRequest) {
    const InterfaceRef<IZOCDataServer> server = IZOCDataServer::GetLoggedInServerRef();
    const InterfaceRef<IZOCAsset> asset =
        server ? server->GetAssetFromURL(inRequest.url, ResourceWritability::kReadOnly) : nullptr;
    const Guid requestID = Guid::CreateUnique();
    AddPendingRequest(requestID);
    const InterfaceRef<PrepareChangesOperation> self(this);
    const RequestCompletion onLoaded = [self, inRequest, asset](const Guid& inID, int inResult,
                                                                const InterfaceRef<IZOCServerResource>&,
                                                                const shared_ptr<ostnet::Response>&) {
        if (inResult >= 0 && !self->IsCanceled()) {
            self->OnAsset(inRequest, asset);
        }
        self->OnRemovedAssetLoaded(inID);
    };
    if (IsCanceled() || !LoadFresh(RFL::QueryInterface<IZOCServerResource>(asset), requestID, onLoaded)) {
        return OnRemovedAssetLoaded(requestID);
    }
    OnRequestStarted(requestID);
}

void PrepareChangesOperation::OnRemovedAssetLoaded(const Guid& inRequestID) {
    if (RemovePendingRequest(inRequestID) == kListLoads + mExpectedAssets) {
        Finish();
    }
}

}  // namespace ZOCL
