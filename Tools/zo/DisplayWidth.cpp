// Display width by the wide ranges of Unicode's EastAsianWidth and the usual zero-width ranges.
#include "DisplayWidth.h"

#include <algorithm>
#include <cstdint>
#include <iterator>

#include "ostcore/utility/StringConversion.h"

namespace zo {
namespace {

struct Range {
    std::uint32_t first;
    std::uint32_t last;
};

// Sorted. Combining marks, joiners, variation selectors, Hangul vowels and finals.
constexpr Range kZeroWidth[] = {
    {0x0300, 0x036F}, {0x0483, 0x0489}, {0x0591, 0x05BD}, {0x05BF, 0x05BF},   {0x05C1, 0x05C2},
    {0x05C4, 0x05C5}, {0x05C7, 0x05C7}, {0x0610, 0x061A}, {0x064B, 0x065F},   {0x0670, 0x0670},
    {0x06D6, 0x06DC}, {0x06DF, 0x06E4}, {0x06E7, 0x06E8}, {0x06EA, 0x06ED},   {0x0900, 0x0902},
    {0x093A, 0x093A}, {0x093C, 0x093C}, {0x0941, 0x0948}, {0x094D, 0x094D},   {0x0E31, 0x0E31},
    {0x0E34, 0x0E3A}, {0x0E47, 0x0E4E}, {0x1160, 0x11FF}, {0x1AB0, 0x1AFF},   {0x1DC0, 0x1DFF},
    {0x200B, 0x200D}, {0x2060, 0x2064}, {0x20D0, 0x20F0}, {0x302A, 0x302D},   {0x3099, 0x309A},
    {0xFE00, 0xFE0F}, {0xFE20, 0xFE2F}, {0xFEFF, 0xFEFF}, {0x1F3FB, 0x1F3FF}, {0xE0100, 0xE01EF},
};

// Sorted. East Asian wide and fullwidth characters, and emoji that are wide by default.
constexpr Range kWide[] = {
    {0x1100, 0x115F},   {0x231A, 0x231B},   {0x2329, 0x232A},   {0x23E9, 0x23EC},   {0x23F0, 0x23F0},
    {0x23F3, 0x23F3},   {0x25FD, 0x25FE},   {0x2614, 0x2615},   {0x2648, 0x2653},   {0x267F, 0x267F},
    {0x2693, 0x2693},   {0x26A1, 0x26A1},   {0x26AA, 0x26AB},   {0x26BD, 0x26BE},   {0x26C4, 0x26C5},
    {0x26CE, 0x26CE},   {0x26D4, 0x26D4},   {0x26EA, 0x26EA},   {0x26F2, 0x26F3},   {0x26F5, 0x26F5},
    {0x26FA, 0x26FA},   {0x26FD, 0x26FD},   {0x2705, 0x2705},   {0x270A, 0x270B},   {0x2728, 0x2728},
    {0x274C, 0x274C},   {0x274E, 0x274E},   {0x2753, 0x2755},   {0x2757, 0x2757},   {0x2795, 0x2797},
    {0x27B0, 0x27B0},   {0x27BF, 0x27BF},   {0x2B1B, 0x2B1C},   {0x2B50, 0x2B50},   {0x2B55, 0x2B55},
    {0x2E80, 0x303E},   {0x3041, 0x33FF},   {0x3400, 0x4DBF},   {0x4E00, 0xA4C6},   {0xA960, 0xA97C},
    {0xAC00, 0xD7A3},   {0xF900, 0xFAFF},   {0xFE10, 0xFE19},   {0xFE30, 0xFE6B},   {0xFF01, 0xFF60},
    {0xFFE0, 0xFFE6},   {0x16FE0, 0x18CFF}, {0x1AFF0, 0x1B2FB}, {0x1F004, 0x1F004}, {0x1F0CF, 0x1F0CF},
    {0x1F18E, 0x1F18E}, {0x1F191, 0x1F19A}, {0x1F200, 0x1F265}, {0x1F300, 0x1F320}, {0x1F32D, 0x1F335},
    {0x1F337, 0x1F37C}, {0x1F37E, 0x1F393}, {0x1F3A0, 0x1F3CA}, {0x1F3CF, 0x1F3D3}, {0x1F3E0, 0x1F3F0},
    {0x1F3F4, 0x1F3F4}, {0x1F3F8, 0x1F43E}, {0x1F440, 0x1F440}, {0x1F442, 0x1F4FC}, {0x1F4FF, 0x1F53D},
    {0x1F54B, 0x1F54E}, {0x1F550, 0x1F567}, {0x1F57A, 0x1F57A}, {0x1F595, 0x1F596}, {0x1F5A4, 0x1F5A4},
    {0x1F5FB, 0x1F64F}, {0x1F680, 0x1F6C5}, {0x1F6CC, 0x1F6CC}, {0x1F6D0, 0x1F6D2}, {0x1F6D5, 0x1F6D7},
    {0x1F6DC, 0x1F6DF}, {0x1F6EB, 0x1F6EC}, {0x1F6F4, 0x1F6FC}, {0x1F7E0, 0x1F7EB}, {0x1F7F0, 0x1F7F0},
    {0x1F90C, 0x1F93A}, {0x1F93C, 0x1F945}, {0x1F947, 0x1F9FF}, {0x1FA70, 0x1FAFF}, {0x20000, 0x2FFFD},
    {0x30000, 0x3FFFD},
};

template <std::size_t N>
bool IsIn(const Range (&inRanges)[N], std::uint32_t inPoint) {
    const auto* found =
        std::upper_bound(std::begin(inRanges), std::end(inRanges), inPoint,
                         [](std::uint32_t inValue, const Range& inRange) { return inValue < inRange.first; });
    return found != std::begin(inRanges) && inPoint <= std::prev(found)->last;
}

std::size_t WidthOf(std::uint32_t inPoint) {
    if (IsIn(kZeroWidth, inPoint)) {
        return 0;
    }
    return IsIn(kWide, inPoint) ? 2 : 1;
}

// Takes one code point off valid UTF-8; a stray byte stands for itself.
std::uint32_t TakePoint(std::string_view& ioText) {
    const auto lead = static_cast<unsigned char>(ioText.front());
    std::size_t length = lead >= 0xF0 ? 4 : lead >= 0xE0 ? 3 : lead >= 0xC0 ? 2 : 1;
    if (length > ioText.size()) {
        length = 1;
    }
    std::uint32_t point = length == 1 ? lead : lead & (0x7Fu >> length);
    for (std::size_t index = 1; index < length; ++index) {
        point = (point << 6) | (static_cast<unsigned char>(ioText[index]) & 0x3Fu);
    }
    ioText.remove_prefix(length);
    return point;
}

bool IsUnsafe(std::uint32_t inPoint) {
    const bool control = inPoint < 0x20 || (inPoint >= 0x7F && inPoint < 0xA0);
    const bool separator = inPoint == 0x2028 || inPoint == 0x2029;
    const bool direction = (inPoint >= 0x202A && inPoint <= 0x202E) ||
                           (inPoint >= 0x2066 && inPoint <= 0x2069) || inPoint == 0x200E ||
                           inPoint == 0x200F || inPoint == 0x061C;
    return control || separator || direction;
}

}  // namespace

std::size_t DisplayWidth(std::string_view inText) {
    std::size_t width = 0;
    while (!inText.empty()) {
        width += WidthOf(TakePoint(inText));
    }
    return width;
}

std::string Truncate(std::string_view inText, std::size_t inColumns) {
    if (DisplayWidth(inText) <= inColumns) {
        return std::string(inText);
    }
    if (inColumns == 0) {
        return {};
    }
    std::size_t width = 0;
    std::string_view rest = inText;
    std::size_t kept = 0;
    while (!rest.empty()) {
        width += WidthOf(TakePoint(rest));
        if (width > inColumns - 1) {
            break;
        }
        kept = inText.size() - rest.size();
    }
    return std::string(inText.substr(0, kept)) + "\u2026";
}

std::string ForTerminal(std::string_view inText) {
    const std::string valid = ostcore::utility::ReplaceInvalidUTF8(inText);
    std::string safe;
    safe.reserve(valid.size());
    std::string_view rest = valid;
    while (!rest.empty()) {
        const std::string_view before = rest;
        if (IsUnsafe(TakePoint(rest))) {
            safe += "\uFFFD";
        } else {
            safe += before.substr(0, before.size() - rest.size());
        }
    }
    return safe;
}

}  // namespace zo
