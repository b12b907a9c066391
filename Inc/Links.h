// Link records of the server's documents: how they are read, searched, and their templates filled in.
#pragma once

#include <utility>
#include <vector>

#include "ostcore/serialization/JSON.h"
#include "ZOClient/Types.h"

namespace ZOCL {

struct Link {
    ImmutableString relation;
    ImmutableString title;
    ImmutableString href;
    ImmutableString type;
    ImmutableString eTag;
};

/// In the order of the document.
using Links = std::vector<Link>;

/// Reads the array under "links" of an object; an absent key gives an empty list. Throws bad_any_cast for a
/// wrong type.
Links ReadLinks(const ostcore::serialization::JSONValue& inObject);

/// The first link with this relation and, unless inType is null, this media type; a link of null strings
/// when there is none.
Link FindLink(const Links& inLinks, const ImmutableString& inRelation, const ImmutableString& inType);

/// Fills in the fields of a template by plain text replacement in one pass, at most five of them. A field
/// without a value stays as it is.
ImmutableString ExpandTemplate(const ImmutableString& inTemplate,
                               const std::vector<std::pair<const char*, ImmutableString>>& inFields);

}  // namespace ZOCL
