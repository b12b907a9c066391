// The waits of the blocking calls.
#include "Connection/SynchronousRequest.h"

#include <atomic>

#include "ostcore/threads/MainThread.h"

namespace ZOCL {

using ostcore::threads::Gate;

namespace {

/// How long the main thread sleeps at a stretch.
constexpr std::uint32_t kMainThreadWaitMilliseconds = 1500;

std::atomic<int> gBlockedWaits{0};

class BlockedWaitCount {
public:
    explicit BlockedWaitCount(bool inIsServed) : mIsServed(inIsServed) { gBlockedWaits += mIsServed ? 1 : 0; }
    ~BlockedWaitCount() { gBlockedWaits -= mIsServed ? 1 : 0; }
    BlockedWaitCount(const BlockedWaitCount&) = delete;
    BlockedWaitCount& operator=(const BlockedWaitCount&) = delete;

private:
    const bool mIsServed;
};

}  // namespace

int CountOfBlockedWaits() noexcept {
    return gBlockedWaits;
}

void WaitForRequest(Gate& ioGate, const Guid& inRequestID, std::uint32_t inTimeoutMilliseconds,
                    ostnet::http::RequestProcessor& ioTop, const function<void()>& inWhileMainThreadWaits) {
    const BlockedWaitCount count(ioTop.WaitingForRequest(inRequestID, inTimeoutMilliseconds));
    if (ostcore::threads::IsMainThread()) {
        while (!Gate::PassThrough(ioGate, kMainThreadWaitMilliseconds)) {
            inWhileMainThreadWaits();
        }
        return;
    }
    if (!Gate::PassThrough(ioGate, inTimeoutMilliseconds)) {
        ioTop.TryToCancelRequest(inRequestID);
        Gate::PassThrough(ioGate, Gate::kWaitForever);
    }
}

}  // namespace ZOCL
