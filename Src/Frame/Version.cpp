// Reading and comparing versions of servers.
#include "Frame/Version.h"

#include <charconv>

namespace ZOCL {

namespace {

std::uint32_t ReadNumber(std::string_view inText) {
    std::uint32_t number = 0;
    const auto end = std::from_chars(inText.data(), inText.data() + inText.size(), number);
    return end.ec == std::errc() ? number : 0;
}

}  // namespace

bool ParseVersion(std::string_view inText, Version& outVersion) {
    const std::size_t first = inText.find('.');
    if (first == std::string_view::npos) {
        return false;
    }
    const std::size_t second = inText.find('.', first + 1);
    if (second == std::string_view::npos) {
        return false;
    }
    outVersion.major = ReadNumber(inText.substr(0, first));
    outVersion.minor = ReadNumber(inText.substr(first + 1, second - first - 1));
    return true;
}

bool VersionSatisfies(const Version& inServer, const Version& inWanted) {
    if (inServer.major != inWanted.major) {
        return inServer.major > inWanted.major;
    }
    return inServer.minor >= inWanted.minor;
}

}  // namespace ZOCL
