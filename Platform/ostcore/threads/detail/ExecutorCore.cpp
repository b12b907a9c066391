// The queue of one executor and its turns.
#include "ostcore/threads/detail/ExecutorCore.h"

#include <chrono>

#include "ostcore/threads/detail/GuardedCall.h"

namespace ostcore {
namespace threads {
namespace {

/// The executors whose functions this thread is in the middle of, innermost first.
struct RunningFrame {
    const ExecutorCore* core;
    const RunningFrame* outer;
};
thread_local const RunningFrame* tInnermostFrame = nullptr;

class ScopedFrame {
public:
    explicit ScopedFrame(const ExecutorCore* inCore) : mFrame{inCore, tInnermostFrame} {
        tInnermostFrame = &mFrame;
    }
    ~ScopedFrame() { tInnermostFrame = mFrame.outer; }
    ScopedFrame(const ScopedFrame&) = delete;
    ScopedFrame& operator=(const ScopedFrame&) = delete;

private:
    const RunningFrame mFrame;
};

bool IsInsideFunctionOf(const ExecutorCore* inCore) {
    for (const RunningFrame* frame = tInnermostFrame; frame; frame = frame->outer) {
        if (frame->core == inCore) {
            return true;
        }
    }
    return false;
}

/// Counts what is accepted and has not ended, over all executors of the process.
struct Outstanding {
    Mutex mutex;
    ConditionVariable idle;
    std::atomic<std::size_t> count{0};

    void Add() { count.fetch_add(1, std::memory_order_relaxed); }
    void Remove(std::size_t inCount) {
        if (inCount == 0 || count.fetch_sub(inCount, std::memory_order_acq_rel) != inCount) {
            return;
        }
        MutexLock lock(mutex);
        idle.NotifyAll();
    }
};

Outstanding& AllOutstanding() {
    static Outstanding* const outstanding = new Outstanding;
    return *outstanding;
}

MonotonicTime DeadlineAfter(std::uint32_t inMilliseconds) {
    return std::chrono::steady_clock::now() + std::chrono::milliseconds(inMilliseconds);
}

}  // namespace

/// One turn on its way. Whoever drops it without a run stops the executor; see the class comment.
class ExecutorCore::Turn {
public:
    explicit Turn(shared_ptr<ExecutorCore> inCore) : mCore(std::move(inCore)) {}
    ~Turn() {
        if (mCore) {
            mCore->Stop();
        }
    }
    Turn(const Turn&) = delete;
    Turn& operator=(const Turn&) = delete;

    void Run() {
        const shared_ptr<ExecutorCore> core = std::move(mCore);
        mCore.reset();
        core->RunTurn();
    }

private:
    shared_ptr<ExecutorCore> mCore;
};

ExecutorCore::ExecutorCore(const char* inLabel, std::size_t inWidth, Dispatch inDispatch)
    : mLabel(inLabel), mWidth(inWidth), mDispatch(std::move(inDispatch)) {}

bool ExecutorCore::Post(function<void()> inFunction) {
    if (!inFunction) {
        return false;
    }
    MutexLock lock(mMutex);
    if (mIsStopped) {
        return false;
    }
    mQueue.push_back(std::move(inFunction));
    AllOutstanding().Add();
    if (mTurns >= mWidth) {
        return true;
    }
    ++mTurns;
    lock.Unlock();
    return DispatchTurn();
}

// A refused turn is destroyed, which stops this executor and drops the queue.
bool ExecutorCore::DispatchTurn() {
    const auto turn = boost::make_shared<Turn>(shared_from_this());
    return mDispatch([turn] { turn->Run(); });
}

void ExecutorCore::RunTurn() {
    function<void()> next;
    if (TakeNext(next)) {
        {
            const ScopedFrame frame(this);
            CallGuarded(next, mLabel);
            next.clear();  // what it holds is released as part of its run
        }
        EndFunction();
    }
    EndTurn();
}

bool ExecutorCore::TakeNext(function<void()>& outFunction) {
    MutexLock lock(mMutex);
    if (mQueue.empty()) {
        return false;
    }
    outFunction.swap(mQueue.front());
    mQueue.pop_front();
    ++mRunning;
    return true;
}

void ExecutorCore::EndFunction() {
    {
        MutexLock lock(mMutex);
        --mRunning;
        mIdle.NotifyAll();
    }
    AllOutstanding().Remove(1);
}

void ExecutorCore::EndTurn() {
    {
        MutexLock lock(mMutex);
        if (mQueue.size() < mTurns) {
            --mTurns;
            return;
        }
    }
    DispatchTurn();
}

void ExecutorCore::Stop() {
    std::deque<function<void()>> dropped;
    {
        MutexLock lock(mMutex);
        mIsStopped = true;
        dropped.swap(mQueue);
        mIdle.NotifyAll();
    }
    const std::size_t count = dropped.size();
    dropped.clear();
    AllOutstanding().Remove(count);
}

bool ExecutorCore::IsStopped() const {
    MutexLock lock(mMutex);
    return mIsStopped;
}

bool ExecutorCore::Wait(std::uint32_t inMilliseconds) {
    if (IsInsideFunctionOf(this)) {
        return false;
    }
    const MonotonicTime deadline = DeadlineAfter(inMilliseconds);
    MutexLock lock(mMutex);
    while (!mQueue.empty() || mRunning > 0) {
        if (inMilliseconds == kForever) {
            mIdle.Wait(lock);
        } else if (!mIdle.WaitUntil(lock, deadline)) {
            return mQueue.empty() && mRunning == 0;
        }
    }
    return true;
}

bool WaitForExecutors(std::uint32_t inMilliseconds) {
    Outstanding& all = AllOutstanding();
    const MonotonicTime deadline = DeadlineAfter(inMilliseconds);
    MutexLock lock(all.mutex);
    while (all.count.load(std::memory_order_acquire) > 0) {
        if (inMilliseconds == kForever) {
            all.idle.Wait(lock);
        } else if (!all.idle.WaitUntil(lock, deadline)) {
            return all.count.load(std::memory_order_acquire) == 0;
        }
    }
    return true;
}

}  // namespace threads
}  // namespace ostcore
