// The workers of the base processor: a few threads on which completions and posted functions run.
#pragma once

#include <chrono>
#include <deque>
#include <functional>
#include <memory>
#include <thread>
#include <vector>

#include "ostcore/threads/Mutex.h"
#include "ostcore/Types.h"

namespace ostnet {
namespace http {

class Exchange;

/// What a worker does next: end an exchange in one way or another, or run a function.
struct Job {
    enum class Kind { kFunction, kAnswered, kCancelled, kProgress };
    Kind kind = Kind::kFunction;
    std::shared_ptr<Exchange> exchange;
    function<void()> work;
};

/// A small pool that takes jobs in their order, one at a time for each worker.
///
/// A worker that is about to block on work of this very pool says so (AboutToBlock) and is replaced by
/// another for the time of its job, so that nested waits cannot starve the pool.
class WorkerPool {
public:
    using Runner = std::function<void(Job&)>;

    WorkerPool(unsigned inWorkerCount, Runner inRunner);
    ~WorkerPool();
    WorkerPool(const WorkerPool&) = delete;
    WorkerPool& operator=(const WorkerPool&) = delete;

    /// False after Stop: the job is dropped.
    bool Post(Job inJob);
    /// Moves all jobs out of the list. A worker is woken only when all sleep: one that works comes to these
    /// jobs by itself. The caller looks after the case that it does not come (MayStall, WakeOne).
    bool PostAll(std::vector<Job>& ioJobs);
    /// True while jobs wait and a worker sleeps.
    bool MayStall() const noexcept;
    void WakeOne();
    bool IsWorker() const noexcept;
    /// False when no other worker can be had.
    bool AboutToBlock();

    /// Takes no more jobs, runs those that it has and joins the workers; one that calls this itself is let
    /// go instead and ends with its job.
    void Stop();
    /// For the end of the process: drops what has not begun and waits for the workers no longer than this.
    void Abandon(std::chrono::milliseconds inPatience);

private:
    struct State;
    static bool NextJob(State& ioState, Job& outJob);
    static void Work(std::shared_ptr<State> inState);
    static void AddWorker(const std::shared_ptr<State>& inState);
    void JoinAll();

    const std::shared_ptr<State> mState;
};

}  // namespace http
}  // namespace ostnet
