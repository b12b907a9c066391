// The document of the differences between two states: what was added, changed and removed, by whom, and which
// of it is in conflict.
#pragma once

#include "Model/TreeDiff.h"
#include "Routes/Documents.h"

namespace zohub {

struct Differences {
    std::string self;
    std::optional<View> left;  ///< pinned; nothing to compare with means that all was added
    View right;
    std::vector<ConflictRecord> conflicts;  ///< of the session on the right side
    std::string accept;                     ///< address of the session when its user may answer conflicts
};

/// All that decides on the bytes of the document, for its tag.
std::string WhatDecides(Differences const& inDifferences);

std::string WriteDifferences(Transaction& inTransaction, std::string const& inApi,
                             Differences const& inDifferences);

}  // namespace zohub
