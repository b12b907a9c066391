// What this process calls itself before the server.
#pragma once

#include <string>

#include "ostcore/Export.h"
#include "ostcore/utility/Guid.h"

namespace ostcore {
namespace config {

/// The host's name; "ZOClient" until it is set. Threads: any.
ZOPLATFORM_EXPORT std::string GetClientName();
/// Control characters are dropped, since the name goes into headers.
ZOPLATFORM_EXPORT void SetClientName(const std::string& inName);
/// The host's build number; "0" until it is set.
ZOPLATFORM_EXPORT std::string GetClientBuildNumber();
ZOPLATFORM_EXPORT void SetClientBuildNumber(const std::string& inBuildNumber);
/// Identifies this run of this process; made at the first call.
ZOPLATFORM_EXPORT utility::Guid GetProcessInstanceID();

}  // namespace config
}  // namespace ostcore
