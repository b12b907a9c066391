// Dialogs on a terminal, for command-line hosts.
#pragma once

#include "ostcore/Export.h"
#include "ostcore/Types.h"
#include "ostui/BackEnd.h"

namespace ostui {

struct TerminalSettings {
    /// Where answers are read and texts are written; both must be terminals, or nothing is ever asked.
    int input = 0;
    int output = 2;
    /// Looked at while a dialog runs: true once the user wants to stop, which dismisses every dialog from
    /// then on. May be empty.
    ostcore::function<bool()> isInterrupted;
};

/// Writes what a dialog reads and asks for each edit and list and at last for a button, one line each;
/// passwords are not echoed. The main thread's queue is pumped while it waits. A dialog that closes by itself
/// shows its text and its progress, and takes a button at any time; what it says is shown to a terminal only.
/// Off a terminal nothing is written and no question is asked: such a dialog is waited for, any other one is
/// dismissed. The end of the input dismisses, too.
ZOPLATFORM_EXPORT shared_ptr<BackEnd> CreateTerminalBackEnd(const TerminalSettings& inSettings);

}  // namespace ostui
