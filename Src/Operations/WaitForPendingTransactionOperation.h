// Waits until nobody's transaction is in the way.
#pragma once

#include <atomic>
#include <vector>

#include "Operations/ForceAbortEnabledOperation.h"
#include "RFL/BatchOperation.h"
#include "ZOClient/IZOCServerResource.h"
#include "ZOClient/IZOCTransaction.h"

namespace ZOCL {

/// Ends with 0 when the list of transactions holds none that counts, and with kResultCancelled by Abort. A
/// list that cannot be read is asked again and again: only a list that was read can say that nothing waits.
/// Exactly one end is posted, none after ForceAbort.
///
/// Threads: any, but Init and Start on one.
class WaitForPendingTransactionOperation final : public RFL::IBatchOperation,
                                                 public ForceAbortEnabledOperation {
public:
    explicit WaitForPendingTransactionOperation(const ImmutableString& inStationID);
    WaitForPendingTransactionOperation(const WaitForPendingTransactionOperation&) = delete;
    WaitForPendingTransactionOperation& operator=(const WaitForPendingTransactionOperation&) = delete;

    /// Takes the transactions that the list holds now for those to be waited for. False: the resource is no
    /// list of transactions.
    bool Init(const InterfaceRef<IZOCServerResource>& inResource,
              const std::vector<ImmutableString>& inIgnoredTypes);

    std::uint32_t AddRef() noexcept override;
    std::uint32_t Release() noexcept override;
    int QueryInterface(const RFL::InterfaceID& inID, void** outInterface) noexcept override;
    int QueryInterfaceNoAddRef(const RFL::InterfaceID& inID, void** outInterface) noexcept override;

    ImmutableString GetStationID() override;
    UString GetDescription() override;
    bool Start() override;
    void Abort() override;
    void ForceAbort(int inResult) override;

    int GetResult() const noexcept { return mResult.load(std::memory_order_acquire); }
    /// Those of the list at Init.
    const std::vector<IZOCTransactionList::Entry>& GetPendingItems() const noexcept { return mPendingItems; }

private:
    ~WaitForPendingTransactionOperation() override;
    void OnTransactionListChanged();
    void StopWatching();
    bool ClaimEnd() noexcept { return mHasEnded.exchange(1, std::memory_order_acq_rel) == 0; }
    void End(int inResult);
    void OnFinished();

    RFL::RefCount mReferences;
    const ImmutableString mStationID;
    InterfaceRef<IZOCServerResource> mResource;
    InterfaceRef<IZOCTransactionList> mList;
    std::vector<ImmutableString> mIgnoredTypes;
    std::vector<IZOCTransactionList::Entry> mPendingItems;
    std::atomic<int> mResult{kResultFailure};
    std::atomic<std::size_t> mPendingCount{0};
    std::atomic<int> mHasEnded{0};
    std::atomic<bool> mIsRunning{false};
    ostcore::threads::Mutex mMutex;
    shared_ptr<ServerResourceChangeNotifier> mNotifier ZO_GUARDED_BY(mMutex);
};

}  // namespace ZOCL
