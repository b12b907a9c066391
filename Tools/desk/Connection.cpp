// Tries tokens and passwords, and keeps what was accepted.
#include "Connection.h"

#include <algorithm>
#include <iterator>

#include "ostcore/threads/MainThread.h"
#include "Text.h"
#include "ZOClient/Dialogs.h"
#include "ZOClient/Library.h"
#include "ZOClient/Messages.h"
#include "ZOClient/Registry.h"

namespace Desk {
namespace {

using ZOCL::ImmutableString;
using ZOCL::InterfaceRef;
using ZOCL::IZOCDataServer;
using ZOCL::ZOLoginData;

/// Of the engine below the requests: libcurl-errors(3).
constexpr int kCertificateFailures[] = {35, 51, 58, 60, 77, 80, 83, 90, 91};

ImmutableString URLOf(const Connection::Login& inLogin) {
    return IZOCDataServer::MakeDataServerURL(ToID(inLogin.server), inLogin.isSecure);
}

/// The token that is stored for exactly this login; null when there is none.
ImmutableString FindToken(const Connection::Login& inLogin, const ZOCL::UString& inSubKey) {
    ZOLoginData data;
    const bool isThere = ZOCL::Registry::GetLastLoginData(data, true, inSubKey) &&
                         IZOCDataServer::MakeDataServerURL(data.serverURL, data.secure) == URLOf(inLogin) &&
                         data.username == ToID(inLogin.user);
    return isThere ? data.token : ImmutableString();
}

QString DescribeFailure(int inResult, const ZOCL::shared_ptr<ostnet::Response>& inResponse) {
    const bool isCertificate =
        inResponse && std::count(std::begin(kCertificateFailures), std::end(kCertificateFailures),
                                 inResponse->curlError) > 0;
    if (isCertificate) {
        return Text(
            "$$$/ZODesk/SignIn/BadCertificate=A secure connection could not be established: the server's "
            "certificate is not trusted on this machine.");
    }
    if (inResult == ZOCL::kResultHTTPUnauthorized) {
        return Text("$$$/ZODesk/SignIn/Refused=The user name or the password is not right.");
    }
    if (!inResponse || inResponse->status <= 0) {
        return Text(
            "$$$/ZODesk/SignIn/NotFound=The server could not be found. Check its address and your network.");
    }
    return Text("$$$/ZODesk/SignIn/Failed=Signing in was not possible: @0.",
                {QString::fromUtf8(ZOCL::GetResultMeaning(inResult))});
}

}  // namespace

Connection::Connection(QObject* inParent) : QObject(inParent), mListener(ZOCL::GetStationID()) {
    mListener.AddHandler<ZOCL::ZOTerminateConnectionMessage>(
        [this](const ZOCL::ZOTerminateConnectionMessage&) { OnTerminated(); });
    mListener.AddHandler<ZOCL::ZONetworkStateMessage>(
        [this](const ZOCL::ZONetworkStateMessage& inMessage) { Q_EMIT NetworkChanged(inMessage.isDown); });
}

Connection::~Connection() {
    Cancel();
}

Connection::Login Connection::FindLastLogin() {
    ZOLoginData data;
    if (!ZOCL::Registry::GetLastLoginData(data, true, ZOCL::UString())) {
        return {};
    }
    return {ToQt(data.serverURL), ToQt(data.username), data.secure};
}

void Connection::SignInWithStored(const Login& inLogin) {
    Cancel();
    mLogin = inLogin;
    mHasPassword = false;
    mTokens.clear();
    // Hosts with windows share one login; those without have one for each user.
    for (const ZOCL::UString& place : {ZOCL::UString(), FromQt(inLogin.user)}) {
        const ImmutableString token = FindToken(inLogin, place);
        if (!token.empty() && (mTokens.empty() || mTokens.back() != token)) {
            mTokens.push_back(token);
        }
    }
    TryNextToken();
}

void Connection::TryNextToken() {
    if (mTokens.empty()) {
        Q_EMIT Failed(QString());
        return;
    }
    ZOCL::ZOSCredentials credentials;
    credentials.username = ToID(mLogin.user);
    credentials.token = mTokens.front();
    mTokens.pop_front();
    Connect(credentials);
}

void Connection::SignIn(const Login& inLogin, const QString& inPassword) {
    Cancel();
    mLogin = inLogin;
    mHasPassword = true;
    ZOCL::ZOSCredentials credentials;
    credentials.username = ToID(inLogin.user);
    credentials.password = inPassword.toStdString();
    Connect(credentials);
}

void Connection::Connect(const ZOCL::ZOSCredentials& inCredentials) {
    mWanted = std::make_shared<bool>(true);
    const std::weak_ptr<bool> wanted = mWanted;
    const bool isStarted = IZOCDataServer::ConnectToServer(
        URLOf(mLogin), inCredentials, mRequest, mLogin.isSecure,
        [this, wanted](const ZOCL::Guid&, const InterfaceRef<IZOCDataServer>& inServer, int inResult,
                       const ZOCL::shared_ptr<ostnet::Response>& inResponse) {
            ostcore::threads::AsyncCallFromMainThread([this, wanted, inServer, inResult, inResponse] {
                if (!wanted.expired()) {
                    OnConnected(inServer, inResult, inResponse);
                }
            });
        },
        false, true);
    if (!isStarted) {
        mWanted.reset();
        Q_EMIT Failed(DescribeFailure(ZOCL::kResultNotStarted, nullptr));
    }
}

void Connection::OnConnected(const InterfaceRef<IZOCDataServer>& inServer, int inResult,
                             const ZOCL::shared_ptr<ostnet::Response>& inResponse) {
    mWanted.reset();
    if (inResult >= 0 && inServer) {
        mIsSignedIn = true;
        StoreLogin();
        Q_EMIT SignedIn();
        return;
    }
    const bool isRefused = inResult >= 0 || inResult == ZOCL::kResultHTTPUnauthorized;
    if (isRefused && !mHasPassword) {
        TryNextToken();
        return;
    }
    Q_EMIT Failed(DescribeFailure(isRefused ? ZOCL::kResultHTTPUnauthorized : inResult, inResponse));
}

/// For the next start, and so that a renewed token is found by the other hosts of this user.
void Connection::StoreLogin() const {
    const InterfaceRef<IZOCDataServer> server = IZOCDataServer::GetLoggedInServerRef();
    if (server) {
        const ZOLoginData data = server->GetLoginData();
        ZOCL::Registry::StoreLoginData(data, ZOCL::UString());
        ZOCL::Registry::StoreLoginData(data, FromQt(mLogin.user));
    }
}

void Connection::Cancel() {
    if (mWanted) {
        mWanted.reset();
        IZOCDataServer::CancelConnectRequest(mRequest);
    }
    mRequests.Cancel();
}

void Connection::SignOut() {
    Cancel();
    const InterfaceRef<IZOCDataServer> server = IZOCDataServer::GetLoggedInServerRef();
    const ImmutableString token = server ? server->GetLoginData().token : ImmutableString();
    mRequests.RunBlocking(
        [token, user = FromQt(mLogin.user)] {
            IZOCDataServer::Terminate(true);
            ZOCL::Registry::ClearAuthToken(token, user);
        },
        [this] {
            mIsSignedIn = false;
            Q_EMIT SignedOut();
        });
}

/// The user has given up on a lost login or network, in a window of the library.
void Connection::OnTerminated() {
    Cancel();
    IZOCDataServer::Terminate(false);
    mIsSignedIn = false;
    ZOCL::CloseModalDialogs([wanted = std::weak_ptr<bool>(mWanted = std::make_shared<bool>(true)), this] {
        if (!wanted.expired()) {
            mWanted.reset();
            Q_EMIT SignedOut();
        }
    });
}

}  // namespace Desk
