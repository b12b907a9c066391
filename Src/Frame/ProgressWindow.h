// Runs a batch operation under a modal progress window.
#pragma once

#include "ostcore/Types.h"
#include "RFL/BatchOperation.h"

namespace ZOCL {

/// Identifiers of the window and of what is in it.
constexpr const char* kProgressWindowID = "ZOProgressDialog";
constexpr const char* kProgressText = "progressStaticText";
constexpr const char* kProgressBar = "progressBar";
constexpr const char* kProgressSecondButton = "secondButton";
constexpr const char* kProgressCancelButton = "cancelButton";

/// What a progress window says; all texts are UTF-8.
struct ProgressWindowSettings {
    /// Empty: the product's name.
    U8String title;
    /// Stands above the bar until the operation says something else (UpdateOperationDescriptionMessage).
    U8String caption;
    bool canCancel = true;
    /// Empty: "Cancel".
    U8String cancelText;
    /// Empty: there is no second button.
    U8String secondText;
    /// What the second button does, on the main thread; it may run further windows. True closes this one:
    /// the operation is then no longer waited for, and stopping it is the function's business.
    function<bool()> onSecond;
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
    kSecondButton
};

/// Starts the operation and returns when it has ended; the main thread's queue is pumped meanwhile. Cancel
/// calls Abort once and waits for the end. Without a back end for windows the operation runs all the same.
/// Main thread only; hold no lock.
ProgressEnd RunProgressWindow(const RFL::InterfaceRef<RFL::IBatchOperation>& inOperation,
                              const ProgressWindowSettings& inSettings);

}  // namespace ZOCL
