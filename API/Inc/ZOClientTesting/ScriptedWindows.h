// Dialogs without a screen: a test says beforehand how each is answered, and reads afterwards what was shown.
#pragma once

#include <deque>
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

    void Press(const std::string& inButton);
    void Enter(const std::string& inEdit, const std::string& inText);
    void Select(const std::string& inList, int inRow);
    void Dismiss();
    /// Runs the main thread's queue until the condition holds; a mismatch when it does not in that time.
    bool WaitUntil(const function<bool()>& inCondition, std::uint32_t inMilliseconds = 20000);

private:
    friend class ScriptedWindows;
    ScriptedWindow(ostui::Dialog& ioDialog, std::vector<std::string>& ioMismatches)
        : mDialog(ioDialog), mMismatches(ioMismatches) {}

    ostui::Dialog& mDialog;
    std::vector<std::string>& mMismatches;
};

/// A back end for dialogs. In place from construction to destruction; then the former one is put back.
///
/// A dialog is answered by the oldest script for it. One for which there is none is dismissed and noted as a
/// mismatch, unless it closes by itself: that one is waited for. After its script a dialog that is still open
/// is waited for, too, at most for 20 seconds. Main thread only.
class ScriptedWindows {
public:
    using Script = function<void(ScriptedWindow& ioWindow)>;
    struct ShownWindow {
        std::string id;
        std::string title;
        /// As they were when the dialog opened.
        std::vector<ostui::Control> controls;
        /// Each change of a control's text after that, passwords excepted, as "control: text".
        std::vector<std::string> changes;

        /// The text of a control at the opening, empty when there is none.
        std::string Text(const std::string& inControl) const;
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
