// Reads, searches and fills in link records.
#include "Links.h"

#include "ostcore/utility/ReplaceInString.h"

namespace ZOCL {

using ostcore::serialization::JSONValue;
using ostcore::serialization::JSONView;

namespace {

ImmutableString ReadText(JSONView inLink, std::string_view inKey) {
    const JSONView value = inLink.Find(inKey);
    return value.IsNull() ? ImmutableString() : value.AsInternedString();
}

Link ReadLink(JSONView inLink) {
    if (!inLink.IsObject()) {
        ostcore::serialization::ThrowWrongJSONType();
    }
    Link link;
    link.relation = ReadText(inLink, "rel");
    link.title = ReadText(inLink, "title");
    link.href = ReadText(inLink, "href");
    link.type = ReadText(inLink, "type");
    link.eTag = ReadText(inLink, "zo:etag");
    return link;
}

}  // namespace

Links ReadLinks(const JSONValue& inObject) {
    Links links;
    JSONView(inObject).Find("links").ForEachElement(
        [&](JSONView inLink) { links.push_back(ReadLink(inLink)); });
    return links;
}

Link FindLink(const Links& inLinks, const ImmutableString& inRelation, const ImmutableString& inType) {
    for (const Link& link : inLinks) {
        if (!link.relation.IsNull() && link.relation == inRelation &&
            (inType.IsNull() || link.type == inType)) {
            return link;
        }
    }
    return Link();
}

ImmutableString ExpandTemplate(const ImmutableString& inTemplate,
                               const std::vector<std::pair<const char*, ImmutableString>>& inFields) {
    std::vector<ostcore::utility::Replacement> replacements;
    for (const auto& field : inFields) {
        replacements.emplace_back(field.first, field.second.str());
    }
    return ImmutableString(ostcore::utility::ReplaceInString(inTemplate.view(), replacements));
}

}  // namespace ZOCL
