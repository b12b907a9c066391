// The controls of a dialog: how they are added, found and changed by the logic.
#include <algorithm>

#include "ostcore/debug/Trace.h"
#include "ostui/BackEnd.h"
#include "ostui/Dialog.h"

namespace ostui {
namespace {

void Wipe(U8String& ioText) {
    volatile char* bytes = ioText.data();
    for (std::size_t i = 0; i < ioText.size(); ++i) {
        bytes[i] = 0;
    }
    ioText.clear();
}

bool HasFixedItems(ControlType inType) noexcept {
    return inType == ControlType::kRadioGroup || inType == ControlType::kTabs;
}

bool HasIdentifier(const View& inView, const std::string& inID) {
    const std::string* const own = inView.Find("identifier");
    return (own && *own == inID) ||
           std::any_of(inView.children.begin(), inView.children.end(),
                       [&](const View& inChild) { return HasIdentifier(inChild, inID); });
}

}  // namespace

int Control::FindItem(const std::string& inItemID) const noexcept {
    const auto found = std::find(itemIDs.begin(), itemIDs.end(), inItemID);
    return found == itemIDs.end() || inItemID.empty() ? -1 : static_cast<int>(found - itemIDs.begin());
}

Dialog::Dialog(std::string inID, U8String inTitle) : mID(std::move(inID)), mTitle(std::move(inTitle)) {}

Dialog::~Dialog() {
    for (Control& control : mControls) {
        if (control.type == ControlType::kPasswordEdit) {
            Wipe(control.text);
        } else if (control.tree) {
            control.tree->SetOnChanged({});
        }
    }
}

Control& Dialog::Add(ControlType inType, const std::string& inID) {
    const bool isDuplicate = Find(inID) != nullptr;
    Control control;
    control.type = inType;
    control.id = isDuplicate || inID.empty() ? MakeUpID() : inID;
    control.isEnabled = !isDuplicate;
    if (isDuplicate) {
        ostcore::debug::Trace(
            "ostui", ostcore::debug::kTraceLevel_Error,
            "The dialog " + mID + " has two controls " + inID + "; the second is disabled.");
    }
    if (inType == ControlType::kTree) {
        control.tree = boost::make_shared<Tree>();
        control.tree->SetOnChanged([this, id = control.id] { Tell(id); });
    }
    mControls.push_back(std::move(control));
    mHandlers.emplace_back();
    return mControls.back();
}

std::string Dialog::MakeUpID() const {
    for (int number = 1;; ++number) {
        const std::string id = "#" + std::to_string(number);
        if (!Find(id) && !(mLayout && HasIdentifier(*mLayout, id))) {
            return id;
        }
    }
}

void Dialog::AddStaticText(const std::string& inID, U8String inText) {
    Add(ControlType::kStaticText, inID).text = std::move(inText);
}

void Dialog::AddImage(const std::string& inID, std::string inImage) {
    Add(ControlType::kImage, inID).image = std::move(inImage);
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
    TellBackEnd();
}

void Dialog::SetClosesByItself() {
    mClosesByItself = true;
}

function<void()>* Dialog::FindHandler(const std::string& inID, bool inIsButton) {
    const Control* const control = Find(inID);
    if (!control || (control->type == ControlType::kButton) != inIsButton) {
        return nullptr;
    }
    return &mHandlers[static_cast<std::size_t>(control - mControls.data())];
}

void Dialog::SetHandler(const std::string& inButton, function<void()> inOnPressed) {
    if (function<void()>* const handler = FindHandler(inButton, true)) {
        handler->swap(inOnPressed);
    }
}

void Dialog::SetOnChanged(const std::string& inID, function<void()> inFunction) {
    if (function<void()>* const handler = FindHandler(inID, false)) {
        handler->swap(inFunction);
    }
}

void Dialog::SetFocus(const std::string& inID) {
    mFocus = inID;
}

void Dialog::SetOnOpened(function<void()> inFunction) {
    mOnOpened.swap(inFunction);
}

const Control* Dialog::Find(const std::string& inID) const {
    const auto found = std::find_if(mControls.begin(), mControls.end(),
                                    [&](const Control& inControl) { return inControl.id == inID; });
    return found == mControls.end() ? nullptr : &*found;
}

bool Dialog::IsShown(const Control& inControl) const {
    // Groups stand before what they hold, so this comes to an end.
    const Control* control = &inControl;
    while (control && control->isVisible) {
        if (control->group.empty()) {
            return true;
        }
        control = Find(control->group);
    }
    return false;
}

bool Dialog::IsUsable(const Control& inControl) const {
    const Control* control = &inControl;
    while (control && control->isVisible && control->isEnabled) {
        if (control->group.empty()) {
            return true;
        }
        control = Find(control->group);
    }
    return false;
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
        if (!HasFixedItems(ioControl.type)) {
            ioControl.itemIDs.clear();
            ioControl.selection = -1;
        } else if (inItems.size() != ioControl.items.size()) {
            return;
        }
        ioControl.items = std::move(inItems);
    });
}

void Dialog::SetProgress(const std::string& inID, std::uint32_t inValue, std::uint32_t inTotal) {
    ChangeControl(inID, [&](Control& ioControl) {
        ioControl.value = std::min(inValue, inTotal);
        ioControl.total = inTotal;
    });
}

void Dialog::SetEnabled(const std::string& inID, bool inIsEnabled) {
    if (Find(inID)) {
        ChangeControl(inID, [&](Control& ioControl) { ioControl.isEnabled = inIsEnabled; });
        return;
    }
    for (const Control& control : mControls) {
        const int row = control.type == ControlType::kRadioGroup ? control.FindItem(inID) : -1;
        if (row >= 0) {
            ChangeControl(control.id, [&](Control& ioControl) {
                if (inIsEnabled) {
                    ioControl.disabledItems.erase(row);
                } else {
                    ioControl.disabledItems.insert(row);
                }
            });
            return;
        }
    }
}

void Dialog::SetVisible(const std::string& inID, bool inIsVisible) {
    ChangeControl(inID, [&](Control& ioControl) { ioControl.isVisible = inIsVisible; });
}

void Dialog::SetTitle(U8String inTitle) {
    mTitle = std::move(inTitle);
    TellBackEnd();
}

void Dialog::SetSelection(const std::string& inID, int inRow) {
    ChangeControl(inID, [&](Control& ioControl) {
        if (inRow == -1 || ioControl.HasItem(inRow)) {
            ioControl.selection = inRow;
        }
    });
}

void Dialog::SetChecked(const std::string& inID, bool inIsChecked) {
    ChangeControl(inID, [&](Control& ioControl) { ioControl.isChecked = inIsChecked; });
}

U8String Dialog::GetText(const std::string& inID) const {
    const Control* const control = Find(inID);
    return control ? control->text : U8String();
}

bool Dialog::IsChecked(const std::string& inID) const {
    const Control* const control = Find(inID);
    return control && control->isChecked;
}

shared_ptr<Tree> Dialog::GetTree(const std::string& inID) const {
    const Control* const control = Find(inID);
    return control ? control->tree : nullptr;
}

void Dialog::SetGeometry(const Geometry& inGeometry) {
    mGeometry = inGeometry;
}

int Dialog::GetSelection(const std::string& inID) const {
    const Control* const control = Find(inID);
    return control ? control->selection : -1;
}

}  // namespace ostui
