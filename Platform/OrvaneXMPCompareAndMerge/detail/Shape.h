// What the rules of merging make of a node.
#pragma once

#include "OrvaneXMP/Namespaces.h"
#include "OrvaneXMPCompareAndMerge/Types.h"

namespace OrvaneXMPCompareAndMerge {

/// The kinds of Docs/xmp-merge.md.
enum class Shape : std::uint8_t {
    Absent,
    Simple,
    Structure,
    Ordered,
    Unordered,
    Alternative,
    LanguageAlternative
};

Shape ShapeOf(const Node& inNode);
NodeType TypeOf(const Node& inNode) noexcept;
/// An unordered array whose items are all simple.
bool IsUnorderedOfSimple(const Node& inNode) noexcept;

/// Of an item of a language alternative.
inline std::string_view LanguageOf(const Node& inItem) noexcept {
    return inItem.QualifierNamed(OrvaneXMP::LanguageName()).Value();
}

/// The place of what is described; no property can have this name.
const OrvaneXMP::Name& AboutName();
/// An absent node when it is empty.
Node AboutOf(const Packet& inPacket);
/// Throws std::invalid_argument for properties that are no structure without qualifiers.
void RequireProperties(const Packet& inPacket);

}  // namespace OrvaneXMPCompareAndMerge
