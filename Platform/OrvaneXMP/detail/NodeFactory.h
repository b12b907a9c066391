// Makes nodes from parts that are known to be sound, without looking at them again.
#pragma once

#include "OrvaneXMP/Tree.h"

namespace OrvaneXMP {

class NodeFactory {
public:
    /// From the form that Name::Text gives.
    static Name MakeName(std::string_view inExpanded) { return Name(ImmutableString(inExpanded)); }

    /// The parts are moved out of their place. Fields and qualifiers are sorted, each name once. Throws
    /// std::length_error when the node would be too high.
    static Node MakeSimple(Kind inKind, std::string_view inText, Field* inQualifiers, std::size_t inCount);
    static Node MakeStructure(Field* inFields, std::size_t inSize, Field* inQualifiers, std::size_t inCount);
    static Node MakeArray(Kind inKind, Node* inItems, std::size_t inSize, Field* inQualifiers,
                          std::size_t inCount);

    /// Sorts by name; a field that is there twice with equal nodes is dropped once, and the number of those
    /// that remain is returned. With different nodes outTwice tells the name.
    static std::size_t Sort(Field* ioFields, std::size_t inSize, Name& outTwice);

private:
    static Node::Data* Allocate(Kind inKind, std::size_t inContentBytes, Field* inQualifiers,
                                std::size_t inCount, std::size_t inBelow);
    static Node Adopt(const Node::Data* inData) noexcept {
        Node node;
        node.mData = inData;
        return node;
    }
};

/// True when the text is UTF-8 made of characters that XML allows.
bool IsXMLText(std::string_view inText) noexcept;

}  // namespace OrvaneXMP
