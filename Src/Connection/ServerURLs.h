// How the URLs of a server are formed, cut and moved onto the host that the client connected to.
#pragma once

#include <string>
#include <string_view>

#include "ZOClient/Types.h"

namespace ZOCL {

/// The discovery URL without its fixed path; the text itself when it has none of it.
std::string_view CutToBaseURL(std::string_view inDiscoveryURL);

/// What the login dialog lists: the base without scheme, and without the port when that is the default.
std::string MakeServerText(std::string_view inBaseURL, bool inSecure);

/// The base without its scheme.
std::string_view WithoutScheme(std::string_view inURL);

/// Puts scheme, host and port of the base in the place of those of the URL. A URL without a path stays as it
/// is.
std::string MoveOntoBase(std::string_view inURL, std::string_view inBaseURL);

/// Whether a request to the URL reaches the origin of the base, so that a token may go with it.
bool IsOnBase(std::string_view inURL, std::string_view inBaseURL);

}  // namespace ZOCL
