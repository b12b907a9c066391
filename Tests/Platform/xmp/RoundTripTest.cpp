// Whatever tree is written reads back as the same tree, in the same bytes when it is written again.
#include <rapidcheck.h>

#include "XmpTest.h"

namespace OrvaneXMP {

namespace {

/// Texts with what XML makes hard: markup, white space at the ends, carriage returns, foreign letters.
rc::Gen<std::string> Texts() {
    const auto piece = rc::gen::elementOf(std::vector<std::string>{
        "a", "<", "&", ">", "\"", "'", "\r", "\n", "\t", " ", "]]>", "\xC3\xA9", "\xF0\x9D\x84\x9E", "\x7F"});
    return rc::gen::map(rc::gen::container<std::vector<std::string>>(piece),
                        [](const std::vector<std::string>& inPieces) {
                            std::string text;
                            for (const std::string& each : inPieces) {
                                text += each;
                            }
                            return text;
                        });
}

rc::Gen<Name> Names() {
    return rc::gen::map(
        rc::gen::pair(rc::gen::elementOf(std::vector<std::string>{"urn:a#", "urn:<&\"'>", "http://b/",
                                                                  std::string(kNamespace_Meta),
                                                                  std::string(kNamespace_XMP)}),
                      rc::gen::elementOf(std::vector<std::string>{"p", "RDF", "li", "\xC3\xA9", "x-1.2"})),
        [](const auto& inParts) { return Name(inParts.first, inParts.second); });
}

rc::Gen<Node> Nodes(int inDepth);

rc::Gen<std::vector<Field>> Fields(int inDepth) {
    const auto row =
        rc::gen::container<std::vector<std::pair<Name, Node>>>(rc::gen::pair(Names(), Nodes(inDepth)));
    return rc::gen::map(row, [](const std::vector<std::pair<Name, Node>>& inPairs) {
        Node structure = Node::Structure({});
        for (const auto& [name, node] : inPairs) {
            structure = structure.WithField(name, node);
        }
        return std::vector<Field>(structure.Fields().begin(), structure.Fields().end());
    });
}

rc::Gen<Node> Bare(int inDepth) {
    const auto text = rc::gen::map(Texts(), [](const std::string& inText) { return Node::Text(inText); });
    const auto uri = rc::gen::map(Texts(), [](const std::string& inText) { return Node::URI(inText); });
    if (inDepth == 0) {
        return rc::gen::oneOf(text, uri);
    }
    const auto structure =
        rc::gen::map(rc::gen::pair(Fields(inDepth - 1), rc::gen::arbitrary<bool>()), [](const auto& inParts) {
            const Node node = Node::Structure(inParts.first);
            return inParts.second ? node : node.WithField(TypeName(), Node::URI("urn:type"));
        });
    const auto array =
        rc::gen::map(rc::gen::pair(rc::gen::element(Kind::Unordered, Kind::Ordered, Kind::Alternative),
                                   rc::gen::container<std::vector<Node>>(Nodes(inDepth - 1))),
                     [](const auto& inParts) { return Node::Array(inParts.first, inParts.second); });
    return rc::gen::oneOf(text, structure, array);
}

rc::Gen<Node> Nodes(int inDepth) {
    const auto language = rc::gen::map(
        rc::gen::pair(Bare(inDepth),
                      rc::gen::elementOf(std::vector<std::string>{"x-default", "de", "en-US", ""})),
        [](const auto& inParts) { return Lang(inParts.first, inParts.second); });
    if (inDepth == 0) {
        return rc::gen::weightedOneOf<Node>({{4, Bare(0)}, {1, language}});
    }
    const auto qualified =
        rc::gen::map(rc::gen::tuple(Bare(inDepth), Fields(inDepth - 1), rc::gen::arbitrary<bool>()),
                     [](const auto& inParts) {
                         const Node node = std::get<0>(inParts).WithQualifiers(std::get<1>(inParts));
                         return std::get<2>(inParts) ? Lang(node, "fr") : node;
                     });
    return rc::gen::weightedOneOf<Node>({{4, Bare(inDepth)}, {1, language}, {1, qualified}});
}

}  // namespace

TEST(XmpRoundTrip, WhatIsWrittenReadsBackTheSame) {
    EXPECT_TRUE(rc::check("write then read", [] {
        Packet packet;
        packet.about = *Texts();
        packet.properties = Node::Structure(*rc::gen::resize(6, Fields(3)));
        WriteOptions options;
        options.layout = *rc::gen::element(WriteOptions::Layout::Readable, WriteOptions::Layout::Compact);
        options.wrapper = *rc::gen::element(WriteOptions::Wrapper::None, WriteOptions::Wrapper::ReadOnly,
                                            WriteOptions::Wrapper::Writable);
        options.padding = *rc::gen::inRange<std::size_t>(0, 300);
        const std::string text = WritePacket(packet, options);
        const ReadResult back = ReadPacket(text);
        RC_ASSERT(static_cast<bool>(back));
        RC_ASSERT(*back.packet == packet);
        RC_ASSERT(WritePacket(*back.packet, options) == text);
    }));
}

TEST(XmpRoundTrip, EqualTreesGiveTheSameBytesWhateverTheirPacketsLookedLike) {
    const Packet one =
        Read(WithRDF("<rdf:Description t:b='2'><t:a><t:S t:y='1' t:x='2'/></t:a></rdf:Description>"));
    const Packet other = Read(
        WithProperties("<t:a rdf:parseType='Resource'>\n<t:x>2</t:x><rdf:type rdf:resource='urn:test#S'/>"
                       "<t:y>1</t:y></t:a>") +
        "<?after all?>");
    EXPECT_NE(one, other);
    EXPECT_EQ(WritePacket(one),
              WritePacket(Read(WithRDF("<rdf:Description><t:b>2</t:b></rdf:Description>"
                                       "<rdf:Description rdf:about=''><t:a rdf:parseType='Resource'>\n"
                                       "<t:x>2</t:x><rdf:type rdf:resource='urn:test#S'/><t:y>1</t:y>"
                                       "</t:a></rdf:Description>"))));
}

TEST(XmpRoundTrip, TheWrittenPacketHasItsWrapperAndPadding) {
    Packet packet;
    packet.properties = Node::Structure({{Name(kNamespace_DC, "format"), Node::Text("a\rb")}});
    WriteOptions options;
    options.padding = 101;
    const std::string text = WritePacket(packet, options);
    EXPECT_EQ(text,
              "<?xpacket begin=\"\xEF\xBB\xBF\" id=\"W5M0MpCehiHzreSzNTczkc9d\"?>\n"
              "<x:xmpmeta xmlns:x=\"adobe:ns:meta/\">\n"
              " <rdf:RDF xmlns:rdf=\"http://www.w3.org/1999/02/22-rdf-syntax-ns#\">\n"
              "  <rdf:Description rdf:about=\"\"\n"
              "     xmlns:dc=\"http://purl.org/dc/elements/1.1/\">\n"
              "   <dc:format>a&#xD;b</dc:format>\n"
              "  </rdf:Description>\n"
              " </rdf:RDF>\n"
              "</x:xmpmeta>\n" +
                  std::string(99, ' ') + "\n <?xpacket end=\"w\"?>");
    options.layout = WriteOptions::Layout::Compact;
    options.wrapper = WriteOptions::Wrapper::None;
    EXPECT_NE(WritePacket(packet, options).find("dc:format=\"a&#xD;b\"/></rdf:RDF>"), std::string::npos);
}

}  // namespace OrvaneXMP
