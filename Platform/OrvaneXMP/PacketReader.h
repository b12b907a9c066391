// Reads an XMP packet (ISO 16684-1) into a tree.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

#include "OrvaneXMP/Tree.h"
#include "ostcore/Export.h"
#include "ostcore/Types.h"

namespace OrvaneXMP {

/// Why a packet was refused, and where: line and column from 1 in the text, 0 when there is no place.
struct ReadFailure {
    std::string reason;
    std::size_t line = 0;
    std::size_t column = 0;

    /// "line 3, column 14: REASON"
    ZOPLATFORM_EXPORT std::string Text() const;
};

/// Either a packet or the reason why there is none.
struct ReadResult {
    ostcore::optional<Packet> packet;
    ReadFailure failure;

    explicit operator bool() const noexcept { return packet.has_value(); }
};

/// Reads one packet in UTF-8, UTF-16 or UTF-32 of either byte order, with or without a byte order mark: the
/// packet wrapper and its padding, x:xmpmeta, or rdf:RDF alone.
///
/// Nothing that the packet says is dropped: all forms of RDF that XMP allows become nodes, foreign namespaces
/// included, and what the data model cannot hold is refused (rdf:parseType other than Resource, references
/// between nodes, resources within resources, a property given twice with different values). Language follows
/// RDF: xml:lang of an outer element holds for the properties below it.
///
/// Foreign input is bounded: document type declarations are refused, and so are packets beyond the limits of
/// Tree.h, more than 10,000 attributes or about 1 MiB in one tag, 4096 namespaces, 4 KiB in the URI of one.
///
/// Threads: any. Errors: come as a value; only std::bad_alloc is thrown. The reason quotes names, no values.
ZOPLATFORM_EXPORT ReadResult ReadPacket(std::string_view inBytes);

}  // namespace OrvaneXMP
