// What a dialog on a terminal shows.
#include <algorithm>

#include "ostcore/config/ZString.h"
#include "ostcore/utility/ReplaceInString.h"
#include "ostui/detail/TerminalRun.h"
#include "ostui/detail/TerminalTable.h"
#include "ostui/detail/TerminalText.h"

namespace ostui {
namespace detail {

using ostcore::ZString;

namespace {

/// The rest of a long tree is told by its number only; its rows can be chosen all the same.
constexpr std::size_t kMostRows = 500;

U8String Labelled(const U8String& inLabel, const U8String& inText) {
    return inLabel.empty() ? inText : inLabel + " " + inText;
}

bool EndsWithColon(const U8String& inText) {
    return !inText.empty() && inText.back() == ':';
}

bool MayHaveLabel(const Control& inControl) {
    switch (inControl.type) {
        case ControlType::kStaticText:
            return !inControl.text.empty() && !EndsWithColon(inControl.text);
        case ControlType::kTextEdit:
        case ControlType::kPasswordEdit:
        case ControlType::kSearchEdit:
        case ControlType::kPopup:
        case ControlType::kList:
            return inControl.label.empty();
        default:
            return false;
    }
}

U8String KeyOf(const TreeRow& inRow) {
    U8String key = inRow.id;
    for (const U8String& cell : inRow.cells) {
        key += '\0' + cell;
    }
    return key;
}

}  // namespace

void TerminalRun::Show(const Control& inControl) {
    const bool isAsked = IsQuestion(inControl) && !mDialog.ClosesByItself();
    if (!mDialog.IsShown(inControl) || isAsked) {
        return;
    }
    switch (inControl.type) {
        case ControlType::kStaticText:
            if (!FindRadioGroup(inControl) && !IsLabel(inControl)) {
                SayOnce(inControl, Labelled(LabelOf(inControl), inControl.text));
            }
            break;
        case ControlType::kGroup:
            if (HoldsSomething(inControl)) {
                SayOnce(inControl, inControl.text);
            }
            break;
        case ControlType::kTextEdit:
        case ControlType::kSearchEdit:
            if (!inControl.text.empty()) {
                SayOnce(inControl, Labelled(LabelOf(inControl), inControl.text));
            }
            break;
        case ControlType::kList:
        case ControlType::kPopup:
        case ControlType::kRadioGroup:
            if (inControl.HasItem(inControl.selection)) {
                SayOnce(inControl, Labelled(LabelOf(inControl),
                                            inControl.items[static_cast<std::size_t>(inControl.selection)]));
            }
            break;
        case ControlType::kCheckBox:
            SayOnce(inControl, (inControl.isChecked ? "[x] " : "[ ] ") + inControl.text);
            break;
        case ControlType::kTree:
            ShowTree(inControl);
            break;
        default:
            break;
    }
}

void TerminalRun::SayOnce(const Control& inControl, const U8String& inText) {
    U8String& said = mSaid[inControl.id];
    if (said != inText) {
        said = inText;
        SayWrapped({}, inText);
    }
}

void TerminalRun::SayWrapped(const U8String& inMargin, const U8String& inText) {
    const std::size_t width = mTerminal.Width();
    const std::size_t margin = DisplayWidth(inMargin);
    const U8String text = Wrap(SafeText(inText), width > margin ? width - margin : 0);
    mTerminal.Say(inMargin + ostcore::utility::ReplaceInString(text, {{"\n", "\n" + U8String(margin, ' ')}}));
}

void TerminalRun::ShowTree(const Control& inTree) {
    const Tree& tree = *inTree.tree;
    if (tree.GetRows().empty() || mShownTrees[inTree.id] == tree.GetRevision()) {
        return;
    }
    mShownTrees[inTree.id] = tree.GetRevision();
    std::vector<int> rows = tree.GetRowsInOrder();
    if (mIsWaiting) {
        // A list that grows while it is waited for shows what is new.
        std::set<U8String>& said = mSaidRows[inTree.id];
        rows.erase(std::remove_if(rows.begin(), rows.end(),
                                  [&](int inRow) {
                                      const TreeRow& row = tree.GetRows()[static_cast<std::size_t>(inRow)];
                                      return !said.insert(KeyOf(row)).second;
                                  }),
                   rows.end());
    }
    SayTable(inTree, rows, false);
}

void TerminalRun::SayTable(const Control& inTree, const std::vector<int>& inRows, bool inHasNumbers) {
    std::vector<int> rows = inRows;
    rows.resize(std::min(rows.size(), kMostRows));
    if (rows.empty()) {
        return;
    }
    std::vector<U8String> lines = TableLines(*inTree.tree, rows, inHasNumbers, mTerminal.Width());
    const U8String head = lines.front();
    const bool hasHead = head.find_first_not_of(' ') != U8String::npos;
    // A continued list does not repeat its head.
    const bool isContinued = mIsWaiting && !mSaid.emplace(inTree.id, head).second;
    U8String text;
    for (std::size_t i = hasHead && !isContinued ? 0 : 1; i < lines.size(); ++i) {
        text += (text.empty() ? "" : "\n") + lines[i];
    }
    if (inRows.size() > rows.size()) {
        text += "\n" + ZString("$$$/ostui/Terminal/MoreRows=... and @0 more",
                               {std::to_string(inRows.size() - rows.size())})
                           .AsUTF8();
    }
    mTerminal.Say(text);
}

void TerminalRun::SayItems(const Control& inChoice) {
    if (!inChoice.label.empty()) {
        mTerminal.Say(inChoice.label);
    }
    const View* const layout = mDialog.GetLayout();
    if (inChoice.type == ControlType::kRadioGroup && layout) {
        SayRadioButtons(inChoice, *layout);
        return;
    }
    for (int row = 0; inChoice.HasItem(row); ++row) {
        SayItem(inChoice, row);
    }
}

/// The buttons and the texts between them, as they stand in the layout.
void TerminalRun::SayRadioButtons(const Control& inGroup, const View& inView) {
    const std::string id = inView.GetIdentifier();
    const Control* const control = mDialog.Find(id);
    if (inView.tag == "ost_radio_button" && inGroup.FindItem(id) >= 0) {
        SayItem(inGroup, inGroup.FindItem(id));
    } else if (control && control->type == ControlType::kStaticText && mDialog.IsShown(*control) &&
               FindRadioGroup(*control) == mDialog.Find(inGroup.id)) {
        SayWrapped("     ", control->text);
    }
    for (const View& child : inView.children) {
        SayRadioButtons(inGroup, child);
    }
}

void TerminalRun::SayItem(const Control& inChoice, int inRow) {
    const std::string number = inChoice.IsItemEnabled(inRow) ? std::to_string(inRow + 1) : "-";
    SayWrapped("  " + number + "  ", SafeLine(inChoice.items[static_cast<std::size_t>(inRow)]));
}

const Control* TerminalRun::FindLabel(const Control& inControl) const {
    const std::vector<Control>& controls = mDialog.GetControls();
    const auto found = std::find_if(controls.begin(), controls.end(),
                                    [&](const Control& inOther) { return inOther.id == inControl.id; });
    if (found == controls.begin() || found == controls.end() || !MayHaveLabel(*found)) {
        return nullptr;
    }
    const Control& before = *(found - 1);
    const bool isLabel = before.type == ControlType::kStaticText && !before.isMultiLine &&
                         EndsWithColon(before.text) && before.group == found->group;
    return isLabel && mDialog.IsShown(before) && mDialog.IsShown(*found) ? &before : nullptr;
}

U8String TerminalRun::LabelOf(const Control& inControl) const {
    const Control* const label = FindLabel(inControl);
    return label ? label->text : inControl.label;
}

bool TerminalRun::IsLabel(const Control& inText) const {
    const std::vector<Control>& controls = mDialog.GetControls();
    const auto found = std::find_if(controls.begin(), controls.end(),
                                    [&](const Control& inOther) { return inOther.id == inText.id; });
    return found != controls.end() && found + 1 != controls.end() && FindLabel(*(found + 1)) == &*found;
}

const Control* TerminalRun::FindRadioGroup(const Control& inControl) const {
    const Control* group = mDialog.Find(inControl.group);
    while (group && group->type != ControlType::kRadioGroup) {
        group = mDialog.Find(group->group);
    }
    return group;
}

bool TerminalRun::HoldsSomething(const Control& inGroup) const {
    const std::vector<Control>& controls = mDialog.GetControls();
    return !inGroup.text.empty() &&
           std::any_of(controls.begin(), controls.end(), [&](const Control& inControl) {
               return inControl.group == inGroup.id && mDialog.IsShown(inControl) &&
                      (inControl.type != ControlType::kGroup || HoldsSomething(inControl));
           });
}

}  // namespace detail
}  // namespace ostui
