// A plain mutex and condition that clang can check, for state that never calls out while it is held.
#pragma once

#include <chrono>
#include <condition_variable>
#include <mutex>

#include "ostcore/threads/SpinBeforeSleep.h"
#include "ostcore/threads/ThreadAnnotations.h"

namespace ostcore {
namespace threads {

/// A non-recursive mutex. Use it for leaf state; what user code can re-enter takes a RecursiveMutex.
class ZO_CAPABILITY("mutex") Mutex {
public:
    Mutex() = default;
    Mutex(const Mutex&) = delete;
    Mutex& operator=(const Mutex&) = delete;

    void Lock() const ZO_ACQUIRE() { detail::LockOrSleep(mMutex); }
    void Unlock() const ZO_RELEASE() { mMutex.unlock(); }

private:
    friend class MutexLock;
    mutable std::mutex mMutex;
};

/// Holds a Mutex for a scope; Unlock lets go early.
class ZO_SCOPED_CAPABILITY MutexLock {
public:
    explicit MutexLock(const Mutex& inMutex) ZO_ACQUIRE(inMutex) : mLock(inMutex.mMutex, std::defer_lock) {
        detail::LockOrSleep(mLock);
    }
    ~MutexLock() ZO_RELEASE() {}
    MutexLock(const MutexLock&) = delete;
    MutexLock& operator=(const MutexLock&) = delete;

    void Unlock() ZO_RELEASE() { mLock.unlock(); }

private:
    friend class ConditionVariable;
    std::unique_lock<std::mutex> mLock;
};

/// Waits for a change of what a Mutex guards. Wake-ups can be spurious: wait in a loop over the condition.
class ConditionVariable {
public:
    void Wait(MutexLock& ioLock) { mCondition.wait(ioLock.mLock); }
    /// False when the time came first.
    bool WaitUntil(MutexLock& ioLock, std::chrono::steady_clock::time_point inTime) {
        return mCondition.wait_until(ioLock.mLock, inTime) == std::cv_status::no_timeout;
    }
    void NotifyOne() noexcept { mCondition.notify_one(); }
    void NotifyAll() noexcept { mCondition.notify_all(); }

private:
    std::condition_variable mCondition;
};

}  // namespace threads
}  // namespace ostcore
