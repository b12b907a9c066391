// A request as the routes see it, and the answer that they give.
#pragma once

#include <map>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace zohub {

inline constexpr char kJsonType[] = "application/json;charset=utf-8";

struct Request {
    std::string method;
    std::string target;                 ///< path and query as they came
    std::vector<std::string> segments;  ///< the decoded path, without empty leading part
    std::map<std::string, std::string> query;
    std::vector<std::pair<std::string, std::string>> headers;
    std::string body;         ///< already unpacked
    std::string baseUrl;      ///< "http://host:port" as the client named this server
    std::string peerAddress;  ///< of the client
    bool isSecure = false;

    /// The first header of that name, without regard to case; empty when there is none.
    std::string_view Header(std::string_view inName) const;
    std::string Cookie(std::string_view inName) const;
    bool IsRead() const { return method == "GET" || method == "HEAD"; }
};

/// A body that may be shared between answers; the packed form is made once when it is first asked for.
class Body {
public:
    explicit Body(std::string inPlain);

    std::string const& Plain() const { return mPlain; }
    std::shared_ptr<std::string const> Packed() const;
    std::size_t Size() const;

private:
    struct Lazy;
    std::string const mPlain;
    std::shared_ptr<Lazy> mLazy;
};

struct Response {
    int status = 200;
    std::string contentType;
    std::vector<std::pair<std::string, std::string>> headers;
    std::shared_ptr<Body const> body;
    std::string etag;          ///< with its quotes; empty for none
    bool isImmutable = false;  ///< content-addressed: may be kept for ever
    bool closeAfter = false;

    void SetBody(std::string inText, std::string inType);
};

Response JsonResponse(int inStatus, std::string inText);
Response ErrorResponse(int inStatus, std::string const& inCode, std::string const& inMessage);
Response EmptyResponse(int inStatus);

/// "Not Modified" for 304, and so on.
std::string_view ReasonPhrase(int inStatus);

/// The entity tag that belongs to a text that decides on a document's bytes.
std::string MakeETag(std::string_view inWhatDecides);

/// If-Match: true when the header is absent or names the tag. A tag without its quotes is accepted as well.
bool IfMatchHolds(Request const& inRequest, std::string_view inETag);
/// If-None-Match: true when the header is present and names the tag.
bool IfNoneMatchHits(Request const& inRequest, std::string_view inETag);
bool AcceptsGzip(Request const& inRequest);

/// Throws Failure 412 unless the request's If-Match holds.
void RequireMatch(Request const& inRequest, std::string_view inETag, std::string const& inWhat);

}  // namespace zohub
