// Sort keys; the case folding of Unicode is utf8proc's.
#include "ostui/detail/SortKey.h"

#include <utf8proc.h>

#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <memory>

#include "ostcore/utility/StringConversion.h"

namespace ostui {
namespace detail {
namespace {

bool IsDigit(char inCharacter) noexcept {
    return inCharacter >= '0' && inCharacter <= '9';
}

bool IsASCII(std::string_view inText) noexcept {
    return std::all_of(inText.begin(), inText.end(),
                       [](char inCharacter) { return static_cast<unsigned char>(inCharacter) < 0x80; });
}

std::string Fold(std::string_view inText) {
    const std::string valid = ostcore::utility::ReplaceInvalidUTF8(inText);
    utf8proc_uint8_t* bytes = nullptr;
    const utf8proc_ssize_t size = utf8proc_map(
        reinterpret_cast<const utf8proc_uint8_t*>(valid.data()), static_cast<utf8proc_ssize_t>(valid.size()),
        &bytes, static_cast<utf8proc_option_t>(UTF8PROC_STABLE | UTF8PROC_COMPOSE | UTF8PROC_CASEFOLD));
    const std::unique_ptr<utf8proc_uint8_t, decltype(&std::free)> owner(bytes, &std::free);
    return size < 0 ? valid
                    : std::string(reinterpret_cast<const char*>(bytes), static_cast<std::size_t>(size));
}

/// A digit, which no other part of a key begins with, then how many digits follow, then these.
void AppendNumber(std::string_view inDigits, std::string& ioKeys) {
    inDigits.remove_prefix(std::min(inDigits.find_first_not_of('0'), inDigits.size()));
    const auto count = static_cast<std::uint32_t>(inDigits.size());
    ioKeys += '0';
    for (int shift = 24; shift >= 0; shift -= 8) {
        ioKeys += static_cast<char>(count >> shift);
    }
    ioKeys += inDigits;
}

}  // namespace

void AppendSortKey(std::string_view inText, std::string& ioKeys) {
    const bool isASCII = IsASCII(inText);
    const std::string folded = isASCII ? std::string() : Fold(inText);
    const std::string_view text = isASCII ? inText : std::string_view(folded);
    for (std::size_t at = 0; at < text.size();) {
        if (IsDigit(text[at])) {
            const auto end =
                std::find_if_not(text.begin() + static_cast<std::ptrdiff_t>(at), text.end(), IsDigit);
            const auto stop = static_cast<std::size_t>(end - text.begin());
            AppendNumber(text.substr(at, stop - at), ioKeys);
            at = stop;
        } else {
            const char character = text[at++];
            const bool isUpper = character >= 'A' && character <= 'Z';
            ioKeys += isUpper ? static_cast<char>(character + ('a' - 'A')) : character;
        }
    }
}

}  // namespace detail
}  // namespace ostui
