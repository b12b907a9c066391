// The login of a data server: taking, verifying and giving up its token.
#include "Connection/ConnectSequence.h"
#include "Connection/DataServer.h"
#include "Connection/LoggedInServer.h"
#include "Connection/LoginToken.h"
#include "Connection/ReconnectDialog.h"
#include "Connection/RememberedLogin.h"
#include "Frame/Station.h"
#include "ostcore/debug/DebugDatabase.h"
#include "ostnet/HeaderConstants.h"
#include "Relations.h"
#include "ZOClient/Messages.h"

namespace ZOCL {

using ostcore::threads::ScopedLock;

bool DataServer::Authenticate(const ConnectCompletion& inCompletion, const Guid& inRequestID) {
    return boost::make_shared<ConnectSequence>(InterfaceRef<DataServer>(this), inRequestID,
                                               ConnectSequence::Goal::kSignedIn, inCompletion)
        ->Start();
}

bool DataServer::TakeTokenFromResponse(const shared_ptr<ostnet::Response>& inResponse) {
    if (!inResponse || inResponse->status < 200 || inResponse->status > 399) {
        // While the user is asked for the password, what is parked waits for the answer.
        if (!mTokenLost) {
            mChain.authorization->SetAuthToken(ImmutableString());
        }
        return false;
    }
    const ImmutableString token = FindLoginToken(inResponse);
    if (!token.IsNull() && HasUseEnded()) {
        Revoke(token);
        return false;
    }
    ImmutableString held;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::TakeTokenFromResponse");
        if (!token.IsNull()) {
            mCredentials.token = token;
            WipePassword(mCredentials.password);
        }
        held = mCredentials.token;
    }
    // What waited for the token leaves now, and must outlive a failure of the network as it did before; the
    // rest of the sign-in goes past the chain.
    if (!token.IsNull() && mWasAccepted) {
        EnableRetries();
    }
    mChain.authorization->SetAuthToken(held);
    return !token.IsNull();
}

bool DataServer::VerifyAuthentication(const shared_ptr<ostnet::Response>& inResponse) {
    const ImmutableString logout = GetLink(kRelation_System_Logout);
    const bool isHeld = !GetToken().IsNull();
    const bool isInResponse = !FindLoginToken(inResponse).IsNull();
    if (logout.IsNull() || !inResponse || !inResponse->IsSuccess() || (!isHeld && !isInResponse)) {
        return false;
    }
    // Before the login is remembered, so that what is remembered is the newest token.
    if (isInResponse) {
        TakeTokenFromResponse(inResponse);
    }
    mWasAccepted = true;
    EnableRetries();
    if (mBecomeLoggedIn && BecomeLoggedInServer()) {
        RememberLogin(GetLoginData());
        PostLibraryMessage(ZOLoginMessage());
    }
    return true;
}

// Under the lock, so that the end of use, which turns them off, has the last word.
void DataServer::EnableRetries() {
    if (ostcore::debug::DebugDatabase::GetBool("ZOClient.DisableRetries", false)) {
        return;
    }
    ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::EnableRetries");
    if (!mUseHasEnded) {
        mChain.recoverableError->SetRetriesEnabled(true);
    }
}

bool DataServer::BecomeLoggedInServer() {
    InterfaceRef<IZOCDataServer> former;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::VerifyAuthentication");
        if (mUseHasEnded) {
            return false;
        }
        former = ExchangeLoggedInServer(Self());
        UpdateLoginData();
    }
    const InterfaceRef<DataServer> formerServer = RFL::QueryInterface<DataServer>(former);
    if (formerServer && formerServer.GetUnchecked() != this) {
        formerServer->ReleaseCaches();
    }
    return true;
}

void DataServer::DropToken() {
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::DropToken");
        mCredentials.token = ImmutableString();
    }
    mChain.authorization->SetAuthToken(ImmutableString());
}

void DataServer::SendLogout() {
    const ImmutableString url = GetLink(kRelation_System_Logout);
    if (url.IsNull()) {
        return;
    }
    mChain.authorization->ClearAuthTokenNotificationFunction();
    mChain.authorization->SetAuthToken(GetToken());
    BlockingPOST(url, ostnet::Headers(), shared_ptr<RecycledMemory const>(), ostnet::http::kWaitForever);
    DropToken();
}

void DataServer::Revoke(const ImmutableString& inToken) {
    const ImmutableString link = GetLink(kRelation_System_Logout);
    const ImmutableString url = link.IsNull() ? link : MakeRequestURL(link);
    if (url.IsNull()) {
        return;
    }
    // Past the chain, which has another token or none.
    mChain.global->POST(
        Guid::CreateUnique(), [](const Guid&, const shared_ptr<ostnet::Response>&) {}, url,
        {{ostnet::kHEADER_COOKIE, inToken}}, shared_ptr<RecycledMemory const>(),
        ostnet::http::RequestOptions());
}

void DataServer::ReleaseCaches() {
    decltype(mProductionCache) productions;
    decltype(mMediaLocatorCache) locators;
    InterfaceRef<IZOCUser> user;
    ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::ReleaseCaches");
    productions.swap(mProductionCache);
    locators.swap(mMediaLocatorCache);
    std::swap(user, mLoggedInUser);
    lock.Unlock();
    mChain.cache->Purge();
}

void DataServer::EndUse() {
    ReleaseCaches();
    Guid renewal;
    shared_ptr<ReconnectDialog> dialog;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::DataServer::Terminate");
        mLoginData = ZOLoginData();
        mUseHasEnded = true;
        WipePassword(mSavedCredentials.password);
        renewal = mRenewal;
        dialog = mReconnectDialog;
    }
    mChain.recoverableError->SetRetriesEnabled(false);
    CloseNetworkWarning();
    // A sign-in that is under way ends, and takes what is parked with it; what waits for the user ends here.
    CancelConnectRequest(renewal);
    if (dialog) {
        dialog->CloseAsOvertaken();
    }
    if (mTokenLost) {
        mChain.authorization->SetAuthToken(GetToken());
    }
}

}  // namespace ZOCL
