// The login of a data server: taking, verifying, renewing and giving up its token.
#include "Connection/ConnectSequence.h"
#include "Connection/DataServer.h"
#include "Connection/LoggedInServer.h"
#include "Connection/LoginToken.h"
#include "Frame/Station.h"
#include "HLM/HLM.h"
#include "ostcore/debug/Trace.h"
#include "ostcore/utility/StringConversion.h"
#include "Relations.h"
#include "ZOClient/Messages.h"
#include "ZOClient/Registry.h"

namespace ZOCL {

using ostcore::threads::ScopedLock;

namespace {

/// Overwrites the bytes before it lets them go.
void WipePassword(std::string& ioPassword) {
    volatile char* bytes = ioPassword.data();
    for (std::size_t i = 0; i < ioPassword.size(); ++i) {
        bytes[i] = 0;
    }
    ioPassword.clear();
}

/// What an accepted login leaves in the registry.
void RememberLogin(const ZOLoginData& inData) {
    if (HLM::GetIsHeadless()) {
        Registry::StoreLoginData(inData, ostcore::utility::ToUTF16(inData.username.view()));
    }
    Registry::SetZORegistryValue(Registry::kRegistryHasLoggedInValue, u"true");
    if (!Registry::IsZOEnabled()) {
        Registry::ResetIsZOEnabled();
    }
}

}  // namespace

bool DataServer::Authenticate(const ConnectCompletion& inCompletion, const Guid& inRequestID) {
    return boost::make_shared<ConnectSequence>(InterfaceRef<DataServer>(this), inRequestID,
                                               ConnectSequence::Goal::kSignedIn, inCompletion)
        ->Start();
}

bool DataServer::TakeTokenFromResponse(const shared_ptr<ostnet::Response>& inResponse) {
    if (!inResponse || inResponse->status < 200 || inResponse->status > 399) {
        mChain.authorization->SetAuthToken(ImmutableString());
        return false;
    }
    const ImmutableString token = FindLoginToken(inResponse);
    ImmutableString held;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::TakeTokenFromResponse");
        if (!token.IsNull()) {
            mCredentials.token = token;
            WipePassword(mCredentials.password);
        }
        held = mCredentials.token;
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
    mChain.recoverableError->SetRetriesEnabled(true);
    if (mBecomeLoggedIn && BecomeLoggedInServer()) {
        RememberLogin(GetLoginData());
        PostLibraryMessage(ZOLoginMessage());
    }
    return true;
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

void DataServer::GetNewAuthToken() {
    bool canSignIn = false;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::GetNewAuthToken");
        canSignIn = !mUseHasEnded && !mSavedCredentials.username.IsNull() &&
                    (!mSavedCredentials.token.IsNull() || !mSavedCredentials.password.empty());
        if (canSignIn) {
            mCredentials = mSavedCredentials;
        } else {
            mCredentials.token = ImmutableString();
            WipePassword(mCredentials.password);
        }
    }
    const InterfaceRef<DataServer> self(this);
    const auto onRenewed = [self](const Guid&, const InterfaceRef<IZOCDataServer>& inServer, int inResult,
                                  const shared_ptr<ostnet::Response>&) {
        self->OnRenewed(inResult, inServer);
    };
    if (!canSignIn || !Authenticate(onRenewed, Guid::CreateUnique())) {
        mChain.authorization->SetAuthToken(ImmutableString());
    }
}

void DataServer::OnRenewed(int inResult, const InterfaceRef<IZOCDataServer>& inServer) {
    if (inResult >= 0 && inServer) {
        return;
    }
    if (ostcore::debug::TraceEnabled("ZOCL", ostcore::debug::kTraceLevel_Error)) {
        ostcore::debug::Trace(
            "ZOCL", ostcore::debug::kTraceLevel_Error,
            ostcore::debug::StructuredText("The authentication token has expired and the attempt "
                                           "to re-authenticate failed.")
                .Add("server", mBaseURL.view())
                .Add("result", GetResultName(inResult)));
    }
    // Whatever way the sequence ended, nobody waits for a token that does not come.
    if (GetToken().IsNull()) {
        mChain.authorization->SetAuthToken(ImmutableString());
    }
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

void DataServer::ReleaseCaches() {
    decltype(mProductionCache) productions;
    decltype(mMediaLocatorCache) locators;
    InterfaceRef<IZOCUser> user;
    ScopedLock lock(IZOCDataServer::GetLock(), "DataServer::ReleaseCaches");
    productions.swap(mProductionCache);
    locators.swap(mMediaLocatorCache);
    std::swap(user, mLoggedInUser);
    lock.Unlock();
}

void DataServer::EndUse() {
    ReleaseCaches();
    mChain.recoverableError->SetRetriesEnabled(false);
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::DataServer::Terminate");
    mLoginData = ZOLoginData();
    mUseHasEnded = true;
    WipePassword(mSavedCredentials.password);
}

}  // namespace ZOCL
