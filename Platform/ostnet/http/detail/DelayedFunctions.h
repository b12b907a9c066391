// Functions that wait for their time on the scheduler and then go to the workers.
#pragma once

#include <map>
#include <memory>
#include <vector>

#include "ostcore/threads/Mutex.h"
#include "ostcore/threads/Scheduler.h"
#include "ostnet/http/detail/WorkerPool.h"

namespace ostnet {
namespace http {

/// Holds each waiting function until the scheduler calls or the shutdown takes it; whoever takes it out of
/// the table runs it, so it runs once.
class DelayedFunctions : public std::enable_shared_from_this<DelayedFunctions> {
public:
    /// Takes a function whose time has come.
    using Due = std::function<void(function<void()>)>;

    explicit DelayedFunctions(Due inDue);

    /// False when the scheduler refuses, or after TakeAll.
    bool Add(const function<void()>& inFunction, std::uint32_t inDelayMilliseconds);
    /// Gives up all that wait, in the order in which they were added, and refuses more.
    std::vector<function<void()>> TakeAll();

private:
    struct Entry {
        function<void()> work;
        shared_ptr<ostcore::threads::Scheduler> scheduler;
        ostcore::threads::Scheduler::TimerID timer = ostcore::threads::Scheduler::kNoTimer;
    };
    void OnDue(std::uint64_t inKey);

    const Due mDue;
    ostcore::threads::Mutex mMutex;
    std::map<std::uint64_t, Entry> mWaiting ZO_GUARDED_BY(mMutex);
    std::uint64_t mNextKey ZO_GUARDED_BY(mMutex) = 0;
    bool mIsClosed ZO_GUARDED_BY(mMutex) = false;
};

}  // namespace http
}  // namespace ostnet
