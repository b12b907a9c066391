// The message box: a text and a choice of standard buttons.
#pragma once

#include <map>

#include "ostcore/Export.h"
#include "ostui/Dialog.h"

namespace ostui {

/// Standard buttons, to be combined.
enum MessageBoxButton : int {
    kMessageBoxOK = 1,
    kMessageBoxCancel = 2,
    kMessageBoxYes = 4,
    kMessageBoxNo = 8,
};
/// What comes back when nothing could be shown, since the caller is not on the main thread.
constexpr int kMessageBoxNoAnswer = 2048;

/// What kind of message it is.
enum class MessageBoxIcon {
    kNone,
    kNote,
    kCaution,
    /// Something has failed.
    kStop
};

/// The identifier of each message box, and of what is in it.
extern ZOPLATFORM_EXPORT const char* const kMessageBoxID;
extern ZOPLATFORM_EXPORT const char* const kMessageBoxText;
/// Only in a box with an icon.
extern ZOPLATFORM_EXPORT const char* const kMessageBoxImage;

struct MessageBoxSettings {
    U8String title;
    U8String message;
    /// A combination of MessageBoxButton.
    int buttons = kMessageBoxOK;
    /// 0: none is pressed by the enter key.
    int defaultButton = 0;
    MessageBoxIcon icon = MessageBoxIcon::kNone;
    /// Texts in the place of the standard ones, by button.
    std::map<int, U8String> buttonTexts;
};

/// Shows the box and returns the button that was pressed. When nobody answers, or nobody can be asked, that
/// is the one that changes least: Cancel, else No, else OK, else Yes. Main thread; see kMessageBoxNoAnswer.
ZOPLATFORM_EXPORT int RunMessageBox(const MessageBoxSettings& inSettings);

/// "MessageBoxNote", "MessageBoxCaution", "MessageBoxStop": a back end that shows images has icons of these
/// names, also when its host supplies none. Empty for kNone.
ZOPLATFORM_EXPORT std::string GetMessageBoxIconName(MessageBoxIcon inIcon);
/// "okButton", "cancelButton", "yesButton", "noButton"; empty for anything else.
ZOPLATFORM_EXPORT std::string GetMessageBoxButtonID(int inButton);

}  // namespace ostui
