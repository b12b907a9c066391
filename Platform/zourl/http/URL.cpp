#include "zourl/http/URL.h"

#include <boost/config.hpp>
// The parser is compiled into this source alone. Its classes ask to be visible; a host with another version
// of it must not meet ours.
#undef BOOST_SYMBOL_VISIBLE
#define BOOST_SYMBOL_VISIBLE
#include <boost/url/parse.hpp>
#include <boost/url/src.hpp>
#include <boost/url/url_view.hpp>

#include <charconv>

#include "ostcore/utility/StringConversion.h"

namespace zourl {
namespace http {
namespace {

std::string ToString(boost::core::string_view inText) {
    return {inText.data(), inText.size()};
}

/// Reads what follows the host: nothing, or a colon and a port. False for all else.
bool ReadPort(std::string_view inText, ostcore::optional<std::uint16_t>& outPort) {
    if (inText.empty()) {
        return true;
    }
    std::uint16_t port = 0;
    const char* const end = inText.data() + inText.size();
    const auto read = std::from_chars(inText.data() + 1, end, port);
    if (inText.front() != ':' || read.ec != std::errc() || read.ptr != end || port == 0) {
        return false;
    }
    outPort = port;
    return true;
}

}  // namespace

std::uint16_t URL::GetEffectivePort() const noexcept {
    if (mPort) {
        return *mPort;
    }
    return mIsSecure ? 443 : 80;
}

std::string URL::GetOrigin() const {
    std::string origin = std::string(GetScheme()) + "://" + mHost;
    if (GetEffectivePort() != (mIsSecure ? 443 : 80)) {
        origin += ":" + std::to_string(*mPort);
    }
    return origin;
}

bool URL::HasSameOrigin(const URL& inOther) const noexcept {
    return mIsSecure == inOther.mIsSecure && GetEffectivePort() == inOther.GetEffectivePort() &&
           mHost == inOther.mHost;
}

ostcore::optional<URL> Create(std::string_view inText) {
    const auto parsed = boost::urls::parse_uri(boost::core::string_view(inText.data(), inText.size()));
    if (!parsed) {
        return {};
    }
    const boost::urls::url_view view = *parsed;
    const bool isSecure = view.scheme_id() == boost::urls::scheme::https;
    if ((!isSecure && view.scheme_id() != boost::urls::scheme::http) || !view.has_authority() ||
        view.has_userinfo() || view.encoded_host().empty() || view.encoded_host().contains('%')) {
        return {};
    }
    URL url;
    url.mIsSecure = isSecure;
    url.mText = inText;
    url.mHost = ostcore::utility::FoldCaseASCII(ToString(view.encoded_host()));
    url.mPath = ToString(view.encoded_path());
    url.mQuery = view.has_query() ? ToString(view.encoded_query()) : std::string();
    const std::string authority = ToString(view.encoded_authority());
    // The parser takes what follows a port's digits for a path, even without a slash.
    const bool isPathSound = url.mPath.empty() || url.mPath.front() == '/';
    if (!isPathSound || !ReadPort(std::string_view(authority).substr(url.mHost.size()), url.mPort)) {
        return {};
    }
    return url;
}

bool Create(std::string_view inText, URL& outURL) {
    auto url = Create(inText);
    if (!url) {
        return false;
    }
    outURL = std::move(*url);
    return true;
}

}  // namespace http
}  // namespace zourl
