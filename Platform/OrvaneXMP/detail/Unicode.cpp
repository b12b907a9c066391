// Finds and converts UTF-16 and UTF-32.
#include "OrvaneXMP/detail/Unicode.h"

#include <array>
#include <cstdint>

#include "OrvaneXMP/Tree.h"

namespace OrvaneXMP {

namespace {

constexpr std::uint32_t kNothing = 0xFFFFFFFFu;

/// Reads one code point after the other.
class CodePoints {
public:
    CodePoints(std::string_view inBytes, TextForm inForm) : mBytes(inBytes) {
        mIsLittle = inForm == TextForm::UTF16Little || inForm == TextForm::UTF32Little;
        mUnit = inForm == TextForm::UTF16Little || inForm == TextForm::UTF16Big ? 2 : 4;
    }

    bool AreAllRead() const noexcept { return mAt == mBytes.size(); }
    /// kNothing for what is no character.
    std::uint32_t Next() noexcept {
        const std::uint32_t first = NextUnit();
        if (mUnit == 4) {
            return first > 0x10FFFF || IsSurrogate(first) ? kNothing : first;
        }
        if (!IsSurrogate(first)) {
            return first;
        }
        const std::uint32_t second = first < 0xDC00 ? NextUnit() : kNothing;
        const bool isPair = second >= 0xDC00 && second <= 0xDFFF;
        return isPair ? 0x10000 + ((first - 0xD800) << 10) + (second - 0xDC00) : kNothing;
    }

private:
    static bool IsSurrogate(std::uint32_t inUnit) noexcept { return inUnit >= 0xD800 && inUnit <= 0xDFFF; }
    std::uint32_t NextUnit() noexcept {
        if (mBytes.size() - mAt < mUnit) {
            mAt = mBytes.size();
            return kNothing;
        }
        std::uint32_t unit = 0;
        for (std::size_t byte = 0; byte < mUnit; ++byte) {
            const std::size_t place = mIsLittle ? mUnit - 1 - byte : byte;
            unit = unit << 8 | static_cast<unsigned char>(mBytes[mAt + place]);
        }
        mAt += mUnit;
        return unit;
    }

    std::string_view mBytes;
    std::size_t mAt = 0;
    std::size_t mUnit = 2;
    bool mIsLittle = true;
};

void Append(std::string& ioText, std::uint32_t inCodePoint) {
    const auto further = [&](unsigned inShift) {
        ioText += static_cast<char>(0x80 | (inCodePoint >> inShift & 0x3F));
    };
    if (inCodePoint < 0x80) {
        ioText += static_cast<char>(inCodePoint);
    } else if (inCodePoint < 0x800) {
        ioText += static_cast<char>(0xC0 | inCodePoint >> 6);
        further(0);
    } else if (inCodePoint < 0x10000) {
        ioText += static_cast<char>(0xE0 | inCodePoint >> 12);
        further(6);
        further(0);
    } else {
        ioText += static_cast<char>(0xF0 | inCodePoint >> 18);
        further(12);
        further(6);
        further(0);
    }
}

}  // namespace

TextForm FindTextForm(std::string_view inBytes) noexcept {
    std::array<unsigned char, 4> head{1, 1, 1, 1};
    for (std::size_t at = 0; at < head.size() && at < inBytes.size(); ++at) {
        head[at] = static_cast<unsigned char>(inBytes[at]);
    }
    const bool isLittleMark = head[0] == 0xFF && head[1] == 0xFE;
    const bool isBigMark = head[0] == 0xFE && head[1] == 0xFF;
    const bool endsInZeros = head[2] == 0 && head[3] == 0;
    const bool beginsWithZeros = head[0] == 0 && head[1] == 0;
    if (beginsWithZeros) {
        return TextForm::UTF32Big;
    }
    if (isLittleMark || head[1] == 0) {
        return endsInZeros ? TextForm::UTF32Little : TextForm::UTF16Little;
    }
    return isBigMark || head[0] == 0 ? TextForm::UTF16Big : TextForm::EightBit;
}

bool ConvertToUTF8(std::string_view inBytes, TextForm inForm, std::string& outText) {
    CodePoints points(inBytes, inForm);
    while (!points.AreAllRead()) {
        const std::uint32_t point = points.Next();
        if (point == kNothing || outText.size() > kMaximumPacketSize) {
            return false;
        }
        Append(outText, point);
    }
    return true;
}

}  // namespace OrvaneXMP
