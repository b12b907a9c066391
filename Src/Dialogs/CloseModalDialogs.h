// The end of what CloseModalDialogs (ZOClient/Dialogs.h) has begun.
#pragma once

namespace ZOCL {

/// Ends every clearing of the screen that still goes on: no window is cancelled any more, no function called,
/// and no timer is left. Main thread.
void StopClosingModalDialogs();

}  // namespace ZOCL
