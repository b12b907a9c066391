// Calls that come later, over the scheduler.
#include "ostcore/threads/DelayedCall.h"

#include <chrono>
#include <thread>

#include "ostcore/threads/Mutex.h"

namespace ostcore {
namespace threads {
namespace {

/// A call that either begins or is cancelled: whoever changes the state first owns the function.
class PendingCall final : public DelayedCall, public enable_shared_from_this<PendingCall> {
public:
    PendingCall(shared_ptr<Executor> inExecutor, function<void()> inFunction)
        : mExecutor(std::move(inExecutor)), mFunction(std::move(inFunction)) {}

    bool Start(const shared_ptr<Scheduler>& inScheduler, std::uint32_t inMilliseconds) {
        mScheduler = inScheduler;
        const auto self = shared_from_this();
        const Scheduler::TimerID timer =
            inScheduler->Schedule(std::chrono::milliseconds(inMilliseconds), [self] { self->OnTime(); });
        mTimer.store(timer, std::memory_order_release);
        return timer != Scheduler::kNoTimer;
    }

    bool Cancel() override {
        if (!Claim()) {
            return false;
        }
        if (const shared_ptr<Scheduler> scheduler = mScheduler.lock()) {
            scheduler->Cancel(mTimer.load(std::memory_order_acquire));
        }
        mFunction.clear();
        return true;
    }

private:
    bool Claim() { return !mIsClaimed.exchange(true, std::memory_order_acq_rel); }

    void OnTime() {
        if (!mExecutor) {
            Run();
            return;
        }
        const auto self = shared_from_this();
        if (!mExecutor->Post([self] { self->Run(); }) && Claim()) {
            mFunction.clear();
        }
    }

    void Run() {
        if (!Claim()) {
            return;
        }
        function<void()> run;
        run.swap(mFunction);
        run();
    }

    const shared_ptr<Executor> mExecutor;
    function<void()> mFunction;      // belongs to whoever claimed the call
    weak_ptr<Scheduler> mScheduler;  // weak: the scheduler holds the call while it waits
    std::atomic<bool> mIsClaimed{false};
    std::atomic<Scheduler::TimerID> mTimer{Scheduler::kNoTimer};
};

}  // namespace

DelayedCall::~DelayedCall() = default;

shared_ptr<DelayedCall> PostDelayed(const shared_ptr<Executor>& inExecutor, function<void()> inFunction,
                                    std::uint32_t inMilliseconds) {
    if (!inFunction) {
        return {};
    }
    const auto call = boost::make_shared<PendingCall>(inExecutor, std::move(inFunction));
    return call->Start(GetGlobalScheduler(), inMilliseconds) ? call : shared_ptr<DelayedCall>();
}

// ---------------------------------------------------------------------------------------------------------

/// Each queued call has a number; only the call whose number is current runs, so a cancel just moves on.
class DeferredCaller::Core : public enable_shared_from_this<DeferredCaller::Core> {
public:
    Core(shared_ptr<Executor> inExecutor, function<void()> inFunction)
        : mExecutor(std::move(inExecutor)), mFunction(std::move(inFunction)) {}

    bool Queue(std::uint32_t inMilliseconds) ZO_EXCLUDES(mMutex) {
        std::uint64_t number = 0;
        {
            MutexLock lock(mMutex);
            if (mIsQueued) {
                return true;
            }
            mIsQueued = true;
            number = ++mNumber;
        }
        const auto ticket = boost::make_shared<Ticket>(shared_from_this(), number);
        const auto call = PostDelayed(
            mExecutor, [ticket] { ticket->Run(); }, inMilliseconds);
        return call && Attach(number, call);
    }

    void Cancel() ZO_EXCLUDES(mMutex) {
        shared_ptr<DelayedCall> waiting;
        {
            MutexLock lock(mMutex);
            mIsQueued = false;
            ++mNumber;
            waiting.swap(mWaiting);
        }
        if (waiting) {
            waiting->Cancel();
        }
    }

private:
    /// Travels with the call. Lost without a run (the executor was stopped), it frees the place.
    class Ticket {
    public:
        Ticket(shared_ptr<Core> inCore, std::uint64_t inNumber)
            : mCore(std::move(inCore)), mNumber(inNumber) {}
        ~Ticket() { mCore->Leave(mNumber); }
        Ticket(const Ticket&) = delete;
        Ticket& operator=(const Ticket&) = delete;
        void Run() {
            if (mCore->Leave(mNumber)) {
                mCore->mFunction();
            }
        }

    private:
        const shared_ptr<Core> mCore;
        const std::uint64_t mNumber;
    };

    // Keeps the handle of a call that still waits; cancels that of one that was cancelled meanwhile.
    bool Attach(std::uint64_t inNumber, const shared_ptr<DelayedCall>& inCall) ZO_EXCLUDES(mMutex) {
        {
            MutexLock lock(mMutex);
            if (mNumber == inNumber) {
                if (mIsQueued) {
                    mWaiting = inCall;
                }
                return true;
            }
        }
        inCall->Cancel();
        return true;
    }

    // True for the call that is current: it leaves the queue now.
    bool Leave(std::uint64_t inNumber) ZO_EXCLUDES(mMutex) {
        shared_ptr<DelayedCall> ended;
        MutexLock lock(mMutex);
        if (!mIsQueued || mNumber != inNumber) {
            return false;
        }
        mIsQueued = false;
        ended.swap(mWaiting);
        return true;
    }

    const shared_ptr<Executor> mExecutor;
    const function<void()> mFunction;
    Mutex mMutex;
    bool mIsQueued ZO_GUARDED_BY(mMutex) = false;
    std::uint64_t mNumber ZO_GUARDED_BY(mMutex) = 0;
    shared_ptr<DelayedCall> mWaiting ZO_GUARDED_BY(mMutex);
};

DeferredCaller::DeferredCaller(shared_ptr<Executor> inExecutor, function<void()> inFunction)
    : mCore(boost::make_shared<Core>(std::move(inExecutor), std::move(inFunction))) {}
DeferredCaller::~DeferredCaller() {
    mCore->Cancel();
}
bool DeferredCaller::QueueOnlyOnce(std::uint32_t inMilliseconds) {
    return mCore->Queue(inMilliseconds);
}
void DeferredCaller::Cancel() {
    mCore->Cancel();
}

}  // namespace threads
}  // namespace ostcore
