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

}  // namespace

void ScriptedWindow::Press(const std::string& inButton) {
    if (!mDialog.Press(inButton)) {
        mMismatches.push_back(ID() + ": the button " + inButton + " cannot be pressed");
    }
}

void ScriptedWindow::Enter(const std::string& inEdit, const std::string& inText) {
    if (!mDialog.Enter(inEdit, inText)) {
        mMismatches.push_back(ID() + ": nothing can be entered into " + inEdit);
    }
}

void ScriptedWindow::Select(const std::string& inList, int inRow) {
    if (!mDialog.Select(inList, inRow)) {
        mMismatches.push_back(ID() + ": row " + std::to_string(inRow) + " of " + inList +
                              " cannot be selected");
    }
}

void ScriptedWindow::Dismiss() {
    mDialog.Dismiss();
}

bool ScriptedWindow::WaitUntil(const function<bool()>& inCondition, std::uint32_t inMilliseconds) {
    if (PumpUntil(inCondition, inMilliseconds)) {
        return true;
    }
    mMismatches.push_back(ID() + ": what the script waited for did not happen");
    return false;
}

std::string ScriptedWindows::ShownWindow::Text(const std::string& inControl) const {
    const auto found = std::find_if(controls.begin(), controls.end(),
                                    [&](const ostui::Control& inOther) { return inOther.id == inControl; });
    return found == controls.end() ? std::string() : found->text;
}

class ScriptedWindows::Core final : public ostui::BackEnd {
public:
    void RunModal(ostui::Dialog& ioDialog) override {
        const std::size_t index = mShown.size();
        mShown.push_back({ioDialog.GetID(), ioDialog.GetTitle(), ioDialog.GetControls(), {}});
        mRunning.emplace_back(&ioDialog, index);
        Play(ioDialog);
        mRunning.pop_back();
    }

    void OnControlChanged(ostui::Dialog& ioDialog, const ostui::Control& inControl) override {
        const auto running = std::find_if(mRunning.rbegin(), mRunning.rend(), [&](const auto& inRunning) {
            return inRunning.first == &ioDialog;
        });
        if (running != mRunning.rend() && inControl.type != ostui::ControlType::kPasswordEdit) {
            mShown[running->second].changes.push_back(inControl.id + ": " + inControl.text);
        }
    }

    void Add(const std::string& inName, Script inScript) {
        mScripts.emplace_back(inName, std::move(inScript));
    }

    std::vector<ShownWindow> mShown;
    std::vector<std::string> mMismatches;
    std::deque<std::pair<std::string, Script>> mScripts;

private:
    void Play(ostui::Dialog& ioDialog) {
        const auto found = std::find_if(mScripts.begin(), mScripts.end(), [&](const auto& inEntry) {
            return inEntry.first == ioDialog.GetID() || inEntry.first == ioDialog.GetTitle();
        });
        if (found != mScripts.end()) {
            const Script script = found->second;
            mScripts.erase(found);
            ScriptedWindow window(ioDialog, mMismatches);
            script(window);
        } else if (!ioDialog.ClosesByItself()) {
            mMismatches.push_back("nobody answers " + ioDialog.GetID() + ", \"" + ioDialog.GetTitle() + "\"");
            ioDialog.Dismiss();
        }
        if (!PumpUntil([&] { return ioDialog.IsClosed(); }, kLongestWait)) {
            mMismatches.push_back(ioDialog.GetID() + " was still open after its script");
            ioDialog.Close(ostui::kResponseCancel);
        }
    }

    std::vector<std::pair<ostui::Dialog*, std::size_t>> mRunning;
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
