// Packing of answers and bounded unpacking of request bodies.
#pragma once

#include <string>
#include <string_view>

namespace zohub {

/// The text as one gzip member.
std::string GzipPack(std::string_view inText);

struct UnpackLimits {
    std::size_t maxSize = 0;         ///< bytes after unpacking
    std::size_t maxRatio = 200;      ///< unpacked to packed, looked at above freeSize
    std::size_t freeSize = 1 << 20;  ///< below this the ratio does not matter
};

/// Unpacks gzip or zlib data. Throws Failure 400 for damaged data and 413 beyond a limit; what was unpacked
/// until then never exceeds the limit by more than one step of 64 KiB.
std::string Unpack(std::string_view inPacked, UnpackLimits const& inLimits);

}  // namespace zohub
