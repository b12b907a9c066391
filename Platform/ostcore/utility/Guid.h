// 128-bit identifiers of requests, connections and documents.
#pragma once

#include <cstdint>
#include <functional>
#include <iosfwd>
#include <string>
#include <string_view>

#include "ostcore/Export.h"

namespace ostcore {
namespace utility {

/// A 128-bit identifier, version 4 of RFC 4122 when made by CreateUnique. A plain value.
class ZOPLATFORM_EXPORT Guid {
public:
    /// The null identifier: all zero.
    constexpr Guid() noexcept = default;
    constexpr Guid(std::uint64_t inHigh, std::uint64_t inLow) noexcept : mHigh(inHigh), mLow(inLow) {}

    /// A fresh random identifier from the system's random source.
    static Guid CreateUnique();
    /// Reads the form 8-4-4-4-12 in either case, with or without braces. Returns false and leaves
    /// outGuid alone for anything else.
    static bool Parse(std::string_view inText, Guid& outGuid);

    /// Lower-case text of the form 8-4-4-4-12.
    std::string ToString() const;
    bool IsNull() const noexcept { return mHigh == 0 && mLow == 0; }
    std::uint64_t High() const noexcept { return mHigh; }
    std::uint64_t Low() const noexcept { return mLow; }

    friend bool operator==(const Guid& inLeft, const Guid& inRight) noexcept {
        return inLeft.mHigh == inRight.mHigh && inLeft.mLow == inRight.mLow;
    }
    friend bool operator!=(const Guid& inLeft, const Guid& inRight) noexcept { return !(inLeft == inRight); }
    /// Compares the halves as unsigned numbers, the first half first.
    friend bool operator<(const Guid& inLeft, const Guid& inRight) noexcept {
        return inLeft.mHigh != inRight.mHigh ? inLeft.mHigh < inRight.mHigh : inLeft.mLow < inRight.mLow;
    }

private:
    std::uint64_t mHigh = 0;
    std::uint64_t mLow = 0;
};

ZOPLATFORM_EXPORT std::ostream& operator<<(std::ostream& ioStream, const Guid& inGuid);

}  // namespace utility
}  // namespace ostcore

namespace std {
template <>
struct hash<ostcore::utility::Guid> {
    size_t operator()(const ostcore::utility::Guid& inGuid) const noexcept {
        return static_cast<size_t>(inGuid.High() ^ (inGuid.Low() * 0x9E3779B97F4A7C15ull));
    }
};
}  // namespace std
