// The table of the merge, row by row, for each kind of node.
#include "MergeTest.h"

namespace OrvaneXMPCompareAndMerge {

namespace {

const std::string kNone;
const std::string kText = "<t:p>a</t:p>";
const std::string kOtherText = "<t:p>b</t:p>";
const std::string kThirdText = "<t:p>c</t:p>";

std::string Array(const char* inKind, std::initializer_list<const char*> inItems) {
    std::string text = std::string("<t:p><rdf:") + inKind + ">";
    for (const char* const item : inItems) {
        text += std::string("<rdf:li>") + item + "</rdf:li>";
    }
    return text + "</rdf:" + inKind + "></t:p>";
}

std::string Bag(std::initializer_list<const char*> inItems) {
    return Array("Bag", inItems);
}

/// Pairs of language and text.
std::string Spoken(std::initializer_list<std::pair<const char*, const char*>> inItems) {
    std::string text = "<t:p><rdf:Alt>";
    for (const auto& [language, item] : inItems) {
        text += std::string("<rdf:li xml:lang='") + language + "'>" + item + "</rdf:li>";
    }
    return text + "</rdf:Alt></t:p>";
}

std::string Structure(const std::string& inFields) {
    return "<t:p rdf:parseType='Resource'>" + inFields + "</t:p>";
}

struct Case {
    const char* what;
    std::string base;
    std::string latest;
    std::string user;
    std::string merged;
    /// "path reason"
    std::multiset<std::string> conflicts;
};

void Expect(const std::vector<Case>& inCases) {
    for (const Case& each : inCases) {
        SCOPED_TRACE(each.what);
        const Packet base = Read(WithProperties(each.base));
        const Packet latest = Read(WithProperties(each.latest));
        const Packet user = Read(WithProperties(each.user));
        const ResultRef result = Merge(base, latest, user);
        EXPECT_EQ(result->GetMergedPacket(), Read(WithProperties(each.merged)))
            << WritePacket(result->GetMergedPacket());
        EXPECT_EQ(ConflictsOf(*result), each.conflicts);
    }
}

}  // namespace

TEST(XmpMergeTable, OneSideOrBothAlikeOfEveryKind) {
    const std::string ordered = Array("Seq", {"a", "b"});
    const std::vector<std::pair<std::string, std::string>> changes = {
        {kNone, kText},
        {kText, kNone},
        {kText, kOtherText},
        {kText, "<t:p rdf:resource='a'/>"},
        {kText, "<t:p xml:lang='de'>a</t:p>"},
        {kText, Structure("<t:a>1</t:a>")},
        {Structure("<t:a>1</t:a>"), Structure("<t:a>2</t:a><t:b>3</t:b>")},
        {Structure("<t:a>1</t:a>"), Structure("")},
        {ordered, Array("Seq", {"b", "a"})},
        {Array("Alt", {"a", "b"}), Array("Alt", {"b", "a"})},
        {Bag({"a", "b", "b"}), Bag({"b", "a"})},
        {Bag({}), kNone},
        {Spoken({{"x-default", "a"}, {"de", "b"}}), Spoken({{"x-default", "a"}})},
        {Spoken({{"x-default", "a"}}), Spoken({{"x-default", "b"}, {"fr", "c"}})}};
    for (const auto& [before, after] : changes) {
        Expect({{"only the user", before, before, after, after, {}},
                {"only the others", before, after, before, after, {}},
                {"both alike", before, after, after, after, {}}});
    }
}

TEST(XmpMergeTable, ContradictionsOfEveryKind) {
    const std::string one = Structure("<t:a>1</t:a>");
    Expect({{"simple", kText, kOtherText, kThirdText, kThirdText, {"t:p 1"}},
            {"added twice", kNone, kOtherText, kThirdText, kThirdText, {"t:p 1"}},
            {"text and URI are both simple",
             kText,
             kOtherText,
             "<t:p rdf:resource='b'/>",
             "<t:p rdf:resource='b'/>",
             {"t:p 1"}},
            {"a value and its qualifiers are one",
             kText,
             kOtherText,
             "<t:p xml:lang='de'>a</t:p>",
             "<t:p xml:lang='de'>a</t:p>",
             {"t:p 1"}},
            {"other kinds", kText, one, Bag({"a"}), Bag({"a"}), {"t:p 2"}},
            {"a language alternative is another kind than an alternative",
             kNone,
             Array("Alt", {"a"}),
             Spoken({{"x-default", "a"}}),
             Spoken({{"x-default", "a"}}),
             {"t:p 2"}},
            {"removed by the user", one, Structure("<t:a>2</t:a>"), kNone, kNone, {"t:p 3"}},
            {"removed by the others",
             one,
             kNone,
             Structure("<t:a>2</t:a>"),
             Structure("<t:a>2</t:a>"),
             {"t:p 4"}},
            {"ordered",
             Array("Seq", {"a"}),
             Array("Seq", {"a", "b"}),
             Array("Seq", {"a", "c"}),
             Array("Seq", {"a", "c"}),
             {"t:p 1"}},
            {"alternative",
             Array("Alt", {"a"}),
             Array("Alt", {"a", "b"}),
             Array("Alt", {"a", "c"}),
             Array("Alt", {"a", "c"}),
             {"t:p 1"}},
            {"structures of a base that was none",
             kText,
             one,
             Structure("<t:b>1</t:b>"),
             Structure("<t:b>1</t:b>"),
             {"t:p 1"}}});
    const std::string structures = "<t:p><rdf:Bag><rdf:li t:a='1'/><rdf:li>x</rdf:li></rdf:Bag></t:p>";
    Expect(
        {{"an array with one structure", Bag({}), structures, Bag({"y"}), Bag({"y"}), {"t:p 1"}},
         {"simple on both sides, not in base", structures, Bag({"x"}), Bag({"y"}), Bag({"y"}), {"t:p 1"}}});
}

TEST(XmpMergeTable, StructuresAreTakenApartFieldByField) {
    const std::string base = Structure("<t:a>1</t:a><t:b>1</t:b><t:c>1</t:c><t:d>1</t:d>");
    Expect({{"each field its own",
             base,
             Structure("<t:a>2</t:a><t:b>1</t:b><t:d>1</t:d><t:e>1</t:e>"),
             Structure("<t:a>1</t:a><t:b>2</t:b><t:c>1</t:c><t:f>1</t:f>"),
             Structure("<t:a>2</t:a><t:b>2</t:b><t:e>1</t:e><t:f>1</t:f>"),
             {}},
            {"conflicts in fields",
             base,
             Structure("<t:a>2</t:a><t:b>2</t:b><t:c>1</t:c>"),
             Structure("<t:a>3</t:a><t:c>1</t:c><t:d>2</t:d>"),
             Structure("<t:a>3</t:a><t:c>1</t:c><t:d>2</t:d>"),
             {"t:p/t:a 1", "t:p/t:b 3", "t:p/t:d 4"}},
            {"without a base",
             kNone,
             Structure("<t:a>1</t:a><t:b>1</t:b>"),
             Structure("<t:b>2</t:b><t:c>1</t:c>"),
             Structure("<t:a>1</t:a><t:b>2</t:b><t:c>1</t:c>"),
             {"t:p/t:b 1"}},
            {"all fields gone",
             Structure("<t:a>1</t:a><t:b>1</t:b>"),
             Structure("<t:a>1</t:a>"),
             Structure("<t:b>1</t:b>"),
             Structure(""),
             {}}});
    const auto nested = [](const char* inA, const char* inB) {
        return Structure(std::string("<t:s rdf:parseType='Resource'><t:a>") + inA + "</t:a><t:b>" + inB +
                         "</t:b></t:s>");
    };
    Expect({{"structures in structures",
             nested("1", "1"),
             nested("2", "1"),
             nested("1", "2"),
             nested("2", "2"),
             {}},
            {"and conflicts there",
             nested("1", "1"),
             nested("2", "1"),
             nested("3", "2"),
             nested("3", "2"),
             {"t:p/t:s/t:a 1"}}});
    const auto qualified = [](const char* inField, const char* inQualifier) {
        return std::string("<t:p><rdf:Description><rdf:value t:a='") + inField + "'/><t:q>" + inQualifier +
               "</t:q></rdf:Description></t:p>";
    };
    Expect({{"qualifiers of a structure",
             qualified("1", "1"),
             qualified("2", "1"),
             qualified("1", "2"),
             qualified("2", "2"),
             {}},
            {"conflicts in qualifiers",
             qualified("1", "1"),
             qualified("2", "2"),
             qualified("1", "3"),
             qualified("2", "3"),
             {"t:p/?t:q 1"}}});
}

TEST(XmpMergeTable, LanguageAlternativesAreTakenApartLanguageByLanguage) {
    const std::string base = Spoken({{"x-default", "a"}, {"de", "a"}, {"fr", "a"}});
    Expect({{"each its own",
             base,
             Spoken({{"x-default", "b"}, {"de", "a"}, {"it", "n"}}),
             Spoken({{"de", "b"}, {"x-default", "a"}, {"fr", "a"}}),
             Spoken({{"x-default", "b"}, {"de", "b"}, {"it", "n"}}),
             {}},
            {"conflicts",
             base,
             Spoken({{"x-default", "b"}, {"de", "b"}}),
             Spoken({{"x-default", "c"}, {"de", "a"}, {"fr", "b"}}),
             Spoken({{"x-default", "c"}, {"de", "b"}, {"fr", "b"}}),
             {"t:p[?xml:lang=\"x-default\"] 1", "t:p[?xml:lang=\"fr\"] 4"}},
            {"without a base",
             kNone,
             Spoken({{"x-default", "a"}, {"de", "b"}}),
             Spoken({{"x-default", "a"}, {"fr", "c"}}),
             Spoken({{"x-default", "a"}, {"de", "b"}, {"fr", "c"}}),
             {}}});
    // The order says nothing to a machine, but people see it.
    const ResultRef result =
        Merge(Read(WithProperties(kNone)),
              Read(WithProperties(Spoken({{"x-default", "a"}, {"fr", "b"}, {"de", "c"}}))),
              Read(WithProperties(Spoken({{"it", "d"}, {"x-default", "a"}, {"cs", "e"}}))));
    std::string order;
    for (const Node& item : result->GetMergedPacket().Property(N("p")).Items()) {
        order += std::string(item.QualifierNamed(LanguageName()).Value()) + " ";
    }
    EXPECT_EQ(order, "x-default fr de it cs ");
}

TEST(XmpMergeTable, UnorderedArraysOfSimpleItemsAreMergedByCounts) {
    Expect({{"both add", Bag({"a"}), Bag({"a", "b"}), Bag({"c", "a"}), Bag({"a", "b", "c"}), {}},
            {"both add the same", Bag({}), Bag({"b", "b", "x"}), Bag({"b"}), Bag({"b", "b", "x"}), {}},
            {"both remove", Bag({"a", "b", "c"}), Bag({"b", "c"}), Bag({"a", "c"}), Bag({"c"}), {}},
            {"both remove the same, one more of them",
             Bag({"a", "a", "a", "b"}),
             Bag({"a", "b"}),
             Bag({"b"}),
             Bag({"b"}),
             {}},
            {"one adds, one removes",
             Bag({"a", "a"}),
             Bag({"a", "a", "a"}),
             Bag({"a"}),
             Bag({"a", "a", "a"}),
             {}},
            {"one removes, one adds",
             Bag({"a", "a"}),
             Bag({"a"}),
             Bag({"a", "a", "a"}),
             Bag({"a", "a", "a"}),
             {}},
            {"without a base", kNone, Bag({"a", "b"}), Bag({"b", "c"}), Bag({"a", "b", "c"}), {}}});
    const auto spoken = [](const char* inLanguage) {
        return std::string("<t:p><rdf:Bag><rdf:li xml:lang='") + inLanguage + "'>a</rdf:li></rdf:Bag></t:p>";
    };
    Expect({{"qualifiers tell items apart",
             Bag({}),
             spoken("de"),
             spoken("fr"),
             "<t:p><rdf:Bag><rdf:li xml:lang='fr'>a</rdf:li><rdf:li xml:lang='de'>a</rdf:li></rdf:Bag></t:p>",
             {}}});
    const ResultRef result =
        Merge(Read(WithProperties(Bag({"x", "a", "y"}))), Read(WithProperties(Bag({"n", "y", "a", "x"}))),
              Read(WithProperties(Bag({"m", "x", "k", "y"}))));
    std::string order;
    for (const Node& item : result->GetMergedPacket().Property(N("p")).Items()) {
        order += item.Value();
    }
    EXPECT_EQ(order, "nyxmk");
}

TEST(XmpMergeTable, WhatIsDescribedIsMergedLikeAProperty) {
    const auto about = [](const char* inURI) {
        Packet packet = Read(WithProperties(kText));
        packet.about = inURI;
        return packet;
    };
    EXPECT_EQ(Merge(about(""), about("urn:x"), about(""))->GetMergedPacket().about, "urn:x");
    EXPECT_EQ(Merge(about("urn:x"), about("urn:x"), about(""))->GetMergedPacket().about, "");
    const auto never = ToldStrategy::Make("never", "rdf:about", nullptr);
    const ResultRef result = Merge(about("urn:x"), about("urn:y"), about("urn:z"), {never});
    EXPECT_EQ(result->GetMergedPacket().about, "urn:z");
    EXPECT_EQ(ConflictsOf(*result), std::multiset<std::string>{"rdf:about 1"});
    EXPECT_TRUE(never->asked.empty());
}

TEST(XmpMergeTable, UnchangedPartsAreShared) {
    const Packet base = Read(WithProperties("<t:q>q</t:q>" + Structure("<t:a>1</t:a><t:b>1</t:b>")));
    const Packet latest = Read(WithProperties("<t:q>q</t:q>" + Structure("<t:a>2</t:a><t:b>1</t:b>")));
    const Packet user = Read(WithProperties("<t:q>r</t:q>" + Structure("<t:a>1</t:a><t:b>1</t:b>")));
    const ResultRef result = Merge(base, latest, user);
    const Packet& merged = result->GetMergedPacket();
    EXPECT_TRUE(merged.Property(N("p")).IsSameAs(latest.Property(N("p"))));
    EXPECT_TRUE(merged.Property(N("q")).IsSameAs(user.Property(N("q"))));
    EXPECT_TRUE(Merge(base, latest, base)->GetMergedPacket().properties.IsSameAs(latest.properties));
}

/// Would take minutes if it were quadratic in the items or the fields, or in the depth.
TEST(XmpMergeTable, WideAndDeepTreesAreMergedInTheirSize) {
    constexpr int kWide = 10000;
    const auto wide = [](int inChanged, const std::string& inMark = "-") {
        std::vector<Field> fields;
        std::vector<Node> items;
        for (int at = 0; at < kWide; ++at) {
            const std::string value = (at % 5 == inChanged ? inMark : "") + std::to_string(at);
            fields.push_back({N("f" + std::to_string(at)), Node::Text(value)});
            items.push_back(Node::Text(value));
        }
        Node structure = Node::Structure(std::move(fields));
        for (std::size_t depth = 0; depth < kMaximumDepth - 4; ++depth) {
            structure = Node::Structure({{N("s"), structure}});
        }
        Packet packet;
        packet.properties =
            Node::Structure({{N("p"), structure}, {N("q"), Node::Array(Kind::Unordered, std::move(items))}});
        return packet;
    };
    const ResultRef result = Merge(wide(-1), wide(1), wide(2));
    EXPECT_TRUE(result->GetUnResolvedConflicts().empty());
    EXPECT_EQ(result->GetMergedPacket().Property(N("q")).Items().size(), kWide * 1u);
    const ResultRef contradicting = Merge(wide(-1), wide(1), wide(1, "+"));
    ASSERT_EQ(contradicting->GetUnResolvedConflicts().size(), kWide / 5u);
    EXPECT_EQ(contradicting->GetUnResolvedConflicts()[0]->GetPath().size(), kMaximumDepth - 2);
    EXPECT_EQ(contradicting->GetMergedPacket().Property(N("q")).Items().size(), kWide / 5u * 6u);
}

}  // namespace OrvaneXMPCompareAndMerge
