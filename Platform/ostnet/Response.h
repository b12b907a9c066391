// The outcome of one HTTP exchange.
#pragma once

#include <cstdint>
#include <string>

#include <boost/container/flat_map.hpp>

#include "ostcore/Export.h"
#include "ostcore/Types.h"
#include "ostcore/utility/Guid.h"
#include "ostcore/utility/ImmutableString.h"
#include "ostcore/utility/RecycledMemory.h"

namespace ostnet {

using ostcore::utility::Guid;
using ostcore::utility::ImmutableString;
using ostcore::utility::RecycledMemory;

/// Compares header names without regard to the case of ASCII letters (RFC 9110, section 5.1).
struct HeaderNameLess {
    using is_transparent = void;
    ZOPLATFORM_EXPORT bool operator()(const ImmutableString& inLeft,
                                      const ImmutableString& inRight) const noexcept;
};
/// Header fields by name; a name can occur more than once. Passed by value between layers.
using Headers = boost::container::flat_multimap<ImmutableString, ImmutableString, HeaderNameLess>;

/// A copy to which so many fields can be added without another allocation.
ZOPLATFORM_EXPORT Headers CopyWithRoom(const Headers& inHeaders, std::size_t inAdded);

/// The first value under a name, the null string when there is none.
ZOPLATFORM_EXPORT ImmutableString GetHeader(const Headers& inHeaders, const ImmutableString& inName);

/// What came back for a request.
class ZOPLATFORM_EXPORT Response {
public:
    /// HTTP status; kStatusCancelled or kStatusNoResponse when there is none.
    std::int32_t status = 0;
    Headers headers;
    /// The body, shared and never copied; null when there is none.
    shared_ptr<RecycledMemory const> payload;
    /// The transport engine's error code, 0 when there was no error.
    std::int32_t curlError = 0;

    static constexpr std::int32_t kStatusCancelled = -1;
    static constexpr std::int32_t kStatusNoResponse = 0;

    Response() = default;
    explicit Response(std::int32_t inStatus) : status(inStatus) {}

    bool IsSuccess() const noexcept { return status >= 200 && status <= 299; }
    /// True when the exchange failed for want of a connection: name not found, refused, reset, timed out,
    /// ended early. False for a null response, for a cancel and for a failure of trust.
    static bool IsNetworkConnectivityError(const shared_ptr<Response>& inResponse);
    /// True when the peer's certificate was not accepted: unknown authority, expired, another host's name.
    static bool IsBadSSLCACert(const shared_ptr<Response>& inResponse);

    std::string GetPayloadAsUTF8String() const;
    /// The first bytes of the payload, for logs; bad UTF-8 is replaced, length bounded.
    std::string GetShortenedPayloadAsUTF8String() const;
    /// One "name: value" a line; values of cookies and credentials are replaced by a mark.
    std::string GetHeadersAsUTF8String() const;
};

}  // namespace ostnet
