// A recursive mutex whose every holder names itself, and the scoped lock over it.
#pragma once

#include <atomic>
#include <mutex>

#include "ostcore/Export.h"
#include "ostcore/threads/SpinBeforeSleep.h"
#include "ostcore/threads/ThreadAnnotations.h"

namespace ostcore {
namespace threads {

/// A recursive mutex with labels: whoever takes it says which operation it is, for diagnostics.
/// Lock and Unlock are const, as a mutex is no part of the value that it guards.
class ZO_CAPABILITY("mutex") RecursiveMutex {
public:
    RecursiveMutex() = default;
    RecursiveMutex(const RecursiveMutex&) = delete;
    RecursiveMutex& operator=(const RecursiveMutex&) = delete;

    /// inLabel must outlive the lock: a literal with the qualified operation name.
    void Lock(const char* inLabel) const ZO_ACQUIRE() {
        detail::LockOrSleep(mMutex);
        mHolder.store(inLabel, std::memory_order_relaxed);
    }
    bool TryLock(const char* inLabel) const ZO_TRY_ACQUIRE(true) {
        if (!mMutex.try_lock()) {
            return false;
        }
        mHolder.store(inLabel, std::memory_order_relaxed);
        return true;
    }
    void Unlock() const ZO_RELEASE() { mMutex.unlock(); }

    /// The label of the last taker; a hint for a debugger or a dump, never a basis for decisions.
    const char* LastLabel() const noexcept { return mHolder.load(std::memory_order_relaxed); }

private:
    mutable std::recursive_mutex mMutex;
    mutable std::atomic<const char*> mHolder{""};
};

/// Holds a RecursiveMutex for a scope. Unlock lets go early, so that calls can be made outside.
class ZO_SCOPED_CAPABILITY ScopedLock {
public:
    ScopedLock(const RecursiveMutex& inMutex, const char* inLabel) ZO_ACQUIRE(inMutex) : mMutex(&inMutex) {
        inMutex.Lock(inLabel);
    }
    ~ScopedLock() ZO_RELEASE() {
        if (mMutex) {
            mMutex->Unlock();
        }
    }
    ScopedLock(const ScopedLock&) = delete;
    ScopedLock& operator=(const ScopedLock&) = delete;

    void Unlock() ZO_RELEASE() {
        mMutex->Unlock();
        mMutex = nullptr;
    }

private:
    const RecursiveMutex* mMutex;
};

}  // namespace threads
}  // namespace ostcore
