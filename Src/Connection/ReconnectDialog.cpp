// Layout and answers of the reconnect window.
#include "Connection/ReconnectDialog.h"

#include "ostcore/config/ZString.h"

namespace ZOCL {

namespace {

constexpr int kResponseOvertaken = 3;
const char kTitle[] = "$$$/ZOCL/ReconnectDialog/Title=Orvane Meridane";
const char kMessage[] =
    "$$$/ZOCL/ReconnectDialog/MsgStr=You have been signed out from the current Orvane Meridane session.\n\n"
    "Please re-enter the password for the user \"@0\" on the server \"@1\":";
const char kSignInText[] = "$$$/ZOCL/ReconnectDialog/SignInText=Sign In";
const char kCancelText[] = "$$$/ZOCL/ReconnectDialog/CancelText=Cancel";
const char kPasswordLabel[] = "$$$/Cadenzo/ZOCL/ZOLoginDialog/kResZOCLPassword=Password";

U8String Text(const char* inKey) {
    return ostcore::ZString(inKey).AsUTF8();
}

}  // namespace

ReconnectDialog::ReconnectDialog(const ImmutableString& inUsername, const ImmutableString& inServer)
    : mDialog(kReconnectDialogID, Text(kTitle)) {
    mDialog.AddStaticText("messageText",
                          ostcore::ZString(kMessage, {inUsername.str(), inServer.str()}).AsUTF8());
    mDialog.AddPasswordEdit(kReconnectPassword, Text(kPasswordLabel));
    // Without a password there is nothing to sign in with; the window stays.
    mDialog.AddButton(kReconnectSignIn, Text(kSignInText), [this] {
        if (!mDialog.GetText(kReconnectPassword).empty()) {
            mDialog.Close(ostui::kResponseOK);
        }
    });
    mDialog.AddButton(kReconnectCancel, Text(kCancelText), ostui::kResponseCancel);
    mDialog.SetDefaultButton(kReconnectSignIn);
    mDialog.SetCancelButton(kReconnectCancel);
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
