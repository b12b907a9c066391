// A message box is a dialog of one text and up to four buttons.
#include "ostui/MessageBox.h"

#include "ostcore/config/ZString.h"
#include "ostcore/threads/MainThread.h"

namespace ostui {

const char* const kMessageBoxID = "MessageBox";
const char* const kMessageBoxText = "messageText";
const char* const kMessageBoxImage = "messageImage";

namespace {

struct StandardButton {
    MessageBoxButton button;
    const char* id;
    const char* text;
};

constexpr StandardButton kStandardButtons[] = {
    {kMessageBoxYes, "yesButton", "$$$/ostui/MessageBox/Yes=Yes"},
    {kMessageBoxOK, "okButton", "$$$/ostui/MessageBox/OK=OK"},
    {kMessageBoxNo, "noButton", "$$$/ostui/MessageBox/No=No"},
    {kMessageBoxCancel, "cancelButton", "$$$/ostui/MessageBox/Cancel=Cancel"},
};

/// From the one that changes least to the one that changes most.
constexpr MessageBoxButton kByHarmlessness[] = {kMessageBoxCancel, kMessageBoxNo, kMessageBoxOK,
                                                kMessageBoxYes};

int MostHarmless(int inButtons) {
    for (const MessageBoxButton button : kByHarmlessness) {
        if (inButtons & button) {
            return button;
        }
    }
    return kMessageBoxOK;
}

U8String TextOf(const StandardButton& inButton, const MessageBoxSettings& inSettings) {
    const auto own = inSettings.buttonTexts.find(inButton.button);
    return own == inSettings.buttonTexts.end() ? ostcore::ZString(inButton.text).AsUTF8() : own->second;
}

}  // namespace

std::string GetMessageBoxIconName(MessageBoxIcon inIcon) {
    switch (inIcon) {
        case MessageBoxIcon::kNote:
            return "MessageBoxNote";
        case MessageBoxIcon::kCaution:
            return "MessageBoxCaution";
        case MessageBoxIcon::kStop:
            return "MessageBoxStop";
        case MessageBoxIcon::kNone:
            break;
    }
    return {};
}

std::string GetMessageBoxButtonID(int inButton) {
    for (const StandardButton& standard : kStandardButtons) {
        if (standard.button == inButton) {
            return standard.id;
        }
    }
    return {};
}

int RunMessageBox(const MessageBoxSettings& inSettings) {
    if (!ostcore::threads::IsMainThread()) {
        return kMessageBoxNoAnswer;
    }
    const int harmless = MostHarmless(inSettings.buttons);
    Dialog dialog(kMessageBoxID, inSettings.title);
    if (inSettings.icon != MessageBoxIcon::kNone) {
        dialog.AddImage(kMessageBoxImage, GetMessageBoxIconName(inSettings.icon));
    }
    dialog.AddStaticText(kMessageBoxText, inSettings.message);
    for (const StandardButton& standard : kStandardButtons) {
        if ((inSettings.buttons | harmless) & standard.button) {
            dialog.AddButton(standard.id, TextOf(standard, inSettings), standard.button);
        }
    }
    dialog.SetCancelButton(GetMessageBoxButtonID(harmless));
    dialog.SetDefaultButton(GetMessageBoxButtonID(inSettings.defaultButton));
    return dialog.RunModal();
}

}  // namespace ostui
