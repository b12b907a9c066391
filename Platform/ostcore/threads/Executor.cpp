// The kinds of executor, each a queue over the threads that fit its work.
#include "ostcore/threads/Executor.h"

#include "ostcore/threads/detail/ExecutorCore.h"
#include "ostcore/threads/detail/GuardedCall.h"
#include "ostcore/threads/detail/ThreadPools.h"

namespace ostcore {
namespace threads {
namespace {

/// The handle that callers hold; see the header for what its end means.
class QueueExecutor : public AsyncThreadedExecutor {
public:
    explicit QueueExecutor(shared_ptr<ExecutorCore> inCore) : mCore(std::move(inCore)) {}

    bool Post(function<void()> inFunction) override { return mCore->Post(std::move(inFunction)); }
    void Stop() override { mCore->Stop(); }
    bool IsStopped() const override { return mCore->IsStopped(); }
    bool Wait(std::uint32_t inMilliseconds) override { return mCore->Wait(inMilliseconds); }

private:
    const shared_ptr<ExecutorCore> mCore;
};

/// Belongs to everybody, so nobody can stop it.
class SharedExecutor final : public QueueExecutor {
public:
    using QueueExecutor::QueueExecutor;
    void Stop() override {}
};

shared_ptr<ExecutorCore> MakeCore(const char* inLabel, std::size_t inWidth,
                                  ExecutorCore::Dispatch inDispatch) {
    return boost::make_shared<ExecutorCore>(inLabel, inWidth, std::move(inDispatch));
}

}  // namespace

Executor::~Executor() = default;

shared_ptr<AsyncThreadedExecutor> CreateIOBoundExecutor(const char* inLabel) {
    return boost::make_shared<QueueExecutor>(MakeCore(inLabel, ExecutorCore::kParallel, RunOnIOThreads));
}

shared_ptr<AsyncThreadedExecutor> GetIOBoundExecutor() {
    static const auto* const shared = new shared_ptr<AsyncThreadedExecutor>(
        boost::make_shared<SharedExecutor>(MakeCore("shared io", ExecutorCore::kParallel, RunOnIOThreads)));
    return *shared;
}

shared_ptr<AsyncThreadedExecutor> CreateCPUBoundExecutor(const char* inLabel) {
    return boost::make_shared<QueueExecutor>(MakeCore(inLabel, ExecutorCore::kParallel, RunOnCPUThreads));
}

shared_ptr<AsyncThreadedExecutor> CreateSubExecutor(const shared_ptr<Executor>& inParent) {
    if (!inParent) {
        return {};
    }
    const auto postOnParent = [inParent](function<void()> inTurn) {
        return inParent->Post(std::move(inTurn));
    };
    return boost::make_shared<QueueExecutor>(MakeCore("sub", ExecutorCore::kSerial, postOnParent));
}

shared_ptr<AsyncThreadedExecutor> CreateAsyncEventLoopExecutor(const char* inLabel) {
    ExecutorCore::Dispatch loop = MakeThreadLoop();
    if (!loop) {
        return {};
    }
    return boost::make_shared<QueueExecutor>(MakeCore(inLabel, ExecutorCore::kSerial, std::move(loop)));
}

// ---------------------------------------------------------------------------------------------------------

class ManualExecutor::Core {
public:
    bool Post(function<void()> inFunction) ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        if (mIsStopped || !inFunction) {
            return false;
        }
        mQueue.push_back(std::move(inFunction));
        return true;
    }

    void Stop() ZO_EXCLUDES(mMutex) {
        std::deque<function<void()>> dropped;
        MutexLock lock(mMutex);
        mIsStopped = true;
        dropped.swap(mQueue);
        lock.Unlock();
    }

    bool IsStopped() const ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        return mIsStopped;
    }

    std::size_t Size() const ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        return mQueue.size();
    }

    function<void()> TakeNext() ZO_EXCLUDES(mMutex) {
        function<void()> next;
        MutexLock lock(mMutex);
        if (!mQueue.empty()) {
            next.swap(mQueue.front());
            mQueue.pop_front();
        }
        return next;
    }

private:
    mutable Mutex mMutex;
    std::deque<function<void()>> mQueue ZO_GUARDED_BY(mMutex);
    bool mIsStopped ZO_GUARDED_BY(mMutex) = false;
};

ManualExecutor::ManualExecutor() : mCore(boost::make_shared<Core>()) {}
ManualExecutor::~ManualExecutor() = default;
bool ManualExecutor::Post(function<void()> inFunction) {
    return mCore->Post(std::move(inFunction));
}
void ManualExecutor::Stop() {
    mCore->Stop();
}
bool ManualExecutor::IsStopped() const {
    return mCore->IsStopped();
}
bool ManualExecutor::Wait(std::uint32_t) {
    return mCore->Size() == 0;
}
std::size_t ManualExecutor::PendingCount() const {
    return mCore->Size();
}

bool ManualExecutor::RunOne() {
    const shared_ptr<Core> core = mCore;
    const function<void()> next = core->TakeNext();
    if (!next) {
        return false;
    }
    CallGuarded(next, "a manual executor");
    return true;
}

std::size_t ManualExecutor::RunAll() {
    const shared_ptr<Core> core = mCore;
    std::size_t count = 0;
    while (const function<void()> next = core->TakeNext()) {
        CallGuarded(next, "a manual executor");
        ++count;
    }
    return count;
}

}  // namespace threads
}  // namespace ostcore
