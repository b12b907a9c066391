// Versions of servers: how they are written and compared.
#pragma once

#include <cstdint>
#include <string_view>

namespace ZOCL {

struct Version {
    std::uint32_t major = 0;
    std::uint32_t minor = 0;

    friend bool operator==(const Version&, const Version&) = default;
};

/// Reads "major.minor.rest": two dots at least; a number that does not read counts as 0, and what follows the
/// second dot is ignored. False, with outVersion unchanged, when there are fewer dots.
bool ParseVersion(std::string_view inText, Version& outVersion);

/// Whether a server of this version serves a client that wants at least that one; newer ones always do.
bool VersionSatisfies(const Version& inServer, const Version& inWanted);

}  // namespace ZOCL
