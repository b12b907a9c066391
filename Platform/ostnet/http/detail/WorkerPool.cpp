#include "ostnet/http/detail/WorkerPool.h"

#include "ostcore/debug/Trace.h"
#include "ostnet/http/detail/ThreadStart.h"

namespace ostnet {
namespace http {
namespace {

using ostcore::debug::kTraceLevel_Fatal;
using ostcore::debug::Trace;
using ostcore::threads::ConditionVariable;
using ostcore::threads::Mutex;
using ostcore::threads::MutexLock;

constexpr std::size_t kMostWorkers = 64;

/// What this thread is to the pool that it works for.
struct ThisWorker {
    const void* pool = nullptr;
    bool isBlocked = false;
};
thread_local ThisWorker tWorker;

}  // namespace

/// Shared by the pool and its threads, so that one that was let go can end after the pool.
struct WorkerPool::State {
    State(unsigned inBaseCount, Runner inRunner) : baseCount(inBaseCount), runner(std::move(inRunner)) {}

    const std::size_t baseCount;
    const Runner runner;
    Mutex mutex;
    ConditionVariable hasWork;
    ConditionVariable workerEnded;
    std::deque<Job> jobs ZO_GUARDED_BY(mutex);
    std::vector<std::thread> threads ZO_GUARDED_BY(mutex);
    std::vector<std::thread::id> ended ZO_GUARDED_BY(mutex);
    std::size_t running ZO_GUARDED_BY(mutex) = 0;
    std::size_t idle ZO_GUARDED_BY(mutex) = 0;
    std::size_t blocked ZO_GUARDED_BY(mutex) = 0;
    bool isStopped ZO_GUARDED_BY(mutex) = false;

    bool IsSpare() const ZO_REQUIRES(mutex) { return running - blocked > baseCount; }
};

WorkerPool::WorkerPool(unsigned inWorkerCount, Runner inRunner)
    : mState(std::make_shared<State>(inWorkerCount, std::move(inRunner))) {
    for (unsigned i = 0; i < inWorkerCount; ++i) {
        AddWorker(mState);
    }
}

WorkerPool::~WorkerPool() {
    Stop();
}

void WorkerPool::AddWorker(const std::shared_ptr<State>& inState) {
    std::vector<std::thread> ended;
    {
        MutexLock lock(inState->mutex);
        auto& threads = inState->threads;
        for (const std::thread::id id : std::exchange(inState->ended, {})) {
            const auto found =
                std::find_if(threads.begin(), threads.end(),
                             [id](const std::thread& inThread) { return inThread.get_id() == id; });
            if (found != threads.end()) {
                ended.push_back(std::move(*found));
                threads.erase(found);
            }
        }
        ++inState->running;
        threads.push_back(StartThread([inState] { Work(inState); }));
    }
    for (std::thread& thread : ended) {
        thread.join();
    }
}

bool WorkerPool::Post(Job inJob) {
    MutexLock lock(mState->mutex);
    if (mState->isStopped) {
        return false;
    }
    mState->jobs.push_back(std::move(inJob));
    const bool wake = mState->idle > 0;
    lock.Unlock();
    if (wake) {
        mState->hasWork.NotifyOne();
    }
    return true;
}

bool WorkerPool::PostAll(std::vector<Job>& ioJobs) {
    MutexLock lock(mState->mutex);
    if (mState->isStopped) {
        return false;
    }
    std::move(ioJobs.begin(), ioJobs.end(), std::back_inserter(mState->jobs));
    const bool wake = mState->idle == mState->running && !ioJobs.empty();
    lock.Unlock();
    ioJobs.clear();
    if (wake) {
        mState->hasWork.NotifyOne();
    }
    return true;
}

bool WorkerPool::MayStall() const noexcept {
    MutexLock lock(mState->mutex);
    return !mState->jobs.empty() && mState->idle > 0;
}

void WorkerPool::WakeOne() {
    mState->hasWork.NotifyOne();
}

/// Waits for a job; false when this worker is to end: the pool is stopped and empty, or the job for whose
/// time this worker's place was filled is over.
bool WorkerPool::NextJob(State& ioState, Job& outJob) {
    MutexLock lock(ioState.mutex);
    if (std::exchange(tWorker.isBlocked, false)) {
        --ioState.blocked;
    }
    while (ioState.jobs.empty() && !ioState.isStopped && !ioState.IsSpare()) {
        ++ioState.idle;
        ioState.hasWork.Wait(lock);
        --ioState.idle;
    }
    if (ioState.jobs.empty() || ioState.IsSpare()) {
        --ioState.running;
        ioState.ended.push_back(std::this_thread::get_id());
        ioState.workerEnded.NotifyAll();
        return false;
    }
    outJob = std::move(ioState.jobs.front());
    ioState.jobs.pop_front();
    return true;
}

void WorkerPool::Work(std::shared_ptr<State> inState) {
    tWorker.pool = inState.get();
    for (Job job; NextJob(*inState, job); job = Job()) {
        try {
            inState->runner(job);
        } catch (const std::exception& inError) {
            Trace("ostnet", kTraceLevel_Fatal,
                  std::string("A completion or posted function threw an exception: ") + inError.what());
        } catch (...) {
            Trace("ostnet", kTraceLevel_Fatal,
                  "A completion or posted function threw something that is no exception.");
        }
    }
}

bool WorkerPool::IsWorker() const noexcept {
    return tWorker.pool == mState.get();
}

bool WorkerPool::AboutToBlock() {
    if (!IsWorker() || tWorker.isBlocked) {
        return true;
    }
    {
        MutexLock lock(mState->mutex);
        if (mState->running >= kMostWorkers || mState->isStopped) {
            return false;
        }
        ++mState->blocked;
        tWorker.isBlocked = true;
    }
    AddWorker(mState);
    return true;
}

void WorkerPool::Stop() {
    {
        MutexLock lock(mState->mutex);
        mState->isStopped = true;
    }
    mState->hasWork.NotifyAll();
    JoinAll();
}

void WorkerPool::JoinAll() {
    std::vector<std::thread> threads;
    {
        MutexLock lock(mState->mutex);
        threads.swap(mState->threads);
    }
    for (std::thread& thread : threads) {
        if (thread.get_id() == std::this_thread::get_id()) {
            thread.detach();
        } else {
            thread.join();
        }
    }
}

void WorkerPool::Abandon(std::chrono::milliseconds inPatience) {
    const auto end = std::chrono::steady_clock::now() + inPatience;
    std::deque<Job> dropped;
    std::vector<std::thread> threads;
    const std::size_t self = IsWorker() ? 1 : 0;
    {
        MutexLock lock(mState->mutex);
        mState->isStopped = true;
        dropped.swap(mState->jobs);
        threads.swap(mState->threads);
        mState->hasWork.NotifyAll();
        while (mState->running > self && mState->workerEnded.WaitUntil(lock, end)) {
        }
    }
    for (std::thread& thread : threads) {
        thread.detach();
    }
}

}  // namespace http
}  // namespace ostnet
