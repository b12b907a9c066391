// A modal window as its logic sees it: controls that are addressed by their identifiers. How it looks is the
// back end's business (ostui/BackEnd.h).
#pragma once

#include <atomic>
#include <cstdint>
#include <string>
#include <vector>

#include "ostcore/Export.h"
#include "ostcore/Types.h"

namespace ostui {

using ostcore::function;
using ostcore::U8String;

enum class ControlType { kStaticText, kTextEdit, kPasswordEdit, kList, kProgressBar, kButton };

/// The state of one control. Texts are UTF-8.
struct Control {
    ControlType type = ControlType::kStaticText;
    std::string id;
    /// What stands beside an edit or a list; empty for the others.
    U8String label;
    /// What a static text or a button reads, or what an edit holds.
    U8String text;
    /// The rows of a list, and the selected one; -1 is none.
    std::vector<U8String> items;
    int selection = -1;
    /// How far a progress bar is; a total of 0 is a bar that only shows that something runs.
    std::uint32_t value = 0;
    std::uint32_t total = 0;
    bool isVisible = true;
    bool isEnabled = true;
};

constexpr int kResponseNone = 0;
constexpr int kResponseOK = 1;
constexpr int kResponseCancel = 2;

/// One modal window. Make it, add its controls in the order in which they stand, run it.
///
/// Threads: the main thread, except Close and IsClosed, which may be called on any. Handlers run on the main
/// thread with no lock held; they may change any control, run other dialogs and close this one.
class ZOPLATFORM_EXPORT Dialog {
public:
    Dialog(std::string inID, U8String inTitle);
    /// Overwrites what password edits hold. The dialog must not be running.
    ~Dialog();
    Dialog(const Dialog&) = delete;
    Dialog& operator=(const Dialog&) = delete;

    // --- Making it. An identifier is used once in a dialog.

    void AddStaticText(const std::string& inID, U8String inText);
    void AddTextEdit(const std::string& inID, U8String inLabel, U8String inText);
    void AddPasswordEdit(const std::string& inID, U8String inLabel);
    void AddList(const std::string& inID, U8String inLabel, std::vector<U8String> inItems);
    void AddProgressBar(const std::string& inID);
    /// A button that closes the dialog with a response.
    void AddButton(const std::string& inID, U8String inText, int inResponse);
    void AddButton(const std::string& inID, U8String inText, function<void()> inOnPressed);
    /// The button that stands for the user who does not answer: the closing box, the escape key, no back end
    /// at all. Without one, not answering closes the dialog with kResponseCancel.
    void SetCancelButton(const std::string& inID);
    /// The button that the enter key presses.
    void SetDefaultButton(const std::string& inID);
    /// Says that the logic closes the dialog when something has happened, so that it asks for no answer.
    void SetClosesByItself();

    // --- Its logic, before and while it runs. An unknown identifier has no effect, or gives nothing.

    void SetText(const std::string& inID, U8String inText);
    void SetItems(const std::string& inID, std::vector<U8String> inItems);
    void SetProgress(const std::string& inID, std::uint32_t inValue, std::uint32_t inTotal);
    void SetEnabled(const std::string& inID, bool inIsEnabled);
    void SetVisible(const std::string& inID, bool inIsVisible);
    U8String GetText(const std::string& inID) const;
    int GetSelection(const std::string& inID) const;

    /// Shows the dialog and pumps the main thread's queue until it is closed; gives the response of Close.
    /// Without a back end nothing is shown: a dialog that closes by itself is waited for, any other one is
    /// dismissed. On another thread nothing happens and kResponseNone is returned.
    /// A dialog that was closed before it ran returns at once. It may run again afterwards.
    int RunModal();
    /// The first call counts until the dialog runs again.
    void Close(int inResponse);
    bool IsClosed() const noexcept;

    // --- For back ends: what there is to show, and what the user does.

    const std::string& GetID() const noexcept { return mID; }
    const U8String& GetTitle() const noexcept { return mTitle; }
    const std::vector<Control>& GetControls() const noexcept { return mControls; }
    const Control* Find(const std::string& inID) const;
    const std::string& GetCancelButton() const noexcept { return mCancelButton; }
    const std::string& GetDefaultButton() const noexcept { return mDefaultButton; }
    bool ClosesByItself() const noexcept { return mClosesByItself; }
    /// Each is false, without effect, when there is no such control or it is hidden or disabled.
    bool Press(const std::string& inButton);
    bool Enter(const std::string& inEdit, U8String inText);
    bool Select(const std::string& inList, int inRow);
    /// The user does not answer. The dialog is closed afterwards, except when it closes by itself and its
    /// cancel button leaves it open.
    void Dismiss();

private:
    static constexpr int kStillOpen = -0x7FFFFFFF;

    Control& Add(ControlType inType, const std::string& inID);
    Control* FindUsable(const std::string& inID);
    template <class Change>
    void ChangeControl(const std::string& inID, const Change& inChange);
    void Tell(const std::string& inID);

    const std::string mID;
    const U8String mTitle;
    std::vector<Control> mControls;
    /// By the index of the control; empty for those that are no buttons.
    std::vector<function<void()>> mHandlers;
    std::string mCancelButton;
    std::string mDefaultButton;
    bool mClosesByItself = false;
    bool mIsRunning = false;
    /// The response of the Close that counted; kStillOpen until then.
    std::atomic<int> mResponse{kStillOpen};
};

}  // namespace ostui
