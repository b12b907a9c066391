// The scripted back end for dialogs.
#include "ZOClientTesting/ScriptedWindows.h"

#include <algorithm>
#include <chrono>

#include "ostcore/threads/MainThread.h"

namespace ZOClientTesting {

namespace {

constexpr std::uint32_t kLongestWait = 20000;

/// Pumps until the condition holds; false when the time passed first.
bool PumpUntil(const function<bool()>& inCondition, std::uint32_t inMilliseconds) {
    const auto end = std::chrono::steady_clock::now() + std::chrono::milliseconds(inMilliseconds);
    while (!inCondition()) {
        if (std::chrono::steady_clock::now() >= end) {
            return false;
        }
        // Short, since a condition may come true by what is not in the queue.
        ostcore::threads::WaitAndPumpMainThread(5);
    }
    return true;
}

int FindRow(const ostui::Tree& inTree, const std::string& inID) {
    const std::vector<ostui::TreeRow>& rows = inTree.GetRows();
    const auto found =
        std::find_if(rows.begin(), rows.end(), [&](const ostui::TreeRow& inRow) { return inRow.id == inID; });
    return found == rows.end() ? -1 : static_cast<int>(found - rows.begin());
}

std::string TextOf(const ostui::Tree& inTree, int inRow) {
    const std::vector<ostui::TreeRow>& rows = inTree.GetRows();
    const ostui::TreeRow& row = rows[static_cast<std::size_t>(inRow)];
    std::string text;
    for (int parent = row.parent; parent != ostui::TreeRow::kTopLevel;
         parent = rows[static_cast<std::size_t>(parent)].parent) {
        text += "  ";
    }
    bool isFirst = true;
    for (const ostui::TreeColumn& column : inTree.GetColumns()) {
        const auto cell = static_cast<std::size_t>(inTree.GetCell(column.id));
        text += (isFirst ? "" : " | ") + (cell < row.cells.size() ? row.cells[cell] : std::string());
        isFirst = false;
    }
    return text;
}

std::vector<std::string> TextsOf(const ostui::Tree& inTree) {
    std::vector<std::string> texts;
    for (const int row : inTree.GetRowsInOrder()) {
        texts.push_back(TextOf(inTree, row));
    }
    return texts;
}

}  // namespace

std::vector<std::string> ScriptedWindow::Rows(const std::string& inTree) const {
    const shared_ptr<ostui::Tree> tree = mDialog.GetTree(inTree);
    return tree ? TextsOf(*tree) : std::vector<std::string>();
}

std::vector<std::string> ScriptedWindow::SelectedIDs(const std::string& inTree) const {
    const shared_ptr<ostui::Tree> tree = mDialog.GetTree(inTree);
    return tree ? tree->GetSelectedIDs() : std::vector<std::string>();
}

void ScriptedWindow::Miss(const std::string& inWhat) {
    mMismatches.push_back(ID() + ": " + inWhat);
}

void ScriptedWindow::Press(const std::string& inButton) {
    if (!mDialog.Press(inButton)) {
        Miss("the button " + inButton + " cannot be pressed");
    }
}

void ScriptedWindow::Enter(const std::string& inEdit, const std::string& inText) {
    if (!mDialog.Enter(inEdit, inText)) {
        Miss("nothing can be entered into " + inEdit);
    }
}

void ScriptedWindow::Select(const std::string& inList, int inRow) {
    if (!mDialog.Select(inList, inRow)) {
        Miss("row " + std::to_string(inRow) + " of " + inList + " cannot be selected");
    }
}

void ScriptedWindow::Choose(const std::string& inControl, const std::string& inItem) {
    const ostui::Control* const control = mDialog.Find(inControl);
    int row = control ? control->FindItem(inItem) : -1;
    if (control && row < 0) {
        const auto found = std::find(control->items.begin(), control->items.end(), inItem);
        row = found == control->items.end() ? -1 : static_cast<int>(found - control->items.begin());
    }
    if (row < 0 || !mDialog.Select(inControl, row)) {
        Miss(inItem + " of " + inControl + " cannot be chosen");
    }
}

void ScriptedWindow::Check(const std::string& inCheckBox, bool inIsChecked) {
    if (!mDialog.Check(inCheckBox, inIsChecked)) {
        Miss(inCheckBox + " cannot be checked");
    }
}

void ScriptedWindow::SelectRows(const std::string& inTree, const std::vector<std::string>& inRowIDs) {
    const shared_ptr<ostui::Tree> tree = mDialog.GetTree(inTree);
    std::vector<int> rows;
    for (const std::string& id : inRowIDs) {
        rows.push_back(tree ? FindRow(*tree, id) : -1);
    }
    if (!mDialog.SelectRows(inTree, rows)) {
        Miss("these rows of " + inTree + " cannot be selected");
    }
}

shared_ptr<ostui::Tree> ScriptedWindow::Touch(const std::string& inTree) {
    const ostui::Control* const control = mDialog.Find(inTree);
    if (!control || !control->tree || mDialog.IsClosed() || !mDialog.IsUsable(*control)) {
        Miss("the tree " + inTree + " cannot be used");
        return {};
    }
    return control->tree;
}

void ScriptedWindow::Activate(const std::string& inTree, const std::string& inRowID) {
    const shared_ptr<ostui::Tree> tree = Touch(inTree);
    const int row = tree ? FindRow(*tree, inRowID) : -1;
    if (row >= 0) {
        tree->Activate(row);
    } else if (tree) {
        Miss("there is no row " + inRowID + " in " + inTree);
    }
}

void ScriptedWindow::ClickColumn(const std::string& inTree, const std::string& inColumnID) {
    const shared_ptr<ostui::Tree> tree = Touch(inTree);
    if (tree && tree->GetCell(inColumnID) >= 0) {
        tree->ClickColumn(inColumnID);
    } else if (tree) {
        Miss("there is no column " + inColumnID + " in " + inTree);
    }
}

void ScriptedWindow::Dismiss() {
    mDialog.Dismiss();
}

bool ScriptedWindow::WaitUntil(const function<bool()>& inCondition, std::uint32_t inMilliseconds) {
    if (PumpUntil(inCondition, inMilliseconds)) {
        return true;
    }
    Miss("what the script waited for did not happen");
    return false;
}

std::string ScriptedWindows::ShownWindow::Text(const std::string& inControl) const {
    const auto found = std::find_if(controls.begin(), controls.end(),
                                    [&](const ostui::Control& inOther) { return inOther.id == inControl; });
    return found == controls.end() ? std::string() : found->text;
}

ScriptedWindows::ShownWindow::Rows ScriptedWindows::ShownWindow::LastRows(const std::string& inTree) const {
    const auto found = trees.find(inTree);
    return found == trees.end() || found->second.empty() ? Rows() : found->second.back();
}

class ScriptedWindows::Core final : public ostui::BackEnd {
public:
    void RunModal(ostui::Dialog& ioDialog) override {
        const std::size_t index = mShown.size();
        mShown.push_back({ioDialog.GetID(), ioDialog.GetTitle(), ioDialog.GetControls(), {}, {}});
        for (const ostui::Control& control : ioDialog.GetControls()) {
            NoteRows(mShown[index], control);
        }
        mRunning.push_back({&ioDialog, index, ioDialog.GetTitle()});
        Play(ioDialog);
        mRunning.pop_back();
    }

    void OnControlChanged(ostui::Dialog& ioDialog, const ostui::Control& inControl) override {
        const auto running = FindRunning(ioDialog);
        if (running == mRunning.rend()) {
            return;
        }
        ShownWindow& shown = mShown[running->index];
        if (inControl.tree) {
            NoteRows(shown, inControl);
        } else if (inControl.type != ostui::ControlType::kPasswordEdit) {
            shown.changes.push_back(inControl.id + ": " + inControl.text);
        }
    }

    void OnDialogChanged(ostui::Dialog& ioDialog) override {
        const auto running = FindRunning(ioDialog);
        if (running != mRunning.rend() && running->title != ioDialog.GetTitle()) {
            running->title = ioDialog.GetTitle();
            mShown[running->index].changes.push_back("title: " + running->title);
        }
    }

    void Add(const std::string& inName, Script inScript) {
        mScripts.emplace_back(inName, std::move(inScript));
    }

    std::vector<ShownWindow> mShown;
    std::vector<std::string> mMismatches;
    std::deque<std::pair<std::string, Script>> mScripts;

private:
    struct Running {
        ostui::Dialog* dialog;
        std::size_t index;
        std::string title;
    };

    static void NoteRows(ShownWindow& ioShown, const ostui::Control& inControl) {
        if (!inControl.tree) {
            return;
        }
        std::vector<ShownWindow::Rows>& shown = ioShown.trees[inControl.id];
        ShownWindow::Rows rows = TextsOf(*inControl.tree);
        if (shown.empty() ? !rows.empty() : rows != shown.back()) {
            shown.push_back(std::move(rows));
        }
    }

    std::vector<Running>::reverse_iterator FindRunning(const ostui::Dialog& inDialog) {
        return std::find_if(mRunning.rbegin(), mRunning.rend(),
                            [&](const Running& inRunning) { return inRunning.dialog == &inDialog; });
    }

    void Play(ostui::Dialog& ioDialog) {
        const auto found = std::find_if(mScripts.begin(), mScripts.end(), [&](const auto& inEntry) {
            return inEntry.first == ioDialog.GetID() || inEntry.first == ioDialog.GetTitle();
        });
        const bool isScripted = found != mScripts.end();
        const Script script = isScripted ? found->second : Script();
        if (isScripted) {
            mScripts.erase(found);
        }
        ioDialog.TellOpened();
        if (isScripted) {
            ScriptedWindow window(ioDialog, mMismatches);
            script(window);
        } else if (!ioDialog.ClosesByItself() && !ioDialog.IsClosed()) {
            mMismatches.push_back("nobody answers " + ioDialog.GetID() + ", \"" + ioDialog.GetTitle() + "\"");
            ioDialog.Dismiss();
        }
        if (!PumpUntil([&] { return ioDialog.IsClosed(); }, kLongestWait)) {
            mMismatches.push_back(ioDialog.GetID() + " was still open after its script");
            ioDialog.Close(ostui::kResponseCancel);
        }
    }

    std::vector<Running> mRunning;
};

ScriptedWindows::ScriptedWindows() : mCore(boost::make_shared<Core>()), mFormer(ostui::SetBackEnd(mCore)) {}

ScriptedWindows::~ScriptedWindows() {
    ostui::SetBackEnd(mFormer);
}

void ScriptedWindows::Answer(const std::string& inIDOrTitle, Script inScript) {
    mCore->Add(inIDOrTitle, std::move(inScript));
}

void ScriptedWindows::AnswerWith(const std::string& inIDOrTitle, const std::string& inButton) {
    mCore->Add(inIDOrTitle, [inButton](ScriptedWindow& ioWindow) { ioWindow.Press(inButton); });
}

const std::vector<ScriptedWindows::ShownWindow>& ScriptedWindows::Shown() const noexcept {
    return mCore->mShown;
}

std::vector<std::string> ScriptedWindows::Mismatches() const {
    std::vector<std::string> all = mCore->mMismatches;
    for (const auto& script : mCore->mScripts) {
        all.push_back("no dialog " + script.first + " came");
    }
    return all;
}

}  // namespace ZOClientTesting
