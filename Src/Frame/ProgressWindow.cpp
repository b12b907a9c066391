// The progress window: a text, a bar and up to two buttons around a running operation.
#include "Frame/ProgressWindow.h"

#include <algorithm>

#include "ostcore/config/ZString.h"
#include "ostcore/threads/MainThread.h"
#include "ostcore/utility/StringConversion.h"
#include "ostui/Dialog.h"

namespace ZOCL {

namespace {

constexpr std::uint32_t kBarTotal = 100;
const char kStandardTitle[] = "$$$/ZOCL/ZOProgressDialog/kResZOCLZOProgressDialogTitle=Orvane Meridane";
const char kStandardCancel[] = "$$$/ZOCL/ZOProgressDialog/kResZOCLCancelButton=Cancel";
const char kCancelling[] = "$$$/ZOCL/ZOProgressDialog/Canceling=Canceling...";

U8String OrStandard(const U8String& inText, const char* inStandard) {
    return inText.empty() ? ostcore::ZString(inStandard).AsUTF8() : inText;
}

class ProgressWindow {
public:
    ProgressWindow(const RFL::InterfaceRef<RFL::IBatchOperation>& inOperation,
                   const ProgressWindowSettings& inSettings)
        : mOperation(inOperation),
          mOnSecond(inSettings.onSecond),
          mDialog(kProgressWindowID, OrStandard(inSettings.title, kStandardTitle)),
          mListener(inOperation->GetStationID()) {
        AddControls(inSettings);
        Listen();
    }

    ProgressEnd Run() {
        if (!mOperation->Start()) {
            return ProgressEnd::kNotStarted;
        }
        mDialog.RunModal();
        return mEnd;
    }

private:
    void AddControls(const ProgressWindowSettings& inSettings) {
        mDialog.SetClosesByItself();
        mDialog.AddStaticText(kProgressText, inSettings.caption);
        mDialog.AddProgressBar(kProgressBar);
        if (!inSettings.secondText.empty()) {
            mDialog.AddButton(kProgressSecondButton, inSettings.secondText, [this] { OnSecond(); });
        }
        if (inSettings.canCancel) {
            mDialog.AddButton(kProgressCancelButton, OrStandard(inSettings.cancelText, kStandardCancel),
                              [this] { OnCancel(); });
            mDialog.SetCancelButton(kProgressCancelButton);
        }
    }

    void Listen() {
        mListener.AddHandler<RFL::OperationCompleteMessage>(
            [this](const RFL::OperationCompleteMessage&) { mDialog.Close(ostui::kResponseOK); });
        mListener.AddHandler<RFL::UpdateOperationProgressMessage>(
            [this](const RFL::UpdateOperationProgressMessage& inMessage) {
                // Also false for what is no number.
                if (inMessage.range > 0 && inMessage.value >= 0) {
                    const double part = std::min(1.0, inMessage.value / inMessage.range);
                    mDialog.SetProgress(kProgressBar, static_cast<std::uint32_t>(part * kBarTotal),
                                        kBarTotal);
                }
            });
        mListener.AddHandler<RFL::UpdateOperationDescriptionMessage>(
            [this](const RFL::UpdateOperationDescriptionMessage& inMessage) {
                mDialog.SetText(kProgressText, ostcore::utility::ToUTF8(inMessage.text));
            });
    }

    void OnCancel() {
        mEnd = ProgressEnd::kCancelled;
        mDialog.SetText(kProgressCancelButton, ostcore::ZString(kCancelling).AsUTF8());
        mDialog.SetEnabled(kProgressCancelButton, false);
        mDialog.SetEnabled(kProgressSecondButton, false);
        mOperation->Abort();
    }

    void OnSecond() {
        if (!mOnSecond || !mOnSecond() || mDialog.IsClosed()) {
            return;
        }
        mEnd = ProgressEnd::kSecondButton;
        mDialog.Close(ostui::kResponseCancel);
    }

    const RFL::InterfaceRef<RFL::IBatchOperation> mOperation;
    const function<bool()> mOnSecond;
    ProgressEnd mEnd = ProgressEnd::kCompleted;
    ostui::Dialog mDialog;
    RFL::Listener mListener;
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

}  // namespace ZOCL
