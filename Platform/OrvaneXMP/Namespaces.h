// The namespaces and the names that the data model itself is written with, and the usual prefixes.
#pragma once

#include <array>
#include <string_view>

#include "OrvaneXMP/Tree.h"

namespace OrvaneXMP {

constexpr std::string_view kNamespace_RDF = "http://www.w3.org/1999/02/22-rdf-syntax-ns#";
constexpr std::string_view kNamespace_XML = "http://www.w3.org/XML/1998/namespace";
constexpr std::string_view kNamespace_Meta = "adobe:ns:meta/";
constexpr std::string_view kNamespace_DC = "http://purl.org/dc/elements/1.1/";
constexpr std::string_view kNamespace_XMP = "http://ns.adobe.com/xap/1.0/";
constexpr std::string_view kNamespace_XMPMM = "http://ns.adobe.com/xap/1.0/mm/";
constexpr std::string_view kNamespace_XMPRights = "http://ns.adobe.com/xap/1.0/rights/";
constexpr std::string_view kNamespace_XMPDM = "http://ns.adobe.com/xmp/1.0/DynamicMedia/";
constexpr std::string_view kNamespace_ResourceEvent = "http://ns.adobe.com/xap/1.0/sType/ResourceEvent#";
constexpr std::string_view kNamespace_ResourceRef = "http://ns.adobe.com/xap/1.0/sType/ResourceRef#";

struct UsualPrefix {
    std::string_view uri;
    std::string_view prefix;
};

/// For namespaces whose prefix no packet has told.
constexpr std::array<UsualPrefix, 10> kUsualPrefixes{{{kNamespace_RDF, "rdf"},
                                                      {kNamespace_XML, "xml"},
                                                      {kNamespace_Meta, "x"},
                                                      {kNamespace_DC, "dc"},
                                                      {kNamespace_XMP, "xmp"},
                                                      {kNamespace_XMPMM, "xmpMM"},
                                                      {kNamespace_XMPRights, "xmpRights"},
                                                      {kNamespace_XMPDM, "xmpDM"},
                                                      {kNamespace_ResourceEvent, "stEvt"},
                                                      {kNamespace_ResourceRef, "stRef"}}};

/// xml:lang, rdf:type and rdf:datatype.
ZOPLATFORM_EXPORT const Name& LanguageName();
ZOPLATFORM_EXPORT const Name& TypeName();
ZOPLATFORM_EXPORT const Name& DatatypeName();

}  // namespace OrvaneXMP
