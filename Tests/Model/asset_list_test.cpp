// Asset lists: filters, look-up, restore, and lists of the size that real productions have.
#include "Model/Asset.h"
#include "Model/AssetList.h"
#include "ModelTest.h"

namespace ZOCL {
namespace {

std::string AssetText(const std::string& inID, const std::string& inName, const std::string& inType,
                      const std::string& inParent) {
    return "{'zo:assetId':'" + inID + "','zo:etag':'e-" + inID + "','properties':{'name':'" + inName +
           "','description':'','mediaLocator':'m-" + inID + "','zo:parent':'" + inParent +
           "','cdzo:assetType':'" + inType + "'},'links':[{'rel':'self','href':'" +
           HubURL("/assets/" + inID).str() + "'}]}";
}

class AssetListTest : public ModelTest {
protected:
    InterfaceRef<AssetList> MakeList() {
        return Make<AssetList>(
            "{'assets':[" + AssetText("1", "one", "bin", "") + "," +
            AssetText("2", "two", "masterclip", "1") + "," + AssetText("3", "two", "masterclip", "1") + "," +
            AssetText("2", "shadow", "bin", "") + "],'links':[" + LinkTo(kRelation_Create, "/assets/new") +
            ",{'rel':'" + kRelation_Assets_Restore.str() + "','href':'" +
            HubURL("/restore/{assetContentId}?x={other}").str() + "'}," +
            LinkTo(kRelation_LatestVersion, "/assets/latest") + "]}");
    }
    static std::vector<std::string> Names(const std::vector<IZOCAssetList::AssetListItem>& inItems) {
        std::vector<std::string> names;
        for (const auto& item : inItems) {
            names.push_back(item.assetIdentifier.str());
        }
        return names;
    }
};

TEST_F(AssetListTest, ItemsAreFilteredInListOrder) {
    const auto list = MakeList();
    EXPECT_THAT(Names(list->GetAllItems()), testing::ElementsAre("1", "2", "3", "2"));
    EXPECT_THAT(Names(list->GetAssetsByType(kAssetType_MasterClip)), testing::ElementsAre("2", "3"));
    EXPECT_TRUE(list->GetAssetsByType("unheard-of").empty());
    EXPECT_THAT(Names(list->GetAssetsWithParentIdentifier("1")), testing::ElementsAre("2", "3"));
    const auto item = list->GetAllItems()[1];
    EXPECT_EQ(item.name, u"two");
    EXPECT_EQ(item.server, server);
    EXPECT_EQ(item.parentIdentifier.view(), "1");
    EXPECT_EQ(item.eTag.view(), "e-2");
    EXPECT_EQ(item.assetType, kAssetType_MasterClip);
    EXPECT_EQ(item.mediaLocatorIdentifier.view(), "m-2");
    XMPEnclosureMap map;
    GetXMPEnclosureMapForAssetList(list->GetAllItems(), map);
    EXPECT_EQ(map.count("m-2_xmp"), 2u);
    EXPECT_EQ(map.count("m-1_xmp"), 1u);
    EXPECT_EQ(Requests(), 0u);
}

TEST_F(AssetListTest, LookUpGivesTheFirstMatchLoadedAndWithItsOwnTag) {
    const auto list = MakeList();
    const auto asset = list->GetAssetByIdentifier("2");
    ASSERT_TRUE(asset);
    EXPECT_EQ(asset->GetName(), u"two");
    const auto resource = RFL::QueryInterface<IZOCServerResource>(asset);
    EXPECT_TRUE(resource->IsLoaded());
    EXPECT_EQ(resource->GetETag(true).view(), "e-2");
    EXPECT_EQ(resource->GetHTTPURL(), HubURL("/assets/2"));
    EXPECT_EQ(list->GetAssetByName(u"two")->GetAssetIdentifier().view(), "2");
    EXPECT_FALSE(list->GetAssetByIdentifier("4"));
    EXPECT_FALSE(list->GetAssetByName(u"Two"));
    EXPECT_EQ(RFL::QueryInterface<IZOCServerResource>(list->GetLatestVersion())->GetHTTPURL(),
              HubURL("/assets/latest"));
    EXPECT_EQ(Requests(), 0u);
    const InterfaceRef<AssetList> empty(new AssetList);
    EXPECT_TRUE(empty->GetAllItems().empty());
    EXPECT_FALSE(empty->GetAssetByIdentifier("2"));
}

TEST_F(AssetListTest, RestoredAssetIsFoundUntilTheNextLoad) {
    const auto list = MakeList();
    net->Expect("POST", HubURL("/restore/c7?x={other}").str(), JSONAnswer(AssetText("7", "back", "bin", "")));
    Outcome outcome;
    ASSERT_TRUE(list->RestoreAsset("c7", Guid::CreateUnique(), outcome.Function()));
    EXPECT_EQ(outcome.Wait(), kResultSuccess);
    EXPECT_EQ(LastRequest().body, "{}");
    EXPECT_EQ(LastRequest().Header("Content-Type"), "application/json;charset=utf-8");
    EXPECT_EQ(RFL::QueryInterface<IZOCServerResource>(list->GetAssetByIdentifier("7")), outcome.Resource());
    EXPECT_TRUE(RFL::QueryInterface<IZOCWritableAsset>(outcome.Resource()));
    net->Expect("GET", "", JSONAnswer("{'assets':[" + AssetText("8", "x", "bin", "") + "]}", "\"t2\""));
    bool changed = false;
    EXPECT_TRUE(list->Refresh(changed, false));
    EXPECT_FALSE(list->GetAssetByIdentifier("7"));
    EXPECT_FALSE(list->GetAssetByIdentifier("2"));
    EXPECT_TRUE(list->GetAssetByIdentifier("8"));
    EXPECT_FALSE(list->RestoreAsset("c7", Guid::CreateUnique(), RequestCompletion()));
}

TEST_F(AssetListTest, LookUpOfEachOfManyAssetsStaysLinear) {
    ostcore::debug::SetTraceLevel("*", 0);
    constexpr int kCount = 50000;
    std::string body = "{'assets':[";
    for (int i = 0; i < kCount; ++i) {
        const std::string id = std::to_string(i);
        body += (i == 0 ? "" : ",") + AssetText(id, "name " + id, "bin", "");
    }
    const auto list = Make<AssetList>(body + "]}");
    const auto items = list->GetAllItems();
    ASSERT_EQ(items.size(), std::size_t(kCount));
    // A scan for each would visit 1.25 billion assets, which takes minutes.
    const auto start = std::chrono::steady_clock::now();
    int found = 0;
    for (const auto& item : items) {
        found += list->GetAssetByIdentifier(item.assetIdentifier) ? 1 : 0;
        found += list->GetAssetByName(item.name) ? 1 : 0;
    }
    EXPECT_EQ(found, 2 * kCount);
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(60));
}

TEST_F(AssetListTest, ReadersAndReloadsMayMeet) {
    ostcore::debug::SetTraceLevel("*", 0);
    net->SetHandler([](const RecordedRequest& inRequest) {
        return JSONAnswer("{'assets':[" + AssetText("1", "one", "bin", "") + "]}",
                          inRequest.requestID.ToString());
    });
    const auto list = MakeList();
    std::atomic<bool> stop{false};
    std::vector<std::thread> readers;
    for (int i = 0; i < 2; ++i) {
        readers.emplace_back([&] {
            while (!stop) {
                EXPECT_TRUE(list->GetAssetByIdentifier("1"));
                EXPECT_FALSE(list->GetAllItems().empty());
            }
        });
    }
    for (int i = 0; i < 200; ++i) {
        bool changed = false;
        EXPECT_TRUE(list->Refresh(changed, false));
    }
    stop = true;
    for (std::thread& reader : readers) {
        reader.join();
    }
}

}  // namespace
}  // namespace ZOCL
