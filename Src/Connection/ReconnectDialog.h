// The window that asks for the password again when a session has ended.
#pragma once

#include "Frame/LibraryWindow.h"

namespace ZOCL {

constexpr const char* kReconnectDialogID = "ZOReconnectDialog";
constexpr const char* kReconnectMessage = "messageText";
constexpr const char* kReconnectPassword = "passwordTextEdit";
constexpr const char* kReconnectSignIn = "okButton";
constexpr const char* kReconnectCancel = "cancelButton";

/// Asks until it is answered or overtaken. Threads: the main thread, except CloseAsOvertaken.
class ReconnectDialog {
public:
    enum class Answer {
        kSignIn,
        kCancel,
        /// A token came from elsewhere, or the session is over: nobody needs the answer.
        kOvertaken
    };

    ReconnectDialog(const ImmutableString& inUsername, const ImmutableString& inServer);
    Answer Run();
    /// What was entered; the dialog forgets it.
    std::string TakePassword();
    void CloseAsOvertaken();

private:
    LibraryWindow mWindow;
    ostui::Dialog& mDialog;
};

}  // namespace ZOCL
