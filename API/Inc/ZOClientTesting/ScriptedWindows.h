// Dialogs without a screen: a test says beforehand how each is answered, and reads afterwards what was shown.
#pragma once

#include <deque>
#include <map>
#include <string>
#include <utility>
#include <vector>

#include "ostui/BackEnd.h"

namespace ZOClientTesting {

using ostcore::function;
using ostcore::shared_ptr;

/// A dialog that is open now, as its user sees it. A touch of something that is not there, hidden or disabled
/// is noted as a mismatch.
class ScriptedWindow {
public:
    const std::string& ID() const { return mDialog.GetID(); }
    const std::string& Title() const { return mDialog.GetTitle(); }
    /// What a control reads or holds; empty when there is none.
    std::string Text(const std::string& inControl) const { return mDialog.GetText(inControl); }
    const ostui::Control* Find(const std::string& inControl) const { return mDialog.Find(inControl); }
    bool IsClosed() const { return mDialog.IsClosed(); }
    /// The rows of a tree from top to bottom, each as its cells in the order of the columns, parted by " | ";
    /// two spaces before it for each row that it is below.
    std::vector<std::string> Rows(const std::string& inTree) const;
    std::vector<std::string> SelectedIDs(const std::string& inTree) const;

    void Press(const std::string& inButton);
    void Enter(const std::string& inEdit, const std::string& inText);
    void Select(const std::string& inList, int inRow);
    /// An item of a popup, radio group, list or of tabs, by its identifier or its text.
    void Choose(const std::string& inControl, const std::string& inItem);
    void Check(const std::string& inCheckBox, bool inIsChecked = true);
    /// Exactly these rows of a tree, by their identifiers.
    void SelectRows(const std::string& inTree, const std::vector<std::string>& inRowIDs);
    /// Opens a row of a tree, as a double click does.
    void Activate(const std::string& inTree, const std::string& inRowID);
    void ClickColumn(const std::string& inTree, const std::string& inColumnID);
    void Dismiss();
    /// Runs the main thread's queue until the condition holds; a mismatch when it does not in that time.
    bool WaitUntil(const function<bool()>& inCondition, std::uint32_t inMilliseconds = 20000);

private:
    friend class ScriptedWindows;
    ScriptedWindow(ostui::Dialog& ioDialog, std::vector<std::string>& ioMismatches)
        : mDialog(ioDialog), mMismatches(ioMismatches) {}
    void Miss(const std::string& inWhat);
    /// A tree that the user can touch; null, and a mismatch, when it is none.
    shared_ptr<ostui::Tree> Touch(const std::string& inTree);

    ostui::Dialog& mDialog;
    std::vector<std::string>& mMismatches;
};

/// A back end for dialogs. In place from construction to destruction; then the former one is put back.
///
/// A dialog is told that it is open, and then answered by the oldest script for it. One for which there is
/// none is dismissed and noted as a mismatch, unless it closes by itself: that one is waited for. After its
/// script a dialog that is still open is waited for, too, at most for 20 seconds. Main thread only.
class ScriptedWindows {
public:
    using Script = function<void(ScriptedWindow& ioWindow)>;
    struct ShownWindow {
        std::string id;
        std::string title;
        /// As they were when the dialog opened.
        std::vector<ostui::Control> controls;
        /// Each change of a control after that, passwords and trees excepted, as "control: text", and each
        /// change of the title as "title: text".
        std::vector<std::string> changes;
        using Rows = std::vector<std::string>;
        /// By tree, all that it has shown, in order: its rows as ScriptedWindow::Rows gives them.
        std::map<std::string, std::vector<Rows>> trees;

        /// The text of a control at the opening, empty when there is none.
        std::string Text(const std::string& inControl) const;
        /// What a tree showed last.
        Rows LastRows(const std::string& inTree) const;
    };

    ScriptedWindows();
    ~ScriptedWindows();
    ScriptedWindows(const ScriptedWindows&) = delete;
    ScriptedWindows& operator=(const ScriptedWindows&) = delete;

    /// Answers the next dialog of that identifier or title; several scripts for one name are used in order.
    void Answer(const std::string& inIDOrTitle, Script inScript);
    /// Presses a button.
    void AnswerWith(const std::string& inIDOrTitle, const std::string& inButton);

    const std::vector<ShownWindow>& Shown() const noexcept;
    /// One text for each mismatch and each script that was not used.
    std::vector<std::string> Mismatches() const;

private:
    class Core;
    shared_ptr<Core> mCore;
    shared_ptr<ostui::BackEnd> mFormer;
};

}  // namespace ZOClientTesting
