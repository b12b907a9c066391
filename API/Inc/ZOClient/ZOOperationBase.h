// The base of most long operations, and the one that loads a resource under a progress window.
#pragma once

#include <atomic>

#include "RFL/BatchOperation.h"
#include "ZOClient/Export.h"
#include "ZOClient/ResultCodes.h"
#include "ZOClient/Types.h"

namespace ZOCL {

/// What every operation has: a station, a result and the wish to stop. A derived class says in Start what is
/// done, looks at IsCanceled at each step, and calls FinishOperation exactly once for a Start that returned
/// true. Functions that are bound to requests hold a reference, so the operation outlives its window.
///
/// Threads: any, but Start on the main thread.
class ZOCL_EXPORT ZOOperationBase : public RFL::IBatchOperation {
public:
    /// Answers with the object itself.
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f4f7065726174ull, 0x696f6e4261736501ull};

    ZOOperationBase();
    ZOOperationBase(const ZOOperationBase&) = delete;
    ZOOperationBase& operator=(const ZOOperationBase&) = delete;

    std::uint32_t AddRef() noexcept override;
    std::uint32_t Release() noexcept override;
    int QueryInterface(const RFL::InterfaceID& inID, void** outInterface) noexcept override;
    int QueryInterfaceNoAddRef(const RFL::InterfaceID& inID, void** outInterface) noexcept override;

    ImmutableString GetStationID() override;
    UString GetDescription() override;
    /// The base does not run.
    bool Start() override;
    /// Notes the wish to stop, and no more.
    void Abort() override;

    virtual InterfaceRef<ZOOperationBase> AddRefSelf();
    /// kResultCancelled once Abort was called, whatever else happened; otherwise what the operation ended
    /// with, kResultFailure until then.
    virtual int GetResult() const;

protected:
    ~ZOOperationBase() override;
    virtual bool IsCanceled() const;
    /// Stores the result and posts RFL::OperationCompleteMessage. Any thread; hold no lock.
    virtual void FinishOperation(int inResult);
    /// What the operation would end with if it ended now.
    int GetStoredResult() const noexcept { return mResult.load(std::memory_order_acquire); }
    void SetStoredResult(int inResult) noexcept { mResult.store(inResult, std::memory_order_release); }

private:
    RFL::RefCount mReferences;
    const ImmutableString mStationID;
    std::atomic<int> mResult{kResultFailure};
    std::atomic<int> mCanceled{0};
};

/// Loads a resource; its result is that of the load. An abort does not stop the request: whoever wants that
/// cancels it by its identifier.
class ZOCL_EXPORT ZOLoadServerResourceOperation : public ZOOperationBase {
public:
    ZOLoadServerResourceOperation(const InterfaceRef<IZOCServerResource>& inResource,
                                  const Guid& inRequestID);

    UString GetDescription() override;
    /// False after an Abort, for a null resource, and when the load did not start.
    bool Start() override;
    const Guid& GetRequestID() const noexcept { return mRequestID; }
    const InterfaceRef<IZOCServerResource>& GetResource() const noexcept { return mResource; }

protected:
    ~ZOLoadServerResourceOperation() override;

private:
    const InterfaceRef<IZOCServerResource> mResource;
    const Guid mRequestID;
};

}  // namespace ZOCL
