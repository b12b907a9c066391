// Controls, and the life of a modal run.
#include "ostui/Dialog.h"

#include <algorithm>

#include "ostcore/threads/MainThread.h"
#include "ostui/BackEnd.h"

namespace ostui {
namespace {

void Wipe(U8String& ioText) {
    volatile char* bytes = ioText.data();
    for (std::size_t i = 0; i < ioText.size(); ++i) {
        bytes[i] = 0;
    }
    ioText.clear();
}

}  // namespace

Dialog::Dialog(std::string inID, U8String inTitle) : mID(std::move(inID)), mTitle(std::move(inTitle)) {}

Dialog::~Dialog() {
    for (Control& control : mControls) {
        if (control.type == ControlType::kPasswordEdit) {
            Wipe(control.text);
        }
    }
}

Control& Dialog::Add(ControlType inType, const std::string& inID) {
    Control control;
    control.type = inType;
    control.id = inID;
    mControls.push_back(std::move(control));
    mHandlers.emplace_back();
    return mControls.back();
}

void Dialog::AddStaticText(const std::string& inID, U8String inText) {
    Add(ControlType::kStaticText, inID).text = std::move(inText);
}

void Dialog::AddTextEdit(const std::string& inID, U8String inLabel, U8String inText) {
    Control& control = Add(ControlType::kTextEdit, inID);
    control.label = std::move(inLabel);
    control.text = std::move(inText);
}

void Dialog::AddPasswordEdit(const std::string& inID, U8String inLabel) {
    Add(ControlType::kPasswordEdit, inID).label = std::move(inLabel);
}

void Dialog::AddList(const std::string& inID, U8String inLabel, std::vector<U8String> inItems) {
    Control& control = Add(ControlType::kList, inID);
    control.label = std::move(inLabel);
    control.items = std::move(inItems);
}

void Dialog::AddProgressBar(const std::string& inID) {
    Add(ControlType::kProgressBar, inID);
}

void Dialog::AddButton(const std::string& inID, U8String inText, int inResponse) {
    AddButton(inID, std::move(inText), [this, inResponse] { Close(inResponse); });
}

void Dialog::AddButton(const std::string& inID, U8String inText, function<void()> inOnPressed) {
    Add(ControlType::kButton, inID).text = std::move(inText);
    mHandlers.back().swap(inOnPressed);
}

void Dialog::SetCancelButton(const std::string& inID) {
    mCancelButton = inID;
}

void Dialog::SetDefaultButton(const std::string& inID) {
    mDefaultButton = inID;
}

void Dialog::SetClosesByItself() {
    mClosesByItself = true;
}

const Control* Dialog::Find(const std::string& inID) const {
    const auto found = std::find_if(mControls.begin(), mControls.end(),
                                    [&](const Control& inControl) { return inControl.id == inID; });
    return found == mControls.end() ? nullptr : &*found;
}

Control* Dialog::FindUsable(const std::string& inID) {
    Control* const control = const_cast<Control*>(Find(inID));
    return control && control->isVisible && control->isEnabled ? control : nullptr;
}

template <class Change>
void Dialog::ChangeControl(const std::string& inID, const Change& inChange) {
    if (Control* const control = const_cast<Control*>(Find(inID))) {
        inChange(*control);
        Tell(inID);
    }
}

void Dialog::Tell(const std::string& inID) {
    const shared_ptr<BackEnd> backEnd = mIsRunning ? GetBackEnd() : nullptr;
    const Control* const control = Find(inID);
    if (backEnd && control) {
        backEnd->OnControlChanged(*this, *control);
    }
}

void Dialog::SetText(const std::string& inID, U8String inText) {
    ChangeControl(inID, [&](Control& ioControl) {
        if (ioControl.type == ControlType::kPasswordEdit) {
            Wipe(ioControl.text);
        }
        ioControl.text = std::move(inText);
    });
}

void Dialog::SetItems(const std::string& inID, std::vector<U8String> inItems) {
    ChangeControl(inID, [&](Control& ioControl) {
        ioControl.items = std::move(inItems);
        ioControl.selection = -1;
    });
}

void Dialog::SetProgress(const std::string& inID, std::uint32_t inValue, std::uint32_t inTotal) {
    ChangeControl(inID, [&](Control& ioControl) {
        ioControl.value = std::min(inValue, inTotal);
        ioControl.total = inTotal;
    });
}

void Dialog::SetEnabled(const std::string& inID, bool inIsEnabled) {
    ChangeControl(inID, [&](Control& ioControl) { ioControl.isEnabled = inIsEnabled; });
}

void Dialog::SetVisible(const std::string& inID, bool inIsVisible) {
    ChangeControl(inID, [&](Control& ioControl) { ioControl.isVisible = inIsVisible; });
}

U8String Dialog::GetText(const std::string& inID) const {
    const Control* const control = Find(inID);
    return control ? control->text : U8String();
}

int Dialog::GetSelection(const std::string& inID) const {
    const Control* const control = Find(inID);
    return control ? control->selection : -1;
}

int Dialog::RunModal() {
    if (!ostcore::threads::IsMainThread() || mIsRunning) {
        return kResponseNone;
    }
    mIsRunning = true;
    const shared_ptr<BackEnd> backEnd = GetBackEnd();
    if (IsClosed()) {
        // Its occasion has passed before it could be shown.
    } else if (backEnd) {
        backEnd->RunModal(*this);
    } else if (mClosesByItself) {
        PumpUntilClosed(*this);
    } else {
        Dismiss();
    }
    mIsRunning = false;
    return mResponse.exchange(kStillOpen);
}

void Dialog::Close(int inResponse) {
    int open = kStillOpen;
    mResponse.compare_exchange_strong(open, inResponse);
    // Wakes the loop that waits for it.
    ostcore::threads::AsyncCallFromMainThread([] {});
}

bool Dialog::IsClosed() const noexcept {
    return mResponse != kStillOpen;
}

bool Dialog::Press(const std::string& inButton) {
    const Control* const button = FindUsable(inButton);
    if (!button || button->type != ControlType::kButton || IsClosed()) {
        return false;
    }
    const function<void()> handler = mHandlers[static_cast<std::size_t>(button - mControls.data())];
    if (handler) {
        handler();
    }
    return true;
}

bool Dialog::Enter(const std::string& inEdit, U8String inText) {
    Control* const edit = FindUsable(inEdit);
    if (!edit || (edit->type != ControlType::kTextEdit && edit->type != ControlType::kPasswordEdit)) {
        return false;
    }
    SetText(inEdit, std::move(inText));
    return true;
}

bool Dialog::Select(const std::string& inList, int inRow) {
    Control* const list = FindUsable(inList);
    if (!list || list->type != ControlType::kList || inRow < -1 ||
        inRow >= static_cast<int>(list->items.size())) {
        return false;
    }
    list->selection = inRow;
    Tell(inList);
    return true;
}

void Dialog::Dismiss() {
    Press(mCancelButton);
    if (!mClosesByItself && !IsClosed()) {
        Close(kResponseCancel);
    }
}

}  // namespace ostui
