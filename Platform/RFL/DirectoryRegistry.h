// Well-known directories by key.
#pragma once

#include <string_view>

#include "ostcore/Export.h"
#include "ostcore/filesupport/Dir.h"

namespace RFL {
namespace DirectoryRegistry {

/// Where the programs of a user put what they share and can make again: the user's cache directory
/// (ostcore::config::GetCacheDirectory).
constexpr std::string_view kDirectory_SharedDocuments = "ostshared.documents";

/// False for a key that is not known. The directory need not exist. Threads: any.
ZOPLATFORM_EXPORT bool FindDirectory(std::string_view inKey, ostcore::filesupport::Dir& outDirectory);

}  // namespace DirectoryRegistry
}  // namespace RFL
