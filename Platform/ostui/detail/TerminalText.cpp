// Widths by Unicode's tables, which are utf8proc's.
#include "ostui/detail/TerminalText.h"

#include <utf8proc.h>

#include <algorithm>

#include "ostcore/utility/StringConversion.h"

namespace ostui {
namespace detail {

using ostcore::U8String;

namespace {

constexpr const char* kReplacement = "\uFFFD";
constexpr const char* kEllipsis = "\u2026";

/// Takes one character off a text that is not empty; U+FFFD for a byte that is no UTF-8.
utf8proc_int32_t TakeCharacter(std::string_view& ioText) {
    utf8proc_int32_t character = 0xFFFD;
    const utf8proc_ssize_t size = utf8proc_iterate(reinterpret_cast<const utf8proc_uint8_t*>(ioText.data()),
                                                   static_cast<utf8proc_ssize_t>(ioText.size()), &character);
    ioText.remove_prefix(size > 0 ? static_cast<std::size_t>(size) : 1);
    return size > 0 ? character : 0xFFFD;
}

std::size_t WidthOf(utf8proc_int32_t inCharacter) {
    return static_cast<std::size_t>(std::max(0, utf8proc_charwidth(inCharacter)));
}

bool IsUnsafe(utf8proc_int32_t inCharacter) {
    const bool changesDirection = (inCharacter >= 0x202A && inCharacter <= 0x202E) ||
                                  (inCharacter >= 0x2066 && inCharacter <= 0x2069) || inCharacter == 0x200E ||
                                  inCharacter == 0x200F || inCharacter == 0x061C;
    const utf8proc_category_t category = utf8proc_category(inCharacter);
    return changesDirection || category == UTF8PROC_CATEGORY_CC || category == UTF8PROC_CATEGORY_ZL ||
           category == UTF8PROC_CATEGORY_ZP;
}

U8String Clean(std::string_view inText, bool inKeepsLines) {
    const U8String valid = ostcore::utility::ReplaceInvalidUTF8(inText);
    U8String clean;
    clean.reserve(valid.size());
    for (std::string_view rest = valid; !rest.empty();) {
        const std::string_view before = rest;
        const utf8proc_int32_t character = TakeCharacter(rest);
        if (character == '\n' || character == '\t') {
            clean += inKeepsLines ? static_cast<char>(character) : ' ';
        } else if (IsUnsafe(character)) {
            clean += kReplacement;
        } else {
            clean += before.substr(0, before.size() - rest.size());
        }
    }
    return clean;
}

}  // namespace

std::size_t DisplayWidth(std::string_view inText) {
    std::size_t width = 0;
    while (!inText.empty()) {
        width += WidthOf(TakeCharacter(inText));
    }
    return width;
}

U8String Truncate(std::string_view inText, std::size_t inColumns) {
    if (DisplayWidth(inText) <= inColumns) {
        return U8String(inText);
    }
    std::size_t width = 1;
    std::size_t kept = 0;
    for (std::string_view rest = inText; !rest.empty();) {
        width += WidthOf(TakeCharacter(rest));
        if (width > inColumns) {
            break;
        }
        kept = inText.size() - rest.size();
    }
    return inColumns == 0 ? U8String() : U8String(inText.substr(0, kept)) + kEllipsis;
}

U8String PadTo(U8String inText, std::size_t inColumns) {
    const std::size_t width = DisplayWidth(inText);
    inText.append(inColumns - std::min(inColumns, width), ' ');
    return inText;
}

U8String Wrap(std::string_view inText, std::size_t inColumns) {
    U8String text;
    std::size_t width = 0;
    while (!inText.empty()) {
        const std::size_t end = std::min(inText.find_first_of(" \n"), inText.size());
        const std::string_view word = inText.substr(0, end);
        const std::size_t wordWidth = DisplayWidth(word);
        if (inColumns > 0 && width + wordWidth > inColumns && !text.empty() && text.back() == ' ') {
            text.back() = '\n';
            width = 0;
        }
        text += word;
        width += wordWidth;
        if (end < inText.size()) {
            text += inText[end];
            width = inText[end] == '\n' ? 0 : width + 1;
        }
        inText.remove_prefix(std::min(end + 1, inText.size()));
    }
    return text;
}

U8String SafeText(std::string_view inText) {
    return Clean(inText, true);
}

U8String SafeLine(std::string_view inText) {
    return Clean(inText, false);
}

}  // namespace detail
}  // namespace ostui
