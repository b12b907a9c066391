// What shows dialogs: installed once by the host, so that the library itself knows no window system.
#pragma once

#include "ostcore/Export.h"
#include "ostcore/Types.h"
#include "ostui/Dialog.h"

namespace ostui {

using ostcore::shared_ptr;

/// Shows dialogs to a user, on a terminal or to a test. Both operations are called on the main thread, with
/// no lock held; dialogs nest.
class ZOPLATFORM_EXPORT BackEnd {
public:
    virtual ~BackEnd();
    /// Shows the dialog, tells it so (Dialog::TellOpened), and hands it what the user does, until it is
    /// closed; pumps the main thread's queue meanwhile. The dialog is closed when this returns.
    virtual void RunModal(Dialog& ioDialog) = 0;
    /// A control of a running dialog has changed, or the tree in it. Told from within the call that changed
    /// it, so from within whatever handed the user's action to the dialog, too.
    virtual void OnControlChanged(Dialog& ioDialog, const Control& inControl);
    /// The title or the default button of a running dialog has changed.
    virtual void OnDialogChanged(Dialog& ioDialog);
};

/// Puts a back end in place and returns the former one; null, as at the start, means that nobody can be
/// asked. Threads: any, but not while a dialog runs.
ZOPLATFORM_EXPORT shared_ptr<BackEnd> SetBackEnd(const shared_ptr<BackEnd>& inBackEnd);
ZOPLATFORM_EXPORT shared_ptr<BackEnd> GetBackEnd();

/// The dialogs that run now, the innermost last; valid until one opens or ends. Main thread.
ZOPLATFORM_EXPORT const std::vector<Dialog*>& GetRunningDialogs();

/// Pumps the main thread's queue until the dialog is closed. Main thread.
ZOPLATFORM_EXPORT void PumpUntilClosed(const Dialog& inDialog);

}  // namespace ostui
