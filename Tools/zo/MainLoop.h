// Waits on the main thread for asynchronous calls of the library, and cancels them on Ctrl-C.
#pragma once

#include <chrono>
#include <functional>
#include <map>

#include "Interrupt.h"
#include "ZOClient/IZOCDataServer.h"

namespace zo {

/// How one asynchronous call ended.
struct Outcome {
    /// False when the call could not be started; nothing else counts then.
    bool started = false;
    int result = ZOCL::kResultNotStarted;
    boost::shared_ptr<ostnet::Response> response;
    ZOCL::InterfaceRef<ZOCL::IZOCServerResource> resource;

    bool Succeeded() const noexcept { return started && result >= 0; }
};

/// Starts a call with the request identifier and completion that it is given.
using StartFunction = std::function<bool(const ZOCL::Guid&, const ZOCL::RequestCompletion&)>;
using CancelFunction = std::function<void(const ZOCL::Guid&)>;
using OutcomeFunction = std::function<void(const Outcome&)>;

/// The library completes on its own threads; here each completion is handed to the main thread, so that
/// verbs need no locks. One function waits for everything that was started.
///
/// An interrupt cancels all calls in flight, once; they still complete, and Wait returns when they have.
/// When the network is given up, nothing is waited for any more, and what completes later is not looked at.
/// Main thread only.
class MainLoop {
public:
    explicit MainLoop(Interrupt& inInterrupt) : mInterrupt(inInterrupt) {}

    /// Starts a call; inDone runs in Wait, on the main thread. When an interrupt has come nothing is started
    /// and inDone learns of a cancelled call. inDone must not throw.
    void Start(const StartFunction& inStart, const CancelFunction& inCancel, OutcomeFunction inDone);
    /// Returns when nothing is in flight. Throws a Failure (cancelled) after an interrupt.
    void Wait();
    /// Starts one call and waits for it and for all others in flight.
    Outcome Run(const StartFunction& inStart, const CancelFunction& inCancel);
    /// The same for a call that must come to its end, such as giving back what was taken: it is started also
    /// after an interrupt, and is not cancelled by one. Throws nothing: with a network that is given up it is
    /// the outcome of a hub that cannot be reached.
    Outcome RunToEnd(const StartFunction& inStart);
    /// Runs something that blocks on another thread and waits for it. An interrupt ends the use of the hub,
    /// and with it what the function blocks on. The function must own all that it uses.
    void RunBlocking(const std::function<void()>& inFunction);
    /// Returns true when the condition holds, false when the time is over. It is asked after each piece of
    /// work of the main thread. Throws a Failure (cancelled) after an interrupt.
    bool WaitUntil(const std::function<bool()>& inCondition, std::chrono::milliseconds inTime);

    struct ConnectOutcome {
        bool started = false;
        int result = ZOCL::kResultNotStarted;
        boost::shared_ptr<ostnet::Response> response;
        ZOCL::InterfaceRef<ZOCL::IZOCDataServer> server;
    };
    using ConnectStart = std::function<bool(ZOCL::Guid&, const ZOCL::IZOCDataServer::ConnectCompletion&)>;
    ConnectOutcome Connect(const ConnectStart& inStart);

    std::size_t InFlight() const noexcept { return mInFlight.size(); }
    /// Throws also when the network is given up (network).
    void ThrowIfInterrupted() const;
    /// The hub did not come back in time: ends all waits.
    void GiveUpNetwork();
    bool IsInterrupted() const noexcept { return mInterrupt.IsRequested(); }
    /// Cancels what is in flight and waits for its end. For the way out after a failure.
    void Drain();

private:
    struct Call {
        ZOCL::Guid request;
        CancelFunction cancel;
    };
    void Launch(const StartFunction& inStart, const CancelFunction& inCancel, OutcomeFunction inDone);
    std::size_t Add(const ZOCL::Guid& inRequest, const CancelFunction& inCancel);
    void CancelAll();
    void PumpUntilIdle();

    Interrupt& mInterrupt;
    bool mCancelled = false;
    bool mNetworkIsGivenUp = false;
    std::size_t mLastCall = 0;
    std::map<std::size_t, Call> mInFlight;
};

}  // namespace zo
