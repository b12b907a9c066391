#include "ostnet/http/detail/HeaderRules.h"

#include <charconv>

#include "ostcore/utility/StringConversion.h"

namespace ostnet {
namespace http {

using ostcore::utility::EqualsIgnoreCaseASCII;

namespace {

constexpr std::size_t kUsualFields = 12;

bool IsTokenCharacter(char inCharacter) noexcept {
    const char lower = static_cast<char>(inCharacter | 0x20);
    if ((lower >= 'a' && lower <= 'z') || (inCharacter >= '0' && inCharacter <= '9')) {
        return true;
    }
    return inCharacter != '\0' &&
           std::string_view("!#$%&'*+-.^_`|~").find(inCharacter) != std::string_view::npos;
}

void AddField(std::string_view inName, const std::string& inValue, Headers& ioHeaders) {
    if (!inName.empty() && IsSafeHeaderValue(inValue)) {
        ioHeaders.emplace(ImmutableString(inName), ImmutableString(inValue));
    }
}

}  // namespace

bool IsToken(std::string_view inText) noexcept {
    return !inText.empty() && std::all_of(inText.begin(), inText.end(), IsTokenCharacter);
}

bool IsSafeHeaderValue(std::string_view inText) noexcept {
    return std::all_of(inText.begin(), inText.end(), [](char inCharacter) {
        const auto byte = static_cast<unsigned char>(inCharacter);
        return byte == '\t' || (byte >= 0x20 && byte != 0x7F);
    });
}

std::string_view TrimBlanks(std::string_view inText) noexcept {
    constexpr std::string_view kBlanks = " \t\r\n";
    const auto first = inText.find_first_not_of(kBlanks);
    if (first == std::string_view::npos) {
        return {};
    }
    return inText.substr(first, inText.find_last_not_of(kBlanks) - first + 1);
}

std::optional<std::uint64_t> ParseContentLength(std::string_view inText) noexcept {
    std::uint64_t value = 0;
    const auto [end, error] = std::from_chars(inText.data(), inText.data() + inText.size(), value);
    if (inText.empty() || error != std::errc() || end != inText.data() + inText.size()) {
        return std::nullopt;
    }
    return value;
}

Headers ParseHead(std::string_view inHead) {
    Headers headers;
    headers.reserve(kUsualFields);
    std::string_view name;
    std::string value;
    while (!inHead.empty()) {
        const auto end = inHead.find('\n');
        const std::string_view line = inHead.substr(0, end);
        inHead.remove_prefix(end == std::string_view::npos ? inHead.size() : end + 1);
        if (!line.empty() && (line.front() == ' ' || line.front() == '\t')) {
            if (const std::string_view more = TrimBlanks(line); !more.empty()) {
                value.append(" ").append(more);
            }
            continue;
        }
        AddField(name, value, headers);
        name = {};
        const auto colon = line.find(':');
        if (colon != std::string_view::npos && IsToken(line.substr(0, colon))) {
            name = line.substr(0, colon);
            value = TrimBlanks(line.substr(colon + 1));
        }
    }
    AddField(name, value, headers);
    return headers;
}

bool AreSendable(const Headers& inHeaders, std::size_t inMaximumSize) noexcept {
    std::size_t size = 0;
    for (const auto& [name, value] : inHeaders) {
        size += name.size() + value.size() + 4;
        if (size > inMaximumSize || !IsToken(name) || !IsSafeHeaderValue(value)) {
            return false;
        }
    }
    return true;
}

bool IsSecretHeader(std::string_view inName) noexcept {
    for (const std::string_view secret :
         {"Cookie", "Set-Cookie", "Authorization", "Proxy-Authorization", "WWW-Authenticate"}) {
        if (EqualsIgnoreCaseASCII(inName, secret)) {
            return true;
        }
    }
    return false;
}

}  // namespace http
}  // namespace ostnet
