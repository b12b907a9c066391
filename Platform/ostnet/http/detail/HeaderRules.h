// What may stand in an HTTP head: the grammar of names and values, and the reading of a received head.
#pragma once

#include <optional>
#include <string_view>

#include "ostnet/Response.h"

namespace ostnet {
namespace http {

/// True for a token of RFC 9110, section 5.6.2: what a header name or a method is made of.
bool IsToken(std::string_view inText) noexcept;

/// True for text that cannot end its header line: no control byte but the tab.
bool IsSafeHeaderValue(std::string_view inText) noexcept;

std::string_view TrimBlanks(std::string_view inText) noexcept;

/// A non-negative decimal number and nothing else (RFC 9110, section 8.6).
std::optional<std::uint64_t> ParseContentLength(std::string_view inText) noexcept;

/// Reads the field lines of a head, status line included or not. Folded lines are joined by a blank
/// (RFC 9112, section 5.2); lines that are no field are left out.
Headers ParseHead(std::string_view inHead);

/// True when every name and value may go out in a head of at most inMaximumSize bytes.
bool AreSendable(const Headers& inHeaders, std::size_t inMaximumSize) noexcept;

/// True for a field whose value is a credential and must reach no log.
bool IsSecretHeader(std::string_view inName) noexcept;

}  // namespace http
}  // namespace ostnet
