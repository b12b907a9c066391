// Bulk transactions against a hub: they leave the same tree as single requests.
#include "HubSessionTest.h"
#include "ZOClient/CompoundAsyncOperation.h"
#include "ZOClient/IZOCBulkTransaction.h"

namespace ZOCL {
namespace {

using TextMap = std::map<std::string, std::string>;

std::string ReadPayload(const InterfaceRef<IZOCEnclosures>& inList, const ImmutableString& inName) {
    return inList->GetEnclosure(inName)->GetEnclosurePayloadAsUTF8();
}

/// Everything that a reader sees of a production, by path.
TextMap ReadTree(const InterfaceRef<IZOCProduction>& inProduction) {
    TextMap tree;
    const auto assets = inProduction->GetAssets();
    bool changed = false;
    As<IZOCServerResource>(assets)->Refresh(changed, false);
    for (const auto& item : assets->GetAllItems()) {
        const auto asset = assets->GetAssetByIdentifier(item.assetIdentifier);
        const AssetBaseProperties properties = asset->GetAssetBaseProperties();
        const std::string root = ostcore::utility::ToUTF8(item.name);
        SubClip subClip;
        const bool isSubClip = asset->GetSubClip(subClip);
        tree[root] = ostcore::utility::ToUTF8(properties.description) + "|" + properties.assetType.str() +
                     "|" + properties.mediaLocator.str() + "|" + std::to_string(properties.tags.size()) +
                     "|" + (isSubClip ? std::to_string(subClip.startBoundary.Ticks()) : "no sub-clip");
        const auto enclosures = asset->GetEnclosures();
        As<IZOCServerResource>(enclosures)->Load(true);
        for (const ImmutableString& name : enclosures->GetEnclosureNames()) {
            tree[root + "/" + name.str()] = ReadPayload(enclosures, name);
        }
        const auto renditions = asset->GetRenditions();
        As<IZOCServerResource>(renditions)->Load(true);
        for (const ImmutableString& flavor : renditions->GetFlavors()) {
            tree[root + "#" + flavor.str()] = renditions->GetRenditionPayload(flavor)->payload->view();
        }
    }
    const auto enclosures = inProduction->GetEnclosures();
    As<IZOCServerResource>(enclosures)->Refresh(changed, false);
    for (const ImmutableString& name : enclosures->GetEnclosureNames()) {
        tree["/" + name.str()] = ReadPayload(enclosures, name);
    }
    return tree;
}

class BulkHubTest : public HubSessionTest {
protected:
    /// The asset of a name, with the transaction as it is now.
    static InterfaceRef<IZOCAsset> Find(const InterfaceRef<IZOCTransaction>& inTransaction,
                                        const UString& inName) {
        const auto assets = As<IZOCProduction>(inTransaction)->GetAssets();
        bool changed = false;
        As<IZOCServerResource>(assets)->Refresh(changed, false);
        return assets->GetAssetByName(inName);
    }
    static AssetBaseProperties Fresh() {
        AssetBaseProperties properties;
        properties.name = u"fresh";
        properties.description = u"n\u00e4w";
        properties.assetType = kAssetType_MasterClip;
        properties.tags = {"one", "two"};
        return properties;
    }
    template <class Gather>
    static void InBulk(const InterfaceRef<IZOCTransaction>& inTransaction, const Gather& inGather) {
        std::promise<int> ended;
        const auto parent =
            CompoundAsyncOperation::Create([&ended](int inResult) { ended.set_value(inResult); },
                                           As<ServerResource>(inTransaction)->GetServer(), false);
        const auto bulk = inTransaction->CreateBulkTransaction(parent);
        ASSERT_TRUE(bulk);
        inGather(bulk);
        bulk->FinishedEditing();
        EXPECT_EQ(ended.get_future().get(), kResultSuccess);
        EXPECT_EQ(Perform([&](const Guid& inID, const RequestCompletion& inDone) {
                      return inTransaction->Refresh(inID, inDone);
                  }).result,
                  kResultSuccess);
    }
    static void ChangeInBulk(const InterfaceRef<IZOCTransaction>& inTransaction) {
        const ImmutableString keep = Find(inTransaction, u"keep")->GetAssetIdentifier();
        const ImmutableString drop = Find(inTransaction, u"drop")->GetAssetIdentifier();
        AssetBaseProperties changed = Find(inTransaction, u"keep")->GetAssetBaseProperties();
        changed.description = u"changed";
        InBulk(inTransaction, [&](const InterfaceRef<IZOCBulkTransaction>& inBulk) {
            BulkNewAsset fresh;
            fresh.properties = Fresh();
            fresh.enclosures = {{"a", Bytes("A")}, {"b", Bytes("B")}};
            fresh.renditions = {{IZOCRendition::kFlavorPNG, Bytes("picture")}};
            inBulk->CreateNewAsset({}, fresh);
            inBulk->DeleteAsset({}, drop);
            inBulk->SetAssetProperties({}, keep, changed, boost::none, boost::none);
            inBulk->SetAssetEnclosure({}, keep, "notes", Bytes("first"));
            inBulk->SetProductionEnclosure("p_xmp", Bytes("first"), true);
        });
        // What was new is there now.
        InBulk(inTransaction, [&](const InterfaceRef<IZOCBulkTransaction>& inBulk) {
            inBulk->SetAssetEnclosure({}, keep, "notes", Bytes("second"));
            inBulk->SetProductionEnclosure("p_xmp", Bytes("second"), false);
        });
        InBulk(inTransaction, [&](const InterfaceRef<IZOCBulkTransaction>& inBulk) {
            inBulk->SetProductionEnclosure("p_xmp", Bytes("third"), true);
        });
    }
    static void ChangeOneByOne(const InterfaceRef<IZOCTransaction>& inTransaction) {
        const auto create = [&](const InterfaceRef<IZOCAsset>& inAsset, const char* inName,
                                const char* inData) {
            EXPECT_EQ(Perform([&](const Guid& inID, const RequestCompletion& inDone) {
                          return CreateEnclosure(
                              inID, As<IZOCWritableAsset>(inAsset)->GetEnclosureFactoryURL(),
                              As<ServerResource>(inAsset)->GetServer(), inName, Bytes(inData), inDone);
                      }).result,
                      kResultSuccess);
        };
        const auto fresh = As<IZOCAsset>(Perform([&](const Guid& inID, const RequestCompletion& inDone) {
                                             return inTransaction->CreateNewAsset(inID, inDone, Fresh());
                                         }).resource);
        create(fresh, "a", "A");
        create(fresh, "b", "B");
        EXPECT_EQ(Perform([&](const Guid& inID, const RequestCompletion& inDone) {
                      return IZOCWritableRenditions::CreateRendition(
                          As<ServerResource>(fresh)->GetServer(),
                          As<IZOCWritableAsset>(fresh)->GetRenditionFactoryURL(), IZOCRendition::kFlavorPNG,
                          Bytes("picture"), inID, inDone);
                  }).result,
                  kResultSuccess);
        EXPECT_TRUE(As<IZOCWritableServerResource>(Find(inTransaction, u"drop"))->Delete());
        const auto keep = Find(inTransaction, u"keep");
        create(keep, "notes", "second");
        AssetBaseProperties changed = keep->GetAssetBaseProperties();
        changed.description = u"changed";
        As<IZOCWritableAsset>(keep)->SetAssetBaseProperties(changed);
        EXPECT_EQ(Perform([&](const Guid& inID, const RequestCompletion& inDone) {
                      return As<IZOCWritableAsset>(keep)->UpdatePropertiesOnServer(inID, inDone);
                  }).result,
                  kResultSuccess);
        EXPECT_EQ(Write(inTransaction, "p_xmp", "second"), kResultSuccess);
    }
};

TEST_F(BulkHubTest, BulkAndSingleRequestsLeaveEqualTrees) {
    const Member anna = SignIn("anna");
    const auto session = anna.OpenSession();
    const auto filling = OpenTransaction(session);
    Add(filling, u"keep");
    Add(filling, u"drop");
    ASSERT_EQ(Commit(filling), kResultSuccess);
    const auto bulk = OpenTransaction(session);
    const auto single = OpenTransaction(session);
    ChangeInBulk(bulk);
    ChangeOneByOne(single);
    const TextMap tree = ReadTree(As<IZOCProduction>(bulk));
    EXPECT_EQ(tree, ReadTree(As<IZOCProduction>(single)));
    EXPECT_EQ(tree.count("drop"), 0u);
    EXPECT_EQ(tree.at("keep/notes"), "second");
    EXPECT_EQ(tree.at("/p_xmp"), "second");
    EXPECT_EQ(tree.at("fresh#image/png"), "picture");
    EXPECT_EQ(Commit(bulk), kResultSuccess);
    EXPECT_EQ(ReadTree(As<IZOCProduction>(session)), tree);
}

}  // namespace
}  // namespace ZOCL
