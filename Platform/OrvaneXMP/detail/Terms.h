// The names of a packet as its reader sees them: each distinct one looked at once.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "OrvaneXMP/detail/NameTable.h"
#include "OrvaneXMP/Tree.h"

namespace OrvaneXMP {

/// What a name means in RDF; Property is any name that means nothing there.
enum class Term : std::uint8_t {
    Property,
    Meta,
    RDF,
    Description,
    Bag,
    Seq,
    Alt,
    Item,
    NumberedItem,
    Value,
    Type,
    About,
    ID,
    NodeID,
    Resource,
    ParseType,
    Datatype,
    ForbiddenInRDF,
    Language,
    Base,
    OtherOfXML,
    NoNamespace
};

struct KnownName {
    Term term = Term::Property;
    /// Of a numbered item, from 1.
    std::uint32_t number = 0;
    /// The number of the last element that had it as an attribute, for who gives elements numbers from 1.
    std::uint32_t seenIn = 0;
    Name name;
};

/// One of an element, whose name may still have to be looked up.
struct Attribute {
    const KnownName* known;
    const char* name;
    const char* value;
};

/// Why a packet is refused; caught before it leaves the reader.
struct Refusal {
    std::string reason;
};

class Terms {
public:
    Terms();

    /// A name as a parser that knows namespaces gives it: URI, space, local name; without a namespace the
    /// local name alone.
    const KnownName& OfElement(std::string_view inName) { return Look(inName, mElements); }
    /// Attributes that RDF lets stand without a namespace are known by their old form as well.
    KnownName& OfAttribute(std::string_view inName) { return Look(inName, mAttributes); }
    const KnownName& Of(const Attribute& inAttribute) {
        return inAttribute.known ? *inAttribute.known : OfAttribute(inAttribute.name);
    }

    /// For who has a table of its own.
    static KnownName New(std::string_view inName, bool inIsAttribute);

private:
    KnownName& Look(std::string_view inName, NameTable<KnownName>& ioTable);

    NameTable<KnownName> mElements;
    NameTable<KnownName> mAttributes;
};

}  // namespace OrvaneXMP
