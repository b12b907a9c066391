// Small text helpers for what comes from the network and from disk.
#include "Base/Text.h"

#include <algorithm>
#include <cctype>

namespace zohub {

namespace {

bool IsAlnum(char c) {
    return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9');
}

int HexValue(char c) {
    if (c >= '0' && c <= '9')
        return c - '0';
    if (c >= 'a' && c <= 'f')
        return c - 'a' + 10;
    if (c >= 'A' && c <= 'F')
        return c - 'A' + 10;
    return -1;
}

char LowerOf(char c) {
    return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
}

// The length of the UTF-8 sequence that begins here, or 0 when it is not a valid one.
std::size_t SequenceLength(std::string_view inText, std::size_t inAt) {
    auto const byte = [&](std::size_t i) { return static_cast<unsigned char>(inText[i]); };
    unsigned char const first = byte(inAt);
    if (first < 0x80)
        return 1;
    std::size_t const length = first >= 0xC2 && first <= 0xDF   ? 2
                               : first >= 0xE0 && first <= 0xEF ? 3
                               : first >= 0xF0 && first <= 0xF4 ? 4
                                                                : 0;
    if (length == 0 || inAt + length > inText.size())
        return 0;
    for (std::size_t i = 1; i < length; ++i)
        if ((byte(inAt + i) & 0xC0) != 0x80)
            return 0;
    unsigned char const second = byte(inAt + 1);
    bool const overlong = (first == 0xE0 && second < 0xA0) || (first == 0xF0 && second < 0x90);
    bool const outside = (first == 0xED && second > 0x9F) || (first == 0xF4 && second > 0x8F);
    return overlong || outside ? 0 : length;
}

void AppendEscaped(std::string& ioTarget, char inCharacter) {
    static char const kDigits[] = "0123456789abcdef";
    switch (inCharacter) {
        case '"':
            ioTarget += "\\\"";
            return;
        case '\\':
            ioTarget += "\\\\";
            return;
        case '\n':
            ioTarget += "\\n";
            return;
        case '\t':
            ioTarget += "\\t";
            return;
        case '\r':
            ioTarget += "\\r";
            return;
        default:
            ioTarget += "\\u00";
            ioTarget += kDigits[static_cast<unsigned char>(inCharacter) >> 4];
            ioTarget += kDigits[inCharacter & 15];
    }
}

}  // namespace

std::optional<std::string> PercentDecode(std::string_view inText) {
    std::string decoded;
    decoded.reserve(inText.size());
    for (std::size_t i = 0; i < inText.size(); ++i) {
        if (inText[i] != '%') {
            decoded += inText[i];
            continue;
        }
        if (i + 2 >= inText.size())
            return std::nullopt;
        int const high = HexValue(inText[i + 1]);
        int const low = HexValue(inText[i + 2]);
        if (high < 0 || low < 0)
            return std::nullopt;
        decoded += static_cast<char>(high * 16 + low);
        i += 2;
    }
    return decoded;
}

std::string PercentEncode(std::string_view inText, std::string_view inAlsoKept) {
    static char const kDigits[] = "0123456789ABCDEF";
    std::string encoded;
    encoded.reserve(inText.size());
    for (char c : inText) {
        bool const kept = IsAlnum(c) || c == '-' || c == '.' || c == '_' || c == '~' ||
                          inAlsoKept.find(c) != std::string_view::npos;
        if (kept) {
            encoded += c;
            continue;
        }
        auto const byte = static_cast<unsigned char>(c);
        encoded += '%';
        encoded += kDigits[byte >> 4];
        encoded += kDigits[byte & 15];
    }
    return encoded;
}

bool IsValidUtf8(std::string_view inText) {
    for (std::size_t i = 0; i < inText.size();) {
        std::size_t const length = SequenceLength(inText, i);
        if (length == 0)
            return false;
        i += length;
    }
    return true;
}

bool HasControlCharacter(std::string_view inText) {
    return std::any_of(inText.begin(), inText.end(),
                       [](char c) { return static_cast<unsigned char>(c) < 0x20 || c == 0x7F; });
}

bool EqualIgnoringCase(std::string_view inLeft, std::string_view inRight) {
    return std::equal(inLeft.begin(), inLeft.end(), inRight.begin(), inRight.end(),
                      [](char a, char b) { return LowerOf(a) == LowerOf(b); });
}

std::string ToLower(std::string_view inText) {
    std::string lower(inText);
    std::transform(lower.begin(), lower.end(), lower.begin(), LowerOf);
    return lower;
}

std::string_view Trim(std::string_view inText) {
    auto const isBlank = [](char c) { return c == ' ' || c == '\t'; };
    while (!inText.empty() && isBlank(inText.front()))
        inText.remove_prefix(1);
    while (!inText.empty() && isBlank(inText.back()))
        inText.remove_suffix(1);
    return inText;
}

std::vector<std::string_view> Split(std::string_view inText, char inSeparator) {
    std::vector<std::string_view> parts;
    std::size_t from = 0;
    while (true) {
        std::size_t const at = inText.find(inSeparator, from);
        parts.push_back(inText.substr(from, at == std::string_view::npos ? at : at - from));
        if (at == std::string_view::npos)
            return parts;
        from = at + 1;
    }
}

void AppendJsonString(std::string& ioTarget, std::string_view inText) {
    ioTarget += '"';
    std::size_t plainFrom = 0;
    for (std::size_t i = 0; i < inText.size(); ++i) {
        char const c = inText[i];
        if (static_cast<unsigned char>(c) >= 0x20 && c != '"' && c != '\\')
            continue;
        ioTarget.append(inText, plainFrom, i - plainFrom);
        AppendEscaped(ioTarget, c);
        plainFrom = i + 1;
    }
    ioTarget.append(inText, plainFrom, inText.size() - plainFrom);
    ioTarget += '"';
}

std::string JsonString(std::string_view inText) {
    std::string text;
    AppendJsonString(text, inText);
    return text;
}

void AppendMember(std::string& ioTarget, std::string_view inKey, std::string_view inValue) {
    if (ioTarget.back() != '{')
        ioTarget += ',';
    ioTarget += '"';
    ioTarget += inKey;
    ioTarget += "\":";
    AppendJsonString(ioTarget, inValue);
}

bool IsIdentifier(std::string_view inText) {
    bool const charactersOk = std::all_of(inText.begin(), inText.end(), [](char c) {
        return IsAlnum(c) || c == '-' || c == '_' || c == '.' || c == '{' || c == '}';
    });
    bool const onlyDots = inText.find_first_not_of('.') == std::string_view::npos;
    return charactersOk && !onlyDots && inText.size() <= 160;
}

bool IsDisplayName(std::string_view inText) {
    return !inText.empty() && inText.size() <= 255 && IsValidUtf8(inText) && !HasControlCharacter(inText);
}

bool IsEnclosureName(std::string_view inText) {
    if (inText.empty() || inText.size() > 1024 || !IsValidUtf8(inText) || HasControlCharacter(inText))
        return false;
    if (inText.front() == '/' || inText.find('\\') != std::string_view::npos)
        return false;
    auto const segments = Split(inText, '/');
    return std::none_of(segments.begin(), segments.end(),
                        [](std::string_view s) { return s == "." || s == ".."; });
}

bool IsMediaType(std::string_view inText) {
    std::size_t const slash = inText.find('/');
    if (slash == std::string_view::npos || slash == 0 || slash + 1 >= inText.size() || inText.size() > 200)
        return false;
    return std::all_of(inText.begin(), inText.end(), [](char c) { return c >= 0x20 && c < 0x7F; });
}

}  // namespace zohub
