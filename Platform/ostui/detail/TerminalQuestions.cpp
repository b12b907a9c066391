// What a dialog on a terminal asks.
#include <algorithm>
#include <charconv>

#include "ostcore/config/ZString.h"
#include "ostcore/utility/StringConversion.h"
#include "ostui/detail/RowChoice.h"
#include "ostui/detail/TerminalRun.h"
#include "ostui/detail/TerminalText.h"

namespace ostui {
namespace detail {

using ostcore::ZString;
using ostcore::utility::EqualsIgnoreCaseASCII;

namespace {

constexpr const char* kYes = "$$$/ostui/Terminal/Yes=yes";
constexpr const char* kNo = "$$$/ostui/Terminal/No=no";
constexpr const char* kAll = "$$$/ostui/Terminal/All=all";
constexpr const char* kNone = "$$$/ostui/Terminal/None=none";
/// What is typed to have nothing in the place of something.
constexpr std::string_view kNothing = "-";
constexpr const char* kLineMargin = "  ";

U8String Text(const char* inKey) {
    return ZString(inKey).AsUTF8();
}

/// "Name [held]: "; a label may end with a colon of its own.
U8String Question(const U8String& inLabel, const U8String& inHeld) {
    U8String label = inLabel;
    while (!label.empty() && (label.back() == ':' || label.back() == ' ')) {
        label.pop_back();
    }
    const U8String held = inHeld.empty() ? U8String() : "[" + inHeld + "]";
    return label + (label.empty() || held.empty() ? "" : " ") + held + ": ";
}

/// Whether an answer is a word or its beginning.
bool Means(std::string_view inAnswer, const U8String& inWord) {
    return !inAnswer.empty() && EqualsIgnoreCaseASCII(inAnswer, inWord.substr(0, inAnswer.size()));
}

/// The row of a number from 1, or of the item that reads so; -1 for anything else.
int RowOf(const Control& inChoice, const std::string& inAnswer) {
    int number = 0;
    const auto [end, error] = std::from_chars(inAnswer.data(), inAnswer.data() + inAnswer.size(), number);
    if (error == std::errc() && end == inAnswer.data() + inAnswer.size() && inChoice.HasItem(number - 1)) {
        return number - 1;
    }
    const auto found =
        std::find_if(inChoice.items.begin(), inChoice.items.end(),
                     [&](const U8String& inItem) { return EqualsIgnoreCaseASCII(inItem, inAnswer); });
    return found == inChoice.items.end() ? -1 : static_cast<int>(found - inChoice.items.begin());
}

}  // namespace

TerminalRun::Outcome TerminalRun::Ask(const Control& inControl) {
    switch (inControl.type) {
        case ControlType::kCheckBox:
            return AskCheckBox(inControl);
        case ControlType::kList:
        case ControlType::kPopup:
        case ControlType::kRadioGroup:
            return AskChoice(inControl);
        case ControlType::kTree:
            return AskRows(inControl);
        default:
            return inControl.isMultiLine ? AskLines(inControl) : AskEdit(inControl);
    }
}

TerminalRun::Outcome TerminalRun::ReadTyped(const U8String& inPrompt, U8String& outText) {
    std::string line;
    const Outcome outcome = Read(inPrompt, line);
    outText = SafeLine(line);
    return outcome;
}

TerminalRun::Outcome TerminalRun::ReadChoice(const U8String& inPrompt, U8String& outText) {
    const Outcome outcome = ReadTyped(inPrompt, outText);
    outText.erase(0, std::min(outText.find_first_not_of(' '), outText.size()));
    outText.erase(outText.find_last_not_of(' ') + 1);
    return outcome;
}

void TerminalRun::SayHintOnce() {
    if (!std::exchange(mHasHinted, true)) {
        mTerminal.Say(
            Text("$$$/ostui/Terminal/Hint=(The enter key keeps what stands in brackets, - empties it.)"));
    }
}

TerminalRun::Outcome TerminalRun::AskEdit(const Control& inEdit) {
    if (inEdit.type == ControlType::kPasswordEdit) {
        std::string password;
        Outcome outcome = Outcome::kNoAnswer;
        {
            // Before the question: what is typed the moment it shows is neither seen nor lost.
            const Terminal::Silence silence(mTerminal);
            outcome = Read(Question(inEdit.label, {}), password);
        }
        if (outcome == Outcome::kAnswered && !password.empty()) {
            mDialog.Enter(inEdit.id, std::move(password));
        }
        return outcome;
    }
    if (!inEdit.text.empty()) {
        SayHintOnce();
    }
    U8String text;
    const Outcome outcome = ReadTyped(Question(inEdit.label, inEdit.text), text);
    if (outcome == Outcome::kAnswered && !text.empty()) {
        const bool isEmptied = text == kNothing && !inEdit.text.empty();
        mDialog.Enter(inEdit.id, isEmptied ? U8String() : std::move(text));
    }
    return outcome;
}

TerminalRun::Outcome TerminalRun::AskLines(const Control& inEdit) {
    if (!inEdit.text.empty()) {
        SayHintOnce();
        mTerminal.Say("[" + inEdit.text + "]");
    }
    mTerminal.Say(inEdit.label + (inEdit.label.empty() ? "" : " ") +
                  Text("$$$/ostui/Terminal/Lines=(an empty line ends the text)"));
    U8String text;
    for (;;) {
        U8String line;
        const Outcome outcome = ReadTyped(kLineMargin, line);
        if (outcome != Outcome::kAnswered) {
            return outcome;
        }
        if (line.empty()) {
            break;
        }
        text += (text.empty() ? "" : "\n") + line;
    }
    if (!text.empty()) {
        const bool isEmptied = text == kNothing && !inEdit.text.empty();
        mDialog.Enter(inEdit.id, isEmptied ? U8String() : std::move(text));
    }
    return Outcome::kAnswered;
}

TerminalRun::Outcome TerminalRun::AskCheckBox(const Control& inBox) {
    const U8String yes = Text(kYes);
    const U8String no = Text(kNo);
    for (;;) {
        U8String answer;
        const Outcome outcome = ReadChoice(
            Question(inBox.text + " (" + yes + "/" + no + ")", inBox.isChecked ? yes : no), answer);
        if (outcome != Outcome::kAnswered || answer.empty()) {
            return outcome;
        }
        if (Means(answer, yes) || Means(answer, no)) {
            mDialog.Check(inBox.id, Means(answer, yes));
            return outcome;
        }
    }
}

TerminalRun::Outcome TerminalRun::AskChoice(const Control& inChoice) {
    SayItems(inChoice);
    const bool isChosen = inChoice.HasItem(inChoice.selection);
    const bool mayBeNone = inChoice.type == ControlType::kList;
    const U8String what = mayBeNone && !isChosen
                              ? Text("$$$/ostui/Terminal/NumberOrNone=Number (nothing for none)")
                              : Text("$$$/ostui/Terminal/Number=Number");
    const U8String prompt = Question(what, isChosen ? std::to_string(inChoice.selection + 1) : U8String());
    for (;;) {
        U8String answer;
        const Outcome outcome = ReadChoice(prompt, answer);
        if (outcome != Outcome::kAnswered || answer.empty()) {
            return outcome;
        }
        const bool isNone = mayBeNone && answer == kNothing;
        if (isNone || RowOf(inChoice, answer) >= 0) {
            if (mDialog.Select(inChoice.id, isNone ? -1 : RowOf(inChoice, answer))) {
                return outcome;
            }
        }
        mTerminal.Say(ZString("$$$/ostui/Terminal/BadNumber=Please type one of the numbers from 1 to @0.",
                              {std::to_string(inChoice.items.size())})
                          .AsUTF8());
    }
}

TerminalRun::Outcome TerminalRun::AskRows(const Control& inTree) {
    const Tree& tree = *inTree.tree;
    mShownTrees[inTree.id] = tree.GetRevision();
    const std::vector<int> rows = tree.GetRowsInOrder();
    SayTable(inTree, rows, true);
    std::vector<int> chosen;
    for (std::size_t place = 0; place < rows.size(); ++place) {
        if (std::binary_search(tree.GetSelection().begin(), tree.GetSelection().end(), rows[place])) {
            chosen.push_back(static_cast<int>(place));
        }
    }
    const bool isOne = tree.GetSelectionMode() == Tree::SelectionMode::kSingle;
    const U8String all = isOne ? U8String() : Text(kAll);
    const U8String none = Text(kNone);
    const int count = static_cast<int>(rows.size());
    const U8String held = chosen.empty() ? none : RowChoiceText(chosen, count, all);
    const U8String what = isOne
                              ? Text("$$$/ostui/Terminal/Row=Row")
                              : ZString("$$$/ostui/Terminal/Rows=Rows, such as 1,3-5 or @0", {all}).AsUTF8();
    for (;;) {
        U8String answer;
        const Outcome outcome = ReadChoice(Question(what, held), answer);
        if (outcome != Outcome::kAnswered || answer.empty()) {
            return outcome;
        }
        const bool isNone = answer == kNothing || EqualsIgnoreCaseASCII(answer, none);
        const auto places = isNone ? std::vector<int>() : ParseRowChoice(answer, count, all);
        std::vector<int> selected;
        for (const int place : places.value_or(std::vector<int>())) {
            selected.push_back(rows[static_cast<std::size_t>(place)]);
        }
        if (places && mDialog.SelectRows(inTree.id, selected)) {
            return outcome;
        }
        mTerminal.Say(ZString("$$$/ostui/Terminal/BadNumber=Please type one of the numbers from 1 to @0.",
                              {std::to_string(count)})
                          .AsUTF8());
    }
}

}  // namespace detail
}  // namespace ostui
