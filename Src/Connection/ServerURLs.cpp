// Text work on the URLs of a server.
#include "Connection/ServerURLs.h"

#include "ostcore/utility/StringConversion.h"
#include "ZOClient/IZOCDataServer.h"
#include "zourl/http/URL.h"

namespace ZOCL {

namespace {

constexpr std::string_view kSchemeEnd = "://";
constexpr std::string_view kHTTP = "http://";
constexpr std::string_view kHTTPS = "https://";
constexpr std::string_view kPlainPort = ":60138";
constexpr std::string_view kSecurePort = ":60137";
constexpr std::string_view kAPIPath = "/content/zo/api";
constexpr std::string_view kDiscoveryPath = "/content/zo/api/discovery.json";

bool StartsWith(std::string_view inText, std::string_view inStart) {
    return inText.substr(0, inStart.size()) == inStart;
}

bool EndsWith(std::string_view inText, std::string_view inEnd) {
    return inText.size() >= inEnd.size() && inText.substr(inText.size() - inEnd.size()) == inEnd;
}

/// Where the authority begins: behind the scheme, or at the start.
std::size_t AuthorityStart(std::string_view inURL) {
    const std::size_t scheme = inURL.find(kSchemeEnd);
    return scheme == std::string_view::npos ? 0 : scheme + kSchemeEnd.size();
}

}  // namespace

std::string_view CutToBaseURL(std::string_view inDiscoveryURL) {
    return inDiscoveryURL.substr(0, inDiscoveryURL.find(kAPIPath));
}

std::string_view WithoutScheme(std::string_view inURL) {
    return inURL.substr(AuthorityStart(inURL));
}

std::string MakeServerText(std::string_view inBaseURL, bool inSecure) {
    std::string_view text = WithoutScheme(inBaseURL);
    const std::string_view port = inSecure ? kSecurePort : kPlainPort;
    if (EndsWith(text, port)) {
        text.remove_suffix(port.size());
    }
    return std::string(text);
}

std::string MoveOntoBase(std::string_view inURL, std::string_view inBaseURL) {
    const std::size_t scheme = inURL.find(kSchemeEnd);
    if (scheme == std::string_view::npos) {
        return std::string(inURL);
    }
    const std::size_t path = inURL.find('/', scheme + kSchemeEnd.size());
    if (path == std::string_view::npos) {
        return std::string(inURL);
    }
    std::string result;
    if (inBaseURL.find(kSchemeEnd) == std::string_view::npos) {
        result = StartsWith(inURL, kHTTPS) ? kHTTPS : kHTTP;
    }
    result += inBaseURL;
    result += inURL.substr(path);
    return result;
}

bool IsOnBase(std::string_view inURL, std::string_view inBaseURL) {
    // What MoveOntoBase moved needs no parsing: the authority ends where the base ends.
    const bool baseIsWhole = inBaseURL.find(kSchemeEnd) != std::string_view::npos;
    if (baseIsWhole && inURL.size() > inBaseURL.size() && StartsWith(inURL, inBaseURL) &&
        inURL[inBaseURL.size()] == '/') {
        return true;
    }
    const auto url = zourl::http::Create(inURL);
    const auto base = zourl::http::Create(inBaseURL);
    return url && base && url->HasSameOrigin(*base);
}

ImmutableString IZOCDataServer::MakeDataServerURL(const ImmutableString& inServer, bool inSecure) {
    std::string url = inServer.str();
    if (url.find(kSchemeEnd) == std::string::npos) {
        url.insert(0, inSecure ? kHTTPS : kHTTP);
    }
    if (url.find(':', AuthorityStart(url)) == std::string::npos) {
        url += inSecure ? kSecurePort : kPlainPort;
    }
    return ImmutableString(url);
}

ImmutableString IZOCDataServer::GetDiscoveryURL(const ImmutableString& inServer) {
    return ImmutableString(inServer.str() + std::string(kDiscoveryPath));
}

bool HasSecureProtocol(const UString& inURL) {
    return StartsWith(ostcore::utility::ToUTF8(inURL), kHTTPS);
}

}  // namespace ZOCL
