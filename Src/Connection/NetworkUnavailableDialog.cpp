// What the network warning says, and its end.
#include "Connection/NetworkUnavailableDialog.h"

namespace ZOCL {

namespace {

const char kTitle[] = "$$$/ZOCL/NetworkWarnDialogTitle=Orvane Meridane";
const char kMessage[] =
    "$$$/ZOCL/NetworkWarnDialogMsg=Communication with the Meridane Collaboration Hub was interrupted due to "
    "network issues. Please wait for the connection to re-establish or press \"Sign Out\" to sign out of the "
    "current Meridane server.";
const char kSignOut[] = "$$$/ZOCL/NetworkWarnDialogCancelMsg=Sign Out";

}  // namespace

ZONetworkUnavailableDialog::ZONetworkUnavailableDialog()
    : mWindow(kNetworkUnavailableDialogID),
      mDialog(mWindow.GetDialog()),
      mWait(new WaitForNetworkRecoveryOperation) {
    mDialog.SetClosesByItself();
    mDialog.SetTitle(UserText(kTitle));
    mDialog.SetText(kNetworkUnavailableMessage, UserText(kMessage));
    // Nobody knows how long it takes.
    mDialog.SetProgress("progressBar", 0, 0);
    mDialog.SetVisible("confirmButton", false);
    mDialog.SetText(kNetworkUnavailableSignOut, UserText(kSignOut));
    // The window goes when the wait has ended, so that it has one end and one result.
    mDialog.SetHandler(kNetworkUnavailableSignOut, [this] {
        mDialog.SetEnabled(kNetworkUnavailableSignOut, false);
        mWait->Abort();
    });
    mDialog.SetCancelButton(kNetworkUnavailableSignOut);
}

ZONetworkUnavailableDialog::~ZONetworkUnavailableDialog() {
    mWait->Abort();
}

int ZONetworkUnavailableDialog::Run() {
    RFL::Listener listener(mWait->GetStationID());
    listener.AddHandler<RFL::OperationCompleteMessage>(
        [this](const RFL::OperationCompleteMessage&) { mDialog.Close(ostui::kResponseOK); });
    if (!mWait->Start()) {
        return kResultFailure;
    }
    mDialog.RunModal();
    return mWait->GetResult();
}

void ZONetworkUnavailableDialog::CloseAsRecovered() {
    mWait->NetworkIsBack();
}

}  // namespace ZOCL
