// Lookups, continuations, the sandbox.
#include "Workflows/WorkflowTools.h"

#include "Frame/Station.h"
#include "ostcore/config/ZString.h"
#include "ostcore/threads/MainThread.h"
#include "ZOClient/Dialogs.h"
#include "ZOClient/Messages.h"
#include "ZOClient/ZOSandbox.h"

namespace ZOCL {

namespace {

shared_ptr<ZOSandbox> FindSandbox(const ImmutableString& inSessionURL) {
    const shared_ptr<ZOSandbox> sandbox = GetCurrentZOSandbox();
    return sandbox && !inSessionURL.empty() && sandbox->GetHTTPURL() == inSessionURL ? sandbox : nullptr;
}

}  // namespace

InterfaceRef<IZOCEditingSession> FindSession(const ImmutableString& inSessionURL) {
    const InterfaceRef<IZOCDataServer> server = IZOCDataServer::GetLoggedInServerRef();
    const InterfaceRef<IZOCProduction> production =
        server && !inSessionURL.empty() ? server->GetProductionFromURL(inSessionURL) : nullptr;
    return production && production->IsEditingSession() ? RFL::QueryInterface<IZOCEditingSession>(production)
                                                        : nullptr;
}

ImmutableString FindProductionURL(const InterfaceRef<IZOCEditingSession>& inSession) {
    const auto production =
        inSession ? RFL::QueryInterface<IZOCServerResource>(inSession->GetParentProduction()) : nullptr;
    return production ? production->GetHTTPURL() : ImmutableString();
}

ImmutableString GetLoadedCommit(const InterfaceRef<IZOCEditingSession>& inSession) {
    const auto production = inSession ? RFL::QueryInterface<IZOCProduction>(inSession) : nullptr;
    return production ? production->GetLoadedRevision() : ImmutableString();
}

bool IsStopped(int inResult) {
    return inResult < 0 && ResultSucceededOrCanceled(inResult);
}

LoginWatch::LoginWatch()
    : mServer(IZOCDataServer::GetLoggedInServerRef()),
      mIsTerminated(boost::make_shared<std::atomic<bool>>(false)),
      mListener(CurrentStation()) {
    mListener.AddHandler<ZOTerminateConnectionMessage>(
        [isTerminated = mIsTerminated](const ZOTerminateConnectionMessage& inMessage) {
            if (inMessage.forced) {
                isTerminated->store(true);
            }
        });
}

LoginWatch::~LoginWatch() = default;

bool LoginWatch::HasEnded() const {
    return mIsTerminated->load() || IZOCDataServer::GetLoggedInServerRef() != mServer;
}

Publish::Continuation MakeContinuation(const Publish::Continuation& inNext) {
    const auto isTaken = boost::make_shared<std::atomic<bool>>(false);
    return [isTaken, inNext](int inResult, const ImmutableString& inCommitId) {
        if (isTaken->exchange(true)) {
            return;
        }
        if (ostcore::threads::IsMainThread()) {
            inNext(inResult, inCommitId);
        } else {
            ostcore::threads::AsyncCallFromMainThread(
                [inNext, inResult, inCommitId] { inNext(inResult, inCommitId); });
        }
    };
}

void RefreshSandbox(const ImmutableString& inSessionURL) {
    if (const shared_ptr<ZOSandbox> sandbox = FindSandbox(inSessionURL)) {
        sandbox->SetDirtyStateUncertain(true);
        sandbox->SetSyncStateUncertain(true);
        sandbox->UpdateSandboxStateAsync();
    }
}

ScopedResolve::ScopedResolve(const ImmutableString& inSessionURL) : mSandbox(FindSandbox(inSessionURL)) {
    if (mSandbox) {
        mSandbox->SetResolveIsInProgress(true);
    }
}

ScopedResolve::~ScopedResolve() {
    if (mSandbox) {
        mSandbox->SetResolveIsInProgress(false);
    }
}

void ShowMessage(const char* inTitle, const char* inMessage, ostui::MessageBoxIcon inIcon) {
    SimpleMessageBox(ostcore::ZString(inTitle).AsString(), ostcore::ZString(inMessage).AsString(),
                     ostui::kMessageBoxOK, ostui::kMessageBoxOK, inIcon);
}

}  // namespace ZOCL
