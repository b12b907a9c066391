#include "RFL/DirectoryRegistry.h"

#include "ostcore/config/StateDirectories.h"

namespace RFL {
namespace DirectoryRegistry {

bool FindDirectory(std::string_view inKey, ostcore::filesupport::Dir& outDirectory) {
    if (inKey != kDirectory_SharedDocuments) {
        return false;
    }
    outDirectory = ostcore::config::GetCacheDirectory();
    return true;
}

}  // namespace DirectoryRegistry
}  // namespace RFL
