// The login of the desk: with what is stored, or with a password.
#pragma once

#include <deque>

#include <QtCore/QObject>

#include "Requests.h"
#include "RFL/Messaging.h"

namespace Desk {

/// Main thread only. A connect request that is cancelled tells nobody of its end.
class Connection : public QObject {
    Q_OBJECT
public:
    struct Login {
        QString server;
        QString user;
        bool isSecure = true;
    };

    explicit Connection(QObject* inParent = nullptr);
    ~Connection() override;

    /// The login that was stored last by a host with windows; empty texts when there is none.
    static Login FindLastLogin();

    /// Tries the tokens that are stored for this user at this server. Ends with SignedIn or Failed.
    void SignInWithStored(const Login& inLogin);
    void SignIn(const Login& inLogin, const QString& inPassword);
    void Cancel();
    /// Ends the login at the hub, too. Ends with SignedOut.
    void SignOut();

    const Login& GetLogin() const { return mLogin; }
    bool IsSignedIn() const { return mIsSignedIn; }

Q_SIGNALS:
    void SignedIn();
    /// Empty when nothing was stored or all of it was refused: then a password is asked for.
    void Failed(const QString& inReason);
    void SignedOut();
    /// The library looks for the hub again and again meanwhile, by itself.
    void NetworkChanged(bool inIsDown);

private:
    void Connect(const ZOCL::ZOSCredentials& inCredentials);
    void OnConnected(const ZOCL::InterfaceRef<ZOCL::IZOCDataServer>& inServer, int inResult,
                     const ZOCL::shared_ptr<ostnet::Response>& inResponse);
    void TryNextToken();
    void StoreLogin() const;
    void OnTerminated();

    Login mLogin;
    bool mIsSignedIn = false;
    /// Tokens that have not been tried.
    std::deque<ZOCL::ImmutableString> mTokens;
    bool mHasPassword = false;
    ZOCL::Guid mRequest;
    /// Tells the connect request that is wanted from those that are not any more.
    std::shared_ptr<bool> mWanted;
    Requests mRequests;
    RFL::Listener mListener;
};

}  // namespace Desk
