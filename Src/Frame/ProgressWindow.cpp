// The progress window: a text, a bar and its buttons around a running operation.
#include "Frame/ProgressWindow.h"

#include <algorithm>

#include "Frame/LibraryWindow.h"
#include "Frame/Station.h"
#include "IForceAbortEnabledOperation.h"
#include "ostcore/threads/MainThread.h"
#include "ostcore/utility/StringConversion.h"
#include "ostui/BackEnd.h"
#include "OutageMinder.h"
#include "ResourceFactory.h"
#include "ZOClient/Messages.h"
#include "ZOClient/ResultCodes.h"

namespace ZOCL {

namespace {

constexpr std::uint32_t kBarTotal = 100;
const char kStandardTitle[] = "$$$/ZOCL/ZOProgressDialog/kResZOCLZOProgressDialogTitle=Orvane Meridane";
const char kStandardCancel[] = "$$$/ZOCL/ZOProgressDialog/kResZOCLCancelButton=Cancel";
const char kCancelling[] = "$$$/ZOCL/ZOProgressDialog/Canceling=Canceling...";
const char kNetworkTitle[] = "$$$/ZOCL/NetworkWarnTitle=Orvane Meridane";
const char kNetworkMessage[] =
    "$$$/ZOCL/NetworkWarnMsg=Communication with the Meridane Collaboration Hub was interrupted due to "
    "network "
    "issues. Please wait for the connection to re-establish or press \"Sign Out\" to sign out of the current "
    "Meridane server.";
const char kSignOut[] = "$$$/ZOCL/NetworkWarnCancelMsg=Sign Out";

/// How many ScopedSilence there are, and how many windows. Main thread only.
int gSilences = 0;
int gShown = 0;

OutageMinder* Outages() {
    return GetCompositionRoot().outages;
}

/// A progress window on the screen.
class ScopedShown {
public:
    ScopedShown() { ++gShown; }
    ~ScopedShown() {
        if (--gShown == 0 && Outages()) {
            Outages()->OnProgressWindowsGone();
        }
    }
    ScopedShown(const ScopedShown&) = delete;
    ScopedShown& operator=(const ScopedShown&) = delete;
};

U8String OrStandard(const U8String& inText, const char* inStandard) {
    return inText.empty() ? UserText(inStandard) : inText;
}

class ProgressWindow {
public:
    ProgressWindow(const RFL::InterfaceRef<RFL::IBatchOperation>& inOperation,
                   const ProgressWindowSettings& inSettings)
        : mOperation(inOperation),
          mSettings(inSettings),
          mWindow(inSettings.layout),
          mDialog(mWindow.GetDialog()),
          mTitle(OrStandard(inSettings.title, kStandardTitle)),
          mCaption(inSettings.caption),
          mCancelText(OrStandard(inSettings.cancelText, kStandardCancel)),
          mOperationListener(inOperation->GetStationID()),
          mLibraryListener(CurrentStation()) {
        SetUp();
        ListenToOperation();
        ListenToLibrary();
    }

    ProgressEnd Run() {
        if (!mOperation->Start()) {
            return ProgressEnd::kNotStarted;
        }
        if (gSilences > 0) {
            ostui::PumpUntilClosed(mDialog);
        } else {
            {
                const ScopedShown shown;
                mDialog.RunModal();
            }
            mHasEnded = true;
            ShowFinalText();
        }
        return mEnd;
    }

private:
    void SetUp() {
        mIsNetworkDown = Outages() && Outages()->IsNetworkDown();
        mDialog.SetClosesByItself();
        mDialog.SetVisible(kProgressConfirmButton, false);
        const bool isDeterminate = mSettings.bar == ProgressBarKind::kDeterminate;
        mDialog.SetProgress(kProgressBar, 0, isDeterminate ? kBarTotal : 0);
        mDialog.SetVisible(kProgressSecondButton, !mSettings.secondText.empty());
        mDialog.SetText(kProgressSecondButton, mSettings.secondText);
        mDialog.SetHandler(kProgressSecondButton, [this] { OnSecond(); });
        mDialog.SetHandler(kProgressCancelButton, [this] { mIsNetworkDown ? OnSignOut() : OnCancel(); });
        mDialog.SetCancelButton(kProgressCancelButton);
        Show();
    }

    /// Puts title, text and cancel button to what they are to say now.
    void Show() {
        mDialog.SetTitle(mIsNetworkDown ? UserText(kNetworkTitle) : mTitle);
        mDialog.SetText(kProgressText, mIsNetworkDown ? UserText(kNetworkMessage) : mCaption);
        mDialog.SetText(kProgressCancelButton, mIsNetworkDown ? UserText(kSignOut)
                                               : mIsCancelled ? UserText(kCancelling)
                                                              : mCancelText);
        mDialog.SetEnabled(kProgressCancelButton, mIsNetworkDown || !mIsCancelled);
        mDialog.SetVisible(kProgressCancelButton, mIsNetworkDown || mSettings.canCancel);
        mDialog.SetEnabled(kProgressSecondButton, !mIsNetworkDown && !mIsCancelled);
    }

    void ListenToOperation() {
        mOperationListener.AddHandler<RFL::OperationCompleteMessage>(
            [this](const RFL::OperationCompleteMessage&) { mDialog.Close(ostui::kResponseOK); });
        mOperationListener.AddHandler<RFL::UpdateOperationProgressMessage>(
            [this](const RFL::UpdateOperationProgressMessage& inMessage) {
                // Also false for what is no number.
                if (mSettings.bar != ProgressBarKind::kRunning && inMessage.range > 0 &&
                    inMessage.value >= 0) {
                    const double part = std::min(1.0, inMessage.value / inMessage.range);
                    mDialog.SetProgress(kProgressBar, static_cast<std::uint32_t>(part * kBarTotal),
                                        kBarTotal);
                }
            });
        mOperationListener.AddHandler<RFL::UpdateOperationDescriptionMessage>(
            [this](const RFL::UpdateOperationDescriptionMessage& inMessage) {
                mCaption = ostcore::utility::ToUTF8(inMessage.text);
                if (!mIsNetworkDown) {
                    mDialog.SetText(kProgressText, mCaption);
                }
            });
    }

    void ListenToLibrary() {
        mLibraryListener.AddHandler<ZONetworkStateMessage>([this](const ZONetworkStateMessage& inMessage) {
            mIsNetworkDown = inMessage.isDown;
            Show();
        });
        mLibraryListener.AddHandler<ZOTerminateConnectionMessage>(
            [this](const ZOTerminateConnectionMessage& inMessage) {
                if (inMessage.forced) {
                    OnTerminated();
                }
            });
    }

    void OnCancel() {
        if (mIsCancelled) {
            return;
        }
        mEnd = ProgressEnd::kCancelled;
        mIsCancelled = true;
        Show();
        mOperation->Abort();
    }

    void OnSignOut() {
        // This window hears of the end of the session, too. It must not be the one that cannot be left.
        if (!Outages() || !Outages()->SignOut()) {
            mIsNetworkDown = false;
            OnCancel();
        }
    }

    void OnTerminated() {
        // Of an operation that has ended the final text may still be on the screen.
        if (mHasEnded || mDialog.IsClosed()) {
            return;
        }
        const auto forceable = RFL::QueryInterface<IForceAbortEnabledOperation>(mOperation);
        if (!forceable) {
            mIsNetworkDown = false;
            return OnCancel();
        }
        mEnd = ProgressEnd::kForceAborted;
        mDialog.Close(ostui::kResponseCancel);
        forceable->ForceAbort(kResultDialogCancelled);
    }

    void OnSecond() {
        if (!mSettings.onSecond || !mSettings.onSecond() || mDialog.IsClosed()) {
            return;
        }
        mEnd = ProgressEnd::kSecondButton;
        mDialog.Close(ostui::kResponseCancel);
    }

    void ShowFinalText() {
        const U8String text =
            mEnd == ProgressEnd::kCompleted && mSettings.finalText ? mSettings.finalText() : U8String();
        if (text.empty()) {
            return;
        }
        // A run of its own, in the same place: this one waits for its user, and for nothing else.
        LibraryWindow window(mSettings.layout);
        ostui::Dialog& dialog = window.GetDialog();
        dialog.SetTitle(mTitle);
        dialog.SetText(kProgressText, text);
        dialog.SetProgress(kProgressBar, kBarTotal, kBarTotal);
        dialog.SetVisible(kProgressSecondButton, false);
        dialog.SetVisible(kProgressCancelButton, false);
        dialog.SetHandler(kProgressConfirmButton, [&dialog] { dialog.Close(ostui::kResponseOK); });
        dialog.SetDefaultButton(kProgressConfirmButton);
        dialog.SetCancelButton(kProgressConfirmButton);
        if (mDialog.GetGeometry()) {
            dialog.SetGeometry(*mDialog.GetGeometry());
        }
        RFL::Listener terminated(CurrentStation());
        terminated.AddHandler<ZOTerminateConnectionMessage>(
            [&dialog](const ZOTerminateConnectionMessage&) { dialog.Close(ostui::kResponseCancel); });
        dialog.RunModal();
    }

    const RFL::InterfaceRef<RFL::IBatchOperation> mOperation;
    const ProgressWindowSettings& mSettings;
    LibraryWindow mWindow;
    ostui::Dialog& mDialog;
    const U8String mTitle;
    /// What the operation says; also kept while the network's message stands in its place.
    U8String mCaption;
    const U8String mCancelText;
    bool mIsCancelled = false;
    bool mIsNetworkDown = false;
    bool mHasEnded = false;
    ProgressEnd mEnd = ProgressEnd::kCompleted;
    RFL::Listener mOperationListener;
    RFL::Listener mLibraryListener;
};

}  // namespace

ProgressEnd RunProgressWindow(const RFL::InterfaceRef<RFL::IBatchOperation>& inOperation,
                              const ProgressWindowSettings& inSettings) {
    if (!inOperation || !ostcore::threads::IsMainThread()) {
        return ProgressEnd::kNotRun;
    }
    ProgressWindow window(inOperation, inSettings);
    return window.Run();
}

bool IsProgressWindowShown() {
    return gShown > 0 && ostui::GetBackEnd();
}

ScopedSilence::ScopedSilence(bool inIsSilent) : mIsSilent(inIsSilent) {
    gSilences += mIsSilent ? 1 : 0;
}

ScopedSilence::~ScopedSilence() {
    gSilences -= mIsSilent ? 1 : 0;
}

}  // namespace ZOCL
