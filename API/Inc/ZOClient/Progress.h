// Waiting for the server under a progress window.
#pragma once

#include "ZOClient/Export.h"
#include "ZOClient/Types.h"

namespace ZOCL {

/// Loads a resource, or with inRefreshIfLoaded asks for its latest version when it is loaded, while a window
/// tells the user to wait; the main thread's queue is pumped meanwhile. The user may cancel.
///
/// Returns the result of the load: 0 also for a resource that was loaded and is not to be refreshed, and for
/// one that has not changed (HTTP 304); kResultRequestCancelled after a cancel; kResultFailure for a null
/// resource and off the main thread, where nothing is done. Main thread only; hold no lock.
ZOCL_EXPORT int LoadServerResourceWithProgress(const InterfaceRef<IZOCServerResource>& inResource,
                                               bool inRefreshIfLoaded);

}  // namespace ZOCL
