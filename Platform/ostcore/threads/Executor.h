// Where work runs: executors for blocking work, for computing, in order, and on a thread of their own.
#pragma once

#include <cstddef>
#include <cstdint>

#include "ostcore/Export.h"
#include "ostcore/Types.h"

namespace ostcore {
namespace threads {

/// Takes functions and runs them elsewhere. Threads: any.
class ZOPLATFORM_EXPORT Executor {
public:
    virtual ~Executor();
    /// True: the function will run, unless the executor is stopped before its turn comes. False: it will
    /// not run, and is destroyed before the call returns. Never runs the function on the caller's stack.
    /// An exception that leaves the function is traced and ends there.
    virtual bool Post(function<void()> inFunction) = 0;
};

/// The name that asynchronous operations know it by.
using AsyncExecutor = Executor;

/// An executor that can be stopped.
///
/// The object is a handle. When its last reference goes, what was accepted still runs and nobody waits for
/// it, so a reference may be dropped anywhere: under a lock, or on one of the executor's own threads.
class ZOPLATFORM_EXPORT AsyncThreadedExecutor : public Executor {
public:
    /// Refuses all further work and drops what has not begun; the dropped functions are destroyed on the
    /// calling thread. What runs goes on. Can be called again without effect.
    virtual void Stop() = 0;
    virtual bool IsStopped() const = 0;
    /// Waits until nothing of this executor runs or waits its turn. False: the time passed first, or the
    /// caller is itself a function of this executor, which would wait for itself. 0xFFFFFFFF is for ever.
    virtual bool Wait(std::uint32_t inMilliseconds) = 0;
};

constexpr std::uint32_t kForever = 0xFFFFFFFFu;

/// For work that blocks (synchronous requests, files). Functions run side by side on a set of threads that
/// grows when all are busy and shrinks when they idle; one executor's blocked work does not hold up
/// another's. The label names the threads' work in traces; it is a literal.
ZOPLATFORM_EXPORT shared_ptr<AsyncThreadedExecutor> CreateIOBoundExecutor(const char* inLabel = "io");
/// The shared one, made at first use. Stop has no effect on it: it belongs to everybody.
ZOPLATFORM_EXPORT shared_ptr<AsyncThreadedExecutor> GetIOBoundExecutor();
/// For work that computes and does not block. Functions run side by side, as many as the machine has cores.
ZOPLATFORM_EXPORT shared_ptr<AsyncThreadedExecutor> CreateCPUBoundExecutor(const char* inLabel = "cpu");
/// Runs its functions one after the other, in the order of Post, on the threads of the parent. When the
/// parent refuses (it was stopped), the sub-executor is stopped as well. Null for a null parent.
ZOPLATFORM_EXPORT shared_ptr<AsyncThreadedExecutor> CreateSubExecutor(const shared_ptr<Executor>& inParent);
/// Runs its functions one after the other on one thread of its own, so that one of them may be a loop. The
/// thread ends when the last reference is gone and the queue is empty.
ZOPLATFORM_EXPORT shared_ptr<AsyncThreadedExecutor> CreateAsyncEventLoopExecutor(const char* inLabel);

/// Waits until nothing runs or waits on any executor of the process. False when the time passed first.
/// Never call it from a function of an executor.
ZOPLATFORM_EXPORT bool WaitForExecutors(std::uint32_t inMilliseconds);

/// Runs nothing by itself: a test says when the next function runs, on its own thread.
class ZOPLATFORM_EXPORT ManualExecutor final : public AsyncThreadedExecutor {
public:
    ManualExecutor();
    ~ManualExecutor() override;
    ManualExecutor(const ManualExecutor&) = delete;
    ManualExecutor& operator=(const ManualExecutor&) = delete;

    bool Post(function<void()> inFunction) override;
    void Stop() override;
    bool IsStopped() const override;
    /// True when nothing is queued; never waits.
    bool Wait(std::uint32_t inMilliseconds) override;

    /// Runs the oldest function; false when none waits.
    bool RunOne();
    /// Runs until none waits, also what is posted meanwhile; returns how many ran.
    std::size_t RunAll();
    std::size_t PendingCount() const;

private:
    class Core;
    shared_ptr<Core> mCore;
};

}  // namespace threads
}  // namespace ostcore
