// Absolute http and https URLs, read strictly.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "ostcore/Export.h"
#include "ostcore/Types.h"

namespace zourl {
namespace http {

/// An absolute http or https URL (RFC 3986, RFC 9110 section 4.2). A plain value.
class ZOPLATFORM_EXPORT URL {
public:
    /// The text as it was given.
    const std::string& GetURIString() const noexcept { return mText; }
    bool IsSecure() const noexcept { return mIsSecure; }
    /// "http" or "https".
    std::string_view GetScheme() const noexcept { return mIsSecure ? "https" : "http"; }
    /// In lower case, an IPv6 address within its brackets.
    const std::string& GetHost() const noexcept { return mHost; }
    /// The port that the text states; none when it states none.
    ostcore::optional<std::uint16_t> GetPort() const noexcept { return mPort; }
    /// The port that a connection goes to: the stated one, else the scheme's.
    std::uint16_t GetEffectivePort() const noexcept;
    /// As in the text, escapes kept; empty or with a leading slash.
    const std::string& GetPath() const noexcept { return mPath; }
    /// As in the text, without the question mark; empty when there is none.
    const std::string& GetQuery() const noexcept { return mQuery; }
    /// "scheme://host" and the port when the text states one that is not the scheme's.
    std::string GetOrigin() const;
    /// Same scheme, host and effective port (RFC 6454).
    bool HasSameOrigin(const URL& inOther) const noexcept;

private:
    friend ZOPLATFORM_EXPORT ostcore::optional<URL> Create(std::string_view inText);
    std::string mText;
    std::string mHost;
    std::string mPath;
    std::string mQuery;
    ostcore::optional<std::uint16_t> mPort;
    bool mIsSecure = false;
};

/// Reads a URL. None for any other scheme, a relative reference, a host that is empty or escaped, user
/// information, a port that is no number from 1 to 65535, and a byte that RFC 3986 does not allow: blanks,
/// controls, bytes over 127.
ZOPLATFORM_EXPORT ostcore::optional<URL> Create(std::string_view inText);
/// The same; false, with outURL unchanged, when the text is no such URL.
ZOPLATFORM_EXPORT bool Create(std::string_view inText, URL& outURL);

}  // namespace http
}  // namespace zourl
