// Waits for the transactions that others have open on a session, and clears away those that were left behind.
#pragma once

#include "Model/TransactionList.h"
#include "ZOClient/CompoundAsyncOperation.h"
#include "ZOClient/IZOCEditingSession.h"

namespace ZOCL {

using ResultCompletion = IZOCEditingSession::ResultCompletion;

/// Rolls back every transaction of the loaded list that this application made on this machine, whatever run
/// of it: one that was left by a crash would block its user for ever. Those that are gone then leave the
/// list. Completes once, on a worker or at once, whether they could be rolled back or not: what could not
/// stays in the list.
void RemoveAndCancelOrphanedTransactions(const InterfaceRef<TransactionList>& inList,
                                         const function<void()>& inCompletion);

/// Loads a transaction, rolls it back and takes it out of the list, as one request of the operation. One that
/// has ended otherwise is no failure. inIntermediate gets the result and returns the result of the step.
void RollbackAsPartOf(const shared_ptr<CompoundAsyncOperation>& inOperation,
                      const InterfaceRef<TransactionList>& inList, const IZOCTransactionList::Entry& inEntry,
                      const function<int(int inResult)>& inIntermediate);

/// Runs the window that waits for the pending transactions of the loaded list, on the main thread and later.
/// Completes once, on a worker: 0 when nothing is pending any more or all was discarded; a failure when the
/// user closes the production, or when something could not be discarded.
void RunPendingTransactionDialog(const InterfaceRef<TransactionList>& inList,
                                 const std::vector<ImmutableString>& inIgnoredTypes,
                                 const ResultCompletion& inCompletion);

/// Goes on when the list has been loaded: clears orphans away, and when others are left runs the window that
/// waits for them, on the main thread.
void WaitForTransactionsOfLoadedList(const InterfaceRef<TransactionList>& inList,
                                     const std::vector<ImmutableString>& inIgnoredTypes,
                                     const ResultCompletion& inCompletion);

}  // namespace ZOCL
