// A modal window as its logic sees it: controls that are addressed by their identifiers. How it looks is the
// back end's business (ostui/BackEnd.h).
#pragma once

#include <atomic>
#include <cstdint>
#include <set>
#include <string>
#include <vector>

#include "ostcore/Export.h"
#include "ostcore/Types.h"
#include "ostui/Tree.h"
#include "ostui/View.h"

namespace ostui {

using ostcore::function;
using ostcore::optional;
using ostcore::shared_ptr;
using ostcore::U8String;

enum class ControlType {
    kStaticText,
    kTextEdit,
    kPasswordEdit,
    kSearchEdit,
    kList,
    /// A choice of one from a closed list.
    kPopup,
    /// A choice of one that shows all; its items are radio buttons.
    kRadioGroup,
    kCheckBox,
    kTree,
    kImage,
    kProgressBar,
    kButton,
    /// Pages of which one is seen; its items are the pages' titles, itemIDs their groups.
    kTabs,
    /// Holds other controls, which are seen and usable only when it is: a row, a column, a box, a subview.
    /// Its text is its title. A radio group and tabs hold controls in the same way.
    kGroup
};

/// The state of one control. Texts are UTF-8.
struct ZOPLATFORM_EXPORT Control {
    ControlType type = ControlType::kStaticText;
    std::string id;
    /// What stands beside an edit or a list; empty for the others.
    U8String label;
    /// What a static text or a button reads, or what an edit holds.
    U8String text;
    /// The rows of a list, popup or radio group, and the selected one; -1 is none.
    std::vector<U8String> items;
    /// The identifiers of a radio group's buttons or of the pages of tabs, and of a popup's items as long as
    /// they are those of its layout (empty for an item without); empty otherwise.
    std::vector<std::string> itemIDs;
    /// The radio buttons that cannot be chosen.
    std::set<int> disabledItems;
    int selection = -1;
    /// Whether a check box is checked.
    bool isChecked = false;
    /// A text that may have several lines: static texts wrap, edits take the enter key.
    bool isMultiLine = false;
    U8String tooltip;
    /// The name of the icon of an image or of a button; empty is none.
    std::string image;
    /// Of kTree only; never null there.
    shared_ptr<Tree> tree;
    /// The identifier of the group that holds it; empty at the top.
    std::string group;
    /// How far a progress bar is; a total of 0 is a bar that only shows that something runs.
    std::uint32_t value = 0;
    std::uint32_t total = 0;
    bool isVisible = true;
    bool isEnabled = true;

    bool HasItem(int inRow) const noexcept { return inRow >= 0 && inRow < static_cast<int>(items.size()); }
    /// -1 when there is no such item.
    int FindItem(const std::string& inItemID) const noexcept;
    bool IsItemEnabled(int inRow) const noexcept { return disabledItems.count(inRow) == 0; }
};

/// Where a window stands, in pixels of a display at 96 dpi.
struct Geometry {
    int left = 0;
    int top = 0;
    int width = 0;
    int height = 0;
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
    /// Makes the controls of a layout, in its order; its root is an "ost_dialog". Buttons do nothing until
    /// SetHandler, except those of "ost_ok_cancel_row" ("okButton", "cancelButton") and "ost_cancel_row",
    /// which close the dialog, are the default and the cancel button. Popups begin at their first item,
    /// tabs at their first page, radio groups without a choice. The layout that GetLayout gives has an
    /// identifier at each control: one that had none is called "#1", "#2", ...
    Dialog(std::string inID, View inLayout);
    /// Overwrites what password edits hold. The dialog must not be running.
    ~Dialog();
    Dialog(const Dialog&) = delete;
    Dialog& operator=(const Dialog&) = delete;

    // --- Making it. An identifier is used once in a dialog. A control whose identifier another one has
    // already gets one of its own ("#1", ...), is disabled for good, and is traced as an error (channel
    // "ostui"): it can be seen, so that the mistake is noticed, and does nothing.

    void AddStaticText(const std::string& inID, U8String inText);
    /// An image by the name of its icon; beside a static text that is added next.
    void AddImage(const std::string& inID, std::string inImage);
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
    /// The button that the enter key presses, as long as it can be pressed.
    void SetDefaultButton(const std::string& inID);
    /// Says that the logic closes the dialog when something has happened, so that it asks for no answer.
    void SetClosesByItself();

    /// What pressing a button does, in the place of what it did.
    void SetHandler(const std::string& inButton, function<void()> inOnPressed);
    /// What is called after the user has changed an edit, a choice or a check box; not for what the logic
    /// changes, nor for an answer that changes nothing. Trees have their own (Tree::SetOnSelectionChanged).
    void SetOnChanged(const std::string& inID, function<void()> inFunction);
    /// The edit or list that has the keyboard at first.
    void SetFocus(const std::string& inID);
    /// Called on the main thread once in each run, when the window is on the screen; may start what fills it.
    /// Called, too, when nothing can be shown and the dialog is waited for since it closes by itself; not
    /// when it is dismissed unseen.
    void SetOnOpened(function<void()> inFunction);

    // --- Its logic, before and while it runs. An unknown identifier has no effect, or gives nothing.

    void SetText(const std::string& inID, U8String inText);
    /// Of a list or popup, which have no selection then. Of a radio group or of tabs: the texts, as many as
    /// there are items; otherwise there is no effect.
    void SetItems(const std::string& inID, std::vector<U8String> inItems);
    void SetProgress(const std::string& inID, std::uint32_t inValue, std::uint32_t inTotal);
    /// The identifier may be that of a radio button, too.
    void SetEnabled(const std::string& inID, bool inIsEnabled);
    void SetVisible(const std::string& inID, bool inIsVisible);
    void SetTitle(U8String inTitle);
    /// A row of a list, popup or radio group, or a page of tabs; -1 is none. No effect beyond the items.
    void SetSelection(const std::string& inID, int inRow);
    void SetChecked(const std::string& inID, bool inIsChecked);
    U8String GetText(const std::string& inID) const;
    bool IsChecked(const std::string& inID) const;
    /// Null when there is no such tree.
    shared_ptr<Tree> GetTree(const std::string& inID) const;
    /// The window's own geometry: set by the logic before it runs, kept true by the back end; none until one
    /// of them has said it.
    void SetGeometry(const Geometry& inGeometry);
    const optional<Geometry>& GetGeometry() const noexcept { return mGeometry; }
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
    /// Null for a dialog whose controls simply stand one below the other, the buttons in a row at the end.
    const View* GetLayout() const noexcept { return mLayout ? &*mLayout : nullptr; }
    /// Whether the user sees it: it and all groups around it are visible. Pages of tabs that are not chosen
    /// count as seen.
    bool IsShown(const Control& inControl) const;
    bool IsUsable(const Control& inControl) const;
    const std::string& GetFocus() const noexcept { return mFocus; }
    /// For the back end, once the window can be seen; runs what SetOnOpened was given.
    void TellOpened();
    const std::string& GetCancelButton() const noexcept { return mCancelButton; }
    const std::string& GetDefaultButton() const noexcept { return mDefaultButton; }
    bool ClosesByItself() const noexcept { return mClosesByItself; }
    /// Each is false, without effect, when there is no such control, when it is hidden or disabled, or the
    /// dialog is closed. The back end is told what these change as it is told what the logic changes.
    bool Press(const std::string& inButton);
    bool Enter(const std::string& inEdit, U8String inText);
    /// A row of a list, popup or radio group, or a page of tabs; -1, no row, of a list only.
    bool Select(const std::string& inList, int inRow);
    bool Check(const std::string& inCheckBox, bool inIsChecked);
    bool SelectRows(const std::string& inTree, const std::vector<int>& inRows);
    /// The user does not answer. The dialog is closed afterwards, except when it closes by itself and its
    /// cancel button leaves it open.
    void Dismiss();

private:
    static constexpr int kStillOpen = -0x7FFFFFFF;
    class LayoutReader;

    Control& Add(ControlType inType, const std::string& inID);
    std::string MakeUpID() const;
    Control* FindUsable(const std::string& inID);
    function<void()>* FindHandler(const std::string& inID, bool inIsButton);
    void CallHandler(const Control& inControl);
    void Show();
    void TellBackEnd();
    template <class Change>
    void ChangeControl(const std::string& inID, const Change& inChange);
    void Tell(const std::string& inID);

    const std::string mID;
    U8String mTitle;
    optional<View> mLayout;
    optional<Geometry> mGeometry;
    std::string mFocus;
    function<void()> mOnOpened;
    std::vector<Control> mControls;
    /// By the index of the control: what a button does, or what follows a change of the others.
    std::vector<function<void()>> mHandlers;
    std::string mCancelButton;
    std::string mDefaultButton;
    bool mClosesByItself = false;
    bool mIsRunning = false;
    bool mIsOpened = false;
    /// The response of the Close that counted; kStillOpen until then.
    std::atomic<int> mResponse{kStillOpen};
};

}  // namespace ostui
