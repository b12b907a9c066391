// Passwords as salted scrypt hashes.
#pragma once

#include <string>
#include <string_view>

namespace zohub {

/// Two to this power is the cost N of scrypt (RFC 7914, section 2): time and memory double with each step.
inline constexpr unsigned kUsualPasswordCost = 15;
inline constexpr unsigned kSmallestPasswordCost = 10;
inline constexpr unsigned kLargestPasswordCost = 16;

/// "scrypt$N$r$p$salt$hash", all that is needed to check a password later.
std::string HashPassword(std::string_view inPassword, unsigned inCost = kUsualPasswordCost);

/// False as well for a hash that cannot be read.
bool PasswordMatches(std::string_view inPassword, std::string const& inHash);

/// Takes as long as PasswordMatches; called for users that do not exist, so that they cannot be told apart.
void SpendPasswordTime(std::string_view inPassword);

}  // namespace zohub
