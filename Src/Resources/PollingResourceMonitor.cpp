// The chains of checks and polls.
#include "Resources/PollingResourceMonitor.h"

#include <algorithm>
#include <mutex>

#include "ostcore/debug/DebugDatabase.h"
#include "ostcore/debug/Trace.h"
#include "ostcore/threads/DelayedCall.h"
#include "PollCancellation.h"
#include "Resources/JoinText.h"
#include "ZOClient/IZOCServerResource.h"

namespace ZOCL {

using ostcore::threads::AsyncThreadedExecutor;
using ostcore::threads::DelayedCall;
using ostcore::threads::MutexLock;
using ostcore::threads::ScopedLock;

namespace {

std::once_flag gOnce;
std::atomic<PollingResourceMonitor*> gMonitor{nullptr};

void TraceThrown(const char* inWhat, const char* inText) {
    if (ostcore::debug::TraceEnabled("ZOCL", ostcore::debug::kTraceLevel_Error)) {
        ostcore::debug::Trace("ZOCL", ostcore::debug::kTraceLevel_Error,
                              JoinText("PollingResourceMonitor: ", std::string_view(inWhat),
                                       " has thrown: ", std::string_view(inText)));
    }
}

/// False when the function has thrown.
bool RunGuarded(const char* inWhat, const function<void()>& inFunction) {
    try {
        inFunction();
        return true;
    } catch (const std::exception& error) {
        TraceThrown(inWhat, error.what());
    } catch (...) {
        TraceThrown(inWhat, "something that is no std::exception");
    }
    return false;
}

}  // namespace

/// One subscription's checks and polls. It lives in what comes next: a timer, a turn of the executor, or the
/// completion of a request.
class PollingResourceMonitor::Chain : public enable_shared_from_this<Chain> {
public:
    Chain(const shared_ptr<ServerResourceChangeNotifier>& inNotifier,
          const shared_ptr<AsyncThreadedExecutor>& inExecutor, std::uint32_t inInterval)
        : mNotifier(inNotifier), mExecutor(inExecutor), mInterval(inInterval) {}

    void Check() {
        if (!GoesOn()) {
            return;
        }
        const InterfaceRef<IZOCServerResource>& resource = mNotifier->GetResource();
        if (resource->GetETag(true) != mNotifier->GetETag()) {
            RunGuarded("a subscriber", [&] { mNotifier->Notify(resource); });
        }
        PollAfterInterval();
    }

    /// So that neither resource nor server is held until the interval has passed.
    void CancelTimer() {
        shared_ptr<DelayedCall> timer;
        {
            MutexLock lock(mMutex);
            timer = mTimer.lock();
        }
        if (timer) {
            timer->Cancel();
        }
    }

private:
    bool GoesOn() const { return !mNotifier->IsStopped() && !mExecutor->IsStopped(); }

    void PollAfterInterval() {
        if (!GoesOn()) {
            return;
        }
        const auto self = shared_from_this();
        const shared_ptr<DelayedCall> timer = ostcore::threads::PostDelayed(
            mExecutor, [self] { self->Poll(); }, mInterval);
        {
            MutexLock lock(mMutex);
            mTimer = timer;
        }
        // A cancellation between the two has not seen this timer.
        if (mExecutor->IsStopped()) {
            CancelTimer();
        }
    }

    void Poll() {
        if (!GoesOn()) {
            return;
        }
        if (ostcore::debug::DebugDatabase::GetBool("ZOClient.DisablePollingResourceMonitor", false) ||
            !StartRefresh()) {
            Check();
        }
    }

    bool StartRefresh() {
        const auto self = shared_from_this();
        const auto onRefreshed = [self](const Guid&, int, const InterfaceRef<IZOCServerResource>&,
                                        const shared_ptr<ostnet::Response>&) { self->Check(); };
        bool hasStarted = false;
        RunGuarded("a refresh", [&] {
            hasStarted = mNotifier->GetResource()->Refresh(Guid::CreateUnique(), onRefreshed);
        });
        return hasStarted;
    }

    const shared_ptr<ServerResourceChangeNotifier> mNotifier;
    const shared_ptr<AsyncThreadedExecutor> mExecutor;
    const std::uint32_t mInterval;
    ostcore::threads::Mutex mMutex;
    /// Weak: the timer holds the chain.
    weak_ptr<DelayedCall> mTimer ZO_GUARDED_BY(mMutex);
};

PollingResourceMonitor& PollingResourceMonitor::Get() {
    std::call_once(gOnce, [] { gMonitor.store(new PollingResourceMonitor, std::memory_order_release); });
    return *gMonitor.load(std::memory_order_acquire);
}

shared_ptr<AsyncThreadedExecutor> PollingResourceMonitor::GetExecutorLocked() {
    if (!mExecutor) {
        mExecutor = ostcore::threads::CreateSubExecutor(ostcore::threads::CreateCPUBoundExecutor("polls"));
    }
    return mExecutor;
}

shared_ptr<ServerResourceChangeNotifier> PollingResourceMonitor::SubscribeToChanges(
    const InterfaceRef<IZOCServerResource>& inResource,
    const ServerResourceChangeNotifier::Function& inFunction, std::uint32_t inInterval,
    bool inNotifyWhenUnloaded) {
    if (!inResource) {
        return nullptr;
    }
    const auto notifier =
        boost::make_shared<ServerResourceChangeNotifier>(inResource, inFunction, inNotifyWhenUnloaded);
    shared_ptr<Chain> chain;
    {
        ScopedLock lock(mMutex, "PollingResourceMonitor::SubscribeToChanges");
        const shared_ptr<AsyncThreadedExecutor> executor = GetExecutorLocked();
        if (!executor) {
            return nullptr;
        }
        chain = boost::make_shared<Chain>(notifier, executor, inInterval);
        mChains.erase(std::remove_if(mChains.begin(), mChains.end(),
                                     [](const weak_ptr<Chain>& inChain) { return inChain.expired(); }),
                      mChains.end());
        mChains.push_back(chain);
    }
    chain->Check();
    return notifier;
}

void PollingResourceMonitor::Cancel(bool inWait) {
    shared_ptr<AsyncThreadedExecutor> executor;
    std::vector<weak_ptr<Chain>> chains;
    {
        ScopedLock lock(mMutex, "PollingResourceMonitor::CancelAllOutstandingPolls");
        executor.swap(mExecutor);
        chains.swap(mChains);
    }
    if (!executor) {
        return;
    }
    executor->Stop();
    for (const weak_ptr<Chain>& weak : chains) {
        if (const shared_ptr<Chain> chain = weak.lock()) {
            chain->CancelTimer();
        }
    }
    if (inWait) {
        executor->Wait(ostcore::threads::kForever);
    }
}

void PollingResourceMonitor::CancelAllOutstandingPolls(bool inWait) {
    if (PollingResourceMonitor* const monitor = gMonitor.load(std::memory_order_acquire)) {
        monitor->Cancel(inWait);
    }
}

PollCancellation* GetPollCancellation() {
    class Cancellation final : public PollCancellation {
        void CancelAllOutstandingPolls() override {
            PollingResourceMonitor::CancelAllOutstandingPolls(false);
        }
    };
    static Cancellation cancellation;
    return &cancellation;
}

}  // namespace ZOCL
