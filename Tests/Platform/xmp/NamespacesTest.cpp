// A name means what the declarations around it say, however often it was met before with another meaning.
#include "XmpTest.h"

namespace OrvaneXMP {

namespace {

Name Other(std::string_view inLocalName) {
    return Name("urn:other#", inLocalName);
}

std::string_view ValueAt(const Packet& inPacket, const Name& inName, const Name& inField) {
    return inPacket.Property(inName).FieldNamed(inField).Value();
}

}  // namespace

TEST(XmpNamespaces, APrefixDeclaredAnewChangesItsNamesUntilTheElementEnds) {
    const std::string anew = " xmlns:t='urn:other#'";
    const std::string field = " rdf:parseType='Resource'><t:x>";
    const Packet packet = Read(WithProperties("<t:a t:x='1'/><t:b" + anew + " t:x='2'/><t:c t:x='3'/><t:d" +
                                              field + "4</t:x></t:d><t:e" + anew + field +
                                              "5</t:x></t:e><t:f" + field + "6</t:x></t:f>"));
    EXPECT_EQ(packet.properties.Fields().size(), 6u);
    EXPECT_EQ(ValueAt(packet, N("a"), N("x")), "1");
    EXPECT_EQ(ValueAt(packet, Other("b"), Other("x")), "2");
    EXPECT_EQ(ValueAt(packet, N("c"), N("x")), "3");
    EXPECT_EQ(ValueAt(packet, N("d"), N("x")), "4");
    EXPECT_EQ(ValueAt(packet, Other("e"), Other("x")), "5");
    EXPECT_EQ(ValueAt(packet, N("f"), N("x")), "6");
}

TEST(XmpNamespaces, TheDefaultNamespaceIsForElementsAndCanBeTakenBack) {
    const Packet packet = Read(WithProperties("<a xmlns='urn:test#'>1</a><a xmlns='urn:other#'>2</a>"));
    EXPECT_EQ(packet.Property(N("a")).Value(), "1");
    EXPECT_EQ(packet.Property(Other("a")).Value(), "2");
    const std::string outside = "<t:p rdf:parseType='Resource' xmlns='urn:other#'><a>1</a>";
    EXPECT_EQ(ValueAt(Read(WithProperties(outside + "</t:p>")), N("p"), Other("a")), "1");
    EXPECT_NE(WhyRefused(WithProperties(outside + "<a xmlns=''>2</a></t:p>")).find("without a namespace"),
              std::string::npos);
    EXPECT_NE(WhyRefused(WithProperties("<a xmlns='urn:test#'>1</a><a>2</a>")).find("without a namespace"),
              std::string::npos);
    EXPECT_FALSE(WhyRefused(WithProperties("<a xmlns='urn:test#' b='1'/>")).empty());
}

TEST(XmpNamespaces, TwoPrefixesOfOneNamespaceAreOneAndGiveAnAttributeOnlyOnce) {
    const std::string alias = "xmlns:u='urn:test#'";
    const Packet packet =
        Read(WithRDF("<rdf:Description t:a='1' u:b='2'><u:c>3</u:c></rdf:Description>", alias));
    EXPECT_EQ(packet, Read(WithProperties("<t:a>1</t:a><t:b>2</t:b><t:c>3</t:c>")));
    EXPECT_EQ(WhyRefused(WithRDF("<rdf:Description t:a='1' u:a='1'/>", alias)),
              "line 1, column 106: duplicate attribute");
}

TEST(XmpNamespaces, WhatIsAgainstTheRulesIsRefusedWhereItStands) {
    const std::string start =
        "<rdf:RDF xmlns:rdf='http://www.w3.org/1999/02/22-rdf-syntax-ns#' xmlns:longer='urn:test#'>";
    const std::pair<const char*, const char*> refused[] = {
        {"<rdf:Description><p:a>1</p:a></rdf:Description>", "line 2, column 18: unbound prefix"},
        {"<rdf:Description p:a='1'/>", "line 2, column 1: unbound prefix"},
        {"<rdf:Description xmlns:p='u:'/><p:Description/>", "line 2, column 32: unbound prefix"},
        {"<rdf:Description xmlns:p=''/>", "line 2, column 1: must not undeclare prefix"},
        {"<rdf:Description xmlns:xmlns='urn:a'/>",
         "line 2, column 1: reserved prefix (xmlns) must not be declared or undeclared"},
        {"<rdf:Description xmlns:xml='urn:a'/>",
         "line 2, column 1: reserved prefix (xml) must not be undeclared or bound to another namespace name"},
        {"<rdf:Description xmlns:p='http://www.w3.org/XML/1998/namespace'/>",
         "line 2, column 1: prefix must not be bound to one of the reserved namespace names"},
        {"<rdf:Description xmlns:p='urn: a'/>", "line 2, column 1: syntax error"},
        {"<rdf:Description longer:a:b='1'/>", "line 2, column 26: not well-formed (invalid token)"},
        {"<rdf:Description longer:1='1'/>", "line 2, column 25: not well-formed (invalid token)"},
        {"<rdf:Description :a='1'/>", "line 2, column 18: not well-formed (invalid token)"},
        {"<rdf:Description xmlns:='1'/>", "line 2, column 24: not well-formed (invalid token)"},
        {"<rdf:Description:a/>", "line 2, column 17: not well-formed (invalid token)"},
        {"<longer:\xC2\xB7/>", "line 2, column 9: not well-formed (invalid token)"},
        {"<?a:b c?>", "line 2, column 4: not well-formed (invalid token)"},
    };
    for (const auto& [text, reason] : refused) {
        EXPECT_EQ(WhyRefused(start + "\n" + text + "</rdf:RDF>"), reason) << text;
    }
}

TEST(XmpNamespaces, RareNamesAndManyDeclarationsAreReadAsWell) {
    const std::string rare =
        "<t:\xC3\xA9>1</t:\xC3\xA9><t:a xmlns:xml='http://www.w3.org/XML/1998/namespace'>2</t:a>";
    const Packet packet = Read(WithProperties(rare));
    EXPECT_EQ(packet.Property(N("\xC3\xA9")).Value(), "1");
    EXPECT_EQ(packet.Property(N("a")).Value(), "2");
    std::string declarations;
    for (int number = 0; number < 2000; ++number) {
        declarations += "xmlns:n" + std::to_string(number) + "='urn:" + std::to_string(number) + "' ";
    }
    const Packet many = Read(WithRDF("<rdf:Description n1999:a='1'/>", declarations));
    EXPECT_EQ(many.Property(Name("urn:1999", "a")).Value(), "1");
    EXPECT_EQ(many.prefixes.size(), 2002u);
}

}  // namespace OrvaneXMP
