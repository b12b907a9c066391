// Whether this process runs without a user before it.
#pragma once

#include "ostcore/Export.h"

namespace HLM {

/// What SetIsHeadless said last; until then, whether the environment variable ZOCLIENT_HEADLESS is set to
/// something other than an empty text, "0" or "false". Threads: any.
ZOPLATFORM_EXPORT bool GetIsHeadless();
/// Called by a host before it starts the library.
ZOPLATFORM_EXPORT void SetIsHeadless(bool inIsHeadless);

}  // namespace HLM
