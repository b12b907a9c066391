// Brings completions to the main thread and waits for them.
#include "MainLoop.h"

#include <algorithm>
#include <memory>

#include "Failure.h"
#include "ostcore/threads/Executor.h"
#include "ostcore/threads/MainThread.h"

namespace zo {
namespace {

constexpr std::uint32_t kForEver = 0xFFFFFFFFu;
constexpr std::int64_t kLongestTurn = 60000;
/// The transport engine's number for a connection that is refused (libcurl-errors(3)).
constexpr int kCouldNotConnect = 7;

Outcome UnreachableHub() {
    Outcome outcome;
    outcome.started = true;
    outcome.result = ZOCL::kResultNoHTTPResponse;
    outcome.response = boost::make_shared<ostnet::Response>(ostnet::Response::kStatusNoResponse);
    outcome.response->curlError = kCouldNotConnect;
    return outcome;
}

}  // namespace

void MainLoop::Start(const StartFunction& inStart, const CancelFunction& inCancel, OutcomeFunction inDone) {
    if (mInterrupt.IsRequested()) {
        Outcome cancelled;
        cancelled.started = true;
        cancelled.result = ZOCL::kResultCancelled;
        inDone(cancelled);
        return;
    }
    Launch(inStart, inCancel, std::move(inDone));
}

void MainLoop::Launch(const StartFunction& inStart, const CancelFunction& inCancel, OutcomeFunction inDone) {
    const ZOCL::Guid request = ZOCL::Guid::CreateUnique();
    const std::size_t call = Add(request, inCancel);
    const auto done = std::make_shared<OutcomeFunction>(std::move(inDone));
    const auto onCompleted = [this, call, done](
                                 const ZOCL::Guid&, int inResult,
                                 const ZOCL::InterfaceRef<ZOCL::IZOCServerResource>& inResource,
                                 const boost::shared_ptr<ostnet::Response>& inResponse) {
        const Outcome outcome{true, inResult, inResponse, inResource};
        ostcore::threads::AsyncCallFromMainThread([this, call, done, outcome] {
            if (mInFlight.erase(call) > 0) {
                (*done)(outcome);
            }
        });
    };
    if (!inStart(request, onCompleted)) {
        mInFlight.erase(call);
        (*done)(Outcome{});
    }
}

void MainLoop::Wait() {
    PumpUntilIdle();
    ThrowIfInterrupted();
}

Outcome MainLoop::Run(const StartFunction& inStart, const CancelFunction& inCancel) {
    Outcome outcome;
    Start(inStart, inCancel, [&outcome](const Outcome& inOutcome) { outcome = inOutcome; });
    Wait();
    return outcome;
}

Outcome MainLoop::RunToEnd(const StartFunction& inStart) {
    if (mNetworkIsGivenUp) {
        return UnreachableHub();
    }
    Outcome outcome;
    Launch(
        inStart, [](const ZOCL::Guid&) {}, [&outcome](const Outcome& inOutcome) { outcome = inOutcome; });
    PumpUntilIdle();
    return mNetworkIsGivenUp ? UnreachableHub() : outcome;
}

void MainLoop::RunBlocking(const std::function<void()>& inFunction) {
    Run(
        [&inFunction](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
            return ostcore::threads::GetIOBoundExecutor()->Post([inFunction, inRequest, inCompletion] {
                inFunction();
                inCompletion(inRequest, ZOCL::kResultSuccess, nullptr, nullptr);
            });
        },
        [](const ZOCL::Guid&) { ZOCL::IZOCDataServer::Terminate(false); });
}

bool MainLoop::WaitUntil(const std::function<bool()>& inCondition, std::chrono::milliseconds inTime) {
    const auto end = std::chrono::steady_clock::now() + inTime;
    while (!inCondition()) {
        ThrowIfInterrupted();
        const auto left =
            std::chrono::ceil<std::chrono::milliseconds>(end - std::chrono::steady_clock::now());
        if (left.count() <= 0) {
            return false;
        }
        ostcore::threads::WaitAndPumpMainThread(
            static_cast<std::uint32_t>(std::min<std::int64_t>(left.count(), kLongestTurn)));
    }
    return true;
}

MainLoop::ConnectOutcome MainLoop::Connect(const ConnectStart& inStart) {
    ThrowIfInterrupted();
    const auto outcome = std::make_shared<ConnectOutcome>();
    ZOCL::Guid request;
    const std::size_t call = Add(
        request, [](const ZOCL::Guid& inRequest) { ZOCL::IZOCDataServer::CancelConnectRequest(inRequest); });
    outcome->started = inStart(
        request,
        [this, call, outcome](const ZOCL::Guid&, const ZOCL::InterfaceRef<ZOCL::IZOCDataServer>& inServer,
                              int inResult, const boost::shared_ptr<ostnet::Response>& inResponse) {
            ostcore::threads::AsyncCallFromMainThread([this, call, outcome, inServer, inResult, inResponse] {
                outcome->result = inResult;
                outcome->server = inServer;
                outcome->response = inResponse;
                mInFlight.erase(call);
            });
        });
    if (!outcome->started) {
        mInFlight.erase(call);
        return *outcome;
    }
    // The completion only queues, so the entry is still there although the identifier comes late.
    mInFlight.at(call).request = request;
    Wait();
    return *outcome;
}

void MainLoop::ThrowIfInterrupted() const {
    if (mInterrupt.IsRequested()) {
        throw Failure(ExitCode::Cancelled, "cancelled");
    }
    if (mNetworkIsGivenUp) {
        throw Failure(
            ExitCode::Network,
            "the hub could not be reached, or answered with errors alone, for more than 15 seconds",
            "check that the hub runs ('zo hub status' for a local one), then try again; 'zo status' and "
            "'zo history' tell whether a change had arrived");
    }
}

void MainLoop::GiveUpNetwork() {
    mNetworkIsGivenUp = true;
    mInFlight.clear();
}

void MainLoop::Drain() {
    if (!mInFlight.empty()) {
        CancelAll();
        PumpUntilIdle();
    }
}

std::size_t MainLoop::Add(const ZOCL::Guid& inRequest, const CancelFunction& inCancel) {
    mInFlight[++mLastCall] = Call{inRequest, inCancel};
    return mLastCall;
}

void MainLoop::CancelAll() {
    mCancelled = true;
    const std::map<std::size_t, Call> inFlight = mInFlight;
    for (const auto& [call, entry] : inFlight) {
        entry.cancel(entry.request);
    }
}

void MainLoop::PumpUntilIdle() {
    while (!mInFlight.empty()) {
        if (mInterrupt.IsRequested() && !mCancelled) {
            CancelAll();
        }
        ostcore::threads::WaitAndPumpMainThread(kForEver);
    }
}

}  // namespace zo
