// The names of a packet as its reader sees them: each distinct one looked at once.
#pragma once

#include <cstdint>
#include <string_view>
#include <unordered_map>

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
    Name name;
    /// The name as the parser gave it.
    ImmutableString key;
};

/// Why a packet is refused; caught before it leaves the reader.
struct Refusal {
    std::string reason;
};

class Terms {
public:
    /// A name as the parser gives it: URI, space, local name; without a namespace the local name alone.
    const KnownName& OfElement(const char* inName) { return Look(inName, mElements); }
    /// Attributes that RDF lets stand without a namespace are known by their old form as well.
    const KnownName& OfAttribute(const char* inName) { return Look(inName, mAttributes); }

private:
    using Table = std::unordered_map<std::string_view, KnownName>;
    const KnownName& Look(const char* inName, Table& ioTable);

    Table mElements;
    Table mAttributes;
};

}  // namespace OrvaneXMP
