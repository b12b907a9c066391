#include "ostnet/Response.h"

#include <curl/curl.h>

#include <algorithm>

#include "ostcore/utility/StringConversion.h"
#include "ostnet/http/detail/HeaderRules.h"

namespace ostnet {
namespace {

constexpr std::size_t kShortenedPayloadSize = 512;

int LowerASCII(unsigned char inByte) noexcept {
    return inByte >= 'A' && inByte <= 'Z' ? inByte + 32 : inByte;
}

/// The first bytes of a text, cut before a character rather than within it.
std::string_view CutAtCharacter(std::string_view inText, std::size_t inSize) noexcept {
    if (inText.size() <= inSize) {
        return inText;
    }
    std::size_t end = inSize;
    while (end > inSize - 4 && (static_cast<unsigned char>(inText[end]) & 0xC0) == 0x80) {
        --end;
    }
    return inText.substr(0, end);
}

}  // namespace

bool HeaderNameLess::operator()(const ImmutableString& inLeft,
                                const ImmutableString& inRight) const noexcept {
    if (inLeft == inRight) {
        return false;
    }
    const std::string_view left = inLeft.view(), right = inRight.view();
    const std::size_t common = std::min(left.size(), right.size());
    for (std::size_t i = 0; i < common; ++i) {
        const int difference = LowerASCII(static_cast<unsigned char>(left[i])) -
                               LowerASCII(static_cast<unsigned char>(right[i]));
        if (difference != 0) {
            return difference < 0;
        }
    }
    return left.size() < right.size();
}

Headers CopyWithRoom(const Headers& inHeaders, std::size_t inAdded) {
    Headers::sequence_type fields;
    fields.reserve(inHeaders.size() + inAdded);
    fields.assign(inHeaders.begin(), inHeaders.end());
    Headers copy;
    copy.adopt_sequence(boost::container::ordered_range, std::move(fields));
    return copy;
}

ImmutableString GetHeader(const Headers& inHeaders, const ImmutableString& inName) {
    const auto found = inHeaders.lower_bound(inName);
    if (found == inHeaders.end() || inHeaders.key_comp()(inName, found->first)) {
        return {};
    }
    return found->second;
}

bool Response::IsNetworkConnectivityError(const shared_ptr<Response>& inResponse) {
    if (!inResponse || inResponse->status != kStatusNoResponse) {
        return false;
    }
    switch (inResponse->curlError) {
        case CURLE_COULDNT_RESOLVE_PROXY:
        case CURLE_COULDNT_RESOLVE_HOST:
        case CURLE_COULDNT_CONNECT:
        case CURLE_HTTP2:
        case CURLE_PARTIAL_FILE:
        case CURLE_OPERATION_TIMEDOUT:
        case CURLE_SSL_CONNECT_ERROR:
        case CURLE_GOT_NOTHING:
        case CURLE_SEND_ERROR:
        case CURLE_RECV_ERROR:
        case CURLE_SEND_FAIL_REWIND:
        case CURLE_HTTP2_STREAM:
        case CURLE_PROXY:
            return true;
        default:
            return false;
    }
}

bool Response::IsBadSSLCACert(const shared_ptr<Response>& inResponse) {
    if (!inResponse || inResponse->status != kStatusNoResponse) {
        return false;
    }
    switch (inResponse->curlError) {
        case CURLE_PEER_FAILED_VERIFICATION:
        case CURLE_SSL_CACERT_BADFILE:
        case CURLE_SSL_ISSUER_ERROR:
        case CURLE_SSL_INVALIDCERTSTATUS:
        case CURLE_SSL_PINNEDPUBKEYNOTMATCH:
            return true;
        default:
            return false;
    }
}

std::string Response::GetPayloadAsUTF8String() const {
    return payload ? std::string(payload->view()) : std::string();
}

std::string Response::GetShortenedPayloadAsUTF8String() const {
    if (!payload) {
        return {};
    }
    const std::string_view whole = payload->view();
    std::string text = ostcore::utility::ReplaceInvalidUTF8(CutAtCharacter(whole, kShortenedPayloadSize));
    std::replace(text.begin(), text.end(), '\0', ' ');
    return whole.size() > kShortenedPayloadSize ? text + "..." : text;
}

std::string Response::GetHeadersAsUTF8String() const {
    std::string text;
    for (const auto& [name, value] : headers) {
        text.append(name.view()).append(": ");
        text.append(http::IsSecretHeader(name) ? std::string_view("<hidden>") : value.view()).append("\n");
    }
    return text;
}

}  // namespace ostnet
