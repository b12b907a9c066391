// Looks whether somebody's transaction is in the way of the session of a sandbox.
#include <atomic>

#include "Frame/Station.h"
#include "Model/PendingTransactions.h"
#include "ZOClient/ZOSandbox.h"

namespace ZOCL {

namespace {

std::atomic<bool> gIsCheckRunning{false};

/// One check; whoever holds it goes on. It ends with the last of its functions.
class RunningCheck {
public:
    /// Null when another one goes on.
    static shared_ptr<RunningCheck> Begin() {
        if (gIsCheckRunning.exchange(true, std::memory_order_acq_rel)) {
            return nullptr;
        }
        return shared_ptr<RunningCheck>(new RunningCheck);
    }
    ~RunningCheck() { gIsCheckRunning.store(false, std::memory_order_release); }
    RunningCheck(const RunningCheck&) = delete;
    RunningCheck& operator=(const RunningCheck&) = delete;

private:
    RunningCheck() = default;
};

void OnTransactionListForConflictCheck(const InterfaceRef<TransactionList>& inList, int inResult,
                                       const shared_ptr<ostnet::Response>& inResponse,
                                       const std::vector<ImmutableString>& inTypesToIgnore,
                                       const shared_ptr<RunningCheck>& inCheck) {
    if (inResult < 0 || (inResponse && inResponse->status == 304) || !inList->IsLoaded() ||
        inList->GetPendingItems(inTypesToIgnore).empty()) {
        return;
    }
    RunPendingTransactionDialog(inList, inTypesToIgnore, [inCheck](int inOutcome) {
        if (inOutcome < 0) {
            PostLibraryMessage(ZOCloseProductionMessage());
        }
    });
}

}  // namespace

void ZOSandbox::CheckForPendingTransactionConflicts(
    const std::vector<ImmutableString>& inTypesToIgnore) const {
    if (!mSession) {
        return;
    }
    const shared_ptr<RunningCheck> check = RunningCheck::Begin();
    const auto list =
        check ? RFL::QueryInterface<TransactionList>(mSession->GetOrCreateTransactionList()) : nullptr;
    if (!list) {
        return;
    }
    const auto onLoaded = [list, session = mSession, inTypesToIgnore, check](
                              const Guid&, int inResult, const InterfaceRef<IZOCServerResource>&,
                              const shared_ptr<ostnet::Response>& inResponse) {
        OnTransactionListForConflictCheck(list, inResult, inResponse, inTypesToIgnore, check);
    };
    list->Refresh(Guid::CreateUnique(), onLoaded);
}

}  // namespace ZOCL
