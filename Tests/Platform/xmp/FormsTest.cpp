// Every form in which RDF lets a value be written becomes the node that it stands for.
#include "XmpTest.h"

namespace OrvaneXMP {

namespace {

struct FormCase {
    const char* name;
    Node value;
    std::vector<std::string> forms;
};

const Node kPoint = Node::Structure({{N("x"), Node::Text("1")}, {N("y"), Node::Text("2")}});

Node Typed(const Node& inNode) {
    return inNode.WithField(TypeName(), Node::URI("urn:test#Point"));
}

Node Qualified(const Node& inNode) {
    return inNode.WithQualifiers({{N("q"), Node::Text("w")}});
}

std::vector<FormCase> Cases() {
    return {
        {"text",
         Node::Text("a<b&c"),
         {"<t:p>a&lt;b&amp;c</t:p>", "<t:p>a<!--no-->&#60;b<![CDATA[&]]>c</t:p>"}},
        {"white space and an empty text stay", Node::Text(" \n "), {"<t:p> \n </t:p>", "<t:p> &#xA; </t:p>"}},
        {"empty text", Node::Text(""), {"<t:p/>", "<t:p></t:p>"}},
        {"data type",
         Node::Text("1").WithQualifiers({{DatatypeName(), Node::Text("urn:int")}}),
         {"<t:p rdf:datatype='urn:int'>1</t:p>"}},
        {"URI", Node::URI("urn:u"), {"<t:p rdf:resource='urn:u'/>", "<t:p resource='urn:u'></t:p>"}},
        {"structure",
         kPoint,
         {"<t:p rdf:parseType='Resource'><t:x>1</t:x> <t:y>2</t:y></t:p>", "<t:p t:y='2' t:x='1'/>",
          "<t:p> <rdf:Description><t:y>2</t:y><t:x>1</t:x></rdf:Description> </t:p>",
          "<t:p><rdf:Description t:x='1'><t:y>2</t:y></rdf:Description></t:p>",
          "<t:p><rdf:Description t:x='1' t:y='2' rdf:nodeID='n'/></t:p>"}},
        {"empty structure",
         Node::Structure({}),
         {"<t:p rdf:parseType='Resource'/>", "<t:p><rdf:Description/></t:p>"}},
        {"typed node",
         Typed(kPoint),
         {"<t:p><t:Point t:x='1' t:y='2'/></t:p>", "<t:p t:x='1' t:y='2' rdf:type='urn:test#Point'/>",
          "<t:p rdf:parseType='Resource'><rdf:type rdf:resource='urn:test#Point'/><t:x>1</t:x><t:y>2</t:y></"
          "t:p>"}},
        {"arrays",
         Node::Structure({{N("a"), Node::Array(Kind::Unordered, {Node::Text("1"), Node::Text("2")})},
                          {N("b"), Node::Array(Kind::Ordered, {Node::Text("1"), kPoint})},
                          {N("c"), Node::Array(Kind::Alternative, {})}}),
         {"<t:p rdf:parseType='Resource'><t:a><rdf:Bag><rdf:li>2</rdf:li><rdf:li>1</rdf:li></rdf:Bag></t:a>"
          "<t:b><rdf:Seq><rdf:li>1</rdf:li><rdf:li t:x='1' t:y='2'/></rdf:Seq></t:b><t:c><rdf:Alt/></t:c></"
          "t:p>"}},
        {"languages",
         Node::Array(Kind::Alternative,
                     {Lang(Node::Text("hello"), "x-default"), Lang(Node::Text("hallo"), "de")}),
         {"<t:p><rdf:Alt><rdf:li xml:lang='x-default'>hello</rdf:li><rdf:li xml:lang='de'>hallo</rdf:li>"
          "</rdf:Alt></t:p>"}},
        {"qualified text",
         Qualified(Node::Text("v")),
         {"<t:p rdf:parseType='Resource'><t:q>w</t:q><rdf:value>v</rdf:value></t:p>",
          "<t:p rdf:value='v' t:q='w'/>", "<t:p><rdf:Description rdf:value='v' t:q='w'/></t:p>"}},
        {"qualified URI",
         Qualified(Node::URI("urn:u")),
         {"<t:p rdf:resource='urn:u' t:q='w'/>",
          "<t:p rdf:parseType='Resource'><rdf:value rdf:resource='urn:u'/><t:q>w</t:q></t:p>"}},
        {"qualified structure with a language",
         Lang(Qualified(kPoint), "en"),
         {"<t:p rdf:parseType='Resource'><rdf:value xml:lang='en' t:x='1' t:y='2'/><t:q>w</t:q></t:p>"}},
        {"an outer language holds for the qualifiers",
         Lang(Node::Text("v").WithQualifiers({{N("q"), Lang(Node::Text("w"), "en")}}), "en"),
         {"<t:p xml:lang='en' rdf:parseType='Resource'><rdf:value>v</rdf:value><t:q>w</t:q></t:p>",
          "<t:p xml:lang='en' rdf:value='v' t:q='w'/>",
          "<t:p xml:lang='de'><rdf:Description xml:lang='en' rdf:value='v' t:q='w'/></t:p>"}},
    };
}

}  // namespace

TEST(XmpForms, EachSpellingIsTheSameNode) {
    for (const FormCase& each : Cases()) {
        for (const std::string& form : each.forms) {
            SCOPED_TRACE(std::string(each.name) + ": " + form);
            EXPECT_EQ(Read(WithProperties(form)).Property(N("p")), each.value);
        }
    }
}

TEST(XmpForms, SubjectsOfOneResourceAreOne) {
    const Packet packet =
        Read(WithRDF("<rdf:Description about='urn:me' t:a='1'/><rdf:Description rdf:about=''><t:b>2</t:b>"
                     "<t:a>1</t:a></rdf:Description><t:Clip rdf:about='urn:me'/>"));
    EXPECT_EQ(packet.about, "urn:me");
    EXPECT_EQ(packet.properties, Node::Structure({{N("a"), Node::Text("1")},
                                                  {N("b"), Node::Text("2")},
                                                  {TypeName(), Node::URI("urn:test#Clip")}}));
}

TEST(XmpForms, TheLanguageOfAWrapperHoldsForEachPropertyWithoutItsOwn) {
    const Packet packet =
        Read("<x:xmpmeta xmlns:x='adobe:ns:meta/' xml:lang='fr'>" +
             WithRDF("<rdf:Description t:a='1'><t:b xml:lang='de'>2</t:b><t:c rdf:resource='urn:u'/>"
                     "</rdf:Description><rdf:Description xml:lang='en'><t:d>4</t:d></rdf:Description>") +
             "</x:xmpmeta>");
    EXPECT_EQ(packet.Property(N("a")), Lang(Node::Text("1"), "fr"));
    EXPECT_EQ(packet.Property(N("b")), Lang(Node::Text("2"), "de"));
    EXPECT_EQ(packet.Property(N("c")), Node::URI("urn:u"));
    EXPECT_EQ(packet.Property(N("d")), Lang(Node::Text("4"), "en"));
}

TEST(XmpForms, NumberedItemsStandInTheOrderOfTheirNumbers) {
    const Node items = Read(WithProperties("<t:p><rdf:Seq rdf:_4='d'><rdf:_2>b</rdf:_2><rdf:li>a</rdf:li>"
                                           "<rdf:_10>j</rdf:_10></rdf:Seq></t:p>"))
                           .Property(N("p"));
    EXPECT_EQ(items, Node::Array(Kind::Ordered,
                                 {Node::Text("a"), Node::Text("b"), Node::Text("d"), Node::Text("j")}));
}

TEST(XmpForms, WhatTheModelCannotHoldIsRefusedWithItsPlace) {
    const char* const refused[] = {
        "<t:p rdf:parseType='Literal'><b/></t:p>",
        "<t:p rdf:parseType='Collection'/>",
        "<t:p rdf:nodeID='n'/>",
        "<t:p rdf:ID='n'>x</t:p>",
        "<t:p><rdf:Description rdf:about='urn:other'/></t:p>",
        "<t:p>text<rdf:Description/></t:p>",
        "<t:p><rdf:Description/>text</t:p>",
        "<t:p><rdf:Bag/><rdf:Bag/></t:p>",
        "<t:p rdf:resource='urn:u' rdf:value='v'/>",
        "<t:p rdf:resource='urn:u'>text</t:p>",
        "<t:p rdf:parseType='Resource' t:q='w'/>",
        "<t:p rdf:datatype='urn:int' t:q='w'/>",
        "<t:p plain='1'/>",
        "<t:p xml:base='urn:u'/>",
        "<t:p rdf:bagID='n'/>",
        "<p>1</p>",
        "<t:p>1</t:p><t:p>2</t:p>",
        "<rdf:value>1</rdf:value>",
        "<rdf:li>1</rdf:li>",
        "<t:p><rdf:Seq><t:q>1</t:q></rdf:Seq></t:p>",
        "<t:p><rdf:Seq t:q='1'/></t:p>",
        "<t:p><rdf:Seq><rdf:_2>1</rdf:_2><rdf:_2>1</rdf:_2></rdf:Seq></t:p>",
        "text",
    };
    for (const char* properties : refused) {
        SCOPED_TRACE(properties);
        EXPECT_EQ(WhyRefused(WithProperties("\n" + std::string(properties))).find("line 2, column"), 0u);
    }
    EXPECT_NE(WhyRefused(WithRDF("<rdf:Description rdf:about='urn:a'/><rdf:Description rdf:about='urn:b'/>"))
                  .find("two resources"),
              std::string::npos);
    EXPECT_NE(WhyRefused("<x:xmpmeta xmlns:x='adobe:ns:meta/'/>").find("no rdf:RDF"), std::string::npos);
}

TEST(XmpForms, ForeignPrefixesAreKeptWhereTheyAreFree) {
    Packet packet = Read(WithProperties("<t:a>1</t:a><u:b xmlns:u='urn:u#'>2</u:b><t:c xmlns:t='urn:t#'/>"));
    const std::string text = WritePacket(packet);
    EXPECT_NE(text.find("xmlns:u=\"urn:u#\""), std::string::npos) << text;
    // Two namespaces had t: the first by URI has it now.
    EXPECT_NE(text.find("xmlns:t=\"urn:t#\""), std::string::npos) << text;
    EXPECT_NE(text.find("xmlns:ns1=\"urn:test#\""), std::string::npos) << text;
    EXPECT_EQ(Read(text), packet);
    EXPECT_EQ(WritePacket(Read(text)), text);
}

}  // namespace OrvaneXMP
