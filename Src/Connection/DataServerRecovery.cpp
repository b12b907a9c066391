// A network that is down: what the user or a headless process gets to see of it, until it is back or they
// give up.
#include "Connection/DataServer.h"
#include "Connection/NetworkUnavailableDialog.h"
#include "Frame/ProgressWindow.h"
#include "Frame/Station.h"
#include "HLM/HLM.h"
#include "ostcore/debug/Trace.h"
#include "ostcore/threads/MainThread.h"
#include "ostcore/utility/StringConversion.h"
#include "ostui/BackEnd.h"
#include "OutageMinder.h"
#include "ZOClient/Messages.h"

namespace ZOCL {

using ostcore::threads::ScopedLock;

namespace {

/// How long a headless process bears a network that is down.
constexpr std::chrono::seconds kHeadlessLimit{15};
const char kMayBeUnavailable[] = "Detected recoverable errors. Network may be unavailable";

void TellNetworkState(bool inIsDown) {
    ZONetworkStateMessage message;
    message.isDown = inIsDown;
    PostLibraryMessage(message);
}

class LoggedInServerOutage final : public OutageMinder {
public:
    bool IsNetworkDown() override {
        const auto server = Find();
        return server && server->IsNetworkDown();
    }
    bool SignOut() override {
        const auto server = Find();
        return server && server->SignOutFromOutage();
    }
    void OnProgressWindowsGone() override {
        if (const auto server = Find()) {
            server->OnProgressWindowsGone();
        }
    }

private:
    static InterfaceRef<DataServer> Find() {
        return RFL::QueryInterface<DataServer>(IZOCDataServer::GetLoggedInServerRef());
    }
};

}  // namespace

OutageMinder* GetOutageMinder() {
    static LoggedInServerOutage outage;
    return &outage;
}

void DataServer::WarnAboutRecoverableErrors(bool inDetected) {
    if (inDetected) {
        OnNetworkDown();
    } else {
        OnNetworkBack();
    }
}

void DataServer::OnNetworkDown() {
    if (HasUseEnded()) {
        return;
    }
    if (!mWarnAboutErrors.exchange(true)) {
        TellNetworkState(true);
        QueueShowWarnings();
    }
    if (HLM::GetIsHeadless()) {
        HandleHeadlessNetworkFailureTimeout();
    }
}

void DataServer::OnNetworkBack() {
    const bool isWarning = mPromptActive;
    const bool wasDown = mWarnAboutErrors.exchange(false);
    CloseNetworkWarning();
    if (!wasDown) {
        return;
    }
    TellNetworkState(false);
    // A question for the password gives way to the network, and has its turn now; with a warning on show,
    // when that has gone.
    if (mTokenLost && !isWarning) {
        QueueShowWarnings();
    }
}

void DataServer::CloseNetworkWarning() {
    shared_ptr<ZONetworkUnavailableDialog> warning;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "WarnAboutRecoverableErrors()");
        warning = mNetworkWarning;
        mFirstFailureTime = boost::none;
    }
    if (warning) {
        warning->CloseAsRecovered();
    }
}

void DataServer::QueueShowWarnings() {
    RFL::AsyncCallFromMainThread([self = InterfaceRef<DataServer>(this)] {
        // A progress window tells of the outage, and can be pressed, as long as nothing blocks below it.
        if (!self->mWarnAboutErrors || !IsProgressWindowShown()) {
            self->ShowWarningsIfNeeded();
        }
    });
}

void DataServer::OnProgressWindowsGone() {
    if (mWarnAboutErrors && !HLM::GetIsHeadless()) {
        QueueShowWarnings();
    }
}

bool DataServer::SignOutFromOutage() {
    if (!mWarnAboutErrors.exchange(false)) {
        return false;
    }
    SignOutFromWarning();
    return true;
}

void DataServer::ShowWarningsIfNeeded() {
    if (!mWarnAboutErrors) {
        ShowTokenLostIfNeeded();
    } else if (!HLM::GetIsHeadless()) {
        PromptForRecoverableErrors();
    } else if (ostcore::debug::TraceEnabled("ZOCL", ostcore::debug::kTraceLevel_Error)) {
        ostcore::debug::Trace("ZOCL", ostcore::debug::kTraceLevel_Error, kMayBeUnavailable);
    }
}

void DataServer::PromptForRecoverableErrors() {
    // With nobody to press the button the requests wait, and the main thread goes on.
    if (!mWarnAboutErrors || !ostui::GetBackEnd() || mPromptActive.exchange(true)) {
        return;
    }
    shared_ptr<ZONetworkUnavailableDialog> warning;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "PromptForRecoverableErrors");
        if (!mNetworkWarning && !mUseHasEnded) {
            mNetworkWarning = boost::make_shared<ZONetworkUnavailableDialog>();
        }
        warning = mNetworkWarning;
    }
    // Asked again once the object can be found: whoever ends the wait from now on closes it.
    if (warning && mWarnAboutErrors && warning->Run() == kResultCancelled && mWarnAboutErrors) {
        SignOutFromWarning();
    }
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "PromptForRecoverableErrors - 2");
        mNetworkWarning.reset();
    }
    // A failure that goes on is reported again, and then all of this begins anew.
    mWarnAboutErrors = false;
    mPromptActive = false;
    if (mTokenLost && !HasUseEnded()) {
        QueueShowWarnings();
    }
}

void DataServer::SignOutFromWarning() {
    mChain.recoverableError->SetRetriesEnabled(false);
    ZOTerminateConnectionMessage message;
    message.forced = true;
    RFL::StationUtils::PostMessageToUIThread(CurrentStation(), message, true);
}

// Measured on the scheduler's clock, which is monotonic: a wall clock that is set must not end a process.
void DataServer::HandleHeadlessNetworkFailureTimeout() {
    const auto now = ostcore::threads::GetGlobalScheduler()->Now();
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "HandleHeadlessNetworkFailureTimeout()");
        if (!mFirstFailureTime) {
            mFirstFailureTime = now;
            return;
        }
        if (now - *mFirstFailureTime < kHeadlessLimit || HLM::GetWaitsForNetwork()) {
            return;
        }
        // One end is enough, however many reports are still on their way.
        mFirstFailureTime = boost::none;
    }
    mChain.recoverableError->SetRetriesEnabled(false);
    mChain.upload->CancelAllRequests();
    ReportFatalHeadlessError("Failed to receive a valid network response for more than " +
                             std::to_string(kHeadlessLimit.count()) + " seconds.");
}

void DataServer::ReportFatalHeadlessError(const std::string& inMessage) {
    if (!HLM::GetIsHeadless()) {
        return;
    }
    function<void(const UString&)> report;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::ReportFatalHeadlessError");
        report = mFatalErrorFunction;
    }
    if (report) {
        report(ostcore::utility::ToUTF16(inMessage));
    }
    if (ostcore::debug::TraceEnabled("ZOCL", ostcore::debug::kTraceLevel_Fatal)) {
        ostcore::debug::Trace("ZOCL", ostcore::debug::kTraceLevel_Fatal, "Exiting process: " + inMessage);
    }
    ostcore::threads::AsyncCallFromMainThread([] { HLM::EndProcess(); });
}

}  // namespace ZOCL
