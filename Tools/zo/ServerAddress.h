// Addresses of hubs as people type them, and user names that may be used.
#pragma once

#include <string>

namespace zo {

enum class Scheme { Secure, Plain };

/// Adds what is missing: the scheme given here and the default port. Throws a Failure (usage) for anything
/// but a scheme (http or https), a host and a port: no path, no user information.
std::string CompleteServerAddress(const std::string& inText, Scheme inDefault);
bool IsSecureAddress(const std::string& inServer);
/// Whether the host is this machine itself.
bool IsLoopbackAddress(const std::string& inServer);
/// False for control characters, and for the backslash, which parts the keys of the registry. An empty name
/// is usable: it stands for no user.
bool IsUsableUserName(const std::string& inName);

}  // namespace zo
