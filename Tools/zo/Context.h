// What a verb works with: its arguments, the output, the main loop, and the hub once it is connected.
#pragma once

#include <memory>
#include <string>

#include "Arguments.h"
#include "Configuration.h"
#include "MainLoop.h"
#include "Output.h"
#include "RFL/Messaging.h"
#include "State.h"

namespace zo {

/// Which hub, and as whom.
struct Target {
    /// With scheme and port, as MakeDataServerURL writes it.
    std::string server;
    std::string user;
    bool secure = false;
    /// What the login named; empty when it named none.
    std::string authorityFile;
    /// Whether this user signed in at this hub, last of all hubs.
    bool isKnown = false;
};

/// The library while it runs: started as a headless host, ended when this object goes away, with nothing of
/// it left in flight.
///
/// With a person before it zo waits for a hub that is away; else it gives up after the library's 15 seconds.
class Library {
public:
    Library(MainLoop& inLoop, Output& ioOutput);
    ~Library();
    Library(const Library&) = delete;
    Library& operator=(const Library&) = delete;

private:
    void OnNetworkState(bool inIsDown);

    MainLoop& mLoop;
    Output& mOutput;
    bool mNetworkIsDown = false;
    std::unique_ptr<RFL::Listener> mListener;
};

/// Main thread only.
class Context {
public:
    Context(const Arguments& inArguments, Output& ioOutput, Interrupt& inInterrupt)
        : mArguments(inArguments), mOutput(ioOutput), mInterrupt(inInterrupt), mLoop(inInterrupt) {}

    const Arguments& Args() const noexcept { return mArguments; }
    Output& Out() noexcept { return mOutput; }
    Interrupt& Signals() noexcept { return mInterrupt; }
    MainLoop& Loop() noexcept { return mLoop; }
    State& Remembered() noexcept { return mState; }
    const Configuration& Settings();

    /// Starts the library, once.
    void StartLibrary();
    /// The hub and user that flags, environment, former logins (newest first) and the configuration name, in
    /// this order. The user may be empty. Throws a Failure (usage) when no hub is named, or badly.
    Target FindTarget();
    /// Connects with the token of a former login; afterwards the same server again.
    ZOCL::InterfaceRef<ZOCL::IZOCDataServer> Server();
    /// The target of Server().
    const Target& ConnectedTarget() const noexcept { return mTarget; }

private:
    std::string Complete(const std::string& inServer) const;

    const Arguments& mArguments;
    Output& mOutput;
    Interrupt& mInterrupt;
    MainLoop mLoop;
    State mState;
    std::unique_ptr<Configuration> mConfiguration;
    Target mTarget;
    // Before the server reference, so that the library goes after it.
    std::unique_ptr<Library> mLibrary;
    ZOCL::InterfaceRef<ZOCL::IZOCDataServer> mServer;
};

/// What --ca and --proxy say.
TransportFlags TransportFlagsOf(const Arguments& inArguments);

}  // namespace zo
