// Layout and end of the network warning.
#include "Connection/NetworkUnavailableDialog.h"

#include "ostcore/config/ZString.h"

namespace ZOCL {

namespace {

const char kTitle[] = "$$$/ZOCL/NetworkWarnDialogTitle=Orvane Meridane";
const char kMessage[] =
    "$$$/ZOCL/NetworkWarnDialogMsg=Communication with the Meridane Collaboration Hub was interrupted due to "
    "network issues. Please wait for the connection to re-establish or press \"Sign Out\" to sign out of the "
    "current Meridane server.";
const char kSignOut[] = "$$$/ZOCL/NetworkWarnDialogCancelMsg=Sign Out";

U8String Text(const char* inKey) {
    return ostcore::ZString(inKey).AsUTF8();
}

}  // namespace

ZONetworkUnavailableDialog::ZONetworkUnavailableDialog()
    : mDialog(kNetworkUnavailableDialogID, Text(kTitle)), mWait(new WaitForNetworkRecoveryOperation) {
    mDialog.SetClosesByItself();
    mDialog.AddStaticText(kNetworkUnavailableMessage, Text(kMessage));
    // The window goes when the wait has ended, so that it has one end and one result.
    mDialog.AddButton(kNetworkUnavailableSignOut, Text(kSignOut), [this] {
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
