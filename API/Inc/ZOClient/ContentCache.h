// Where payloads are kept between runs.
#pragma once

#include "ostcore/filesupport/Dir.h"
#include "ZOClient/Export.h"
#include "ZOClient/Types.h"

namespace ZOCL {

/// The directory below which the client keeps what it can fetch again: "MeridaneCache" in the user's cache
/// directory (ZOCLIENT_CACHE_HOME, else XDG_CACHE_HOME/zoclient, else ~/.cache/zoclient). It is made, mode
/// 0700, when it is missing. False when it cannot be made, is a symbolic link, or is not the user's own: then
/// payloads are kept in memory alone. Any thread.
ZOCL_EXPORT bool GetZOCacheBaseDir(ostcore::filesupport::Dir& outDirectory);

}  // namespace ZOCL
