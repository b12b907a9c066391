// Productions, their roles and lists, and what a copy or a change sends.
#include "Model/Production.h"
#include "Model/ProductionList.h"
#include "ModelTest.h"
#include "ostcore/debug/DebugDatabase.h"
#include "ZOClient/IZOCAsset.h"

namespace ZOCL {
namespace {

class ProductionTest : public ModelTest {
protected:
    ~ProductionTest() override { ostcore::debug::DebugDatabase::ClearOverrides(); }

    static std::string Lists() {
        return LinkTo(kRelation_Enclosures, "/p/enclosures") + "," + LinkTo(kRelation_Assets, "/p/assets") +
               "," + LinkTo(kRelation_Assets_Full, "/p/full");
    }
    template <class T>
    static ImmutableString URL(const InterfaceRef<T>& inObject) {
        return RFL::QueryInterface<IZOCServerResource>(inObject)->GetHTTPURL();
    }
};

TEST_F(ProductionTest, AccessorsAndListsComeFromTheBody) {
    const auto production = Make<Production>(
        "{'zo:productionId':'p','zo:sessionId':'s','zo:commitId':'c1','owner':'o','created':'2026-02-03T04:"
        "05:06.5Z',"
        "'properties':{'name':'N','description':'D','tags':['t']},'links':[" +
        Lists() + "," + LinkTo(kRelation_Sessions, "/p/sessions") + ",{'rel':'" +
        kRelation_Assets_Asset_ById.str() + "','href':'" + HubURL("/a/{assetId}/{commitId}/{assetId}").str() +
        "'}]}");
    EXPECT_EQ(production->GetIdentifier().view(), "s");
    EXPECT_EQ(production->GetName(), u"N");
    EXPECT_EQ(production->GetDescription(), u"D");
    EXPECT_EQ(production->GetOwner().view(), "o");
    EXPECT_EQ(production->GetLoadedRevision().view(), "c1");
    EXPECT_EQ(production->GetTags().size(), 1u);
    EXPECT_EQ(production->GetCreationTime().time_of_day().seconds(), 6);
    EXPECT_TRUE(production->GetModificationTime().is_not_a_date_time());
    EXPECT_EQ(URL(production->GetAssets()), HubURL("/p/full"));
    EXPECT_EQ(URL(production->GetEnclosures()), HubURL("/p/enclosures"));
    EXPECT_FALSE(RFL::QueryInterface<IZOCServerResource>(production->GetAssets())->IsLoaded());
    EXPECT_TRUE(RFL::QueryInterface<IZOCWritableAssetList>(production->GetAssets()));
    EXPECT_EQ(production->GetSessionsLink(), HubURL("/p/sessions"));
    EXPECT_EQ(production->GetAssetURL("x", ""), HubURL("/a/x/HEAD/x"));
    EXPECT_EQ(production->GetAssetURL("x", "c7"), HubURL("/a/x/c7/x"));
    EXPECT_EQ(URL(production->GetAssetsWithParent("a&b c")), HubURL("/p/full?parentId=a%26b%20c"));
    EXPECT_EQ(Requests(), 0u);
    const InterfaceRef<Production> unloaded(new Production);
    EXPECT_TRUE(unloaded->GetLoadedRevision().IsNull());
    EXPECT_FALSE(unloaded->GetAssets());
    EXPECT_TRUE(unloaded->GetAssetURL("x", "").IsNull());
}

TEST_F(ProductionTest, FullListIsTakenUnlessDisabled) {
    ostcore::debug::DebugDatabase::SetOverride("ZOClient.DisableFullAssetList", "true");
    EXPECT_EQ(URL(Make<Production>("{'links':[" + Lists() + "]}")->GetAssets()), HubURL("/p/assets"));
}

TEST_F(ProductionTest, MissingListsAreReportedAndTheOldOnesStay) {
    const auto production = Make<Production>("{'links':[" + Lists() + "]}");
    const auto assets = production->GetAssets();
    net->Expect("GET", "", JSONAnswer("{'links':[]}", "\"t2\""));
    bool changed = false;
    EXPECT_TRUE(production->Refresh(changed, false));
    EXPECT_EQ(production->GetAssets(), assets);
    EXPECT_TRUE(
        Traced("<ZOCL.Production> <5> Failed to load enclosures and assets link lists for production, uri: " +
               HubURL("/object").str() + ", httpStatusCode: 200, httpLibCode: 0, payload: "));
    EXPECT_TRUE(Traced("expression: (enclosuresLink == ostnet::URL() || assetsLink == ostnet::URL())"));
    const auto bare = Make<Production>("{}");
    EXPECT_FALSE(bare->GetAssets());
    EXPECT_FALSE(bare->GetEnclosures());
}

TEST_F(ProductionTest, ReloadReplacesTheLists) {
    const auto production = Make<Production>("{'links':[" + Lists() + "]}");
    const auto assets = production->GetAssets();
    net->Expect("GET", HubURL("/p/full").str(), JSONAnswer("{'assets':[{'zo:assetId':'1'}]}"));
    EXPECT_TRUE(RFL::QueryInterface<IZOCServerResource>(assets)->Load(true));
    net->Expect("GET", "", JSONAnswer("{'links':[" + Lists() + "]}", "\"t2\""));
    bool changed = false;
    EXPECT_TRUE(production->Refresh(changed, false));
    EXPECT_NE(production->GetAssets(), assets);
    EXPECT_FALSE(RFL::QueryInterface<IZOCServerResource>(assets)->IsLoaded());
    EXPECT_TRUE(assets->GetAllItems().empty());
}

TEST_F(ProductionTest, LinksTellTheRoleAndTheRelationOfACopy) {
    struct Row {
        const ImmutableString& relation;
        bool session, transaction, isTemplate;
        const ImmutableString& copyRelation;
    };
    const Row rows[] = {
        {kRelation_Sessions_Session_Push, true, false, false, kRelation_Sessions_Session_Copy},
        {kRelation_Transactions_Transaction_Commit, false, true, false,
         kRelation_Productions_Production_Copy},
        {kRelation_Productions_Production_Create_Production, false, false, true,
         kRelation_Productions_Production_Create_Production},
        {kRelation_Productions, false, false, false, kRelation_Productions_Production_Copy},
    };
    for (const Row& row : rows) {
        const bool own = row.relation == row.copyRelation;
        const auto production =
            Make<Production>("{'links':[" + LinkTo(row.relation, own ? "/copy" : "/role") +
                             (own ? std::string() : "," + LinkTo(row.copyRelation, "/copy")) + "]}");
        EXPECT_EQ(production->IsEditingSession(), row.session);
        EXPECT_EQ(production->IsTransaction(), row.transaction);
        EXPECT_EQ(production->IsTemplate(), row.isTemplate);
        net->Expect("POST", HubURL("/copy").str(),
                    JSONAnswer("{'zo:productionId':'new'}").With("Location", HubURL("/new").str()));
        Outcome outcome;
        ASSERT_TRUE(production->Copy(Guid::CreateUnique(), outcome.Function(), u"n", u"d", true));
        EXPECT_EQ(outcome.Wait(), kResultSuccess);
        EXPECT_EQ(LastRequest().body, Quote("{'name':'n','description':'d','isTemporary':true}"));
        EXPECT_EQ(LastRequest().Header("Content-Type"), "application/json;charset=utf-8");
        EXPECT_EQ(RFL::QueryInterface<IZOCProduction>(outcome.Resource())->GetIdentifier().view(), "new");
        EXPECT_EQ(outcome.Resource()->GetHTTPURL(), HubURL("/new"));
    }
    EXPECT_FALSE(Make<Production>("{}")->Copy(Guid::CreateUnique(), RequestCompletion(), u"n", u"d", false));
}

TEST_F(ProductionTest, ChangedPropertiesGoBackWithUnknownKeysAndTheTag) {
    const auto production =
        Make<Production>("{'properties':{'future':{'a':[1.0]},'name':'old','x':null},'links':[" +
                         LinkTo(kRelation_Edit, "/edit") + "]}");
    production->SetName(u"new");
    production->SetDescription(u"d");
    EXPECT_EQ(production->GetName(), u"new");
    EXPECT_EQ(Requests(), 0u);
    net->Expect("PUT", HubURL("/edit").str(), ScriptedAnswer::Status(200));
    Outcome outcome;
    ASSERT_TRUE(production->UpdateProductionBaseProperties(Guid::CreateUnique(), outcome.Function()));
    EXPECT_EQ(outcome.Wait(), kResultSuccess);
    EXPECT_EQ(LastRequest().body, Quote("{'future':{'a':[1.0]},'name':'new','x':null,'description':'d'}"));
    EXPECT_EQ(LastRequest().Header("If-Match"), "\"t1\"");
}

TEST_F(ProductionTest, MostRecentRevisionLoadsTheLatestVersion) {
    const auto production =
        Make<Production>("{'commitId':'old','links':[" + LinkTo(kRelation_LatestVersion, "/latest") + "]}");
    net->Expect("GET", HubURL("/latest").str(), JSONAnswer("{'commitId':'new','links':[" + Lists() + "]}"));
    EXPECT_EQ(production->GetMostRecentRevision().view(), "new");
    EXPECT_EQ(production->GetLoadedRevision().view(), "old");
    net->Expect("GET", "", ScriptedAnswer::Status(500));
    EXPECT_TRUE(production->GetMostRecentRevision().IsNull());
    EXPECT_THAT(Assertions(),
                testing::ElementsAre("isLoaded: Failed to load production " + HubURL("/latest").str()));
}

TEST_F(ProductionTest, AssetsAreFoundInTheListWhichIsLoadedOnce) {
    const auto production = Make<Production>("{'links':[" + Lists() + "]}");
    net->Expect("GET", HubURL("/p/full").str(), JSONAnswer("{'assets':[{'zo:assetId':'1'}]}"));
    Outcome found;
    ASSERT_TRUE(production->GetAssetByIdentifier(Guid::CreateUnique(), "1", found.Function()));
    EXPECT_EQ(found.Wait(), kResultSuccess);
    EXPECT_EQ(RFL::QueryInterface<IZOCAsset>(found.Resource())->GetAssetIdentifier().view(), "1");
    Outcome missing;
    ASSERT_TRUE(production->GetAssetByIdentifier(Guid::CreateUnique(), "2", missing.Function()));
    EXPECT_EQ(missing.Wait(), kResultHTTPNotFound);
    EXPECT_FALSE(missing.Resource());
    EXPECT_TRUE(Traced("<ZOCL.Production> <5> Failed to find asset for identifier, assetID: 2"));
    EXPECT_TRUE(production->GetAssetByIdentifier("1"));
    EXPECT_FALSE(production->GetAssetByIdentifier("2"));
    EXPECT_EQ(Requests(), 1u);
}

TEST_F(ProductionTest, ListsMergeTheirKindsAndWalkPages) {
    const auto list = Make<ProductionList>(
        "{'sessions':[{'zo:sessionId':'s','links':[" + LinkTo(kRelation_Edit, "/s/edit") + "," +
        LinkTo(kRelation_LatestVersion, "/s/latest") +
        "]}],'transactions':[{'zo:transactionId':'t','links':[" +
        LinkTo(kRelation_LatestVersion, "/t/latest") +
        "]}],'productions':[{'zo:productionId':'p','owner':'o',"
        "'zo:lastModified':'2026-05-06T07:08:09Z','properties':{'name':'n','description':'d'},'links':[" +
        LinkTo(kRelation_Edit, "/p/edit") + "," + LinkTo(kRelation_Self, "/p") + "]}],'links':[" +
        LinkTo(kRelation_Next, "/page2") + "]}");
    const auto items = list->GetAllItems();
    ASSERT_EQ(items.size(), 3u);
    EXPECT_EQ(items[0].identifier.view(), "p");
    EXPECT_EQ(items[0].name, u"n");
    EXPECT_EQ(items[0].owner.view(), "o");
    EXPECT_EQ(items[0].url, HubURL("/p"));
    EXPECT_EQ(items[0].lastModified.date().year(), 2026);
    EXPECT_TRUE(items[0].lastModifiedOfAllSessions.is_not_a_date_time());
    EXPECT_EQ(items[1].url, HubURL("/s/edit"));
    EXPECT_EQ(items[2].url, HubURL("/t/latest"));
    const auto production = list->GetProduction(items[0]);
    EXPECT_EQ(URL(production), HubURL("/p"));
    EXPECT_EQ(list->GetProduction(items[0]), production);
    const auto next = list->GetNextPage();
    EXPECT_EQ(URL(next), HubURL("/page2"));
    EXPECT_TRUE(next->GetAllItems().empty());
    EXPECT_EQ(Requests(), 0u);
    net->Expect("GET", HubURL("/page2").str(), JSONAnswer("{'productions':[{}]}"));
    EXPECT_TRUE(next->Load(true));
    EXPECT_EQ(next->GetAllItems().size(), 1u);
    EXPECT_FALSE(next->GetNextPage());
    EXPECT_EQ(list->GetAllItems().size(), 3u);
    net->Expect("POST", HubURL("/object").str(), JSONAnswer("{'zo:productionId':'made'}"));
    Outcome outcome;
    ASSERT_TRUE(list->GetNewProduction(Guid::CreateUnique(), u"n", u"", false, outcome.Function()));
    EXPECT_EQ(outcome.Wait(), kResultSuccess);
    EXPECT_EQ(LastRequest().body, Quote("{'name':'n','description':'','isTemporary':false}"));
}

}  // namespace
}  // namespace ZOCL
