// What all executors share: the queue of one executor, its turns on the threads of somebody else, stop and
// wait.
#pragma once

#include <cstddef>
#include <cstdint>
#include <deque>

#include "ostcore/threads/Clock.h"
#include "ostcore/threads/Executor.h"
#include "ostcore/threads/Mutex.h"
#include "ostcore/Types.h"

namespace ostcore {
namespace threads {

/// The state behind an executor's handle.
///
/// Each accepted function stands in the queue of its executor. A turn is a plain call that is handed to
/// threads elsewhere (a pool, a parent) and runs the oldest function of the queue when it comes. There are
/// never more turns on their way than the width: one makes the executor serial, as the next turn is only
/// handed on when the last has ended. Turns hold the state alive, so the handle may go at any time on any
/// thread.
///
/// Invariant, under the lock: while the executor is not stopped, a queue that is not empty has a turn on its
/// way. A turn that is destroyed without having run (its parent was stopped) therefore stops this executor
/// too; otherwise Post would go on accepting functions whose turn never comes.
class ExecutorCore : public enable_shared_from_this<ExecutorCore> {
public:
    /// Hands a turn to threads; false when they take no more.
    using Dispatch = function<bool(function<void()> inTurn)>;
    static constexpr std::size_t kSerial = 1;
    static constexpr std::size_t kParallel = static_cast<std::size_t>(-1);

    ExecutorCore(const char* inLabel, std::size_t inWidth, Dispatch inDispatch);

    bool Post(function<void()> inFunction) ZO_EXCLUDES(mMutex);
    void Stop() ZO_EXCLUDES(mMutex);
    bool IsStopped() const ZO_EXCLUDES(mMutex);
    bool Wait(std::uint32_t inMilliseconds) ZO_EXCLUDES(mMutex);

private:
    class Turn;

    bool DispatchTurn();
    void RunTurn() ZO_EXCLUDES(mMutex);
    bool TakeNext(function<void()>& outFunction) ZO_EXCLUDES(mMutex);
    void EndFunction() ZO_EXCLUDES(mMutex);
    void EndTurn() ZO_EXCLUDES(mMutex);

    const char* const mLabel;
    const std::size_t mWidth;
    const Dispatch mDispatch;

    mutable Mutex mMutex;
    ConditionVariable mIdle;
    std::deque<function<void()>> mQueue ZO_GUARDED_BY(mMutex);
    std::size_t mTurns ZO_GUARDED_BY(mMutex) = 0;
    std::size_t mRunning ZO_GUARDED_BY(mMutex) = 0;
    bool mIsStopped ZO_GUARDED_BY(mMutex) = false;
};

}  // namespace threads
}  // namespace ostcore
