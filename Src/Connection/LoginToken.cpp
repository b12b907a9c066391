// Finding the login token.
#include "Connection/LoginToken.h"

#include "ostnet/HeaderConstants.h"

namespace ZOCL {

namespace {

constexpr std::string_view kTokenName = "login-token=";

bool HasControlCharacter(std::string_view inText) {
    return std::any_of(inText.begin(), inText.end(), [](char inCharacter) {
        const auto byte = static_cast<unsigned char>(inCharacter);
        return byte < 0x20 || byte == 0x7F;
    });
}

}  // namespace

ImmutableString ExtractLoginToken(std::string_view inSetCookieValue) {
    if (inSetCookieValue.size() > kMaximumSetCookieSize || HasControlCharacter(inSetCookieValue)) {
        return ImmutableString();
    }
    const std::size_t start = inSetCookieValue.find(kTokenName);
    if (start == std::string_view::npos) {
        return ImmutableString();
    }
    const std::size_t semicolon = inSetCookieValue.find(';', start);
    const std::size_t valueEnd = semicolon == std::string_view::npos ? inSetCookieValue.size() : semicolon;
    if (valueEnd == start + kTokenName.size()) {
        return ImmutableString();
    }
    const std::size_t end = semicolon == std::string_view::npos ? valueEnd : semicolon + 1;
    return ImmutableString(inSetCookieValue.substr(start, end - start));
}

ImmutableString FindLoginToken(const shared_ptr<ostnet::Response>& inResponse) {
    if (!inResponse) {
        return ImmutableString();
    }
    const auto range = inResponse->headers.equal_range(ostnet::kHEADER_SET_COOKIE);
    for (auto header = range.first; header != range.second; ++header) {
        const ImmutableString token = ExtractLoginToken(header->second.view());
        if (!token.IsNull()) {
            return token;
        }
    }
    return ImmutableString();
}

}  // namespace ZOCL
