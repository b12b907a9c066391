// Runs a batch operation under a modal progress window.
#pragma once

#include "ostcore/Types.h"
#include "RFL/BatchOperation.h"

namespace ZOCL {

/// Identifiers of the window and of what is in it.
constexpr const char* kProgressWindowID = "ZOProgressDialog";
constexpr const char* kPendingTransactionWindowID = "ZOPendingTransactionDialog";
constexpr const char* kProgressText = "progressStaticText";
constexpr const char* kProgressBar = "progressBar";
constexpr const char* kProgressConfirmButton = "confirmButton";
constexpr const char* kProgressCancelButton = "cancelButton";
/// In the layout of the pending transactions alone.
constexpr const char* kProgressSecondButton = "secondButton";

enum class ProgressBarKind {
    /// Only shows that something runs, until the operation tells how far it is.
    kRunningUntilTold,
    /// Only shows that something runs, whatever the operation tells.
    kRunning,
    /// From nothing to all.
    kDeterminate
};

/// What a progress window says; all texts are UTF-8.
struct ProgressWindowSettings {
    /// One with the controls above.
    const char* layout = kProgressWindowID;
    /// Empty: the product's name.
    U8String title;
    /// Stands above the bar until the operation says something else (UpdateOperationDescriptionMessage).
    U8String caption;
    ProgressBarKind bar = ProgressBarKind::kRunningUntilTold;
    bool canCancel = true;
    /// Empty: "Cancel".
    U8String cancelText;
    /// Empty: there is no second button.
    U8String secondText;
    /// What the second button does, on the main thread; it may run further windows. True closes this one:
    /// the operation is then no longer waited for, and stopping it is the function's business.
    function<bool()> onSecond;
    /// Asked once when the operation has ended by itself: a text that the window shows until the user
    /// confirms it. An empty function or text: the window closes at once.
    function<U8String()> finalText;
};

/// How the window ended. What the operation achieved is asked of the operation.
enum class ProgressEnd {
    /// There is no operation, or the caller is not on the main thread: nothing was done.
    kNotRun,
    /// The operation refused to start.
    kNotStarted,
    /// The operation ended by itself.
    kCompleted,
    /// The user cancelled, and the operation has ended after that.
    kCancelled,
    /// The function of the second button closed the window.
    kSecondButton,
    /// The session was ended while the operation ran: it was torn down with kResultDialogCancelled
    /// (IForceAbortEnabledOperation) and posts nothing any more.
    kForceAborted
};

/// Starts the operation and returns when it has ended; the main thread's queue is pumped meanwhile. Cancel
/// calls Abort once and waits for the end. Without a back end for windows the operation runs all the same.
///
/// While the network is down the window says so and offers to sign out (ZONetworkStateMessage, OutageMinder).
/// A forced end of the session (ZOTerminateConnectionMessage) tears the operation down, or aborts one that
/// cannot be torn down. Main thread only; hold no lock.
ProgressEnd RunProgressWindow(const RFL::InterfaceRef<RFL::IBatchOperation>& inOperation,
                              const ProgressWindowSettings& inSettings);

/// Whether the user sees a progress window now, perhaps below other windows. Main thread.
bool IsProgressWindowShown();

/// While one lives, RunProgressWindow shows nothing: for flows that a host runs without its user. Main
/// thread.
class ScopedSilence {
public:
    explicit ScopedSilence(bool inIsSilent);
    ~ScopedSilence();
    ScopedSilence(const ScopedSilence&) = delete;
    ScopedSilence& operator=(const ScopedSilence&) = delete;

private:
    const bool mIsSilent;
};

}  // namespace ZOCL
