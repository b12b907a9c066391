// A token that was refused: signing in again, by itself or with the user's help, and the end when neither
// works.
#include "Connection/DataServer.h"
#include "Connection/LoginWithProgress.h"
#include "Connection/ReconnectDialog.h"
#include "Connection/RememberedLogin.h"
#include "Frame/Station.h"
#include "HLM/HLM.h"
#include "ostcore/config/ZString.h"
#include "ostcore/debug/Assert.h"
#include "ostcore/debug/Trace.h"
#include "ostcore/utility/StringConversion.h"
#include "ostui/BackEnd.h"
#include "ZOClient/Messages.h"

namespace ZOCL {

using ostcore::threads::ScopedLock;

namespace {

const char kRenewalFailed[] =
    "The authentication token has expired and the attempt to re-authenticate failed.";
const char kRenewalImpossible[] =
    "The authentication token has expired and we were not able to re-authenticate automatically.";
const char kReconnectCaption[] = "$$$/Cadenzo/ZOCL/ReconnectCaption=Connecting to @0...";

/// Whether there is a user whom a window reaches.
bool CanAskUser() {
    return !HLM::GetIsHeadless() && ostui::GetBackEnd();
}

}  // namespace

void DataServer::GetNewAuthToken() {
    bool canSignIn = false;
    bool useHasEnded = false;
    const Guid request = Guid::CreateUnique();
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::GetNewAuthToken");
        useHasEnded = mUseHasEnded;
        canSignIn = !useHasEnded && !mSavedCredentials.username.IsNull() &&
                    (!mSavedCredentials.token.IsNull() || !mSavedCredentials.password.empty());
        if (canSignIn) {
            mCredentials = mSavedCredentials;
            mRenewal = request;
        } else {
            mCredentials.token = ImmutableString();
            WipePassword(mCredentials.password);
        }
    }
    if (!canSignIn) {
        // What is parked waits for the user; with nobody to ask it ends now.
        if (useHasEnded || !CanAskUser()) {
            mChain.authorization->SetAuthToken(ImmutableString());
        }
        if (!useHasEnded) {
            ScheduleWarnings();
        }
        return;
    }
    const auto onRenewed = [self = InterfaceRef<DataServer>(this)](
                               const Guid& inRequest, const InterfaceRef<IZOCDataServer>& inServer,
                               int inResult, const shared_ptr<ostnet::Response>&) {
        self->OnRenewed(inRequest, inResult, inServer);
    };
    if (!Authenticate(onRenewed, request)) {
        OnRenewed(request, kResultNotStarted, nullptr);
    }
}

// A token works from the moment that the login form is answered, and can be refused before the sign-in that
// brought it has run to its end. Then the next sign-in is under way already, and what waits is its business.
void DataServer::OnRenewed(const Guid& inRequest, int inResult,
                           const InterfaceRef<IZOCDataServer>& inServer) {
    bool useHasEnded = false;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::OnRenewed");
        if (mRenewal != inRequest) {
            return;
        }
        useHasEnded = mUseHasEnded;
        mRenewal = Guid();
    }
    if (inResult >= 0 && inServer) {
        ShareRenewedLogin(GetLoginData());
        return;
    }
    if (ostcore::debug::TraceEnabled("ZOCL", ostcore::debug::kTraceLevel_Error)) {
        ostcore::debug::Trace("ZOCL", ostcore::debug::kTraceLevel_Error,
                              ostcore::debug::StructuredText(kRenewalFailed)
                                  .Add("server", mBaseURL.view())
                                  .Add("result", GetResultName(inResult)));
    }
    // Whatever way the sequence ended, nobody waits for a token that does not come. One that was adopted
    // meanwhile stays good.
    mChain.authorization->SetAuthToken(GetToken());
    if (!useHasEnded) {
        ReportFatalHeadlessError(kRenewalFailed);
    }
}

void DataServer::ScheduleWarnings() {
    if (mTokenLost.exchange(true)) {
        return;
    }
    QueueShowWarnings();
}

void DataServer::ShowTokenLostIfNeeded() {
    if (!mTokenLost) {
        return;
    }
    if (!HLM::GetIsHeadless()) {
        PromptForReconnect();
        return;
    }
    ZO_ASSERT_ONCE(false, "false",
                   "ShowWarningsIfNeeded(): Headless applications should re-authenticate their auth tokens "
                   "automatically when they expire.");
    ReportFatalHeadlessError(kRenewalImpossible);
}

void DataServer::PromptForReconnect() {
    if (!mTokenLost || mWarnAboutErrors || mReconnectActive.exchange(true)) {
        return;
    }
    const ZOLoginData loginData = GetLoginData();
    const auto dialog = boost::make_shared<ReconnectDialog>(loginData.username, loginData.serverURL);
    bool isNeeded = false;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::DataServer::PromptForReconnect");
        isNeeded = !mUseHasEnded;
        mReconnectDialog = isNeeded ? dialog : nullptr;
    }
    const bool isGivenUp = isNeeded && !AskUntilReconnected(*dialog, loginData);
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::DataServer::PromptForReconnect");
        mReconnectDialog.reset();
    }
    if (isGivenUp) {
        mChain.authorization->SetAuthToken(ImmutableString());
        ZOTerminateConnectionMessage message;
        message.forced = true;
        RFL::StationUtils::PostMessageToUIThread(CurrentStation(), message, true);
    }
    mReconnectActive = false;
    // The new token may have been lost already, when nobody could be asked since this was still going on.
    if (!isGivenUp && mTokenLost && !HasUseEnded()) {
        QueueShowWarnings();
    }
}

bool DataServer::AskUntilReconnected(ReconnectDialog& ioDialog, const ZOLoginData& inLoginData) {
    const UString caption = ostcore::ZString(kReconnectCaption, {inLoginData.serverURL.str()}).AsString();
    while (mTokenLost && !HasUseEnded()) {
        const ReconnectDialog::Answer answer = ioDialog.Run();
        if (answer == ReconnectDialog::Answer::kOvertaken) {
            return true;
        }
        if (answer == ReconnectDialog::Answer::kCancel) {
            return false;
        }
        ZOSCredentials credentials;
        credentials.username = inLoginData.username;
        credentials.password = ioDialog.TakePassword();
        const InterfaceRef<IZOCDataServer> checked =
            SignInUnderProgress(mBaseURL, mSecure, credentials, caption, LoginRole::kCheckOnly);
        WipePassword(credentials.password);
        if (checked && AdoptToken(checked->GetCredentials().token)) {
            ShareRenewedLogin(GetLoginData());
        }
    }
    return true;
}

bool DataServer::HasUseEnded() const {
    ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::HasUseEnded");
    return mUseHasEnded;
}

bool DataServer::AdoptToken(const ImmutableString& inToken) {
    shared_ptr<ReconnectDialog> dialog;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::AdoptToken");
        if (mUseHasEnded || inToken.IsNull()) {
            return false;
        }
        mCredentials.token = inToken;
        UpdateLoginData();
        dialog = mReconnectDialog;
    }
    // Before the requests go out, since the new token may be refused in turn.
    mTokenLost = false;
    if (dialog) {
        dialog->CloseAsOvertaken();
    }
    // A sign-in of this server that failed before has left them off.
    EnableRetries();
    mChain.authorization->SetAuthToken(inToken);
    return true;
}

}  // namespace ZOCL
