// Tells XMP enclosures from others by their name.
#pragma once

#include "ZOClient/IZOCEnclosure.h"

namespace ZOCL {

/// The base of the name of an XMP enclosure, empty for any other name.
inline ImmutableString GetXMPEnclosureBase(const ImmutableString& inEnclosureName) {
    const ImmutableString suffix = GetXMPEnclosureName(ImmutableString(""));
    const std::string_view name = inEnclosureName.view();
    const std::string_view end = suffix.view();
    const bool isXMP = name.size() > end.size() && name.substr(name.size() - end.size()) == end;
    return isXMP ? ImmutableString(name.substr(0, name.size() - end.size())) : ImmutableString();
}

}  // namespace ZOCL
