// Verifies all that the hub holds: hashes, references, trees, commits; sessions with their transactions,
// conflicts and notes.
#pragma once

#include <string>
#include <vector>

#include "Store/Storage.h"

namespace zohub {

struct CheckReport {
    std::vector<std::string> problems;
    std::size_t objects = 0;
    std::size_t contents = 0;
    std::size_t commits = 0;
    std::size_t unreferenced = 0;  ///< left over from work that was given up; harmless
};

CheckReport CheckStorage(Storage& inStorage);

}  // namespace zohub
