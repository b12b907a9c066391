// Message boxes for hosts.
#include "ostcore/config/ZString.h"
#include "ostcore/utility/StringConversion.h"
#include "ZOClient/Dialogs.h"

namespace ZOCL {

using ostcore::utility::ToUTF8;

namespace {

const char kStandardCancel[] = "$$$/ZOCL/SimpleMessageBoxCancel=Cancel";

}  // namespace

int SimpleMessageBox(const UString& inTitle, const UString& inMessage, int inButtons, int inDefaultButton,
                     ostui::MessageBoxIcon inIcon) {
    ostui::MessageBoxSettings box;
    box.title = ToUTF8(inTitle);
    box.message = ToUTF8(inMessage);
    box.buttons = inButtons;
    box.defaultButton = inDefaultButton;
    box.icon = inIcon;
    return ostui::RunMessageBox(box);
}

int SimpleMessageBoxWithCancel(const UString& inTitle, const UString& inMessage, const UString& inOKText,
                               const UString& inCancelText) {
    ostui::MessageBoxSettings box;
    box.title = ToUTF8(inTitle);
    box.message = ToUTF8(inMessage);
    box.buttons = ostui::kMessageBoxOK | ostui::kMessageBoxCancel;
    box.defaultButton = ostui::kMessageBoxOK;
    box.buttonTexts[ostui::kMessageBoxCancel] =
        inCancelText.empty() ? ostcore::ZString(kStandardCancel).AsUTF8() : ToUTF8(inCancelText);
    if (!inOKText.empty()) {
        box.buttonTexts[ostui::kMessageBoxOK] = ToUTF8(inOKText);
    }
    return ostui::RunMessageBox(box);
}

}  // namespace ZOCL
