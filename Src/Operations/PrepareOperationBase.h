// The base of operations that gather what a window needs, with several requests in flight.
#pragma once

#include <vector>

#include "ostcore/threads/Executor.h"
#include "ostcore/threads/RecursiveMutex.h"
#include "ZOClient/IZOCDataServer.h"
#include "ZOClient/ZOOperationBase.h"

namespace ZOCL {

/// Run does the work, once, on an executor of its own and never on the main thread; its later steps run where
/// requests complete. A derived class that has started N requests side by side finishes when
/// RemovePendingRequest returns N.
class ZOPrepareOperationBase : public ZOOperationBase, public RFL::IThreadedQueueRequest {
public:
    std::uint32_t AddRef() noexcept override { return ZOOperationBase::AddRef(); }
    std::uint32_t Release() noexcept override { return ZOOperationBase::Release(); }
    int QueryInterface(const RFL::InterfaceID& inID, void** outInterface) noexcept override {
        return ZOOperationBase::QueryInterface(inID, outInterface);
    }
    int QueryInterfaceNoAddRef(const RFL::InterfaceID& inID, void** outInterface) noexcept override;

    bool Start() override;
    /// Asks the requests in flight to stop as well.
    void Abort() override;

protected:
    ZOPrepareOperationBase();
    ~ZOPrepareOperationBase() override;

    void AddPendingRequest(const Guid& inRequestID);
    /// To be told of each start that succeeded: a cancel that came while it was under way found nothing.
    void OnRequestStarted(const Guid& inRequestID);
    /// Counts a request that has come back, a known one or not; returns how many have.
    unsigned RemovePendingRequest(const Guid& inRequestID);
    /// Ends with the result that is stored.
    void Finish();

private:
    void TryToCancel(const Guid& inRequestID);

    shared_ptr<ostcore::threads::AsyncExecutor> mExecutor;
    ostcore::threads::RecursiveMutex mRequestLock;
    /// The one that the requests go to, which may be given up while they are out.
    InterfaceRef<IZOCDataServer> mServer ZO_GUARDED_BY(mRequestLock);
    std::vector<Guid> mPendingRequests ZO_GUARDED_BY(mRequestLock);
    unsigned mCompletedRequests ZO_GUARDED_BY(mRequestLock) = 0;
};

}  // namespace ZOCL
