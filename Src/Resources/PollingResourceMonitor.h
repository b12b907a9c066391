// Asks the server again and again whether resources have changed, for those who subscribed to them.
#pragma once

#include <vector>

#include "ostcore/threads/Executor.h"
#include "ostcore/threads/RecursiveMutex.h"
#include "ZOClient/ServerResourceChangeNotifier.h"

namespace ZOCL {

/// One for the process, made by the first subscription. Threads: any.
///
/// Each subscription is a chain: a check compares the resource's tag with the notifier's and lets a poll
/// follow after the interval; the poll refreshes the resource, and the end of that is the next check. So a
/// chain never runs twice at a time, and ends where it finds its notifier or the executor stopped.
class PollingResourceMonitor {
public:
    static PollingResourceMonitor& Get();

    /// The interval is in milliseconds and the same after every answer, failures included. Null for a null
    /// resource. The first check runs on this thread.
    shared_ptr<ServerResourceChangeNotifier> SubscribeToChanges(
        const InterfaceRef<IZOCServerResource>& inResource,
        const ServerResourceChangeNotifier::Function& inFunction, std::uint32_t inInterval,
        bool inNotifyWhenUnloaded);

    /// Ends all chains; a later subscription starts afresh. With inWait no poll or function of a subscriber
    /// runs on a thread of the polls when it returns, unless it is called from one; a request that is in
    /// flight still ends, and nothing follows it. Makes no monitor where there is none.
    static void CancelAllOutstandingPolls(bool inWait);

private:
    class Chain;
    PollingResourceMonitor() = default;
    shared_ptr<ostcore::threads::AsyncThreadedExecutor> GetExecutorLocked() ZO_REQUIRES(mMutex);
    void Cancel(bool inWait);

    ostcore::threads::RecursiveMutex mMutex;
    shared_ptr<ostcore::threads::AsyncThreadedExecutor> mExecutor ZO_GUARDED_BY(mMutex);
    std::vector<weak_ptr<Chain>> mChains ZO_GUARDED_BY(mMutex);
};

}  // namespace ZOCL
