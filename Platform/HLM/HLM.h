// Whether this process runs without a user before it.
#pragma once

#include "ostcore/Export.h"
#include "ostcore/Types.h"

namespace HLM {

/// What SetIsHeadless said last; until then, whether the environment variable ZOCLIENT_HEADLESS is set to
/// something other than an empty text, "0" or "false". Threads: any.
ZOPLATFORM_EXPORT bool GetIsHeadless();
/// Called by a host before it starts the library.
ZOPLATFORM_EXPORT void SetIsHeadless(bool inIsHeadless);

/// Whether a headless process waits for a network that is down without an end, as one does that somebody
/// watches. False, as at the start: it ends after 15 seconds (SetEndProcessFunction). Threads: any.
ZOPLATFORM_EXPORT bool GetWaitsForNetwork();
ZOPLATFORM_EXPORT void SetWaitsForNetwork(bool inWaits);

/// How this process ends when the library cannot go on without a user; a host that ends in a way of its own
/// says so here. An empty function, as at the start, means std::exit with EXIT_FAILURE. Threads: any.
ZOPLATFORM_EXPORT void SetEndProcessFunction(ostcore::function<void()> inFunction);
/// Ends the process in that way. Main thread; hold no lock.
ZOPLATFORM_EXPORT void EndProcess();

}  // namespace HLM
