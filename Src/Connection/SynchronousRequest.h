// How a thread waits for a request that another thread completes.
#pragma once

#include <cstdint>

#include "ostcore/threads/Gate.h"
#include "ostnet/http/RequestProcessor.h"
#include "ZOClient/Types.h"

namespace ZOCL {

/// What the completion leaves for the one who waits.
class SynchronousCompletionData {
public:
    /// Both are called once, by the completion and after the wait.
    void Complete(const shared_ptr<ostnet::Response>& inResponse) {
        mResponse = inResponse;
        mGate.Open();
    }
    const shared_ptr<ostnet::Response>& Response() const noexcept { return mResponse; }
    ostcore::threads::Gate& Gate() noexcept { return mGate; }

private:
    ostcore::threads::Gate mGate;
    shared_ptr<ostnet::Response> mResponse;
};

/// Waits until the gate opens. On the main thread for as long as it takes, with a call of the function every
/// 1500 milliseconds, so that the user learns what the wait is for; elsewhere the time-out, when it passes,
/// cancels the request, and the wait goes on for the end that this brings.
void WaitForRequest(ostcore::threads::Gate& ioGate, const Guid& inRequestID,
                    std::uint32_t inTimeoutMilliseconds, ostnet::http::RequestProcessor& ioTop,
                    const function<void()>& inWhileMainThreadWaits);

/// How many threads now wait for a request that the base processor serves meanwhile.
int CountOfBlockedWaits() noexcept;

}  // namespace ZOCL
