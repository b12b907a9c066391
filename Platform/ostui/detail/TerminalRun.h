// One dialog on a terminal: what it shows, what it asks, and the wait for its end.
#pragma once

#include <cstdint>
#include <map>
#include <set>
#include <string>
#include <vector>

#include "ostui/detail/Terminal.h"
#include "ostui/Dialog.h"

namespace ostui {
namespace detail {

/// Goes through the controls in their order, again and again until the dialog is closed: shows what is to be
/// read, asks what is to be answered, and at last which button is to be pressed. What changes meanwhile is
/// shown again; where that makes another question of it, the round begins anew. A dialog that closes by
/// itself, or that for now has a bar and nothing to answer, is waited for with a status line.
class TerminalRun {
public:
    TerminalRun(Terminal& ioTerminal, Dialog& ioDialog) : mTerminal(ioTerminal), mDialog(ioDialog) {}

    void Run();
    void OnControlChanged(const Control& inControl);
    /// Another dialog is on the screen now.
    void OnCovered() { mIsCovered = true; }
    /// It is gone.
    void OnUncovered();

private:
    /// What became of a question.
    enum class Outcome { kAnswered, kAskAnew, kNoAnswer };

    bool IsBusy() const;
    bool IsQuestion(const Control& inControl) const;
    std::vector<bool> Questions() const;

    void Wait();
    void ShowStatus();
    void DismissOnce();

    /// One round; false when the user does not answer any more.
    bool AskAll();
    Outcome Ask(const Control& inControl);
    Outcome AskEdit(const Control& inEdit);
    Outcome AskLines(const Control& inEdit);
    Outcome AskCheckBox(const Control& inBox);
    Outcome AskChoice(const Control& inChoice);
    Outcome AskRows(const Control& inTree);
    Outcome AskButton();
    Outcome Read(const U8String& inPrompt, std::string& outLine);
    Outcome ReadTyped(const U8String& inPrompt, U8String& outText);
    /// Without the spaces around it.
    Outcome ReadChoice(const U8String& inPrompt, U8String& outText);

    void Show(const Control& inControl);
    void SayOnce(const Control& inControl, const U8String& inText);
    /// What does not fit on a line goes on below the text, not below the margin.
    void SayWrapped(const U8String& inMargin, const U8String& inText);
    void ShowTree(const Control& inTree);
    void SayTable(const Control& inTree, const std::vector<int>& inRows, bool inHasNumbers);
    void SayItems(const Control& inChoice);
    void SayRadioButtons(const Control& inGroup, const View& inView);
    void SayItem(const Control& inChoice, int inRow);
    void SayHintOnce();
    /// The text that ends with a colon right before a control without a label; null for none.
    const Control* FindLabel(const Control& inControl) const;
    U8String LabelOf(const Control& inControl) const;
    /// Whether a text is the label of what follows it, and is said with that.
    bool IsLabel(const Control& inText) const;
    /// The radio group that it stands in; null for none.
    const Control* FindRadioGroup(const Control& inControl) const;
    bool HoldsSomething(const Control& inGroup) const;

    U8String Choices() const;
    bool MayGoBack() const;
    std::string ButtonOf(const std::string& inLine) const;

    Terminal& mTerminal;
    Dialog& mDialog;
    /// What was last said of a control, and the state of a tree that was.
    std::map<std::string, U8String> mSaid;
    std::map<std::string, std::uint64_t> mShownTrees;
    /// The rows that were said while it was waited for.
    std::map<std::string, std::set<U8String>> mSaidRows;
    /// The question that waits for its answer, and what can be answered while it does.
    U8String mPrompt;
    std::vector<bool> mQuestions;
    bool mIsCovered = false;
    bool mIsReading = false;
    bool mIsWaiting = false;
    bool mIsStale = false;
    bool mHasHinted = false;
    bool mIsDismissed = false;
};

}  // namespace detail
}  // namespace ostui
