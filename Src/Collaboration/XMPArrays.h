// Arrays of XMP without their items, so that kind and qualifiers survive when the items are put together
// anew.
#pragma once

#include <utility>
#include <vector>

#include "OrvaneXMP/Tree.h"

namespace ZOCL {

/// The array with these items in the place of its own.
inline OrvaneXMP::Node ArrayLike(const OrvaneXMP::Node& inArray, std::vector<OrvaneXMP::Node> inItems) {
    const OrvaneXMP::Range<OrvaneXMP::Field> qualifiers = inArray.Qualifiers();
    return OrvaneXMP::Node::Array(inArray.GetKind(), std::move(inItems))
        .WithQualifiers(std::vector<OrvaneXMP::Field>(qualifiers.begin(), qualifiers.end()));
}

/// The array without items; absent for an absent one.
inline OrvaneXMP::Node ShapeOf(const OrvaneXMP::Node& inArray) {
    return inArray.IsPresent() ? ArrayLike(inArray, {}) : OrvaneXMP::Node();
}

}  // namespace ZOCL
