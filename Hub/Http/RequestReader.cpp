// From the parsed message to a Request, and from a Response to the head on the wire.
#include "Http/RequestReader.h"

#include "Base/Clock.h"
#include "Base/Error.h"
#include "Base/Gzip.h"
#include "Base/Text.h"

namespace zohub {

namespace http = boost::beast::http;

namespace {

constexpr std::size_t kMaxTarget = 8 * 1024;
constexpr std::size_t kMaxHeaders = 100;

std::string_view ViewOf(boost::beast::string_view inText) {
    return {inText.data(), inText.size()};
}

bool IsValidHost(std::string_view inHost) {
    if (inHost.empty() || inHost.size() > 255)
        return false;
    std::string_view name = inHost;
    std::string_view port;
    if (inHost.front() == '[') {
        std::size_t const end = inHost.find(']');
        if (end == std::string_view::npos)
            return false;
        name = inHost.substr(1, end - 1);
        port = inHost.substr(end + 1);
        if (name.empty() || name.find_first_not_of("0123456789abcdefABCDEF:.") != std::string_view::npos)
            return false;
    } else {
        std::size_t const colon = inHost.find(':');
        name = inHost.substr(0, colon);
        port = colon == std::string_view::npos ? std::string_view() : inHost.substr(colon);
        static constexpr std::string_view kNameCharacters =
            "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789-._";
        if (name.empty() || name.find_first_not_of(kNameCharacters) != std::string_view::npos)
            return false;
    }
    if (port.empty())
        return true;
    return port.size() >= 2 && port.size() <= 6 && port.front() == ':' &&
           port.find_first_not_of("0123456789", 1) == std::string_view::npos;
}

[[noreturn]] void FailBadRequest(std::string const& inMessage) {
    throw Failure(400, "request-malformed", inMessage);
}

void ReadPath(Request& ioRequest, std::string_view inPath) {
    if (inPath.empty() || inPath.front() != '/')
        FailBadRequest("The address must begin with a slash.");
    for (auto part : Split(inPath.substr(1), '/')) {
        auto const segment = PercentDecode(part);
        bool const usable = segment && !segment->empty() && *segment != "." && *segment != ".." &&
                            segment->find('/') == std::string::npos &&
                            segment->find('\\') == std::string::npos && IsValidUtf8(*segment) &&
                            !HasControlCharacter(*segment);
        if (!usable)
            FailBadRequest("The address has an empty, relative or badly coded part.");
        ioRequest.segments.push_back(*segment);
    }
}

void ReadQuery(Request& ioRequest, std::string_view inQuery) {
    for (auto pair : Split(inQuery, '&')) {
        if (pair.empty())
            continue;
        std::size_t const equals = std::min(pair.find('='), pair.size());
        auto name = PercentDecode(pair.substr(0, equals));
        auto value = PercentDecode(pair.substr(std::min(equals + 1, pair.size())));
        if (!name || !value || !IsValidUtf8(*name) || !IsValidUtf8(*value))
            FailBadRequest("The query of the address is badly coded.");
        ioRequest.query[*name] = *value;
    }
}

std::string UnpackBody(std::string inBody, std::string_view inCoding, ServerLimits const& inLimits) {
    inCoding = Trim(inCoding);
    if (inCoding.empty() || EqualIgnoringCase(inCoding, "identity"))
        return inBody;
    if (!EqualIgnoringCase(inCoding, "gzip") && !EqualIgnoringCase(inCoding, "x-gzip") &&
        !EqualIgnoringCase(inCoding, "deflate"))
        throw Failure(415, "coding-unknown", "The body's Content-Encoding is not gzip, deflate or identity.");
    UnpackLimits limits;
    limits.maxSize = inLimits.maxBody;
    return Unpack(inBody, limits);
}

bool HasBodyType(Response const& inResponse) {
    return inResponse.body && !inResponse.contentType.empty();
}

}  // namespace

void CheckHead(RequestHead const& inHead, std::optional<std::uint64_t> inContentLength,
               ServerLimits const& inLimits) {
    if (inHead.version() != 11 && inHead.version() != 10)
        FailBadRequest("Only HTTP/1.1 and HTTP/1.0 are spoken here.");
    std::size_t const lengths = inHead.count(http::field::content_length);
    std::size_t const codings = inHead.count(http::field::transfer_encoding);
    if (lengths > 1 || codings > 1 || (lengths == 1 && codings == 1))
        FailBadRequest("The length of the body is given more than once.");
    if (lengths == 1 &&
        ViewOf(inHead[http::field::content_length]).find_first_not_of("0123456789") != std::string_view::npos)
        FailBadRequest("The length of the body is not one number.");
    if (codings == 1 && !EqualIgnoringCase(Trim(ViewOf(inHead[http::field::transfer_encoding])), "chunked"))
        throw Failure(501, "transfer-coding-unknown", "The only transfer coding taken here is chunked.");
    if (inHead.count(http::field::host) > 1 ||
        (inHead.version() == 11 && inHead.count(http::field::host) == 0))
        FailBadRequest("A request needs exactly one Host header.");
    if (inHead.count(http::field::host) == 1 && !IsValidHost(ViewOf(inHead[http::field::host])))
        FailBadRequest("The Host header is not a host name with an optional port.");
    if (inHead.target().size() > kMaxTarget)
        FailBadRequest("The address is too long.");
    std::size_t count = 0;
    for (auto const& field : inHead) {
        if (HasControlCharacter(ViewOf(field.value())) &&
            ViewOf(field.value()).find_first_of(std::string_view("\r\n\0", 3)) != std::string_view::npos)
            FailBadRequest("A header has a character that is not allowed.");
        if (++count > kMaxHeaders)
            throw Failure(431, "too-many-headers", "The request has more headers than this server accepts.");
    }
    if (inContentLength && *inContentLength > BodyLimitFor(inHead, inLimits))
        throw Failure(
            413, "body-too-large",
            "The body is larger than the " + std::to_string(BodyLimitFor(inHead, inLimits)) +
                " bytes that this server accepts here; sign in first, or send it in smaller parts.");
}

std::uint64_t BodyLimitFor(RequestHead const& inHead, ServerLimits const& inLimits) {
    bool const claimsToken =
        ViewOf(inHead[http::field::cookie]).find("login-token=") != std::string_view::npos;
    return claimsToken ? inLimits.maxBody : inLimits.maxAnonymousBody;
}

Request MakeRequest(http::request<http::string_body>&& inMessage, bool inIsSecure,
                    std::string const& inPeerAddress, ServerLimits const& inLimits) {
    Request request;
    request.method = std::string(ViewOf(inMessage.method_string()));
    request.target = std::string(ViewOf(inMessage.target()));
    request.peerAddress = inPeerAddress;
    request.isSecure = inIsSecure;
    std::string_view const host = ViewOf(inMessage[http::field::host]);
    request.baseUrl =
        (inIsSecure ? "https://" : "http://") + (host.empty() ? "localhost" : std::string(host));
    for (auto const& field : inMessage)
        request.headers.emplace_back(ViewOf(field.name_string()), ViewOf(field.value()));
    std::string_view const target = request.target;
    std::size_t const question = target.find('?');
    ReadPath(request, target.substr(0, question));
    if (question != std::string_view::npos)
        ReadQuery(request, target.substr(question + 1));
    request.body = UnpackBody(std::move(inMessage.body()), request.Header("Content-Encoding"), inLimits);
    return request;
}

std::string WriteResponseHead(Response const& inResponse, std::size_t inLength, bool inIsPacked,
                              bool inKeepAlive) {
    std::string head = "HTTP/1.1 " + std::to_string(inResponse.status) + " ";
    head += ReasonPhrase(inResponse.status);
    auto const add = [&head](std::string_view inName, std::string_view inValue) {
        head += "\r\n";
        head += inName;
        head += ": ";
        for (char c : inValue)
            head += static_cast<unsigned char>(c) < 0x20 || c == 0x7F ? '?' : c;
    };
    add("Date", FormatHttpTime(SystemClock()()));
    add("Server", "zohub/1.0.0");
    if (HasBodyType(inResponse))
        add("Content-Type", inResponse.contentType);
    if (inIsPacked)
        add("Content-Encoding", "gzip");
    if (!inResponse.etag.empty())
        add("ETag", inResponse.etag);
    add("Cache-Control", inResponse.isImmutable ? "private, max-age=31536000, immutable" : "no-cache");
    add("Vary", "Accept-Encoding, Cookie");
    // Payloads are what users put there; a browser must not run them in the hub's name.
    add("X-Content-Type-Options", "nosniff");
    add("Content-Security-Policy", "default-src 'none'; sandbox");
    for (auto const& [name, value] : inResponse.headers)
        add(name, value);
    if (inResponse.status != 204 && inResponse.status != 304)
        add("Content-Length", std::to_string(inLength));
    add("Connection", inKeepAlive ? "keep-alive" : "close");
    head += "\r\n\r\n";
    return head;
}

}  // namespace zohub
