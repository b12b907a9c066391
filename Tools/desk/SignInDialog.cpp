// Checks what was typed, signs in and tells what is wrong.
#include "SignInDialog.h"

#include <QtCore/QUrl>
#include <QtWidgets/QDialogButtonBox>
#include <QtWidgets/QFormLayout>
#include <QtWidgets/QMessageBox>
#include <QtWidgets/QVBoxLayout>

#include "Icons.h"
#include "Text.h"

namespace Desk {
namespace {

QLabel* MakeHeading() {
    auto* const heading = new QLabel(Text("$$$/ZODesk/SignIn/Heading=Sign in to Orvane Meridane"));
    QFont font = heading->font();
    font.setPointSizeF(font.pointSizeF() * 1.4);
    font.setBold(true);
    heading->setFont(font);
    return heading;
}

bool IsThisMachine(const QString& inServer) {
    const QString host = QUrl::fromUserInput(inServer).host();
    return host == QLatin1String("localhost") || host == QLatin1String("::1") ||
           host.startsWith(QLatin1String("127."));
}

}  // namespace

SignInDialog::SignInDialog(Connection& ioConnection, const Connection::Login& inProposal, QWidget* inParent)
    : QDialog(inParent),
      mConnection(ioConnection),
      mServer(new QLineEdit(inProposal.server)),
      mUser(new QLineEdit(inProposal.user)),
      mPassword(new QLineEdit),
      mSecure(new QCheckBox(Text("$$$/ZODesk/SignIn/Secure=Use a secure &connection"))),
      mMessage(new QLabel),
      mBar(new QProgressBar),
      mSignIn(new QPushButton(Text("$$$/ZODesk/SignIn/Button=Sign &In"))) {
    setObjectName(QStringLiteral("signInWindow"));
    setWindowTitle(Text("$$$/ZODesk/SignIn/Title=Sign In"));
    setWindowModality(Qt::WindowModal);
    mServer->setObjectName(QStringLiteral("server"));
    mServer->setPlaceholderText(Text("$$$/ZODesk/SignIn/ServerHint=hub.example.com"));
    mUser->setObjectName(QStringLiteral("user"));
    mPassword->setObjectName(QStringLiteral("password"));
    mPassword->setEchoMode(QLineEdit::Password);
    mSecure->setObjectName(QStringLiteral("secure"));
    mSecure->setChecked(inProposal.isSecure);
    mMessage->setObjectName(QStringLiteral("message"));
    mMessage->setTextFormat(Qt::PlainText);
    mMessage->setWordWrap(true);
    mBar->setRange(0, 0);
    mBar->setTextVisible(false);
    mSignIn->setObjectName(QStringLiteral("signIn"));

    auto* const form = new QFormLayout;
    form->setSpacing(10);
    form->addRow(Text("$$$/ZODesk/SignIn/Server=Se&rver:"), mServer);
    form->addRow(Text("$$$/ZODesk/SignIn/User=&User name:"), mUser);
    form->addRow(Text("$$$/ZODesk/SignIn/Password=&Password:"), mPassword);
    form->addRow(QString(), mSecure);
    for (QLineEdit* const field : {mServer, mUser, mPassword}) {
        // In line with the text of its field.
        form->labelForField(field)->setMinimumHeight(field->sizeHint().height());
    }
    auto* const logo = new QLabel;
    logo->setPixmap(GetIcon("SP_MeridaneLogo_44x42").pixmap(QSize(44, 42), devicePixelRatioF()));
    auto* const top = new QHBoxLayout;
    top->setSpacing(14);
    top->addWidget(logo);
    top->addWidget(MakeHeading(), 1);
    auto* const buttons = new QDialogButtonBox;
    buttons->addButton(mSignIn, QDialogButtonBox::AcceptRole);
    buttons->addButton(Text("$$$/ZODesk/Cancel=Cancel"), QDialogButtonBox::RejectRole)->setAutoDefault(false);
    auto* const layout = new QVBoxLayout(this);
    layout->setContentsMargins(24, 22, 24, 20);
    layout->setSpacing(16);
    layout->addLayout(top);
    layout->addLayout(form);
    layout->addWidget(mMessage);
    layout->addWidget(mBar);
    layout->addWidget(buttons);
    mSignIn->setDefault(true);
    setMinimumWidth(440);

    connect(buttons, &QDialogButtonBox::accepted, this, &SignInDialog::SignIn);
    connect(buttons, &QDialogButtonBox::rejected, this, &SignInDialog::reject);
    connect(mServer, &QLineEdit::textEdited, this, &SignInDialog::OnServerEdited);
    connect(&mConnection, &Connection::SignedIn, this, &QDialog::accept);
    connect(&mConnection, &Connection::Failed, this, &SignInDialog::OnFailed);
    SetRunning(false);
    mMessage->hide();
    QLineEdit* const first = inProposal.server.isEmpty() ? mServer
                             : inProposal.user.isEmpty() ? mUser
                                                         : mPassword;
    first->setFocus();
}

Connection::Login SignInDialog::GetLogin() const {
    return {mServer->text().trimmed(), mUser->text().trimmed(), mSecure->isChecked()};
}

/// An address that tells its scheme decides.
void SignInDialog::OnServerEdited() {
    const QString server = mServer->text().trimmed();
    const bool isSecure = ZOCL::HasSecureProtocol(FromQt(server));
    const bool isPlain = server.startsWith(QLatin1String("http://"));
    mSecure->setEnabled(!isSecure && !isPlain);
    mSecure->setChecked(isSecure || (!isPlain && mSecure->isChecked()));
}

void SignInDialog::SignIn() {
    const Connection::Login login = GetLogin();
    if (login.server.isEmpty() || login.user.isEmpty() || mPassword->text().isEmpty()) {
        OnFailed(Text("$$$/ZODesk/SignIn/Empty=Please enter a value into every field."));
        return;
    }
    if (login.isSecure || IsThisMachine(login.server)) {
        Start();
    } else {
        AskAboutPlain();
    }
}

void SignInDialog::AskAboutPlain() {
    auto* const question = new QMessageBox(QMessageBox::Warning, windowTitle(),
                                           Text("$$$/ZODesk/SignIn/Plain=Without a secure connection "
                                                "everybody on the network can read your password."),
                                           QMessageBox::Cancel, this);
    const QPushButton* const goOn =
        question->addButton(Text("$$$/ZODesk/SignIn/PlainGoOn=Sign In Anyway"), QMessageBox::DestructiveRole);
    question->setAttribute(Qt::WA_DeleteOnClose);
    connect(goOn, &QPushButton::clicked, this, &SignInDialog::Start);
    question->open();
}

void SignInDialog::Start() {
    mMessage->hide();
    SetRunning(true);
    const QString password = mPassword->text();
    mPassword->clear();
    mConnection.SignIn(GetLogin(), password);
}

void SignInDialog::OnFailed(const QString& inReason) {
    SetRunning(false);
    mMessage->setText(inReason);
    mMessage->setVisible(!inReason.isEmpty());
    mPassword->setFocus();
}

void SignInDialog::SetRunning(bool inIsRunning) {
    mIsRunning = inIsRunning;
    mBar->setVisible(inIsRunning);
    mSignIn->setEnabled(!inIsRunning);
    for (QWidget* const field : {static_cast<QWidget*>(mServer), static_cast<QWidget*>(mUser),
                                 static_cast<QWidget*>(mPassword), static_cast<QWidget*>(mSecure)}) {
        field->setEnabled(!inIsRunning);
    }
    if (!inIsRunning) {
        OnServerEdited();
    }
}

void SignInDialog::reject() {
    if (mIsRunning) {
        mConnection.Cancel();
        SetRunning(false);
        return;
    }
    QDialog::reject();
}

}  // namespace Desk
