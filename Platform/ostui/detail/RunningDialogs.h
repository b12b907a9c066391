// Which dialogs run now.
#pragma once

#include "ostui/Dialog.h"

namespace ostui {
namespace detail {

/// Counts a dialog among those that run, for a scope. Main thread.
class RunningDialog {
public:
    explicit RunningDialog(Dialog& ioDialog);
    ~RunningDialog();
    RunningDialog(const RunningDialog&) = delete;
    RunningDialog& operator=(const RunningDialog&) = delete;
};

}  // namespace detail
}  // namespace ostui
