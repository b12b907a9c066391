// Asks for server, user and password, and stays until somebody is signed in or gives up.
#pragma once

#include <QtWidgets/QCheckBox>
#include <QtWidgets/QDialog>
#include <QtWidgets/QLabel>
#include <QtWidgets/QLineEdit>
#include <QtWidgets/QProgressBar>
#include <QtWidgets/QPushButton>

#include "Connection.h"

namespace Desk {

/// Accepted when the connection is signed in. The password is taken out of its field when it is used.
class SignInDialog : public QDialog {
    Q_OBJECT
public:
    SignInDialog(Connection& ioConnection, const Connection::Login& inProposal, QWidget* inParent);

    /// Cancels what is under way and lets the user try again; without anything under way, closes.
    void reject() override;

private:
    void SignIn();
    void AskAboutPlain();
    void Start();
    void OnFailed(const QString& inReason);
    void OnServerEdited();
    void SetRunning(bool inIsRunning);
    Connection::Login GetLogin() const;

    Connection& mConnection;
    QLineEdit* mServer;
    QLineEdit* mUser;
    QLineEdit* mPassword;
    QCheckBox* mSecure;
    QLabel* mMessage;
    QProgressBar* mBar;
    QPushButton* mSignIn;
    bool mIsRunning = false;
};

}  // namespace Desk
