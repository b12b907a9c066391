// The window that tells a user who is in the way, and lets him wait, give up, or discard what is pending.
#pragma once

#include <atomic>

#include "Model/TransactionList.h"
#include "ZOClient/CompoundAsyncOperation.h"

namespace ZOCL {

/// Runs once, on the main thread, as work of a compound operation.
class PendingTransactionDialog {
public:
    /// The list is loaded and has pending items.
    PendingTransactionDialog(const InterfaceRef<TransactionList>& inList,
                             const std::vector<ImmutableString>& inIgnoredTypes);

    /// Returns 0 when nothing is pending any more, or when the user discards: then each pending transaction
    /// is rolled back as a further request of the operation. A failure: the user closes the production
    /// (kResultDialogCancelled), or the wait could not be started.
    int Run(const shared_ptr<CompoundAsyncOperation>& inOperation);
    /// When the operation has ended: the first failure of a rollback, or 0. One failure does not keep the
    /// other transactions from being rolled back.
    int GetDiscardResult() const noexcept { return mDiscardResult.load(std::memory_order_acquire); }

private:
    static bool IsDiscardConfirmed();
    /// The dialog must outlive the operation.
    void Discard(const shared_ptr<CompoundAsyncOperation>& inOperation);

    const InterfaceRef<TransactionList> mList;
    const std::vector<ImmutableString> mIgnoredTypes;
    std::atomic<int> mDiscardResult{kResultSuccess};
};

}  // namespace ZOCL
