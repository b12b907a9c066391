// Finds the secrets of a text by the names that stand before them.
#include <array>

#include "ostcore/debug/Trace.h"
#include "ostcore/utility/StringConversion.h"

namespace ostcore {
namespace debug {
namespace {

constexpr std::string_view kMark = "[hidden]";
constexpr std::string_view kBlanks = " \t";

/// How far the value behind a name goes.
enum class Extent {
    Word,   // one token: up to a blank, a separator of cookies or forms, or a quote
    Field,  // a form field or a multi-part section: it may hold blanks
    Line    // the rest of the line with its folded continuation: a header value
};

struct Secret {
    std::string_view name;  // lower case
    Extent extent;
};

constexpr std::array<Secret, 6> kSecrets{{
    {"login-token", Extent::Word},
    {"lastauthenticationtoken", Extent::Word},
    {"j_password", Extent::Field},
    {"authorization", Extent::Line},  // Proxy-Authorization as well
    {"set-cookie", Extent::Line},
    {"cookie", Extent::Line},
}};

std::size_t SkipAny(std::string_view inText, std::size_t inPosition, std::string_view inSet) {
    return std::min(inText.find_first_not_of(inSet, inPosition), inText.size());
}

std::size_t FindAny(std::string_view inText, std::size_t inPosition, std::string_view inSet) {
    return std::min(inText.find_first_of(inSet, inPosition), inText.size());
}

// The end of a quoted value whose opening quote stands before the position.
std::size_t EndOfQuoted(std::string_view inText, std::size_t inPosition, char inQuote) {
    while (inPosition < inText.size() && inText[inPosition] != inQuote) {
        inPosition += inText[inPosition] == '\\' ? 2 : 1;
    }
    return std::min(inPosition, inText.size());
}

// A line ends at its end unless the next one begins with a blank, which continues it (RFC 9112, section 5.2).
std::size_t EndOfHeader(std::string_view inText, std::size_t inPosition) {
    for (;;) {
        const std::size_t end = FindAny(inText, inPosition, "\r\n");
        std::size_t next = end;
        if (next < inText.size() && inText[next] == '\r') {
            ++next;
        }
        if (next < inText.size() && inText[next] == '\n') {
            ++next;
        }
        if (next == end || next >= inText.size() || kBlanks.find(inText[next]) == std::string_view::npos) {
            return end;
        }
        inPosition = next;
    }
}

struct Span {
    std::size_t begin;
    std::size_t end;
};

// The section behind the name of a multi-part field: from the empty line to the next boundary.
optional<Span> SectionBehind(std::string_view inText, std::size_t inPosition) {
    const std::size_t withCR = inText.find("\r\n\r\n", inPosition);
    const std::size_t plain = inText.find("\n\n", inPosition);
    if (withCR == std::string_view::npos && plain == std::string_view::npos) {
        return {};
    }
    const std::size_t begin = withCR < plain ? withCR + 4 : plain + 2;
    return Span{begin, std::min(inText.find("\n--", begin), inText.size())};
}

// Where the value is, given the end of the name; none when the name is only mentioned.
optional<Span> FindValue(std::string_view inText, std::size_t inNameEnd, Extent inExtent) {
    std::size_t position = SkipAny(inText, inNameEnd, "\\\"'");
    const bool isNameQuoted = position != inNameEnd;
    position = SkipAny(inText, position, kBlanks);
    if (position >= inText.size()) {
        return {};
    }
    if (inText[position] != '=' && inText[position] != ':') {
        return isNameQuoted && inExtent == Extent::Field ? SectionBehind(inText, position) : optional<Span>();
    }
    position = SkipAny(inText, position + 1, kBlanks);
    if (inExtent == Extent::Line) {
        return Span{position, EndOfHeader(inText, position)};
    }
    if (position < inText.size() && (inText[position] == '"' || inText[position] == '\'')) {
        return Span{position + 1, EndOfQuoted(inText, position + 1, inText[position])};
    }
    return Span{position, FindAny(inText, position, inExtent == Extent::Word ? " \t\r\n;,&\"'<>)" : "&\r\n")};
}

const Secret* SecretAt(std::string_view inFolded, std::size_t inPosition) {
    for (const Secret& secret : kSecrets) {
        if (inFolded.compare(inPosition, secret.name.size(), secret.name) == 0) {
            return &secret;
        }
    }
    return nullptr;
}

}  // namespace

std::string RedactSecrets(std::string_view inText) {
    const std::string folded = utility::FoldCaseASCII(inText);
    std::string result;
    result.reserve(inText.size());
    std::size_t copied = 0;
    // Every name begins with one of these letters.
    for (std::size_t at = 0; (at = FindAny(folded, at, "acjls")) < folded.size();) {
        const Secret* const secret = SecretAt(folded, at);
        if (!secret) {
            ++at;
            continue;
        }
        at += secret->name.size();
        const optional<Span> value = FindValue(inText, at, secret->extent);
        if (value && value->end > value->begin) {
            result.append(inText.substr(copied, value->begin - copied)).append(kMark);
            copied = at = value->end;
        }
    }
    return result.append(inText.substr(copied));
}

}  // namespace debug
}  // namespace ostcore
