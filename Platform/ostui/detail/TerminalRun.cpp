// The rounds of a dialog on a terminal.
#include "ostui/detail/TerminalRun.h"

#include <algorithm>

#include "ostcore/config/ZString.h"
#include "ostcore/threads/MainThread.h"
#include "ostcore/utility/StringConversion.h"
#include "ostui/detail/TerminalText.h"

namespace ostui {
namespace detail {
namespace {

constexpr std::uint32_t kTurnMilliseconds = 20;

bool IsUsableButton(const Dialog& inDialog, const Control& inControl) {
    return inControl.type == ControlType::kButton && inDialog.IsUsable(inControl);
}

/// A button with a picture only goes by its tooltip.
const U8String& TextOf(const Control& inButton) {
    return !inButton.text.empty()      ? inButton.text
           : !inButton.tooltip.empty() ? inButton.tooltip
                                       : inButton.id;
}

U8String BackText() {
    return "(" + ostcore::ZString("$$$/ostui/Terminal/Back=enter goes back to the questions").AsUTF8() +
           ")  ";
}

}  // namespace

void TerminalRun::Run() {
    mTerminal.EndLine();
    const bool mayAsk = mTerminal.IsInteractive() && !mTerminal.IsInterrupted();
    if (!mDialog.ClosesByItself() && !mayAsk) {
        mDialog.Dismiss();
        return;
    }
    if (mDialog.GetLayout() && !mDialog.ClosesByItself() && !mDialog.GetTitle().empty()) {
        mTerminal.Say(mDialog.GetTitle());
    }
    mDialog.TellOpened();
    while (!mDialog.IsClosed()) {
        if (mDialog.ClosesByItself() || IsBusy()) {
            Wait();
        } else if (mTerminal.IsInterrupted() || !AskAll()) {
            mDialog.Dismiss();
        }
    }
    mTerminal.EndLine();
}

void TerminalRun::OnControlChanged(const Control& inControl) {
    if (!mTerminal.IsInteractive() || mIsCovered) {
        return;
    }
    if (mIsWaiting || mIsReading) {
        Show(inControl);
    }
    if (mIsWaiting) {
        ShowStatus();
    } else if (mIsReading) {
        const auto shown = mShownTrees.find(inControl.id);
        const bool isAnotherTree = inControl.tree && IsQuestion(inControl) && shown != mShownTrees.end() &&
                                   shown->second != inControl.tree->GetRevision();
        mIsStale = mIsStale || isAnotherTree || Questions() != mQuestions || IsBusy();
    }
}

void TerminalRun::OnUncovered() {
    mIsCovered = false;
    if (mIsWaiting || mIsReading) {
        for (const Control& control : mDialog.GetControls()) {
            OnControlChanged(control);
        }
    }
    if (mIsReading && !mIsStale) {
        mTerminal.Prompt(mPrompt);
    }
}

bool TerminalRun::IsQuestion(const Control& inControl) const {
    switch (inControl.type) {
        case ControlType::kTextEdit:
        case ControlType::kPasswordEdit:
        case ControlType::kSearchEdit:
        case ControlType::kCheckBox:
            return mDialog.IsUsable(inControl);
        case ControlType::kList:
        case ControlType::kPopup:
        case ControlType::kRadioGroup:
            return mDialog.IsUsable(inControl) && !inControl.items.empty();
        case ControlType::kTree:
            return mDialog.IsUsable(inControl) && !inControl.tree->GetRows().empty() &&
                   inControl.tree->GetSelectionMode() != Tree::SelectionMode::kNone;
        default:
            return false;
    }
}

std::vector<bool> TerminalRun::Questions() const {
    std::vector<bool> questions;
    for (const Control& control : mDialog.GetControls()) {
        questions.push_back(IsQuestion(control));
    }
    return questions;
}

bool TerminalRun::IsBusy() const {
    const std::vector<Control>& controls = mDialog.GetControls();
    const auto isBar = [&](const Control& inControl) {
        return inControl.type == ControlType::kProgressBar && mDialog.IsShown(inControl);
    };
    return std::any_of(controls.begin(), controls.end(), isBar) &&
           std::none_of(controls.begin(), controls.end(),
                        [&](const Control& inControl) { return IsQuestion(inControl); });
}

void TerminalRun::Wait() {
    const auto mustWait = [&] { return !mDialog.IsClosed() && (mDialog.ClosesByItself() || IsBusy()); };
    mIsWaiting = true;
    for (const Control& control : mDialog.GetControls()) {
        Show(control);
    }
    ShowStatus();
    bool mayRead = mTerminal.IsInteractive();
    while (mustWait()) {
        if (mTerminal.IsInterrupted()) {
            DismissOnce();
            mayRead = false;
        }
        std::string line;
        const auto outcome =
            mayRead ? mTerminal.ReadLine([&] { return !mustWait(); }, line) : Terminal::Line::kOver;
        if (outcome == Terminal::Line::kRead) {
            mDialog.Press(ButtonOf(line));
            ShowStatus();
        } else if (outcome == Terminal::Line::kEnd) {
            mayRead = false;
            if (!mDialog.ClosesByItself()) {
                DismissOnce();
            }
        } else if (!mayRead && mustWait()) {
            ostcore::threads::WaitAndPumpMainThread(kTurnMilliseconds);
        }
    }
    mIsWaiting = false;
    mTerminal.EndLine();
}

void TerminalRun::DismissOnce() {
    if (!std::exchange(mIsDismissed, true)) {
        mDialog.Dismiss();
    }
}

void TerminalRun::ShowStatus() {
    if (mIsCovered || mDialog.IsClosed()) {
        return;
    }
    U8String status;
    for (const Control& control : mDialog.GetControls()) {
        if (control.type == ControlType::kProgressBar && control.total > 0 && mDialog.IsShown(control)) {
            status += std::to_string(std::uint64_t{control.value} * 100 / control.total) + " %  ";
        }
    }
    const U8String choices = Choices();
    mTerminal.ShowStatus(status + (choices.empty() ? choices : choices + "> "));
}

bool TerminalRun::AskAll() {
    const std::size_t count = mDialog.GetControls().size();
    for (std::size_t i = 0; i < count; ++i) {
        Control control = mDialog.GetControls()[i];
        Show(control);
        control.label = LabelOf(control);
        const Outcome outcome = IsQuestion(control) ? Ask(control) : Outcome::kAnswered;
        if (mDialog.IsClosed() || outcome == Outcome::kAskAnew || IsBusy()) {
            return true;
        }
        if (outcome == Outcome::kNoAnswer) {
            return false;
        }
    }
    // What the answers have changed.
    for (const Control& control : mDialog.GetControls()) {
        Show(control);
    }
    return AskButton() != Outcome::kNoAnswer;
}

TerminalRun::Outcome TerminalRun::Read(const U8String& inPrompt, std::string& outLine) {
    mPrompt = inPrompt;
    mQuestions = Questions();
    mIsStale = false;
    mIsReading = true;
    mTerminal.Prompt(inPrompt);
    const auto line = mTerminal.ReadLine([&] { return mIsStale || mDialog.IsClosed(); }, outLine);
    mIsReading = false;
    if (line == Terminal::Line::kRead) {
        return Outcome::kAnswered;
    }
    mIsStale ? mTerminal.TakeBackPrompt() : mTerminal.EndLine();
    return mIsStale || mDialog.IsClosed() ? Outcome::kAskAnew : Outcome::kNoAnswer;
}

TerminalRun::Outcome TerminalRun::AskButton() {
    for (;;) {
        const U8String choices = Choices();
        if (choices.empty()) {
            return Outcome::kNoAnswer;
        }
        std::string line;
        const Outcome outcome = Read(choices + (MayGoBack() ? BackText() : U8String()) + "> ", line);
        if (outcome != Outcome::kAnswered) {
            return outcome;
        }
        if (mDialog.Press(ButtonOf(line))) {
            return Outcome::kAnswered;
        }
        if (line.empty() && MayGoBack()) {
            return Outcome::kAskAnew;
        }
    }
}

/// Whether the enter key presses no button, so that it can lead back to the questions.
bool TerminalRun::MayGoBack() const {
    const Control* const button = mDialog.Find(mDialog.GetDefaultButton());
    const std::vector<bool> questions = Questions();
    return (!button || !IsUsableButton(mDialog, *button)) &&
           std::find(questions.begin(), questions.end(), true) != questions.end();
}

/// "[1] Yes (enter)  [2] No  "; empty when there is no button.
U8String TerminalRun::Choices() const {
    U8String text;
    int number = 0;
    for (const Control& control : mDialog.GetControls()) {
        if (IsUsableButton(mDialog, control)) {
            text += "[" + std::to_string(++number) + "] " + SafeLine(TextOf(control));
            if (control.id == mDialog.GetDefaultButton()) {
                text += " (" + ostcore::ZString("$$$/ostui/Terminal/Enter=enter").AsUTF8() + ")";
            }
            text += "  ";
        }
    }
    return text;
}

/// By number or text; an empty line is the default button. Anything else is none.
std::string TerminalRun::ButtonOf(const std::string& inLine) const {
    if (inLine.empty()) {
        return mDialog.GetDefaultButton();
    }
    int number = 0;
    for (const Control& control : mDialog.GetControls()) {
        if (IsUsableButton(mDialog, control) &&
            (inLine == std::to_string(++number) ||
             ostcore::utility::EqualsIgnoreCaseASCII(inLine, TextOf(control)))) {
            return control.id;
        }
    }
    return {};
}

}  // namespace detail
}  // namespace ostui
