// What two packets differ in.
#pragma once

#include <vector>

#include "OrvaneXMPCompareAndMerge/Types.h"
#include "ostcore/Export.h"

namespace OrvaneXMPCompareAndMerge {

enum class ChangeKind : std::int32_t { Added = 1, Removed = 2, Changed = 3 };

/// One node that is not the same. The old one is absent when it was added, the new one when it was removed.
struct Difference {
    SharedPath path;
    ChangeKind kind;
    Node oldNode;
    Node newNode;
};

/// From old to new, in the order of the names; empty for equal packets. Structures are compared field by
/// field, language alternatives language by language and both with their qualifiers; all other arrays, and
/// simple values with their qualifiers, are one node. What is described counts as the property rdf:about.
/// Threads: any. Errors: std::bad_alloc, and std::invalid_argument for properties that are no structure
/// without qualifiers.
ZOPLATFORM_EXPORT std::vector<Difference> FindDifferences(const Packet& inOld, const Packet& inNew);

}  // namespace OrvaneXMPCompareAndMerge
