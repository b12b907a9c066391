// The media protocol versions that the host speaks, and what of a server's list is usable for it.
#pragma once

#include <cstdint>
#include <vector>

namespace ZOCL {

/// The server's list, or an empty one unless both versions of the host are set and the first is in it.
std::vector<std::uint32_t> UsableRenderProtocolVersions(const std::vector<std::uint32_t>& inServerVersions);

}  // namespace ZOCL
