// The life of a modal run, and what the user does in it.
#include "ostui/Dialog.h"

#include <utility>

#include "ostcore/threads/MainThread.h"
#include "ostui/BackEnd.h"
#include "ostui/detail/RunningDialogs.h"

namespace ostui {
namespace {

bool IsEdit(ControlType inType) noexcept {
    return inType == ControlType::kTextEdit || inType == ControlType::kPasswordEdit ||
           inType == ControlType::kSearchEdit;
}

/// Sets a mark for a scope.
class Mark {
public:
    explicit Mark(bool& ioMark) : mMark(ioMark) { mMark = true; }
    ~Mark() { mMark = false; }
    Mark(const Mark&) = delete;
    Mark& operator=(const Mark&) = delete;

private:
    bool& mMark;
};

}  // namespace

int Dialog::RunModal() {
    if (!ostcore::threads::IsMainThread() || mIsRunning) {
        return kResponseNone;
    }
    {
        const Mark running(mIsRunning);
        const detail::RunningDialog counted(*this);
        mIsOpened = false;
        Show();
    }
    return mResponse.exchange(kStillOpen);
}

void Dialog::Show() {
    const shared_ptr<BackEnd> backEnd = GetBackEnd();
    if (IsClosed()) {
        // Its occasion has passed before it could be shown.
    } else if (backEnd) {
        backEnd->RunModal(*this);
    } else if (mClosesByItself) {
        TellOpened();
        PumpUntilClosed(*this);
    } else {
        Dismiss();
    }
}

void Dialog::TellOpened() {
    const function<void()> onOpened = mOnOpened;
    if (mIsRunning && !std::exchange(mIsOpened, true) && onOpened) {
        onOpened();
    }
}

void Dialog::TellBackEnd() {
    const shared_ptr<BackEnd> backEnd = mIsRunning ? GetBackEnd() : nullptr;
    if (backEnd) {
        backEnd->OnDialogChanged(*this);
    }
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

Control* Dialog::FindUsable(const std::string& inID) {
    Control* const control = const_cast<Control*>(Find(inID));
    return control && !IsClosed() && IsUsable(*control) ? control : nullptr;
}

void Dialog::CallHandler(const Control& inControl) {
    // A copy, since it may be replaced from within.
    const function<void()> handler = mHandlers[static_cast<std::size_t>(&inControl - mControls.data())];
    if (handler) {
        handler();
    }
}

bool Dialog::Press(const std::string& inButton) {
    const Control* const button = FindUsable(inButton);
    if (!button || button->type != ControlType::kButton) {
        return false;
    }
    CallHandler(*button);
    return true;
}

bool Dialog::Enter(const std::string& inEdit, U8String inText) {
    const Control* const edit = FindUsable(inEdit);
    if (!edit || !IsEdit(edit->type)) {
        return false;
    }
    const bool isChanged = edit->text != inText;
    SetText(inEdit, std::move(inText));
    if (isChanged) {
        CallHandler(*edit);
    }
    return true;
}

bool Dialog::Select(const std::string& inList, int inRow) {
    Control* const choice = FindUsable(inList);
    const bool isNone = choice && inRow == -1 && choice->type == ControlType::kList;
    if (!choice || (!isNone && !choice->HasItem(inRow)) || !choice->IsItemEnabled(inRow)) {
        return false;
    }
    if (choice->type == ControlType::kTabs) {
        const Control* const page = Find(choice->itemIDs[static_cast<std::size_t>(inRow)]);
        if (page && !IsUsable(*page)) {
            return false;
        }
    }
    const bool isChanged = std::exchange(choice->selection, inRow) != inRow;
    Tell(inList);
    if (isChanged) {
        CallHandler(*choice);
    }
    return true;
}

bool Dialog::Check(const std::string& inCheckBox, bool inIsChecked) {
    Control* const box = FindUsable(inCheckBox);
    if (!box || box->type != ControlType::kCheckBox) {
        return false;
    }
    const bool isChanged = std::exchange(box->isChecked, inIsChecked) != inIsChecked;
    Tell(inCheckBox);
    if (isChanged) {
        CallHandler(*box);
    }
    return true;
}

bool Dialog::SelectRows(const std::string& inTree, const std::vector<int>& inRows) {
    const Control* const control = FindUsable(inTree);
    return control && control->tree && control->tree->Select(inRows);
}

void Dialog::Dismiss() {
    Press(mCancelButton);
    if (!mClosesByItself && !IsClosed()) {
        Close(kResponseCancel);
    }
}

}  // namespace ostui
