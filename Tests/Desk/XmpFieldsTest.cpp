// Fields of packets: only what was edited changes.
#include <gmock/gmock.h>

#include "OrvaneXMP/PacketReader.h"
#include "OrvaneXMP/PacketWriter.h"
#include "XmpFields.h"

namespace Desk {
namespace {

using testing::HasSubstr;
using testing::Not;

OrvaneXMP::Packet Read(const std::string& inProperties) {
    const auto read = OrvaneXMP::ReadPacket(
        "<rdf:RDF xmlns:rdf='http://www.w3.org/1999/02/22-rdf-syntax-ns#'><rdf:Description rdf:about='' "
        "xmlns:dc='http://purl.org/dc/elements/1.1/' xmlns:a='http://a.example/'>" +
        inProperties + "</rdf:Description></rdf:RDF>");
    EXPECT_TRUE(read) << read.failure.Text();
    return read ? *read.packet : OrvaneXMP::Packet();
}

XmpField Field(const OrvaneXMP::Packet& inPacket, const char* inLocalName) {
    for (const XmpField& field : ReadXmpFields(inPacket)) {
        if (field.name.LocalName() == inLocalName) {
            return field;
        }
    }
    ADD_FAILURE() << inLocalName;
    return {};
}

std::string Edited(const OrvaneXMP::Packet& inPacket, const char* inLocalName, const char* inValue) {
    XmpField field = Field(inPacket, inLocalName);
    field.value = QString::fromUtf8(inValue);
    return OrvaneXMP::WritePacket(WithXmpField(inPacket, field));
}

TEST(XmpFields, AreTheUsualOnesThenOtherTextsAndNothingThatIsNoText) {
    const auto packet = Read(
        "<a:note>n</a:note><a:deep rdf:parseType='Resource'><a:x>1</a:x></a:deep>"
        "<dc:subject><rdf:Bag><rdf:li>one</rdf:li><rdf:li>two</rdf:li></rdf:Bag></dc:subject>");
    const auto fields = ReadXmpFields(packet);
    EXPECT_EQ(fields.front().name.LocalName(), "title");
    EXPECT_TRUE(fields.front().value.isEmpty());
    EXPECT_EQ(fields.back().label, QStringLiteral("a:note"));
    EXPECT_EQ(Field(packet, "subject").value, QStringLiteral("one; two"));
}

TEST(XmpFields, ATitleIsChangedInTheLanguagesThatSayTheSame) {
    const auto packet = Read(
        "<dc:title><rdf:Alt><rdf:li xml:lang='x-default'>Old</rdf:li><rdf:li "
        "xml:lang='en-GB'>Old</rdf:li><rdf:li xml:lang='de'>Alt</rdf:li></rdf:Alt></dc:title>");
    EXPECT_EQ(Field(packet, "title").value, QStringLiteral("Old"));
    const std::string edited = Edited(packet, "title", "New");
    EXPECT_THAT(edited, HasSubstr("xml:lang=\"x-default\">New<"));
    EXPECT_THAT(edited, HasSubstr("xml:lang=\"en-GB\">New<"));
    EXPECT_THAT(edited, HasSubstr("xml:lang=\"de\">Alt<"));
    EXPECT_THAT(Edited(packet, "title", " "), Not(HasSubstr("dc:title")));
    EXPECT_THAT(Edited(Read(""), "title", "First"),
                HasSubstr("<rdf:li xml:lang=\"x-default\">First</rdf:li>"));
}

TEST(XmpFields, EntriesOfAListKeepTheirKindAndQualifiers) {
    const auto packet =
        Read("<dc:creator><rdf:Bag><rdf:li xml:lang='de'>Jonas</rdf:li></rdf:Bag></dc:creator>");
    const std::string edited = Edited(packet, "creator", " Grace ;; Jonas;");
    EXPECT_THAT(edited, HasSubstr("<rdf:Bag>"));
    EXPECT_THAT(edited, HasSubstr("<rdf:li>Grace</rdf:li>"));
    EXPECT_THAT(edited, HasSubstr("<rdf:li xml:lang=\"de\">Jonas</rdf:li>"));
    EXPECT_THAT(Edited(Read(""), "creator", "Ada"), HasSubstr("<rdf:Seq>"));
    EXPECT_THAT(Edited(packet, "creator", " ; "), Not(HasSubstr("dc:creator")));
}

TEST(XmpFields, WhatNoPacketCanHoldIsRefused) {
    const auto packet = Read("<a:note>n</a:note>");
    EXPECT_THROW(Edited(packet, "note", "\x01"), std::invalid_argument);
}

}  // namespace
}  // namespace Desk
