// Packets for tests of the merge, short to write.
#pragma once

#include <string>

#include <gtest/gtest.h>

#include "Collaboration/XMPMergeNames.h"
#include "Collaboration/XMPTreeMerge.h"
#include "OrvaneXMP/PacketReader.h"

namespace ZOCL {

/// The text of a packet with these properties, as elements.
inline std::string PacketText(const std::string& inProperties) {
    return "<x:xmpmeta xmlns:x='adobe:ns:meta/'><rdf:RDF "
           "xmlns:rdf='http://www.w3.org/1999/02/22-rdf-syntax-ns#'><rdf:Description rdf:about='' "
           "xmlns:xmp='http://ns.adobe.com/xap/1.0/' xmlns:xmpMM='http://ns.adobe.com/xap/1.0/mm/' "
           "xmlns:xmpDM='http://ns.adobe.com/xmp/1.0/DynamicMedia/' "
           "xmlns:stEvt='http://ns.adobe.com/xap/1.0/sType/ResourceEvent#' "
           "xmlns:dc='http://purl.org/dc/elements/1.1/' xmlns:own='http://example.com/own/'>" +
           inProperties + "</rdf:Description></rdf:RDF></x:xmpmeta>";
}

inline OrvaneXMP::Packet PacketOf(const std::string& inProperties) {
    const OrvaneXMP::ReadResult read = OrvaneXMP::ReadPacket(PacketText(inProperties));
    EXPECT_TRUE(read) << read.failure.Text() << "\n" << inProperties;
    return read ? *read.packet : OrvaneXMP::Packet();
}

/// A merge of three packets given by their properties.
struct Merged {
    Merged(const std::string& inBase, const std::string& inLatest, const std::string& inUser)
        : result(MergeXMPTrees(PacketOf(inBase), PacketOf(inLatest), PacketOf(inUser))) {}

    bool IsWhole() const { return result->GetUnResolvedConflicts().empty(); }
    const OrvaneXMP::Packet& Packet() const { return result->GetMergedPacket(); }
    /// The text of a simple property; "-" without one.
    std::string Text(const OrvaneXMP::Name& inName) const {
        const OrvaneXMP::Node& node = Packet().Property(inName);
        return node.IsPresent() ? std::string(node.Value()) : "-";
    }
    /// The source of the only conflict that was settled, 0 when it was not exactly one.
    int Source() const {
        const auto& resolved = result->GetResolvedConflicts();
        return resolved.size() == 1 ? static_cast<int>(resolved[0]->GetResolvedSource()) : 0;
    }
    bool Says(const std::string& inProperties) const { return Packet() == PacketOf(inProperties); }

    RFL::InterfaceRef<OrvaneXMPCompareAndMerge::IThreeWayMergeResult_v1> result;
};

}  // namespace ZOCL
