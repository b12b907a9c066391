// The address under which other machines know this one.
#pragma once

#include "ostnet/Response.h"

namespace ostnet {
namespace utility {

/// The first IPv4 address of an interface that is up and is no loopback, else the first such IPv6 address
/// beyond the link, else "127.0.0.1". Looked up at the first call and kept. Threads: any.
ZOPLATFORM_EXPORT ImmutableString LocalHostIPAddress();

}  // namespace utility

/// Identifies this run of this process, also before other machines; made at the first call.
ZOPLATFORM_EXPORT ImmutableString GetProcessUniqueID();

}  // namespace ostnet
