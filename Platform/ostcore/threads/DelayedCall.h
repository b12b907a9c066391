// Calls that come later, once or again and again, on an executor of the caller's choice.
#pragma once

#include <cstdint>

#include "ostcore/Export.h"
#include "ostcore/threads/Executor.h"
#include "ostcore/threads/Scheduler.h"
#include "ostcore/Types.h"

namespace ostcore {
namespace threads {

/// The handle of a call that PostDelayed accepted. Dropping it does not cancel. Threads: any.
class ZOPLATFORM_EXPORT DelayedCall {
public:
    virtual ~DelayedCall();
    /// True: the function has not begun and never will; it is released before the call returns.
    /// False: it has begun, has ended, or was cancelled before.
    virtual bool Cancel() = 0;
};

/// Runs the function once on the executor after so many milliseconds of the global scheduler's time. A null
/// executor means the scheduler's own thread, for functions that are short and do not block. The executor is
/// kept until then; when it refuses at that moment, the function is released without a call. Null: refused.
ZOPLATFORM_EXPORT shared_ptr<DelayedCall> PostDelayed(const shared_ptr<Executor>& inExecutor,
                                                      function<void()> inFunction,
                                                      std::uint32_t inMilliseconds);

/// Calls one function later, and no more than once however often it is queued meanwhile.
///
/// The destructor cancels. Neither it nor Cancel waits for a call that runs. Threads: any.
class ZOPLATFORM_EXPORT DeferredCaller {
public:
    /// A null executor means the scheduler's own thread.
    DeferredCaller(shared_ptr<Executor> inExecutor, function<void()> inFunction);
    ~DeferredCaller();
    DeferredCaller(const DeferredCaller&) = delete;
    DeferredCaller& operator=(const DeferredCaller&) = delete;

    /// Queues the call. While one waits, does nothing and returns true; once the call begins, the next can be
    /// queued, also from inside it. False: refused.
    bool QueueOnlyOnce(std::uint32_t inMilliseconds);
    /// Takes back the call that waits, if one does.
    void Cancel();

private:
    class Core;
    shared_ptr<Core> mCore;
};

/// Calls a function once every period, first after one period, until stopped.
///
/// Calls never overlap: a period that ends while the call before it has not is skipped. Threads: any.
class ZOPLATFORM_EXPORT RepeatDelayFunction {
public:
    /// Starts at once, on the global scheduler's time. A null executor means the scheduler's own thread, for
    /// functions that are short and do not block. A period of 0 counts as 1.
    RepeatDelayFunction(shared_ptr<Executor> inExecutor, function<void()> inFunction,
                        std::uint32_t inPeriodMilliseconds);
    /// Stops.
    ~RepeatDelayFunction();
    RepeatDelayFunction(const RepeatDelayFunction&) = delete;
    RepeatDelayFunction& operator=(const RepeatDelayFunction&) = delete;

    /// No call begins afterwards. Waits for one that runs, unless called from it. Never call it while holding
    /// a lock that the function takes.
    void Stop();

private:
    class Core;
    shared_ptr<Core> mCore;
};

}  // namespace threads
}  // namespace ostcore
