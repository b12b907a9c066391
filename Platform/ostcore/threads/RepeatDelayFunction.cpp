// A function once every period, without overlap, until stopped.
#include <chrono>
#include <thread>

#include "ostcore/threads/DelayedCall.h"
#include "ostcore/threads/Mutex.h"

namespace ostcore {
namespace threads {

/// The timer arms itself anew before it makes the call, from the time at which it should have rung, so that a
/// slow call or a late timer does not shift the beat.
class RepeatDelayFunction::Core : public enable_shared_from_this<RepeatDelayFunction::Core> {
public:
    Core(const shared_ptr<Scheduler>& inScheduler, shared_ptr<Executor> inExecutor,
         function<void()> inFunction, std::uint32_t inPeriod)
        : mExecutor(std::move(inExecutor)),
          mPeriod(std::chrono::milliseconds(std::max<std::uint32_t>(inPeriod, 1))),
          mScheduler(inScheduler),
          mFunction(std::move(inFunction)) {}

    void Start(const shared_ptr<Scheduler>& inScheduler) ZO_EXCLUDES(mMutex) {
        {
            MutexLock lock(mMutex);
            mNextTime = inScheduler->Now() + mPeriod;
        }
        Arm(inScheduler, mPeriod);
    }

    void Stop() ZO_EXCLUDES(mMutex) {
        Scheduler::TimerID timer = Scheduler::kNoTimer;
        {
            MutexLock lock(mMutex);
            mIsStopped = true;
            std::swap(timer, mTimer);
        }
        if (const shared_ptr<Scheduler> scheduler = mScheduler.lock()) {
            scheduler->Cancel(timer);
        }
        MutexLock lock(mMutex);
        while (mIsRunning && mRunner != std::this_thread::get_id()) {
            mEnded.Wait(lock);
        }
    }

private:
    void Arm(const shared_ptr<Scheduler>& inScheduler, Duration inDelay) ZO_EXCLUDES(mMutex) {
        const auto self = shared_from_this();
        const Scheduler::TimerID timer = inScheduler->Schedule(inDelay, [self] { self->OnTime(); });
        {
            MutexLock lock(mMutex);
            if (!mIsStopped) {
                mTimer = timer;
                return;
            }
        }
        inScheduler->Cancel(timer);
    }

    void OnTime() ZO_EXCLUDES(mMutex) {
        const shared_ptr<Scheduler> scheduler = mScheduler.lock();
        if (!scheduler) {
            return;
        }
        const MonotonicTime now = scheduler->Now();
        Duration delay{};
        bool mustCall = false;
        {
            MutexLock lock(mMutex);
            if (mIsStopped) {
                return;
            }
            mNextTime = std::max(mNextTime + mPeriod, now);
            delay = mNextTime - now;
            mustCall = !mIsBusy;
            mIsBusy = true;
        }
        Arm(scheduler, delay);
        if (mustCall) {
            StartCall();
        }
    }

    void StartCall() ZO_EXCLUDES(mMutex) {
        if (!mExecutor) {
            Run();
            return;
        }
        const auto self = shared_from_this();
        if (!mExecutor->Post([self] { self->Run(); })) {
            MutexLock lock(mMutex);
            mIsBusy = false;
        }
    }

    void Run() ZO_EXCLUDES(mMutex) {
        {
            MutexLock lock(mMutex);
            if (mIsStopped) {
                mIsBusy = false;
                return;
            }
            mIsRunning = true;
            mRunner = std::this_thread::get_id();
        }
        const RunningMark mark(*this);
        mFunction();
    }

    void EndRun() ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        mIsRunning = false;
        mIsBusy = false;
        mEnded.NotifyAll();
    }

    /// Ends the run however the function is left.
    class RunningMark {
    public:
        explicit RunningMark(Core& inCore) : mCore(inCore) {}
        ~RunningMark() { mCore.EndRun(); }
        RunningMark(const RunningMark&) = delete;
        RunningMark& operator=(const RunningMark&) = delete;

    private:
        Core& mCore;
    };

    const shared_ptr<Executor> mExecutor;
    const Duration mPeriod;
    const weak_ptr<Scheduler> mScheduler;  // weak: the scheduler holds this while the timer runs
    const function<void()> mFunction;

    Mutex mMutex;
    ConditionVariable mEnded;
    MonotonicTime mNextTime ZO_GUARDED_BY(mMutex);
    Scheduler::TimerID mTimer ZO_GUARDED_BY(mMutex) = Scheduler::kNoTimer;
    bool mIsStopped ZO_GUARDED_BY(mMutex) = false;
    bool mIsBusy ZO_GUARDED_BY(mMutex) = false;  // a call was posted and has not ended
    bool mIsRunning ZO_GUARDED_BY(mMutex) = false;
    std::thread::id mRunner ZO_GUARDED_BY(mMutex);
};

RepeatDelayFunction::RepeatDelayFunction(shared_ptr<Executor> inExecutor, function<void()> inFunction,
                                         std::uint32_t inPeriodMilliseconds) {
    const shared_ptr<Scheduler> scheduler = GetGlobalScheduler();
    mCore = boost::make_shared<Core>(scheduler, std::move(inExecutor), std::move(inFunction),
                                     inPeriodMilliseconds);
    mCore->Start(scheduler);
}

RepeatDelayFunction::~RepeatDelayFunction() {
    mCore->Stop();
}

void RepeatDelayFunction::Stop() {
    mCore->Stop();
}

}  // namespace threads
}  // namespace ostcore
