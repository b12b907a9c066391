// Holds the host's media protocol versions.
#include "Frame/MediaProtocolVersions.h"

#include <algorithm>
#include <atomic>

#include "ZOClient/Library.h"

namespace ZOCL {

namespace {

std::atomic<std::uint32_t> gFirst{0};
std::atomic<std::uint32_t> gSecond{0};

}  // namespace

void SetCompatibleMediaProtocolVersions(unsigned long inFirst, unsigned long inSecond) {
    gFirst = static_cast<std::uint32_t>(inFirst);
    gSecond = static_cast<std::uint32_t>(inSecond);
}

std::vector<std::uint32_t> UsableRenderProtocolVersions(const std::vector<std::uint32_t>& inServerVersions) {
    const std::uint32_t first = gFirst;
    const std::uint32_t second = gSecond;
    const bool isListed =
        std::find(inServerVersions.begin(), inServerVersions.end(), first) != inServerVersions.end();
    if (first == 0 || second == 0 || !isListed) {
        return {};
    }
    return inServerVersions;
}

}  // namespace ZOCL
