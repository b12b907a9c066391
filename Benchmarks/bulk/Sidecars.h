// Packets as an ingest brings them: 4 KiB of metadata, no two alike.
#pragma once

#include <cstddef>
#include <string>

namespace bench {

constexpr std::size_t kSidecarBytes = 4096;

/// The same text for the same number.
std::string SidecarOf(std::size_t inNumber);

}  // namespace bench
