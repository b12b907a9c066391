// Passwords as salted scrypt hashes.
#pragma once

#include <string>
#include <string_view>

namespace zohub {

/// "scrypt$N$r$p$salt$hash", all that is needed to check a password later.
std::string HashPassword(std::string_view inPassword);

/// False as well for a hash that cannot be read.
bool PasswordMatches(std::string_view inPassword, std::string const& inHash);

/// Takes as long as PasswordMatches; called for users that do not exist, so that they cannot be told apart.
void SpendPasswordTime(std::string_view inPassword);

}  // namespace zohub
