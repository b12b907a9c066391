// Conversion between UTF-8 and UTF-16 that survives any bytes.
#include "ostcore/utility/StringConversion.h"

#include <iterator>

#include <utf8/unchecked.h>

namespace ostcore {
namespace utility {
namespace {

constexpr char32_t kReplacement = 0xFFFD;

struct Decoded {
    char32_t codePoint;
    std::size_t size;
    bool isValid;
};

bool IsBetween(unsigned char inByte, unsigned char inLow, unsigned char inHigh) noexcept {
    return inByte >= inLow && inByte <= inHigh;
}

/// What may follow a lead byte (Unicode, table 3-7): how many bytes, and the range of the first of them.
struct LeadByte {
    int trailing;
    unsigned char low;
    unsigned char high;
};

LeadByte ClassifyLead(unsigned char inByte) noexcept {
    if (IsBetween(inByte, 0xC2, 0xDF)) {
        return {1, 0x80, 0xBF};
    }
    if (IsBetween(inByte, 0xE0, 0xEF)) {
        return {2, static_cast<unsigned char>(inByte == 0xE0 ? 0xA0 : 0x80),
                static_cast<unsigned char>(inByte == 0xED ? 0x9F : 0xBF)};
    }
    if (IsBetween(inByte, 0xF0, 0xF4)) {
        return {3, static_cast<unsigned char>(inByte == 0xF0 ? 0x90 : 0x80),
                static_cast<unsigned char>(inByte == 0xF4 ? 0x8F : 0xBF)};
    }
    return {0, 0, 0};
}

// Reads one character, or the maximal subpart of an ill-formed sequence. The text is not empty.
Decoded DecodeOne(std::string_view inText) noexcept {
    const auto byteAt = [&](std::size_t inIndex) { return static_cast<unsigned char>(inText[inIndex]); };
    const unsigned char lead = byteAt(0);
    if (lead < 0x80) {
        return {lead, 1, true};
    }
    const LeadByte kind = ClassifyLead(lead);
    if (kind.trailing == 0) {
        return {kReplacement, 1, false};
    }
    char32_t codePoint = lead & (0x3Fu >> kind.trailing);
    std::size_t size = 1;
    for (int i = 0; i < kind.trailing; ++i, ++size) {
        const unsigned char low = i == 0 ? kind.low : 0x80;
        const unsigned char high = i == 0 ? kind.high : 0xBF;
        if (size >= inText.size() || !IsBetween(byteAt(size), low, high)) {
            return {kReplacement, size, false};
        }
        codePoint = (codePoint << 6) | (byteAt(size) & 0x3Fu);
    }
    return {codePoint, size, true};
}

std::size_t LengthOfASCII(std::string_view inText) noexcept {
    std::size_t length = 0;
    while (length < inText.size() && static_cast<unsigned char>(inText[length]) < 0x80) {
        ++length;
    }
    return length;
}

char LowerASCII(char inCharacter) noexcept {
    return inCharacter >= 'A' && inCharacter <= 'Z' ? static_cast<char>(inCharacter + ('a' - 'A'))
                                                    : inCharacter;
}

bool IsHighSurrogate(char16_t inUnit) noexcept {
    return inUnit >= 0xD800 && inUnit <= 0xDBFF;
}
bool IsLowSurrogate(char16_t inUnit) noexcept {
    return inUnit >= 0xDC00 && inUnit <= 0xDFFF;
}

}  // namespace

U8String ToUTF8(std::u16string_view inText) {
    U8String result;
    result.reserve(inText.size());
    for (std::size_t i = 0; i < inText.size(); ++i) {
        const char16_t unit = inText[i];
        char32_t codePoint = unit;
        if (IsHighSurrogate(unit) && i + 1 < inText.size() && IsLowSurrogate(inText[i + 1])) {
            codePoint = 0x10000 + ((char32_t(unit) - 0xD800) << 10) + (char32_t(inText[++i]) - 0xDC00);
        } else if (IsHighSurrogate(unit) || IsLowSurrogate(unit)) {
            codePoint = kReplacement;
        }
        utf8::unchecked::append(codePoint, std::back_inserter(result));
    }
    return result;
}

UString ToUTF16(std::string_view inText) {
    UString result;
    result.reserve(inText.size());
    while (!inText.empty()) {
        const std::size_t plain = LengthOfASCII(inText);
        result.append(inText.begin(), inText.begin() + static_cast<std::ptrdiff_t>(plain));
        inText.remove_prefix(plain);
        if (inText.empty()) {
            break;
        }
        const Decoded decoded = DecodeOne(inText);
        inText.remove_prefix(decoded.size);
        if (decoded.codePoint < 0x10000) {
            result.push_back(static_cast<char16_t>(decoded.codePoint));
        } else {
            const char32_t offset = decoded.codePoint - 0x10000;
            result.push_back(static_cast<char16_t>(0xD800 + (offset >> 10)));
            result.push_back(static_cast<char16_t>(0xDC00 + (offset & 0x3FF)));
        }
    }
    return result;
}

bool IsValidUTF8(std::string_view inText) noexcept {
    while (!inText.empty()) {
        inText.remove_prefix(LengthOfASCII(inText));
        if (inText.empty()) {
            break;
        }
        const Decoded decoded = DecodeOne(inText);
        if (!decoded.isValid) {
            return false;
        }
        inText.remove_prefix(decoded.size);
    }
    return true;
}

U8String ReplaceInvalidUTF8(std::string_view inText) {
    U8String result;
    result.reserve(inText.size());
    while (!inText.empty()) {
        const Decoded decoded = DecodeOne(inText);
        if (decoded.isValid) {
            result.append(inText.substr(0, decoded.size));
        } else {
            result.append("\xEF\xBF\xBD");
        }
        inText.remove_prefix(decoded.size);
    }
    return result;
}

std::string FoldCaseASCII(std::string_view inText) {
    std::string result(inText);
    std::transform(result.begin(), result.end(), result.begin(), LowerASCII);
    return result;
}

bool EqualsIgnoreCaseASCII(std::string_view inLeft, std::string_view inRight) noexcept {
    return inLeft.size() == inRight.size() &&
           std::equal(inLeft.begin(), inLeft.end(), inRight.begin(),
                      [](char inA, char inB) { return LowerASCII(inA) == LowerASCII(inB); });
}

}  // namespace utility
}  // namespace ostcore
