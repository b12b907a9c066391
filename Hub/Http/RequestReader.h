// Turns a parsed head and body into a Request, with all checks that need no route.
#pragma once

#include <boost/beast/http/parser.hpp>
#include <boost/beast/http/string_body.hpp>
#include <optional>

#include "Http/Message.h"
#include "Http/Server.h"

namespace zohub {

using BodyParser = boost::beast::http::request_parser<boost::beast::http::string_body>;
using RequestHead = boost::beast::http::request_header<>;

/// Checks of the head alone, before the body is read. Throws Failure 400, 413, 501.
void CheckHead(RequestHead const& inHead, std::optional<std::uint64_t> inContentLength,
               ServerLimits const& inLimits);

/// The largest body that this head may bring.
std::uint64_t BodyLimitFor(RequestHead const& inHead, ServerLimits const& inLimits);

/// Unpacks the body when it is compressed. Throws Failure.
Request MakeRequest(boost::beast::http::request<boost::beast::http::string_body>&& inMessage, bool inIsSecure,
                    std::string const& inPeerAddress, ServerLimits const& inLimits);

/// The head of the answer with its empty line. Keep-alive is what the connection decided on.
std::string WriteResponseHead(Response const& inResponse, std::size_t inLength, bool inIsPacked,
                              bool inKeepAlive);

}  // namespace zohub
