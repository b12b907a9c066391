// Starts the library, finds out which hub is meant, and connects to it.
#include "Context.h"

#include <algorithm>
#include <utility>

#include "Failure.h"
#include "HLM/HLM.h"
#include "ostcore/config/ClientInfo.h"
#include "ostcore/debug/Trace.h"
#include "ostui/BackEnd.h"
#include "ostui/TerminalBackEnd.h"
#include "RFL/Registry.h"
#include "ServerAddress.h"
#include "StoredToken.h"
#include "ZOClient/Library.h"
#include "ZOClient/Messages.h"

#ifndef ZO_VERSION
#define ZO_VERSION "0"
#endif

namespace zo {
namespace {

// The first of the places that has something to say.
std::string FirstOf(std::initializer_list<std::optional<std::string>> inPlaces) {
    for (const auto& place : inPlaces) {
        if (place && !place->empty()) {
            return *place;
        }
    }
    return {};
}

}  // namespace

Library::Library(MainLoop& inLoop, Output& ioOutput) : mLoop(inLoop), mOutput(ioOutput) {
    HLM::SetIsHeadless(true);
    HLM::SetWaitsForNetwork(mOutput.HasPerson());
    // A login that is lost ends the verb's own requests, and with them the verb, by its exit code.
    HLM::SetEndProcessFunction([this] {
        if (mNetworkIsDown) {
            mLoop.GiveUpNetwork();
        }
    });
    // What the library calls fatal is told by the verb in its own words. Who wants traces has asked for them.
    if (!ostcore::debug::TraceEnabled("zo", ostcore::debug::kTraceLevel_Error)) {
        ostcore::debug::SetTraceLevel("*", ostcore::debug::kTraceLevel_Off);
    }
    ostcore::config::SetClientName("zo");
    ostcore::config::SetClientBuildNumber(ZO_VERSION);
    ZOCL::Initialize();
    mListener = std::make_unique<RFL::Listener>(ZOCL::GetStationID());
    mListener->AddHandler<ZOCL::ZONetworkStateMessage>(
        [this](const ZOCL::ZONetworkStateMessage& inMessage) { OnNetworkState(inMessage.isDown); });
    ostui::TerminalSettings terminal;
    if (!mOutput.HasPerson()) {
        terminal.input = -1;  // no terminal: nothing is asked
    }
    terminal.isInterrupted = [this] { return mLoop.IsInterrupted(); };
    ostui::SetBackEnd(ostui::CreateTerminalBackEnd(terminal));
}

void Library::OnNetworkState(bool inIsDown) {
    // A window that is up says so itself.
    if (std::exchange(mNetworkIsDown, inIsDown) == inIsDown || !ostui::GetRunningDialogs().empty()) {
        return;
    }
    mOutput.Note(!inIsDown ? "the hub is back"
                 : mOutput.HasPerson()
                     ? "the hub cannot be reached; waiting until it is back (Ctrl-C ends it)"
                     : "the hub cannot be reached; trying for 15 seconds");
}

Library::~Library() {
    mLoop.Drain();
    mListener.reset();
    HLM::SetEndProcessFunction({});
    ostui::SetBackEnd(nullptr);
    ZOCL::IZOCDataServer::Terminate(false);
    ZOCL::Shutdown();
    // The last one to close brings the registry's journal into its file, so that what was deleted is gone.
    RFL::CloseRegistry();
}

const Configuration& Context::Settings() {
    if (!mConfiguration) {
        mConfiguration = std::make_unique<Configuration>(Configuration::Load());
    }
    return *mConfiguration;
}

void Context::StartLibrary() {
    if (!mLibrary) {
        mLibrary = std::make_unique<Library>(mLoop, mOutput);
    }
}

Target Context::FindTarget() {
    if (mArguments.Has("plain") && mArguments.Has("secure")) {
        throw Failure(ExitCode::Usage, "--plain and --secure exclude each other");
    }
    const std::string namedServer = FirstOf({mArguments.Value("server"), Environment("ZOCLIENT_SERVER")});
    const std::string namedUser = FirstOf({mArguments.Value("user"), Environment("ZOCLIENT_USER")});
    Target target;
    target.server = namedServer.empty() ? std::string() : Complete(namedServer);
    target.user = namedUser;
    const std::vector<LoginRecord> logins = mState.Logins();
    const auto login = std::find_if(logins.begin(), logins.end(), [&](const LoginRecord& inLogin) {
        return (target.server.empty() || inLogin.server == target.server) &&
               (target.user.empty() || inLogin.user == target.user);
    });
    if (login != logins.end()) {
        target.server = login->server;
        target.user = login->user;
        target.authorityFile = login->authorityFile;
        target.isKnown = true;
    }
    if (target.server.empty()) {
        target.server = Complete(Settings().Value("server").value_or(""));
    }
    if (target.user.empty()) {
        target.user = Settings().Value("user").value_or("");
    }
    if (!IsUsableUserName(target.user)) {
        throw Failure(ExitCode::Usage, "a user name cannot hold control characters or a backslash");
    }
    target.secure = IsSecureAddress(target.server);
    return target;
}

std::string Context::Complete(const std::string& inServer) const {
    if (inServer.empty()) {
        throw Failure(ExitCode::Usage, "no hub is named", "run 'zo login --server URL --user NAME' first");
    }
    const bool plain = mArguments.Has("plain");
    const std::string server = CompleteServerAddress(inServer, plain ? Scheme::Plain : Scheme::Secure);
    const bool secure = IsSecureAddress(server);
    if ((plain && secure) || (mArguments.Has("secure") && !secure)) {
        throw Failure(ExitCode::Usage, "the scheme of " + inServer + " contradicts --plain or --secure",
                      "leave one of them out");
    }
    return server;
}

ZOCL::InterfaceRef<ZOCL::IZOCDataServer> Context::Server() {
    if (mServer) {
        return mServer;
    }
    StartLibrary();
    mTarget = FindTarget();
    ApplyTransport(TransportFlagsOf(mArguments), mTarget.authorityFile, Settings());
    // The library sends a user's token to whichever hub it is told, so the match is made here.
    if (!mTarget.isKnown || !StoredToken(mTarget.user).Exists()) {
        const std::string who = mTarget.user.empty() ? "nobody" : mTarget.user;
        throw Failure(ExitCode::NotAuthenticated, who + " is not signed in at " + mTarget.server,
                      "run 'zo login --server " + mTarget.server + "'");
    }
    ZOCL::ZOSCredentials credentials;
    credentials.username = ZOCL::ImmutableString(mTarget.user);
    const auto outcome = mLoop.Connect([&](ZOCL::Guid& outRequest, const auto& inCompletion) {
        return ZOCL::IZOCDataServer::ConnectToServer(ZOCL::ImmutableString(mTarget.server), credentials,
                                                     outRequest, mTarget.secure, inCompletion, false, true);
    });
    const std::string what = "connecting to " + mTarget.server + " as " + mTarget.user;
    if (!outcome.started || outcome.result < 0) {
        throw Failure::OfRequest(what, outcome.result, outcome.response);
    }
    if (!outcome.server) {
        throw Failure(ExitCode::NotAuthenticated, what + ": the hub accepted the request but gave no login",
                      "run 'zo login' to sign in again");
    }
    mServer = outcome.server;
    return mServer;
}

TransportFlags TransportFlagsOf(const Arguments& inArguments) {
    return {inArguments.Value("ca"), inArguments.Value("proxy")};
}

}  // namespace zo
