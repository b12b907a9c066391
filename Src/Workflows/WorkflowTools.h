// What the flows share: finding the session, running an operation under its window, going on when the host
// says so, and the sandbox.
#pragma once

#include <atomic>

#include "Collaboration/WorkflowOperation.h"
#include "ostui/MessageBox.h"
#include "RFL/Messaging.h"
#include "ZOClient/Publish.h"

namespace ZOCL {

class ZOSandbox;

/// Loaded, which may block; null without a logged-in server and for what is no session.
InterfaceRef<IZOCEditingSession> FindSession(const ImmutableString& inSessionURL);
/// The URL of the production that a session belongs to; null when it is not known.
ImmutableString FindProductionURL(const InterfaceRef<IZOCEditingSession>& inSession);
/// The commit that a session's object was loaded at; null for a null session.
ImmutableString GetLoadedCommit(const InterfaceRef<IZOCEditingSession>& inSession);

/// What counts of an operation that has been run: the reason for which it was torn down, else its result.
template <class Operation>
int GetEffectiveResult(const InterfaceRef<Operation>& inOperation) {
    return inOperation->WasForceAborted() ? inOperation->GetForceAbortResult() : inOperation->GetResult();
}

/// True for the ways in which a user, or the end of a session, stops an operation: nobody is told of these.
bool IsStopped(int inResult);

/// Tells whether the session of the login in which it was made has ended since: by force, or by giving up
/// the logged-in server. A flow goes no further then, and shows nothing any more. Make it on the main thread;
/// other threads may destroy it, and ask.
class LoginWatch {
public:
    LoginWatch();
    ~LoginWatch();
    LoginWatch(const LoginWatch&) = delete;
    LoginWatch& operator=(const LoginWatch&) = delete;

    bool HasEnded() const;

private:
    const InterfaceRef<IZOCDataServer> mServer;
    /// Shared with the handler, which may outlast this object by one call.
    const shared_ptr<std::atomic<bool>> mIsTerminated;
    RFL::Listener mListener;
};

/// What is handed to a host: may be called on any thread and any number of times; the first call counts and
/// runs inNext on the main thread, at once when it is called there.
Publish::Continuation MakeContinuation(const Publish::Continuation& inNext);

/// Says that the session is not what it was, and asks for its new state. Only for the current sandbox, and
/// only when it is that of the session.
void RefreshSandbox(const ImmutableString& inSessionURL);
/// Marks a resolve of that session as under way, for as long as it lives.
class ScopedResolve {
public:
    explicit ScopedResolve(const ImmutableString& inSessionURL);
    ~ScopedResolve();
    ScopedResolve(const ScopedResolve&) = delete;
    ScopedResolve& operator=(const ScopedResolve&) = delete;

private:
    const shared_ptr<ZOSandbox> mSandbox;
};

/// A box with OK.
void ShowMessage(const char* inTitle, const char* inMessage,
                 ostui::MessageBoxIcon inIcon = ostui::MessageBoxIcon::kStop);

}  // namespace ZOCL
