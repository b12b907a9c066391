// The main thread's queue.
#include "ostcore/threads/MainThread.h"

#include <chrono>
#include <deque>
#include <thread>

#include "ostcore/threads/detail/GuardedCall.h"
#include "ostcore/threads/Mutex.h"

namespace ostcore {
namespace threads {
namespace {

constexpr std::uint32_t kWaitForever = 0xFFFFFFFFu;

class MainThreadQueue {
public:
    bool Declare() ZO_EXCLUDES(mMutex) {
        std::thread::id nobody;
        const std::thread::id self = std::this_thread::get_id();
        return mThread.compare_exchange_strong(nobody, self) || nobody == self;
    }

    bool IsMine() const { return mThread.load() == std::this_thread::get_id(); }

    void Reset() ZO_EXCLUDES(mMutex) {
        std::deque<function<void()>> dropped;
        function<void()> wake;
        MutexLock lock(mMutex);
        dropped.swap(mQueue);
        wake.swap(mWake);
        mThread.store(std::thread::id());
    }

    void Push(function<void()> inFunction) ZO_EXCLUDES(mMutex) {
        function<void()> wake;
        {
            MutexLock lock(mMutex);
            mQueue.push_back(std::move(inFunction));
            mChanged.NotifyAll();
            wake = mWake;
        }
        if (wake) {
            wake();
        }
    }

    std::size_t Size() const ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        return mQueue.size();
    }

    void SetWake(function<void()> inWake) ZO_EXCLUDES(mMutex) {
        function<void()> wake = inWake;
        bool hasWork = false;
        {
            MutexLock lock(mMutex);
            mWake.swap(inWake);
            hasWork = !mQueue.empty();
        }
        if (hasWork && wake) {
            wake();
        }
    }

    void WaitForWork(std::uint32_t inMilliseconds) ZO_EXCLUDES(mMutex) {
        const auto deadline = std::chrono::steady_clock::now() + std::chrono::milliseconds(inMilliseconds);
        MutexLock lock(mMutex);
        while (mQueue.empty()) {
            if (inMilliseconds == kWaitForever) {
                mChanged.Wait(lock);
            } else if (!mChanged.WaitUntil(lock, deadline)) {
                return;
            }
        }
    }

    // One at a time, so that a function may pump in turn and the order is kept.
    bool RunNext() ZO_EXCLUDES(mMutex) {
        function<void()> next;
        {
            MutexLock lock(mMutex);
            if (mQueue.empty()) {
                return false;
            }
            next.swap(mQueue.front());
            mQueue.pop_front();
        }
        CallGuarded(next, "the main thread");
        return true;
    }

private:
    std::atomic<std::thread::id> mThread{std::thread::id()};
    mutable Mutex mMutex;
    ConditionVariable mChanged;
    std::deque<function<void()>> mQueue ZO_GUARDED_BY(mMutex);
    function<void()> mWake ZO_GUARDED_BY(mMutex);
};

// Never destroyed: background work may queue calls until the process ends.
MainThreadQueue& TheQueue() {
    static MainThreadQueue* const queue = new MainThreadQueue;
    return *queue;
}

}  // namespace

bool SetMainThread() {
    return TheQueue().Declare();
}
void ResetMainThread() {
    TheQueue().Reset();
}
bool IsMainThread() {
    return TheQueue().IsMine();
}
std::size_t MainThreadQueueSize() {
    return TheQueue().Size();
}
void SetMainThreadWakeFunction(function<void()> inFunction) {
    TheQueue().SetWake(std::move(inFunction));
}

void AsyncCallFromMainThread(function<void()> inFunction) {
    if (inFunction) {
        TheQueue().Push(std::move(inFunction));
    }
}

std::size_t PumpMainThread() {
    MainThreadQueue& queue = TheQueue();
    if (!queue.IsMine()) {
        return 0;
    }
    const std::size_t queued = queue.Size();
    std::size_t count = 0;
    while (count < queued && queue.RunNext()) {
        ++count;
    }
    return count;
}

std::size_t WaitAndPumpMainThread(std::uint32_t inMilliseconds) {
    if (!TheQueue().IsMine()) {
        return 0;
    }
    TheQueue().WaitForWork(inMilliseconds);
    return PumpMainThread();
}

}  // namespace threads
}  // namespace ostcore
