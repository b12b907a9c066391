// Clears the screen of modal windows when a session ends.
#include "Dialogs/CloseModalDialogs.h"

#include <algorithm>
#include <utility>
#include <vector>

#include "ostcore/config/ZString.h"
#include "ostcore/threads/DelayedCall.h"
#include "ostcore/threads/MainThread.h"
#include "ostui/BackEnd.h"
#include "ZOClient/Dialogs.h"

namespace ZOCL {

namespace {

constexpr std::uint32_t kDelayMilliseconds = 100;
constexpr std::uint32_t kLongestTryMilliseconds = 10000;
constexpr int kTries = kLongestTryMilliseconds / kDelayMilliseconds;
const char kTitle[] = "$$$/ZOCL/CloseModalDialogs/Title=Orvane Meridane";
const char kMessage[] =
    "$$$/ZOCL/CloseModalDialogs/Message=We have detected open dialogs. Please cancel all dialogs to allow "
    "the sign out process to continue.";

class Closing;

/// Those that go on. Main thread only.
std::vector<shared_ptr<Closing>>& Running() {
    static auto& running = *new std::vector<shared_ptr<Closing>>;
    return running;
}

/// One request to clear the screen.
class Closing : public enable_shared_from_this<Closing> {
public:
    Closing(const function<void()>& inCompletion, const CloseModalDialogsSettings& inSettings)
        : mCompletion(inCompletion), mSettings(inSettings) {}

    void Begin() {
        Running().push_back(shared_from_this());
        Check();
    }

    void Stop() {
        mIsStopped = true;
        if (const shared_ptr<ostcore::threads::DelayedCall> next = std::exchange(mNext, nullptr)) {
            next->Cancel();
        }
    }

private:
    void Check() {
        if (mIsStopped) {
            return;
        }
        ostui::Dialog* const dialog = FindModal();
        if (!dialog || (!mSettings.welcomeDialog.empty() && dialog->GetID() == mSettings.welcomeDialog)) {
            return End();
        }
        if (mTries++ < kTries) {
            dialog->Dismiss();
        } else {
            mTries = 0;
            TellUser();
        }
        CheckLater();
    }

    void End() {
        const shared_ptr<Closing> self = shared_from_this();
        std::vector<shared_ptr<Closing>>& running = Running();
        running.erase(std::remove(running.begin(), running.end(), self), running.end());
        if (mCompletion) {
            mCompletion();
        }
    }

    /// The innermost window that is not on its way out and not the caller's.
    ostui::Dialog* FindModal() const {
        const std::vector<ostui::Dialog*>& running = ostui::GetRunningDialogs();
        const auto found = std::find_if(running.rbegin(), running.rend(), [&](ostui::Dialog* inDialog) {
            return mSettings.ownDialog.empty() || inDialog->GetID() != mSettings.ownDialog;
        });
        return found == running.rend() ? nullptr : *found;
    }

    static void TellUser() {
        SimpleMessageBox(ostcore::ZString(kTitle).AsString(), ostcore::ZString(kMessage).AsString(),
                         ostui::kMessageBoxOK, ostui::kMessageBoxOK, ostui::MessageBoxIcon::kCaution);
    }

    void CheckLater() {
        if (mIsStopped) {
            return;
        }
        const auto self = shared_from_this();
        // Null: short enough for the scheduler's own thread.
        mNext = ostcore::threads::PostDelayed(
            nullptr, [self] { ostcore::threads::AsyncCallFromMainThread([self] { self->Check(); }); },
            kDelayMilliseconds);
    }

    const function<void()> mCompletion;
    const CloseModalDialogsSettings mSettings;
    int mTries = 0;
    bool mIsStopped = false;
    shared_ptr<ostcore::threads::DelayedCall> mNext;
};

}  // namespace

bool CloseModalDialogs(const function<void()>& inCompletion, const CloseModalDialogsSettings& inSettings) {
    if (!ostcore::threads::IsMainThread()) {
        return false;
    }
    boost::make_shared<Closing>(inCompletion, inSettings)->Begin();
    return true;
}

void StopClosingModalDialogs() {
    std::vector<shared_ptr<Closing>> running;
    running.swap(Running());
    for (const shared_ptr<Closing>& closing : running) {
        closing->Stop();
    }
}

}  // namespace ZOCL
