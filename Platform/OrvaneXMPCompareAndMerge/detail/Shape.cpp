// Tells the kinds of nodes apart.
#include "OrvaneXMPCompareAndMerge/detail/Shape.h"

#include <algorithm>
#include <stdexcept>

namespace OrvaneXMPCompareAndMerge {

using OrvaneXMP::Kind;

Shape ShapeOf(const Node& inNode) {
    if (!inNode.IsPresent()) {
        return Shape::Absent;
    }
    switch (inNode.GetKind()) {
        case Kind::Text:
        case Kind::URI:
            return Shape::Simple;
        case Kind::Structure:
            return Shape::Structure;
        case Kind::Unordered:
            return Shape::Unordered;
        case Kind::Ordered:
            return Shape::Ordered;
        case Kind::Alternative:
            break;
    }
    return inNode.IsLanguageAlternative() ? Shape::LanguageAlternative : Shape::Alternative;
}

NodeType TypeOf(const Node& inNode) noexcept {
    return inNode.IsArray() ? NodeType::Array : inNode.IsStructure() ? NodeType::Structure : NodeType::Simple;
}

bool IsUnorderedOfSimple(const Node& inNode) noexcept {
    return inNode.IsPresent() && inNode.GetKind() == Kind::Unordered &&
           std::all_of(inNode.Items().begin(), inNode.Items().end(),
                       [](const Node& inItem) { return inItem.IsSimple(); });
}

const OrvaneXMP::Name& AboutName() {
    static const OrvaneXMP::Name name(OrvaneXMP::kNamespace_RDF, "about");
    return name;
}

Node AboutOf(const Packet& inPacket) {
    return inPacket.about.empty() ? Node() : Node::URI(inPacket.about);
}

void RequireProperties(const Packet& inPacket) {
    if (!inPacket.properties.IsStructure() || !inPacket.properties.Qualifiers().empty()) {
        throw std::invalid_argument("The properties of an XMP packet are no structure without qualifiers");
    }
}

}  // namespace OrvaneXMPCompareAndMerge
