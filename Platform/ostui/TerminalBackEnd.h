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

/// Goes through the controls of a dialog in their order: writes what is to be read, asks what is to be
/// answered, and at last for a button, one line each. Trees are tables, of which rows are chosen by their
/// numbers ("1,3-5", "all"); lists, popups and radio groups are chosen from by number or text; a text of
/// several lines ends with an empty line. A text that ends with a colon right before an edit or a value
/// without a label is its label. Long texts are broken between words. Passwords are not echoed. What is
/// hidden or disabled is not asked, and a picture is left out; the pages of tabs follow one another. When a
/// dialog stays open, the next round begins, in which the enter key keeps each answer; so it does when
/// something changes that can be answered, and by the enter key where that presses no button.
///
/// The main thread's queue is pumped while it waits. A dialog that closes by itself, or has a bar and nothing
/// to answer, shows its text and its progress, and takes a button at any time; what it says is shown to a
/// terminal only. Off a terminal nothing is written and no question is asked: a dialog that closes by itself
/// is waited for, any other one is dismissed. The end of the input dismisses, too. Nothing of what is shown
/// can steer the terminal.
ZOPLATFORM_EXPORT shared_ptr<BackEnd> CreateTerminalBackEnd(const TerminalSettings& inSettings);

}  // namespace ostui
