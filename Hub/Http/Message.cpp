// Requests, answers, and the rules of conditional requests (RFC 9110, section 13).
#include "Http/Message.h"

#include <mutex>

#include "Base/Digest.h"
#include "Base/Error.h"
#include "Base/Gzip.h"
#include "Base/Text.h"

namespace zohub {

namespace {

std::string_view WithoutQuotes(std::string_view inTag) {
    if (inTag.size() >= 2 && inTag.front() == '"' && inTag.back() == '"')
        return inTag.substr(1, inTag.size() - 2);
    return inTag;
}

bool ListNames(std::string_view inList, std::string_view inETag, bool inWeakly) {
    for (auto part : Split(inList, ',')) {
        part = Trim(part);
        if (part == "*")
            return true;
        if (inWeakly && part.substr(0, 2) == "W/")
            part.remove_prefix(2);
        if (!part.empty() && WithoutQuotes(part) == WithoutQuotes(inETag))
            return true;
    }
    return false;
}

}  // namespace

std::string_view Request::Header(std::string_view inName) const {
    for (auto const& [name, value] : headers)
        if (EqualIgnoringCase(name, inName))
            return value;
    return {};
}

std::string Request::Cookie(std::string_view inName) const {
    for (auto const& [header, value] : headers) {
        if (!EqualIgnoringCase(header, "Cookie"))
            continue;
        for (auto part : Split(value, ';')) {
            part = Trim(part);
            if (part.size() > inName.size() && part.substr(0, inName.size()) == inName &&
                part[inName.size()] == '=')
                return std::string(part.substr(inName.size() + 1));
        }
    }
    return {};
}

struct Body::Lazy {
    std::once_flag once;
    std::shared_ptr<std::string const> packed;
};

Body::Body(std::string inPlain) : mPlain(std::move(inPlain)), mLazy(std::make_shared<Lazy>()) {}

std::shared_ptr<std::string const> Body::Packed() const {
    std::call_once(mLazy->once,
                   [&] { mLazy->packed = std::make_shared<std::string const>(GzipPack(mPlain)); });
    return mLazy->packed;
}

std::size_t Body::Size() const {
    return mPlain.size();
}

void Response::SetBody(std::string inText, std::string inType) {
    body = std::make_shared<Body const>(std::move(inText));
    contentType = std::move(inType);
}

Response JsonResponse(int inStatus, std::string inText) {
    Response response;
    response.status = inStatus;
    response.SetBody(std::move(inText), kJsonType);
    return response;
}

Response ErrorResponse(int inStatus, std::string const& inCode, std::string const& inMessage) {
    return JsonResponse(inStatus, "{\"error\":{\"code\":" + JsonString(inCode) +
                                      ",\"message\":" + JsonString(inMessage) + "}}");
}

Response EmptyResponse(int inStatus) {
    Response response;
    response.status = inStatus;
    return response;
}

std::string_view ReasonPhrase(int inStatus) {
    switch (inStatus) {
        case 200:
            return "OK";
        case 201:
            return "Created";
        case 204:
            return "No Content";
        case 304:
            return "Not Modified";
        case 400:
            return "Bad Request";
        case 401:
            return "Unauthorized";
        case 403:
            return "Forbidden";
        case 404:
            return "Not Found";
        case 405:
            return "Method Not Allowed";
        case 408:
            return "Request Timeout";
        case 409:
            return "Conflict";
        case 412:
            return "Precondition Failed";
        case 413:
            return "Content Too Large";
        case 415:
            return "Unsupported Media Type";
        case 422:
            return "Unprocessable Content";
        case 431:
            return "Request Header Fields Too Large";
        case 500:
            return "Internal Server Error";
        case 501:
            return "Not Implemented";
        case 503:
            return "Service Unavailable";
        case 507:
            return "Insufficient Storage";
        default:
            return "Answer";
    }
}

std::string MakeETag(std::string_view inWhatDecides) {
    return "\"" + Sha256Hex(inWhatDecides).substr(0, 32) + "\"";
}

bool IfMatchHolds(Request const& inRequest, std::string_view inETag) {
    std::string_view const list = inRequest.Header("If-Match");
    return list.empty() || ListNames(list, inETag, false);
}

bool IfNoneMatchHits(Request const& inRequest, std::string_view inETag) {
    std::string_view const list = inRequest.Header("If-None-Match");
    return !list.empty() && ListNames(list, inETag, true);
}

bool AcceptsGzip(Request const& inRequest) {
    for (auto part : Split(inRequest.Header("Accept-Encoding"), ',')) {
        auto const pieces = Split(part, ';');
        std::string_view const coding = Trim(pieces[0]);
        if (!EqualIgnoringCase(coding, "gzip") && coding != "*")
            continue;
        std::string quality = pieces.size() > 1 ? std::string(Trim(pieces[1])) : std::string("q=1");
        bool const refused = quality == "q=0" || quality.rfind("q=0.0", 0) == 0;
        return !refused;
    }
    return false;
}

void RequireMatch(Request const& inRequest, std::string_view inETag, std::string const& inWhat) {
    if (!IfMatchHolds(inRequest, inETag))
        throw Failure(412, "changed-meanwhile",
                      inWhat + " was changed since you loaded it; load it again and repeat the change.");
}

}  // namespace zohub
