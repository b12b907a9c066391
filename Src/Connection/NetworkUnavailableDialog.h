// The window that tells that the network is down: it closes by itself when the network is back, and offers to
// sign out.
#pragma once

#include "Connection/WaitForNetworkRecoveryOperation.h"
#include "Frame/LibraryWindow.h"

namespace ZOCL {

constexpr const char* kNetworkUnavailableDialogID = "ZONetworkUnavailableDialog";
constexpr const char* kNetworkUnavailableMessage = "progressStaticText";
constexpr const char* kNetworkUnavailableSignOut = "cancelButton";

/// Runs once. Threads: the main thread, except CloseAsRecovered.
class ZONetworkUnavailableDialog {
public:
    ZONetworkUnavailableDialog();
    /// Ends the wait, which has a thread of its own.
    ~ZONetworkUnavailableDialog();
    ZONetworkUnavailableDialog(const ZONetworkUnavailableDialog&) = delete;
    ZONetworkUnavailableDialog& operator=(const ZONetworkUnavailableDialog&) = delete;
    /// Waits for the network or the user. kResultSuccess: the network is back, or nobody needs the answer any
    /// more. kResultCancelled: the user wants to sign out. kResultFailure: it could not be run.
    int Run();
    /// Any thread, also before Run.
    void CloseAsRecovered();

private:
    LibraryWindow mWindow;
    ostui::Dialog& mDialog;
    const InterfaceRef<WaitForNetworkRecoveryOperation> mWait;
};

}  // namespace ZOCL
