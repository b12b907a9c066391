// The file that keeps the identifier of a machine.
#pragma once

#include <string>

#include "ostcore/Export.h"
#include "ostcore/filesupport/Dir.h"

namespace ostnetsync {

/// The identifier that the directory keeps; made, with the directory, when there is none, and made anew when
/// the file holds something else. Of several processes that make it at once, all get the same one. Empty when
/// it can be neither read nor written. Threads: any.
ZOPLATFORM_EXPORT std::string ReadOrMakeDeviceID(const ostcore::filesupport::Dir& inDirectory);

}  // namespace ostnetsync
