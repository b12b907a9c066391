// Writes a tree as an XMP packet (ISO 16684-1), the same text for the same tree.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>

#include "OrvaneXMP/Tree.h"
#include "ostcore/Export.h"

namespace OrvaneXMP {

struct WriteOptions {
    /// Readable: one element a line, indented. Compact: no white space, short texts as attributes.
    enum class Layout : std::uint8_t { Readable, Compact };
    /// The lines around a packet by which others find it in a file; a writable one ends with "w".
    enum class Wrapper : std::uint8_t { None, ReadOnly, Writable };

    Layout layout = Layout::Readable;
    Wrapper wrapper = Wrapper::Writable;
    /// Bytes of white space before the end of a wrapper, for whoever changes the packet in its place.
    std::size_t padding = 0;
};

/// The packet in UTF-8. Properties, fields, qualifiers and namespaces are sorted, so equal trees with the
/// same prefixes and equally ordered arrays give the same bytes; they read back as an equal tree. A prefix is
/// the packet's own where it has one, else the usual one, else ns1, ns2...
///
/// Errors: std::length_error when the packet would be beyond the limits of Tree.h; std::invalid_argument when
/// the properties are no structure without qualifiers or the resource is no text of XML.
ZOPLATFORM_EXPORT std::string WritePacket(const Packet& inPacket, const WriteOptions& inOptions = {});

}  // namespace OrvaneXMP
