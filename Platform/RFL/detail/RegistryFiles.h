// Where registry files lie and with which modes they are made.
#pragma once

#include <cstdint>
#include <string>

#include "RFL/Registry.h"

namespace RFL {

struct RegistryFileIdentity {
    std::uint64_t device = 0;
    std::uint64_t inode = 0;
};

/// Makes the directory (0700 for the user, 0755 for the machine) and an empty file (0600, 0644) unless they
/// are there, whatever the umask says; checks what is there.
int CreateRegistryFile(RegistryRoot inRoot, const std::string& inFile);

/// Makes sure that there is a regular file and no link, and narrows the mode of a user's own file to 0600.
int CheckRegistryFile(RegistryRoot inRoot, const std::string& inFile);

/// Makes sure that a path names a regular file and no link, and gives the path with its directory resolved.
int ResolveRegistryFile(const std::string& inFile, std::string& outFile, RegistryFileIdentity& outIdentity);

std::string RegistryDirectory(const std::string& inFile);
/// Makes the directory of a registry file and its missing parents, private to the user where it is his.
bool MakeRegistryDirectory(RegistryRoot inRoot, const std::string& inFile);

/// False when there is no regular file.
bool IdentifyRegistryFile(const std::string& inFile, RegistryFileIdentity& outIdentity);

}  // namespace RFL
