// Where state lives, by the XDG base directory rules with one override each.
#pragma once

#include "ostcore/Export.h"
#include "ostcore/filesupport/Dir.h"

namespace ostcore {
namespace config {

/// Each is taken from the environment at every call: the override (used as it is), else the XDG variable and
/// "/zoclient" (a relative XDG path is ignored, as the XDG rules say), else the place under the home
/// directory. The functions only name the directory; Dir::CreatePrivate makes it, mode 0700. Threads: any.

/// ZOCLIENT_CONFIG_HOME, XDG_CONFIG_HOME/zoclient, ~/.config/zoclient.
ZOPLATFORM_EXPORT filesupport::Dir GetConfigDirectory();
/// ZOCLIENT_CACHE_HOME, XDG_CACHE_HOME/zoclient, ~/.cache/zoclient.
ZOPLATFORM_EXPORT filesupport::Dir GetCacheDirectory();
/// ZOCLIENT_STATE_HOME, XDG_STATE_HOME/zoclient, ~/.local/state/zoclient.
ZOPLATFORM_EXPORT filesupport::Dir GetStateDirectory();

}  // namespace config
}  // namespace ostcore
