// The one data server that this process is logged in to.
#pragma once

#include "ZOClient/IZOCDataServer.h"

namespace ZOCL {

/// Puts a server in the place of the logged-in one and returns the former, for the caller to let go outside
/// any lock.
InterfaceRef<IZOCDataServer> ExchangeLoggedInServer(const InterfaceRef<IZOCDataServer>& inServer);

}  // namespace ZOCL
