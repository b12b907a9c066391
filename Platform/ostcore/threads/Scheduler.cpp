// The schedulers: real time on a thread of its own, and time that a test moves.
#include "ostcore/threads/Scheduler.h"

#include <map>
#include <thread>
#include <unordered_map>

#include <boost/date_time/posix_time/posix_time_types.hpp>

#include "ostcore/threads/detail/GuardedCall.h"
#include "ostcore/threads/Mutex.h"

namespace ostcore {
namespace threads {
namespace {

// A delay that does not overflow when it is added to any time of day.
constexpr Duration kLongestDelay = std::chrono::hours(24 * 365 * 100);

Duration ClampDelay(Duration inDelay) {
    return std::clamp(inDelay, Duration::zero(), kLongestDelay);
}

/// Functions by their time, those of one time in the order in which they came. Not locked.
class TimerQueue {
public:
    Scheduler::TimerID Add(MonotonicTime inTime, function<void()> inFunction) {
        const Scheduler::TimerID id = ++mLastID;
        mTimers.emplace(Key(inTime, id), std::move(inFunction));
        mTimes.emplace(id, inTime);
        return id;
    }

    // Takes a timer out; its function is handed over so that it is released outside the lock.
    bool Remove(Scheduler::TimerID inTimer, function<void()>& outFunction) {
        const auto time = mTimes.find(inTimer);
        if (time == mTimes.end()) {
            return false;
        }
        const auto timer = mTimers.find(Key(time->second, inTimer));
        outFunction.swap(timer->second);
        mTimers.erase(timer);
        mTimes.erase(time);
        return true;
    }

    optional<MonotonicTime> NextTime() const {
        return mTimers.empty() ? optional<MonotonicTime>()
                               : optional<MonotonicTime>(mTimers.begin()->first.first);
    }

    function<void()> TakeFirst() {
        function<void()> first;
        Remove(Scheduler::TimerID(mTimers.begin()->first.second), first);
        return first;
    }

    std::size_t Size() const { return mTimers.size(); }

private:
    using Key = std::pair<MonotonicTime, Scheduler::TimerID>;
    std::map<Key, function<void()>> mTimers;
    std::unordered_map<Scheduler::TimerID, MonotonicTime> mTimes;
    Scheduler::TimerID mLastID = Scheduler::kNoTimer;
};

}  // namespace

Clock::~Clock() = default;

// ---------------------------------------------------------------------------------------------------------

class SystemScheduler::Core : public enable_shared_from_this<SystemScheduler::Core> {
public:
    TimerID Add(Duration inDelay, function<void()> inFunction) ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        if (mIsEnding || !EnsureThread()) {
            return kNoTimer;
        }
        const TimerID id =
            mQueue.Add(std::chrono::steady_clock::now() + ClampDelay(inDelay), std::move(inFunction));
        mChanged.NotifyAll();
        return id;
    }

    bool Remove(TimerID inTimer) ZO_EXCLUDES(mMutex) {
        function<void()> removed;
        MutexLock lock(mMutex);
        return mQueue.Remove(inTimer, removed);
    }

    void End() ZO_EXCLUDES(mMutex) {
        TimerQueue dropped;
        MutexLock lock(mMutex);
        mIsEnding = true;
        std::swap(dropped, mQueue);
        mChanged.NotifyAll();
        while (mIsRunning && mThread != std::this_thread::get_id()) {
            mChanged.Wait(lock);
        }
        lock.Unlock();
    }

private:
    bool EnsureThread() ZO_REQUIRES(mMutex) {
        if (mHasThread) {
            return true;
        }
        try {
            std::thread([self = shared_from_this()] { self->Run(); }).detach();
        } catch (const std::system_error&) {
            return false;
        }
        mHasThread = true;
        return true;
    }

    void Run() ZO_EXCLUDES(mMutex) {
        while (function<void()> due = WaitForDue()) {
            CallGuarded(due, "a timer");
            due.clear();
            MutexLock lock(mMutex);
            mIsRunning = false;
            mChanged.NotifyAll();
        }
    }

    // The next function, marked as running; empty at the end.
    function<void()> WaitForDue() ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        while (!mIsEnding) {
            const optional<MonotonicTime> next = mQueue.NextTime();
            if (!next) {
                mChanged.Wait(lock);
            } else if (*next > std::chrono::steady_clock::now()) {
                mChanged.WaitUntil(lock, *next);
            } else {
                mIsRunning = true;
                mThread = std::this_thread::get_id();
                return mQueue.TakeFirst();
            }
        }
        return {};
    }

    Mutex mMutex;
    ConditionVariable mChanged;
    TimerQueue mQueue ZO_GUARDED_BY(mMutex);
    bool mHasThread ZO_GUARDED_BY(mMutex) = false;
    bool mIsEnding ZO_GUARDED_BY(mMutex) = false;
    bool mIsRunning ZO_GUARDED_BY(mMutex) = false;
    std::thread::id mThread ZO_GUARDED_BY(mMutex);
};

SystemScheduler::SystemScheduler() : mCore(boost::make_shared<Core>()) {}
SystemScheduler::~SystemScheduler() {
    mCore->End();
}
MonotonicTime SystemScheduler::Now() const {
    return std::chrono::steady_clock::now();
}
ptime SystemScheduler::UTCNow() const {
    return boost::posix_time::microsec_clock::universal_time();
}

Scheduler::TimerID SystemScheduler::Schedule(Duration inDelay, function<void()> inFunction) {
    return inFunction ? mCore->Add(inDelay, std::move(inFunction)) : kNoTimer;
}

bool SystemScheduler::Cancel(TimerID inTimer) {
    return mCore->Remove(inTimer);
}

// ---------------------------------------------------------------------------------------------------------

class VirtualScheduler::Core {
public:
    MonotonicTime Now() const ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        return mNow;
    }

    ptime UTCNow() const ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        const auto elapsed = std::chrono::duration_cast<std::chrono::microseconds>(mNow - mUTCSetAt);
        return mUTC + boost::posix_time::microseconds(elapsed.count());
    }

    void SetUTC(const ptime& inTime) ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        mUTC = inTime;
        mUTCSetAt = mNow;
    }

    TimerID Add(Duration inDelay, function<void()> inFunction) ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        return mQueue.Add(mNow + ClampDelay(inDelay), std::move(inFunction));
    }

    bool Remove(TimerID inTimer) ZO_EXCLUDES(mMutex) {
        function<void()> removed;
        MutexLock lock(mMutex);
        return mQueue.Remove(inTimer, removed);
    }

    std::size_t RunUntil(MonotonicTime inEnd) ZO_EXCLUDES(mMutex) {
        std::size_t count = 0;
        while (function<void()> due = TakeDue(inEnd)) {
            due();
            ++count;
        }
        return count;
    }

    optional<MonotonicTime> NextTime() const ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        return mQueue.NextTime();
    }

    std::size_t Size() const ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        return mQueue.Size();
    }

private:
    // Moves the time to the next function up to the end and takes it; empty, at the end, when there is none.
    function<void()> TakeDue(MonotonicTime inEnd) ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        const optional<MonotonicTime> next = mQueue.NextTime();
        const bool isDue = next && *next <= inEnd;
        mNow = std::max(mNow, isDue ? *next : inEnd);
        return isDue ? mQueue.TakeFirst() : function<void()>();
    }

    mutable Mutex mMutex;
    TimerQueue mQueue ZO_GUARDED_BY(mMutex);
    // Not zero, so that a time of zero stays free to mean none.
    MonotonicTime mNow ZO_GUARDED_BY(mMutex){std::chrono::hours(1)};
    MonotonicTime mUTCSetAt ZO_GUARDED_BY(mMutex){std::chrono::hours(1)};
    ptime mUTC ZO_GUARDED_BY(mMutex){boost::gregorian::date(2030, 1, 1)};
};

VirtualScheduler::VirtualScheduler() : mCore(boost::make_shared<Core>()) {}
VirtualScheduler::~VirtualScheduler() = default;
MonotonicTime VirtualScheduler::Now() const {
    return mCore->Now();
}
ptime VirtualScheduler::UTCNow() const {
    return mCore->UTCNow();
}
void VirtualScheduler::SetUTC(const ptime& inTime) {
    mCore->SetUTC(inTime);
}
std::size_t VirtualScheduler::PendingCount() const {
    return mCore->Size();
}
bool VirtualScheduler::Cancel(TimerID inTimer) {
    return mCore->Remove(inTimer);
}

Scheduler::TimerID VirtualScheduler::Schedule(Duration inDelay, function<void()> inFunction) {
    return inFunction ? mCore->Add(inDelay, std::move(inFunction)) : kNoTimer;
}

std::size_t VirtualScheduler::Advance(Duration inSpan) {
    const shared_ptr<Core> core = mCore;  // a function may let go of the scheduler
    return core->RunUntil(core->Now() + ClampDelay(inSpan));
}

std::size_t VirtualScheduler::AdvanceToNext() {
    const shared_ptr<Core> core = mCore;
    const optional<MonotonicTime> next = core->NextTime();
    return next ? core->RunUntil(*next) : 0;
}

optional<Duration> VirtualScheduler::TimeToNext() const {
    const optional<MonotonicTime> next = mCore->NextTime();
    return next ? optional<Duration>(*next - mCore->Now()) : optional<Duration>();
}

// ---------------------------------------------------------------------------------------------------------

namespace {

struct GlobalScheduler {
    Mutex mutex;
    shared_ptr<Scheduler> system ZO_GUARDED_BY(mutex) = boost::make_shared<SystemScheduler>();
    shared_ptr<Scheduler> current ZO_GUARDED_BY(mutex) = system;
};

// Never destroyed: timers of static lifetime may ask for it after everything else.
GlobalScheduler& TheGlobalScheduler() {
    static GlobalScheduler* const global = new GlobalScheduler;
    return *global;
}

}  // namespace

shared_ptr<Scheduler> GetGlobalScheduler() {
    GlobalScheduler& global = TheGlobalScheduler();
    MutexLock lock(global.mutex);
    return global.current;
}

shared_ptr<Scheduler> SetGlobalScheduler(shared_ptr<Scheduler> inScheduler) {
    GlobalScheduler& global = TheGlobalScheduler();
    MutexLock lock(global.mutex);
    if (!inScheduler) {
        inScheduler = global.system;
    }
    inScheduler.swap(global.current);
    return inScheduler;
}

}  // namespace threads
}  // namespace ostcore
