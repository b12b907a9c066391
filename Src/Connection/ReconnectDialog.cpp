// What the reconnect window says, and its answers.
#include "Connection/ReconnectDialog.h"

namespace ZOCL {

namespace {

constexpr int kResponseOvertaken = 3;
const char kTitle[] = "$$$/ZOCL/ReconnectDialog/Title=Orvane Meridane";
const char kMessage[] =
    "$$$/ZOCL/ReconnectDialog/MsgStr=You have been signed out from the current Orvane Meridane session.\n\n"
    "Please re-enter the password for the user \"@0\" on the server \"@1\":";
const char kSignInText[] = "$$$/ZOCL/ReconnectDialog/SignInText=Sign In";
const char kCancelText[] = "$$$/ZOCL/ReconnectDialog/CancelText=Cancel";

}  // namespace

ReconnectDialog::ReconnectDialog(const ImmutableString& inUsername, const ImmutableString& inServer)
    : mWindow(kReconnectDialogID), mDialog(mWindow.GetDialog()) {
    mDialog.SetTitle(UserText(kTitle));
    mDialog.SetText(kReconnectMessage, UserText(kMessage, {inUsername.str(), inServer.str()}));
    mDialog.SetText(kReconnectSignIn, UserText(kSignInText));
    mDialog.SetText(kReconnectCancel, UserText(kCancelText));
    // Without a password there is nothing to sign in with; the window stays.
    mDialog.SetHandler(kReconnectSignIn, [this] {
        if (!mDialog.GetText(kReconnectPassword).empty()) {
            mDialog.Close(ostui::kResponseOK);
        }
    });
}

ReconnectDialog::Answer ReconnectDialog::Run() {
    switch (mDialog.RunModal()) {
        case ostui::kResponseOK:
            return Answer::kSignIn;
        case kResponseOvertaken:
            return Answer::kOvertaken;
        default:
            return Answer::kCancel;
    }
}

std::string ReconnectDialog::TakePassword() {
    std::string password = mDialog.GetText(kReconnectPassword);
    mDialog.SetText(kReconnectPassword, {});
    return password;
}

void ReconnectDialog::CloseAsOvertaken() {
    mDialog.Close(kResponseOvertaken);
}

}  // namespace ZOCL
