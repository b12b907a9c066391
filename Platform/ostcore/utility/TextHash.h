// The hash of a text within this process, for tables that foreign texts go into.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string_view>

#include "ostcore/Export.h"

namespace ostcore {
namespace utility {

/// Anew in each process, so that a peer cannot send texts that it knows to share a bucket.
ZOPLATFORM_EXPORT std::uint64_t TextHashSeed();

inline std::uint64_t MultiplyAndFold(std::uint64_t inLeft, std::uint64_t inRight) noexcept {
    __extension__ using Wide = unsigned __int128;
    const Wide product = static_cast<Wide>(inLeft) * inRight;
    return static_cast<std::uint64_t>(product) ^ static_cast<std::uint64_t>(product >> 64);
}

inline std::uint64_t ReadWord(const char* inBytes) noexcept {
    std::uint64_t word;
    std::memcpy(&word, inBytes, sizeof(word));
    return word;
}

/// inSeed is TextHashSeed(), which who hashes often keeps.
inline std::uint64_t HashText(std::string_view inText, std::uint64_t inSeed) noexcept {
    constexpr std::uint64_t kFactor = 0x9FB21C651E98DF25ull;
    constexpr std::size_t kWord = sizeof(std::uint64_t);
    std::uint64_t hash = inSeed ^ (inText.size() * 0x9E3779B97F4A7C15ull);
    const char* bytes = inText.data();
    std::size_t left = inText.size();
    for (; left > 2 * kWord; left -= 2 * kWord, bytes += 2 * kWord) {
        hash = MultiplyAndFold(hash ^ ReadWord(bytes), inSeed ^ ReadWord(bytes + kWord) ^ kFactor);
    }
    // Up to 16 bytes as two words; shorter texts are told apart by their size, which is hashed as well.
    std::uint64_t first = 0;
    std::uint64_t second = 0;
    if (left >= kWord) {
        first = ReadWord(bytes);
        second = ReadWord(bytes + left - kWord);
    } else {
        for (std::size_t at = 0; at < left; ++at) {
            first = (first << 8) | static_cast<unsigned char>(bytes[at]);
        }
    }
    hash = MultiplyAndFold(hash ^ first, inSeed ^ second ^ kFactor);
    return MultiplyAndFold(hash ^ inSeed, kFactor);
}

}  // namespace utility
}  // namespace ostcore
