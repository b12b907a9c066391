// Packets in short form for the tests of XMP.
#pragma once

#include <gtest/gtest.h>

#include <string>
#include <string_view>

#include "OrvaneXMP/Namespaces.h"
#include "OrvaneXMP/PacketReader.h"
#include "OrvaneXMP/PacketWriter.h"
#include "OrvaneXMP/Tree.h"

namespace OrvaneXMP {

inline Name N(std::string_view inLocalName) {
    return Name("urn:test#", inLocalName);
}

inline Node Lang(const Node& inNode, std::string_view inLanguage) {
    return inNode.WithQualifier(LanguageName(), Node::Text(inLanguage));
}

/// Subjects inside of rdf:RDF; the prefix t is that of the test, x:xmpmeta is left out.
inline std::string WithRDF(const std::string& inSubjects, const std::string& inAttributes = {}) {
    return "<rdf:RDF xmlns:rdf=\"http://www.w3.org/1999/02/22-rdf-syntax-ns#\" xmlns:t=\"urn:test#\" " +
           inAttributes + ">" + inSubjects + "</rdf:RDF>";
}

inline std::string WithProperties(const std::string& inProperties) {
    return WithRDF("<rdf:Description rdf:about=''>" + inProperties + "</rdf:Description>");
}

inline Packet Read(const std::string& inText) {
    const ReadResult result = ReadPacket(inText);
    EXPECT_TRUE(result) << result.failure.Text() << "\n" << inText;
    return result ? *result.packet : Packet();
}

inline std::string WhyRefused(const std::string& inText) {
    const ReadResult result = ReadPacket(inText);
    EXPECT_FALSE(result) << inText.substr(0, 2000);
    return result.failure.Text();
}

}  // namespace OrvaneXMP
