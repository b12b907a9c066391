// Tells the user that his session was changed from elsewhere.
#pragma once

#include "ZOClient/CommitMetadata.h"
#include "ZOClient/IZOCDataServer.h"

namespace ZOCL {

/// A message box with OK, for an operation that ended with HTTP 412. inOperationName is what the user calls
/// the operation; inMetadata is that of the newest foreign commit, empty when none is known; inExtra tells
/// what happens next, and has a default when it is empty. A null server leaves the user unnamed.
/// Main thread; blocks until the box is closed, and for the user's name when it is not known yet.
void ShowSessionConflictMessage(const InterfaceRef<IZOCDataServer>& inServer, const UString& inOperationName,
                                const CommitMetadata& inMetadata, const UString& inExtra);

}  // namespace ZOCL
