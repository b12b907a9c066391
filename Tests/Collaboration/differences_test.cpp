// Reading differences and conflicts, and the address of those between any two commits.
#include "Collaboration/Differences.h"
#include "ModelTest.h"

namespace ZOCL {
namespace {

class DifferencesTest : public ModelTest {
protected:
    InterfaceRef<Differences> MakeDifferences(const std::string& inLists) {
        return Make<Differences>(
            "{'info':{'leftSideCommitId':'c1','rightSideCommitId':'c2'},'differences':{" + inLists + "}}");
    }
};

TEST_F(DifferencesTest, EntriesHoldWhatTheServerTells) {
    const auto differences = MakeDifferences(
        "'assets':[{'zo:assetId':'a','zo:name':'Clip','zo:differenceType':'UPDATED','zo:baseCommitId':'c0',"
        "'zo:conflictsWithContentId':'removed','zo:committer':'anna','zo:committed':'2026-02-03T04:05:06Z',"
        "'links':[{'rel':'self','href':'/a'},{'rel':'accept-theirs','href':'/t'},"
        "{'rel':'accept-yours','href':'/y'}]}],"
        "'enclosures':[{'zo:assetId':'a','zo:name':'x.xmp','zo:differenceType':'ADDED',"
        "'links':[{'rel':'self','href':'/a/x'},{'rel':'up','href':'/a'}]},"
        "{'zo:name':'p.xmp','zo:differenceType':'REMOVED'}],"
        "'properties':{'zo:name':'n','zo:differenceType':'UPDATED','links':[{'rel':'self','href':'/s'}]}");
    EXPECT_EQ(differences->GetBaseCommitID().view(), "c1");
    EXPECT_EQ(differences->GetCommitID().view(), "c2");
    const auto assets = differences->GetAssetDifferences();
    ASSERT_EQ(assets.size(), 1u);
    EXPECT_EQ(assets[0].identifier.view(), "a");
    EXPECT_EQ(assets[0].name.view(), "Clip");
    EXPECT_EQ(assets[0].differenceType, kDifferenceType_Updated);
    EXPECT_TRUE(assets[0].IsInConflict());
    EXPECT_EQ(assets[0].conflictsWithContentID.view(), "removed");
    EXPECT_EQ(assets[0].baseCommitID.view(), "c0");
    EXPECT_EQ(assets[0].committer.view(), "anna");
    EXPECT_EQ(assets[0].committed.time_of_day().seconds(), 6);
    EXPECT_EQ(assets[0].itemURL.view(), "/a");
    EXPECT_EQ(assets[0].assetURL.view(), "/a");
    EXPECT_EQ(assets[0].acceptTheirsURL.view(), "/t");
    EXPECT_EQ(assets[0].acceptYoursURL.view(), "/y");
    const auto enclosures = differences->GetEnclosureDifferences();
    ASSERT_EQ(enclosures.size(), 2u);
    EXPECT_EQ(enclosures[0].differenceType, kDifferenceType_Added);
    EXPECT_EQ(enclosures[0].itemURL.view(), "/a/x");
    EXPECT_EQ(enclosures[0].assetURL.view(), "/a");
    EXPECT_EQ(enclosures[1].differenceType, kDifferenceType_Removed);
    EXPECT_TRUE(enclosures[1].identifier.IsNull());
    EXPECT_TRUE(enclosures[1].committed.is_not_a_date_time());
    const auto properties = differences->GetPropertiesDifferences();
    ASSERT_EQ(properties.size(), 1u);
    EXPECT_EQ(properties[0].name.view(), "com.orvane.meridane.properties.difference");
    EXPECT_EQ(properties[0].itemURL.view(), "/s");
}

TEST_F(DifferencesTest, WhatDiffersAndWhatIsInConflict) {
    const std::string plain = "{'zo:assetId':'1'}", conflict = "{'zo:conflictsWithContentId':'c'}";
    const std::string noConflict = "{'zo:conflictsWithContentId':''}";
    struct Row {
        std::string lists;
        bool differs, asset, enclosure, properties;
    };
    const Row rows[] = {
        {"", false, false, false, false},
        {"'assets':[],'enclosures':[],'properties':null", false, false, false, false},
        {"'properties':{}", true, false, false, false},
        {"'properties':" + conflict, true, false, false, true},
        {"'assets':[" + plain + "," + noConflict + "]", true, false, false, false},
        {"'assets':[" + plain + "," + conflict + "]", true, true, false, false},
        {"'enclosures':[" + conflict + "]", true, false, true, false},
    };
    for (const Row& row : rows) {
        const auto differences = MakeDifferences(row.lists);
        EXPECT_EQ(differences->HasDifferences(), row.differs) << row.lists;
        EXPECT_EQ(differences->HasAssetConflicts(), row.asset) << row.lists;
        EXPECT_EQ(differences->HasEnclosureConflicts(), row.enclosure) << row.lists;
        EXPECT_EQ(differences->HasPropertiesConflicts(), row.properties) << row.lists;
        EXPECT_EQ(differences->HasConflicts(), row.asset || row.enclosure || row.properties) << row.lists;
    }
    // A body of the wrong shape is none.
    net->Expect("GET", "", JSONAnswer("{'differences':{'assets':{}}}"));
    const auto bad = MakeAtURL<Differences>(HubURL("/d"), server, ResourceWritability::kReadOnly);
    EXPECT_FALSE(bad->Load(true));
    EXPECT_FALSE(bad->HasDifferences());
}

TEST_F(DifferencesTest, AnyTwoCommits) {
    EXPECT_FALSE(GetDifferencesByCommit(server, "p", "a", "b"));
    ServiceDocument document;
    document.links.push_back({kRelation_Productions_Production_DifferenceByCommit, ImmutableString(),
                              HubURL("/p/{productionId}?base={baseCommitId}&commit={commitId}"),
                              ImmutableString(), ImmutableString()});
    RFL::QueryInterface<DataServer>(server)->TakeLinksDocument(document);
    const auto url = [&](const char* inBase, const char* inCommit) {
        return RFL::QueryInterface<IZOCServerResource>(
                   GetDifferencesByCommit(server, "p", inBase, ImmutableString(inCommit)))
            ->GetHTTPURL();
    };
    EXPECT_EQ(url("a", "b"), HubURL("/p/p?base=a&commit=b"));
    EXPECT_EQ(url("", ""), HubURL("/p/p?base=&commit=HEAD"));
    EXPECT_FALSE(GetDifferencesByCommit(nullptr, "p", "a", "b"));
}

}  // namespace
}  // namespace ZOCL
