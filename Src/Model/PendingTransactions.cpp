// The steps of waiting: load the list, clear away what this application left, then ask the user.
#include "Model/PendingTransactions.h"

#include "Model/ClientMetadata.h"
#include "Model/PendingTransactionDialog.h"
#include "Model/Production.h"
#include "Model/ResourceCreation.h"
#include "ostcore/debug/Assert.h"
#include "ostcore/debug/Trace.h"
#include "ostcore/threads/MainThread.h"
#include "ZOClient/Progress.h"

namespace ZOCL {

using ostcore::debug::kTraceLevel_Error;

namespace {

class MainThreadExecutor final : public ostcore::threads::Executor {
public:
    bool Post(function<void()> inFunction) override {
        ostcore::threads::AsyncCallFromMainThread(std::move(inFunction));
        return true;
    }
};

void TraceError(const std::string& inText) {
    ostcore::debug::Trace("ZOCL.Production", kTraceLevel_Error, inText);
}

bool IsLeftByThisApplication(const IZOCTransactionList::Entry& inEntry, const ClientMetadata& inOwn) {
    return inEntry.metadata.applicationName == inOwn.applicationName &&
           inEntry.metadata.machineID == inOwn.machineID;
}

/// Whoever cannot be rolled back is waited for like anybody else.
int OnOrphanRolledBack(const IZOCTransactionList::Entry& inEntry, int inResult) {
    if (inResult < 0) {
        TraceError(JoinText("Failed to roll back the transaction ", inEntry.identifier,
                            " that this application left, inResult == ", inResult));
    }
    return kResultSuccess;
}

}  // namespace

void RunPendingTransactionDialog(const InterfaceRef<TransactionList>& inList,
                                 const std::vector<ImmutableString>& inIgnoredTypes,
                                 const ResultCompletion& inCompletion) {
    const auto dialog = boost::make_shared<PendingTransactionDialog>(inList, inIgnoredTypes);
    const auto operation = CompoundAsyncOperation::Create(
        [dialog, inCompletion](int inResult) {
            inCompletion(inResult < 0 ? inResult : dialog->GetDiscardResult());
        },
        inList->GetServer(), false);
    ZO_ASSERT_ONCE(operation, "operation", "Failed to create CompoundAsyncOperation?!");
    if (!operation) {
        inCompletion(kResultFailure);
        return;
    }
    operation->CallAsynchronously(
        boost::make_shared<MainThreadExecutor>(), [dialog, operation] { return dialog->Run(operation); },
        false);
}

namespace {

void WaitForTransactionsAsync_OnListLoaded(const InterfaceRef<TransactionList>& inList, int inResult,
                                           const std::vector<ImmutableString>& inIgnoredTypes,
                                           const ResultCompletion& inCompletion) {
    const bool isUnchanged = inResult == kResultHTTPNotModified;
    const int result = (inResult >= 0 || isUnchanged) && !inList->IsLoaded() ? kResultFailure : inResult;
    if (result >= 0 || isUnchanged) {
        WaitForTransactionsOfLoadedList(inList, inIgnoredTypes, inCompletion);
        return;
    }
    if (!ResultSucceededOrCanceled(result)) {
        TraceError(JoinText("Failed to load transaction list, inResult == ", result));
    }
    inCompletion(result);
}

ResultCompletion NeverEmpty(const ResultCompletion& inCompletion) {
    return inCompletion ? inCompletion : ResultCompletion([](int) {});
}

}  // namespace

void RollbackAsPartOf(const shared_ptr<CompoundAsyncOperation>& inOperation,
                      const InterfaceRef<TransactionList>& inList, const IZOCTransactionList::Entry& inEntry,
                      const function<int(int)>& inIntermediate) {
    const auto transaction =
        MakeAtURL<Production>(inEntry.url, inList->GetServer(), ResourceWritability::kWritable);
    const ImmutableString id = inEntry.identifier;
    const auto onEnded = [inList, id, inIntermediate](int inResult) {
        if (inResult >= 0) {
            inList->RemoveItem(id);
        }
        return inIntermediate(inResult);
    };
    const auto onLoaded = [inOperation, transaction, onEnded](int inResult) {
        // It may have been committed since the list was made, or be gone.
        const bool hasEnded = inResult == kResultHTTPNotFound ||
                              (inResult >= 0 && transaction->IsLoaded() && !transaction->IsTransaction());
        if (hasEnded || inResult < 0) {
            return onEnded(hasEnded ? kResultGone : inResult);
        }
        inOperation->Initiate(
            [transaction](const Guid& inID, const RequestCompletion& inDone) {
                return transaction->Rollback(inID, inDone);
            },
            onEnded);
        return kResultSuccess;
    };
    inOperation->Initiate(
        [transaction](const Guid& inID, const RequestCompletion& inDone) {
            return transaction && transaction->Load(inID, inDone, true);
        },
        onLoaded);
}

void RemoveAndCancelOrphanedTransactions(const InterfaceRef<TransactionList>& inList,
                                         const function<void()>& inCompletion) {
    const ClientMetadata own = MakeClientMetadata(ImmutableString());
    std::vector<IZOCTransactionList::Entry> orphans;
    for (const auto& entry : inList->GetAllItems()) {
        if (IsLeftByThisApplication(entry, own)) {
            orphans.push_back(entry);
        }
    }
    if (orphans.empty()) {
        inCompletion();
        return;
    }
    const auto operation =
        CompoundAsyncOperation::Create([inCompletion](int) { inCompletion(); }, inList->GetServer(), false);
    ZO_ASSERT_ONCE(operation, "operation",
                   "RemoveAndCancelOrphanedTransactions(): Failed to create CompoundAsyncOperation");
    if (!operation) {
        inCompletion();
        return;
    }
    // The chain has one request until all are started, so that it cannot end before.
    operation->CallAsynchronously(
        ostcore::threads::GetIOBoundExecutor(),
        [operation, inList, orphans] {
            for (const auto& orphan : orphans) {
                RollbackAsPartOf(operation, inList, orphan,
                                 [orphan](int inResult) { return OnOrphanRolledBack(orphan, inResult); });
            }
            return kResultSuccess;
        },
        false);
}

void WaitForTransactionsOfLoadedList(const InterfaceRef<TransactionList>& inList,
                                     const std::vector<ImmutableString>& inIgnoredTypes,
                                     const ResultCompletion& inCompletion) {
    RemoveAndCancelOrphanedTransactions(inList, [inList, inIgnoredTypes, inCompletion] {
        if (inList->GetPendingItems(inIgnoredTypes).empty()) {
            inCompletion(kResultSuccess);
        } else {
            RunPendingTransactionDialog(inList, inIgnoredTypes, inCompletion);
        }
    });
}

void Production::WaitForPendingTransactions(const std::vector<ImmutableString>& inIgnoredTypes,
                                            const ResultCompletion& inCompletion) {
    const ResultCompletion completion = NeverEmpty(inCompletion);
    const auto list = RFL::QueryInterface<TransactionList>(GetOrCreateTransactionList());
    const int result = LoadServerResourceWithProgress(list, true);
    if (result < 0) {
        completion(result);
        return;
    }
    WaitForTransactionsOfLoadedList(list, inIgnoredTypes, completion);
}

bool Production::GetPendingTransactions(const std::vector<ImmutableString>& inIgnoredTypes,
                                        const ResultCompletion& inCompletion) {
    const auto list = RFL::QueryInterface<TransactionList>(GetOrCreateTransactionList());
    if (!list) {
        return false;
    }
    const ResultCompletion completion = NeverEmpty(inCompletion);
    const auto onLoaded = [list, inIgnoredTypes, completion](const Guid&, int inResult,
                                                             const InterfaceRef<IZOCServerResource>&,
                                                             const shared_ptr<ostnet::Response>&) {
        WaitForTransactionsAsync_OnListLoaded(list, inResult, inIgnoredTypes, completion);
    };
    const Guid id = Guid::CreateUnique();
    return list->IsLoaded() ? list->Refresh(id, onLoaded) : list->Load(id, onLoaded, true);
}

}  // namespace ZOCL
