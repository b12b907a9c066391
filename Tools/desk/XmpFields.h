// What people edit of an XMP packet: its usual properties, and every other one that is a plain text.
#pragma once

#include <vector>

#include <QtCore/QString>

#include "OrvaneXMP/Tree.h"

namespace Desk {

struct XmpField {
    enum class Form { kText, kLanguages, kOrderedList, kUnorderedList };

    OrvaneXMP::Name name;
    QString label;
    /// How the property stands in the packet.
    Form form = Form::kText;
    bool isLong = false;
    /// The entries of a list are parted by semicolons; of several languages it is the default one.
    QString value;
};

/// The usual fields, empty ones too, then the others by name. What is neither a text nor an array of texts is
/// left out.
std::vector<XmpField> ReadXmpFields(const OrvaneXMP::Packet& inPacket);

/// The packet with another value in one of its fields; an empty value takes the property out. All else stays.
/// Throws std::invalid_argument for a value that no packet can hold.
OrvaneXMP::Packet WithXmpField(const OrvaneXMP::Packet& inPacket, const XmpField& inField);

}  // namespace Desk
