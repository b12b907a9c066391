// Equality, sharing and paths of trees.
#include "OrvaneXMP/Path.h"
#include "XmpTest.h"

namespace OrvaneXMP {

namespace {

Node Texts(Kind inKind, std::initializer_list<const char*> inTexts) {
    std::vector<Node> items;
    for (const char* text : inTexts) {
        items.push_back(Node::Text(text));
    }
    return Node::Array(inKind, items);
}

}  // namespace

TEST(XmpTree, EqualityIsThatOfTheDataModel) {
    const auto expect = [](bool inIsEqual, const Node& inLeft, const Node& inRight) {
        EXPECT_EQ(inLeft == inRight, inIsEqual);
        EXPECT_EQ(inRight == inLeft, inIsEqual);
        if (inIsEqual) {
            EXPECT_EQ(inLeft.Hash(), inRight.Hash());
        }
    };
    expect(true, Texts(Kind::Unordered, {"a", "b", "a"}), Texts(Kind::Unordered, {"a", "a", "b"}));
    expect(false, Texts(Kind::Unordered, {"a", "b", "a"}), Texts(Kind::Unordered, {"b", "a", "b"}));
    expect(false, Texts(Kind::Ordered, {"a", "b"}), Texts(Kind::Ordered, {"b", "a"}));
    expect(false, Texts(Kind::Alternative, {"a", "b"}), Texts(Kind::Alternative, {"b", "a"}));
    expect(false, Texts(Kind::Ordered, {"a"}), Texts(Kind::Unordered, {"a"}));
    expect(false, Node::Text("a"), Node::URI("a"));
    expect(false, Node(), Node::Text(""));
    expect(false, Node::Text("a"), Lang(Node::Text("a"), "en"));

    const Node general = Lang(Node::Text("colour"), "x-default");
    const Node british = Lang(Node::Text("colour"), "en-GB");
    const Node american = Lang(Node::Text("color"), "en-US");
    const auto alternative = [](std::vector<Node> inItems) {
        return Node::Array(Kind::Alternative, inItems);
    };
    expect(true, alternative({general, british, american}), alternative({american, general, british}));
    expect(false, alternative({british, american}), alternative({american, british}));
    expect(false, alternative({general, british}), alternative({general, american}));

    // Bags in bags, with the same items in another order at each level.
    const Node inner = Texts(Kind::Unordered, {"1", "2"});
    const Node turned = Texts(Kind::Unordered, {"2", "1"});
    expect(true, Node::Array(Kind::Unordered, {inner, Node::Text("x")}),
           Node::Array(Kind::Unordered, {Node::Text("x"), turned}));
}

TEST(XmpTree, WhatNoPacketCanHoldIsNotMade) {
    EXPECT_THROW(Name("", "a"), std::invalid_argument);
    EXPECT_THROW(Name("urn:a b", "a"), std::invalid_argument);
    EXPECT_THROW(Name("http://www.w3.org/2000/xmlns/", "a"), std::invalid_argument);
    for (const char* local : {"", "1a", "a:b", "a b", "a>", "\xC3\x97", "\xFF", "a/"}) {
        EXPECT_THROW(Name("urn:a", local), std::invalid_argument) << local;
    }
    EXPECT_EQ(Name("urn:a", "\xC3\xA9t\xC3\xA9").LocalName(), "\xC3\xA9t\xC3\xA9");
    const Node one = Node::Text("1");
    EXPECT_THROW(Node::Structure({{N("a"), one}, {N("a"), one}}), std::invalid_argument);
    EXPECT_THROW(Node::Structure({{N("a"), Node()}}), std::invalid_argument);
    EXPECT_THROW(Node::Structure({{Name(kNamespace_RDF, "value"), one}}), std::invalid_argument);
    EXPECT_THROW(Node::Structure({{LanguageName(), one}}), std::invalid_argument);
    EXPECT_THROW(Node::Array(Kind::Structure, {}), std::invalid_argument);
    EXPECT_THROW(one.WithQualifier(LanguageName(), Node::URI("en")), std::invalid_argument);
    EXPECT_THROW(Node::URI("u").WithQualifier(DatatypeName(), one), std::invalid_argument);
    EXPECT_THROW(one.WithField(N("a"), one), std::invalid_argument);
    Packet packet;
    packet.properties = one;
    EXPECT_THROW(WritePacket(packet), std::invalid_argument);
    packet.properties = Node::Structure({{N("a"), Node::Text(std::string(kMaximumPacketSize, 'a'))}});
    EXPECT_THROW(WritePacket(packet), std::length_error);
}

TEST(XmpTree, AChangeSharesWhatItDoesNotTouch) {
    const Node history = Texts(Kind::Ordered, {"a", "b"}).WithQualifier(N("q"), Node::Text("w"));
    const Node root = Node::Structure({{N("history"), history}, {N("other"), Texts(Kind::Ordered, {"x"})}});
    const Path second{PathStep::ToField(N("history")), PathStep::ToItem(1)};

    const Node changed = Replace(root, second, Node::Text("B"));
    EXPECT_EQ(Find(changed, second), Node::Text("B"));
    EXPECT_EQ(Find(root, second), Node::Text("b"));
    EXPECT_TRUE(changed.FieldNamed(N("other")).IsSameAs(root.FieldNamed(N("other"))));
    EXPECT_EQ(changed.FieldNamed(N("history")).QualifierNamed(N("q")), Node::Text("w"));

    EXPECT_EQ(Replace(changed, second, Node::Text("b")), root);
    EXPECT_EQ(Find(Replace(root, second, Node()), {PathStep::ToField(N("history"))}).Items().size(), 1u);
    const Path third{PathStep::ToField(N("history")), PathStep::ToItem(2)};
    EXPECT_EQ(Find(Replace(root, third, Node::Text("c")), third), Node::Text("c"));
    EXPECT_FALSE(Find(root, third).IsPresent());
    EXPECT_THROW(Replace(root, third, Node()), std::invalid_argument);
    EXPECT_THROW(Replace(root, {PathStep::ToField(N("no")), PathStep::ToItem(0)}, Node::Text("c")),
                 std::invalid_argument);
    EXPECT_EQ(Replace(root, {}, Node::Text("c")), Node::Text("c"));
}

TEST(XmpTree, PathsReadAsPeopleWriteThem) {
    Packet packet;
    packet.prefixes = {{"urn:test#", "t"}};
    const Path path{PathStep::ToField(Name(kNamespace_XMPMM, "History")), PathStep::ToItem(0),
                    PathStep::ToField(N("p")), PathStep::ToQualifier(LanguageName())};
    EXPECT_EQ(PathText(path, packet), "xmpMM:History[1]/t:p/?xml:lang");
    EXPECT_EQ(PathText({PathStep::ToField(N("p"))}, Packet()), "{urn:test#}p");
}

}  // namespace OrvaneXMP
