// Who decides a conflict, what may go wrong with that, and what the result tells of it all.
#include <gmock/gmock.h>

#include <algorithm>
#include <stdexcept>

#include "MergeTest.h"
#include "OrvaneXMPCompareAndMerge/Differences.h"
#include "OrvaneXMPCompareAndMerge/Report.h"
#include "ostcore/serialization/JSON.h"

namespace OrvaneXMPCompareAndMerge {

using testing::ElementsAre;
using testing::ElementsAreArray;

namespace {

const std::string kBase =
    "<t:a>1</t:a><t:b>1</t:b><t:s rdf:parseType='Resource'><t:f>1</t:f></t:s>"
    "<t:x><rdf:Seq><rdf:li>1</rdf:li></rdf:Seq></t:x>";
const std::string kLatest =
    "<t:a>2</t:a><t:s rdf:parseType='Resource'><t:f>2</t:f></t:s>"
    "<t:x><rdf:Seq><rdf:li>2</rdf:li></rdf:Seq></t:x>";
const std::string kUser = "<t:a>3</t:a><t:b>3</t:b><t:s rdf:parseType='Resource'><t:f>3</t:f></t:s>";

ResultRef MergeThem(const std::vector<StrategyPtr>& inStrategies) {
    return Merge(Read(WithProperties(kBase)), Read(WithProperties(kLatest)), Read(WithProperties(kUser)),
                 inStrategies);
}

int TakeLatest(const SideNode&, const SideNode& inLatest, const SideNode&, Node& outNode,
               ResolvedSource& outSource) {
    outNode = inLatest.node;
    outSource = ResolvedSource::Latest;
    return kResolved;
}

int Leave(const SideNode&, const SideNode&, const SideNode&, Node&, ResolvedSource&) {
    return static_cast<int>(ConflictReason::ChangedOnBothSides);
}

ToldStrategy::Resolve Give(const Node& inNode, ResolvedSource inSource = ResolvedSource::New) {
    return [=](const SideNode&, const SideNode&, const SideNode&, Node& outNode, ResolvedSource& outSource) {
        outNode = inNode;
        outSource = inSource;
        return kResolved;
    };
}

/// The text of the error at the only conflict that the strategies were to settle and did not.
std::string ErrorAt(const char* inPath, const ToldStrategy::Resolve& inResolve) {
    const ResultRef result = MergeThem({ToldStrategy::Make("failing", inPath, inResolve)});
    EXPECT_TRUE(result->GetResolvedConflicts().empty());
    std::string text;
    for (const auto& each : result->GetUnResolvedConflicts()) {
        if (const auto error = each->GetError()) {
            EXPECT_EQ(PathOf(each->GetPath()), inPath);
            EXPECT_EQ(error->GetStrategyName(), "failing");
            text += error->GetText();
        }
    }
    EXPECT_EQ(result->GetUnResolvedConflicts().size(), 4u);
    return text;
}

}  // namespace

TEST(XmpMergeStrategies, AreAskedInTheirOrderAndTheFirstInterestedDecidesAlone) {
    const auto first = ToldStrategy::Make("first", "t:a", &TakeLatest);
    const auto leaving = ToldStrategy::Make("leaving", "t:b", &Leave);
    const auto second = ToldStrategy::Make("second", "t:b", &TakeLatest);
    const ResultRef result = MergeThem({first, leaving, second});
    EXPECT_THAT(first->asked, ElementsAre("t:a type 0 reason 1", "t:b type 0 reason 4",
                                          "t:s/t:f type 0 reason 1 inside", "t:x type 1 reason 3"));
    EXPECT_THAT(second->asked, ElementsAre("t:s/t:f type 0 reason 1 inside", "t:x type 1 reason 3"));
    EXPECT_EQ(ConflictsOf(*result), (std::multiset<std::string>{"t:b 4", "t:s/t:f 1", "t:x 3"}));
    EXPECT_EQ(result->GetMergedPacket().Property(N("a")).Value(), "2");
    EXPECT_EQ(result->GetMergedPacket().Property(N("b")).Value(), "3");
    ASSERT_EQ(result->GetResolvedConflicts().size(), 1u);
    const IThreeWayResolvedConflict_v1& resolved = *result->GetResolvedConflicts()[0];
    EXPECT_EQ(PathOf(resolved.GetPath()), "t:a");
    EXPECT_EQ(resolved.GetReason(), ConflictReason::ChangedOnBothSides);
    EXPECT_EQ(resolved.GetNodeType(), NodeType::Simple);
    EXPECT_EQ(resolved.GetResolvedSource(), ResolvedSource::Latest);
    EXPECT_EQ(resolved.GetResolvedStatus(), 0x7FFFFFFE);
    EXPECT_EQ(resolved.GetStrategyName(), "first");
}

TEST(XmpMergeStrategies, SeeTheNodesAndThePacketsOfAllSides) {
    bool wasAsked = false;
    const auto looking =
        ToldStrategy::Make("looking", "t:x",
                           [&](const SideNode& inBase, const SideNode& inLatest, const SideNode& inUser,
                               Node& outNode, ResolvedSource& outSource) {
                               wasAsked = true;
                               EXPECT_EQ(inBase.node.Items()[0].Value(), "1");
                               EXPECT_EQ(inLatest.node.Items()[0].Value(), "2");
                               EXPECT_FALSE(inUser);
                               EXPECT_EQ(inUser.packet.Property(N("a")).Value(), "3");
                               EXPECT_EQ(inBase.packet.Property(N("a")).Value(), "1");
                               outNode = inBase.node;
                               outSource = ResolvedSource::Base;
                               return kResolved;
                           });
    const auto removing = ToldStrategy::Make("removing", "t:a", Give(Node(), ResolvedSource::Latest));
    const ResultRef result = MergeThem({looking, removing});
    EXPECT_TRUE(wasAsked);
    EXPECT_EQ(result->GetMergedPacket().Property(N("x")).Items()[0].Value(), "1");
    EXPECT_FALSE(result->GetMergedPacket().Property(N("a")).IsPresent());
}

TEST(XmpMergeStrategies, AFailureLeavesTheConflictWithTheErrorBesideIt) {
    EXPECT_EQ(ErrorAt("t:a", [](auto&&...) -> int { throw std::runtime_error("Conflict"); }), "Conflict");
    EXPECT_EQ(ErrorAt("t:s/t:f", [](auto&&...) -> int { throw 7; }), "An exception of an unknown type");
    EXPECT_EQ(ErrorAt("t:a", Give(Node::Text("x"), static_cast<ResolvedSource>(5))),
              "The strategy gave a source that there is not");
    Node deep = Node::Text("x");
    while (deep.Height() < kMaximumDepth - 1) {
        deep = Node::Structure({{N("s"), deep}});
    }
    EXPECT_EQ(ErrorAt("t:s/t:f", Give(deep)), "The strategy gave a node that is nested too deep");
    EXPECT_EQ(MergeThem({ToldStrategy::Make("deep", "t:a", Give(deep))})->GetResolvedConflicts().size(), 1u);

    const auto titles = [](const char* inText) {
        return Read(WithProperties(std::string("<t:l><rdf:Alt><rdf:li xml:lang='x-default'>") + inText +
                                   "</rdf:li></rdf:Alt></t:l>"));
    };
    for (const Node& wrong : {Node(), Node::Text("x"), Lang(Node::Text("x"), "de")}) {
        const auto strategy = ToldStrategy::Make("wrong", "t:l[?xml:lang=\"x-default\"]", Give(wrong));
        const ResultRef result = Merge(titles("1"), titles("2"), titles("3"), {strategy});
        ASSERT_EQ(result->GetUnResolvedConflicts().size(), 1u);
        EXPECT_TRUE(result->GetUnResolvedConflicts()[0]->GetError());
        EXPECT_EQ(result->GetMergedPacket(), titles("3"));
    }
}

TEST(XmpMergeLibrary, GivesObjectsBetweenItsStartAndItsEnd) {
    void* object = nullptr;
    EXPECT_EQ(CreateObject(IThreeWayMerge_v1::kInterfaceID, &object), kResultNotStarted);
    EXPECT_FALSE(Create<IThreeWayMerge_v1>());
    StartLibrary();
    StartLibrary();
    EndLibrary();
    const auto engine = Create<IThreeWayMerge_v1>();
    ASSERT_TRUE(engine);
    EXPECT_EQ(CreateObject(IThreeWayMergeResult_v1::kInterfaceID, &object),
              RFL::kResultInterfaceNotSupported);
    EXPECT_THROW(engine->RegisterStrategy(nullptr), std::invalid_argument);
    EndLibrary();
    EndLibrary();
    EXPECT_FALSE(Create<IThreeWayMerge_v1>());
    Packet bad;
    bad.properties = Node::Text("x");
    EXPECT_THROW(engine->Merge(bad, Packet(), Packet()), std::invalid_argument);
    EXPECT_TRUE(engine->Merge(Packet(), Packet(), Packet())->GetDecisions().empty());
}

TEST(XmpMergeReport, TellsEachDecisionAndWhatIsLeft) {
    const auto failing =
        ToldStrategy::Make("failing", "t:s/t:f", [](auto&&...) -> int { throw std::runtime_error("no"); });
    const Packet base = Read(WithProperties(kBase + "<t:c>1</t:c><t:d>1</t:d><t:e>1</t:e>"
                                                    "<t:k><rdf:Bag/></t:k><t:same>1</t:same>"));
    const Packet latest =
        Read(WithProperties(kLatest + "<t:c>2</t:c><t:d>1</t:d><t:e>2</t:e>"
                                      "<t:k><rdf:Bag><rdf:li>m</rdf:li></rdf:Bag></t:k><t:same>1</t:same>"));
    const Packet user =
        Read(WithProperties(kUser + "<t:c>1</t:c><t:e>2</t:e>"
                                    "<t:k><rdf:Bag><rdf:li>n</rdf:li></rdf:Bag></t:k><t:same>1</t:same>"));
    const ResultRef result =
        Merge(base, latest, user, {ToldStrategy::Make("first", "t:a", &TakeLatest), failing});
    const auto report = ostcore::serialization::JSONParse(MergeReport(*result));
    const ostcore::serialization::JSONView view(report);
    EXPECT_EQ(view.Find("schema").AsString(), "xmp-merge");
    EXPECT_EQ(view.Find("version").AsInt64(), 1);
    EXPECT_FALSE(view.Find("isMerged").AsBool());
    EXPECT_EQ(view.Find("conflictCount").AsInt64(), 3);
    EXPECT_FALSE(view.Find("isCut").AsBool());
    std::vector<std::string> decisions;
    view.Find("decisions").ForEachElement([&](ostcore::serialization::JSONView inDecision) {
        const auto text = [&](const char* inKey) { return std::string(inDecision.Find(inKey).AsString()); };
        decisions.push_back(text("path") + " " + text("cause") + " " + text("source") +
                            (inDecision.Find("isGone").AsBool() ? " gone" : ""));
    });
    EXPECT_THAT(decisions,
                ElementsAre("t:a strategy latest", "t:b unresolved user", "t:c only-latest-changed latest",
                            "t:d only-user-changed user gone", "t:e both-sides-same latest",
                            "t:k items-merged new", "t:s/t:f unresolved user", "t:x unresolved user gone"));
    std::vector<std::string> conflicts;
    view.Find("conflicts").ForEachElement([&](ostcore::serialization::JSONView inConflict) {
        conflicts.push_back(ostcore::serialization::GetJSONUTF8String(report.Own(inConflict)));
    });
    EXPECT_THAT(
        conflicts,
        ElementsAre(R"({"path":"t:b","type":"simple","reason":4,"base":"1","latest":null,"user":"3"})",
                    R"({"path":"t:s/t:f","type":"simple","reason":1,"base":"1","latest":"2",)"
                    R"("user":"3","strategy":"failing","error":"no"})",
                    R"({"path":"t:x","type":"array","reason":3,"base":{"ordered":["1"]},)"
                    R"("latest":{"ordered":["2"]},"user":null})"));
}

TEST(XmpDifferences, AreFoundWhereTheyLie) {
    Packet before = Read(WithProperties(
        kBase +
        "<t:k><rdf:Bag><rdf:li>a</rdf:li><rdf:li>b</rdf:li></rdf:Bag></t:k>"
        "<t:l><rdf:Alt><rdf:li xml:lang='x-default'>\"1\"</rdf:li><rdf:li xml:lang='de'>1</rdf:li>"
        "</rdf:Alt></t:l>"));
    Packet after =
        Read(WithProperties(
            kUser + "<t:k><rdf:Bag><rdf:li>b</rdf:li><rdf:li>a</rdf:li></rdf:Bag></t:k>"
                    "<t:l><rdf:Alt><rdf:li xml:lang='fr'>1</rdf:li><rdf:li xml:lang='x-default'>2</rdf:li>"
                    "</rdf:Alt></t:l><t:u rdf:parseType='Resource'/>"));
    after.about = "urn:x";
    EXPECT_EQ(DifferenceReport(FindDifferences(before, after), before, after),
              R"({"schema":"xmp-diff","version":1,"differenceCount":9,"differences":[)"
              R"({"path":"rdf:about","kind":"added","old":null,"new":{"uri":"urn:x"}},)"
              R"({"path":"t:a","kind":"changed","old":"1","new":"3"},)"
              R"({"path":"t:b","kind":"changed","old":"1","new":"3"},)"
              R"({"path":"t:l[?xml:lang=\"de\"]","kind":"removed",)"
              R"("old":{"value":"1","qualifiers":{"xml:lang":"de"}},"new":null},)"
              R"({"path":"t:l[?xml:lang=\"fr\"]","kind":"added","old":null,)"
              R"("new":{"value":"1","qualifiers":{"xml:lang":"fr"}}},)"
              R"({"path":"t:l[?xml:lang=\"x-default\"]","kind":"changed",)"
              R"("old":{"value":"\"1\"","qualifiers":{"xml:lang":"x-default"}},)"
              R"("new":{"value":"2","qualifiers":{"xml:lang":"x-default"}}},)"
              R"({"path":"t:s/t:f","kind":"changed","old":"1","new":"3"},)"
              R"({"path":"t:u","kind":"added","old":null,"new":{"structure":{}}},)"
              R"({"path":"t:x","kind":"removed","old":{"ordered":["1"]},"new":null}],"isCut":false})");
    EXPECT_TRUE(FindDifferences(after, after).empty());
}

}  // namespace OrvaneXMPCompareAndMerge
