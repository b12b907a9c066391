// Operations with several requests in flight.
#include "Operations/PrepareOperationBase.h"

#include <algorithm>
#include <utility>

namespace ZOCL {

using ostcore::threads::ScopedLock;

ZOPrepareOperationBase::ZOPrepareOperationBase() = default;
ZOPrepareOperationBase::~ZOPrepareOperationBase() = default;

int ZOPrepareOperationBase::QueryInterfaceNoAddRef(const RFL::InterfaceID& inID,
                                                   void** outInterface) noexcept {
    if (inID == RFL::IThreadedQueueRequest::kInterfaceID) {
        *outInterface = static_cast<RFL::IThreadedQueueRequest*>(this);
        return kResultSuccess;
    }
    return ZOOperationBase::QueryInterfaceNoAddRef(inID, outInterface);
}

bool ZOPrepareOperationBase::Start() {
    mExecutor = ostcore::threads::CreateIOBoundExecutor("prepare operation");
    const InterfaceRef<ZOPrepareOperationBase> self(this);
    return mExecutor && mExecutor->Post([self] { self->Run(); });
}

void ZOPrepareOperationBase::Abort() {
    ZOOperationBase::Abort();
    std::vector<Guid> pending;
    {
        ScopedLock lock(mRequestLock, "ZOPrepareOperationBase::Abort");
        pending = mPendingRequests;
    }
    for (const Guid& request : pending) {
        TryToCancel(request);
    }
}

void ZOPrepareOperationBase::TryToCancel(const Guid& inRequestID) {
    InterfaceRef<IZOCDataServer> server;
    {
        ScopedLock lock(mRequestLock, "ZOPrepareOperationBase::TryToCancel");
        server = mServer;
    }
    if (server) {
        server->TryToCancelRequest(inRequestID);
    }
}

void ZOPrepareOperationBase::OnRequestStarted(const Guid& inRequestID) {
    if (IsCanceled()) {
        TryToCancel(inRequestID);
    }
}

void ZOPrepareOperationBase::AddPendingRequest(const Guid& inRequestID) {
    InterfaceRef<IZOCDataServer> server = IZOCDataServer::GetLoggedInServerRef();
    ScopedLock lock(mRequestLock, "ZOPrepareOperationBase::AddPendingRequest");
    if (!mServer) {
        std::swap(mServer, server);
    }
    mPendingRequests.push_back(inRequestID);
}

unsigned ZOPrepareOperationBase::RemovePendingRequest(const Guid& inRequestID) {
    ScopedLock lock(mRequestLock, "ZOPrepareOperationBase::RemovePendingRequest");
    const auto found = std::find(mPendingRequests.begin(), mPendingRequests.end(), inRequestID);
    if (found != mPendingRequests.end()) {
        mPendingRequests.erase(found);
    }
    return ++mCompletedRequests;
}

void ZOPrepareOperationBase::Finish() {
    FinishOperation(GetStoredResult());
}

}  // namespace ZOCL
