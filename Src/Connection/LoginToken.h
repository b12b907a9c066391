// The login token: how it is found in an answer.
#pragma once

#include <string_view>

#include "ZOClient/Types.h"

namespace ZOCL {

/// Longer Set-Cookie values are refused as a whole.
constexpr std::size_t kMaximumSetCookieSize = 8 * 1024;

/// The text from "login-token=" through the next ";", or to the end. Null when there is none, when its value
/// is empty, which is how a cookie is taken back, and for a value with control characters (a folded line
/// among them) or beyond the size limit.
ImmutableString ExtractLoginToken(std::string_view inSetCookieValue);

/// The first token among all Set-Cookie fields of a response; null for a null response.
ImmutableString FindLoginToken(const shared_ptr<ostnet::Response>& inResponse);

}  // namespace ZOCL
