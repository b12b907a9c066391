// Assets: what they say, what a change sends, and how new ones are made.
#include "Model/Asset.h"
#include "ModelTest.h"
#include "ostcore/debug/DebugDatabase.h"

namespace ZOCL {
namespace {

class AssetTest : public ModelTest {
protected:
    ~AssetTest() override { ostcore::debug::DebugDatabase::ClearOverrides(); }

    InterfaceRef<Asset> MakeWith(const std::string& inProperties, const std::string& inMore = "") {
        return Make<Asset>("{'zo:assetId':'a1','zo:assetContentId':'c1','properties':" + inProperties +
                           ",'links':[" + LinkTo(kRelation_Edit, "/a1/edit") + inMore + "]}");
    }
};

TEST_F(AssetTest, AccessorsReadTheBody) {
    const auto asset = MakeWith(
        "{'name':'N\\u00e4me','description':'d','mediaLocator':'m1','zo:parent':'p1','tags':['x','y'],"
        "'cdzo:assetType':'masterclip','isMulticamEnabled':true,'zeroPoint':{'ticks':7},'smartBinQuery':'q'"
        "}");
    AssetBaseProperties expected(u"N\u00e4me", u"d", "masterclip", "p1", true, ostmediatypes::TickTime(7),
                                 "q");
    expected.mediaLocator = "m1";
    expected.tags = {"x", "y"};
    EXPECT_EQ(asset->GetAssetBaseProperties(), expected);
    EXPECT_EQ(asset->GetName(), u"N\u00e4me");
    EXPECT_EQ(asset->GetDescription(), u"d");
    EXPECT_EQ(asset->GetTags(), expected.tags);
    EXPECT_EQ(asset->GetAssetIdentifier().view(), "a1");
    EXPECT_EQ(asset->GetContentIdentifier().view(), "c1");
    EXPECT_EQ(asset->GetParentAssetIdentifier().view(), "p1");
    EXPECT_TRUE(asset->HasMediaLocator());
    EXPECT_EQ(asset->GetAssetTypeDisplayName(), u"MasterClip");
    SubClip subClip;
    EXPECT_FALSE(asset->GetSubClip(subClip));
    const InterfaceRef<Asset> unloaded(new Asset);
    EXPECT_EQ(unloaded->GetAssetBaseProperties(), AssetBaseProperties());
    ImmutableString type("x");
    EXPECT_FALSE(unloaded->GetAssetType(type));
    EXPECT_EQ(unloaded->GetAssetTypeDisplayName(), u"Unrecognized Asset");
}

TEST_F(AssetTest, PretendedCompositionNeedsItsFlagAndItsName) {
    const auto pretender = MakeWith("{'name':'*** Pretend SF Comp','cdzo:assetType':'sequence'}");
    const auto other = MakeWith("{'name':'*** pretend SF Comp','cdzo:assetType':'sequence'}");
    ImmutableString type;
    EXPECT_TRUE(pretender->GetAssetType(type));
    EXPECT_EQ(type, kAssetType_Sequence);
    ostcore::debug::DebugDatabase::SetOverride("ZOCL.TreatSpecialSequencesAsComps", "true");
    EXPECT_TRUE(pretender->GetAssetType(type));
    EXPECT_EQ(type, kAssetType_Composition);
    EXPECT_TRUE(other->GetAssetType(type));
    EXPECT_EQ(type, kAssetType_Sequence);
}

TEST_F(AssetTest, SubClipsReadAndWriteTheirBoundaries) {
    SubClip subClip;
    ASSERT_TRUE(MakeWith("{'subClip':{'mStartBoundary':{'ticks':5}}}")->GetSubClip(subClip));
    EXPECT_EQ(subClip.startBoundary.Ticks(), 5);
    EXPECT_EQ(subClip.endBoundary, ostmediatypes::kTime_Invalid);
    EXPECT_TRUE(subClip.boundaryIsHard);
    const auto asset = MakeWith("{'name':'n','subClip':{'future':1,'mBoundaryIsHard':true}}");
    subClip.endBoundary = ostmediatypes::TickTime(9);
    subClip.boundaryIsHard = false;
    asset->SetSubClip(subClip);
    net->Expect("PUT", HubURL("/a1/edit").str(), ScriptedAnswer::Status(200).With("ETag", "\"t2\""));
    EXPECT_TRUE(asset->UpdatePropertiesOnServer());
    EXPECT_EQ(LastRequest().body,
              Quote("{'name':'n','subClip':{'future':1,'mBoundaryIsHard':false,'mStartBoundary':{'ticks':5},"
                    "'mEndBoundary':{'ticks':9}}}"));
}

TEST_F(AssetTest, UnknownKeysGoBackUnchangedInValueAndOrder) {
    const std::string before =
        "{'z':1.50,'name':'old','big':18446744073709551615,'a':{'y':[null,true],'x':'\\u00fc'},"
        "'description':'d','tags':['b','a'],'cdzo:assetType':'bin','last':[]}";
    const auto asset = MakeWith(before);
    AssetBaseProperties wanted = asset->GetAssetBaseProperties();
    wanted.tags = {"a", "b"};
    EXPECT_FALSE(asset->SetAssetBaseProperties(wanted));
    wanted.name = u"new";
    wanted.parent = "p";
    EXPECT_TRUE(asset->SetAssetBaseProperties(wanted));
    net->Expect("PUT", HubURL("/a1/edit").str(), ScriptedAnswer::Status(200).With("ETag", "\"t2\""));
    EXPECT_TRUE(asset->UpdatePropertiesOnServer());
    EXPECT_EQ(LastRequest().Header("Content-Type"), "application/json;charset=utf-8");
    EXPECT_EQ(LastRequest().Header("If-Match"), "\"t1\"");
    EXPECT_EQ(asset->GetETag(true).view(), "\"t2\"");
    EXPECT_EQ(LastRequest().body,
              Quote("{'z':1.5,'name':'new','big':18446744073709551615,'a':{'y':[null,true],'x':'\xc3\xbc'},"
                    "'description':'d','tags':['b','a'],'cdzo:assetType':'bin','last':[],'zo:parent':'p'}"));
    EXPECT_EQ(Requests(), 1u);
}

TEST_F(AssetTest, AsynchronousUpdateTakesTheNewTagAndSkipsWithoutChange) {
    const auto asset = MakeWith("{'name':'n'}");
    AssetBaseProperties wanted = asset->GetAssetBaseProperties();
    Outcome unchanged;
    ASSERT_TRUE(asset->SetAssetBasePropertiesAndUpdate(wanted, Guid::CreateUnique(), unchanged.Function()));
    EXPECT_EQ(unchanged.Calls(), 1);
    EXPECT_EQ(unchanged.Response(), nullptr);
    EXPECT_EQ(Requests(), 0u);
    wanted.description = u"d";
    net->Expect("PUT", HubURL("/a1/edit").str(), ScriptedAnswer::Status(200).With("ETag", "\"t2\""));
    Outcome changed;
    ASSERT_TRUE(asset->SetAssetBasePropertiesAndUpdate(wanted, Guid::CreateUnique(), changed.Function()));
    EXPECT_EQ(changed.Wait(), kResultSuccess);
    EXPECT_EQ(changed.Resource(), InterfaceRef<IZOCServerResource>(asset));
    EXPECT_EQ(LastRequest().CountHeader("If-Match"), 0u);
    EXPECT_EQ(asset->GetETag(true).view(), "\"t2\"");
    net->Expect("PUT", "", ScriptedAnswer::Status(412));
    EXPECT_FALSE(asset->UpdatePropertiesOnServer());
    EXPECT_EQ(asset->GetETag(true).view(), "\"t2\"");
}

TEST_F(AssetTest, WithoutAnEditLinkNothingIsSent) {
    const auto asset = Make<Asset>("{'properties':{'name':'n'}}");
    EXPECT_FALSE(asset->UpdatePropertiesOnServer());
    EXPECT_FALSE(asset->UpdatePropertiesOnServer(Guid::CreateUnique(), RequestCompletion()));
    EXPECT_EQ(Requests(), 0u);
}

TEST_F(AssetTest, ContainedListsCostNoRequest) {
    const auto asset =
        Make<Asset>("{'zo:assetId':'a1','links':[" + LinkTo(kRelation_Enclosures, "/a1/enclosures") +
                    "],'enclosures':{'enclosures':[{'name':'x'}],'links':[" +
                    LinkTo(kRelation_Create, "/a1/enclosures/new") +
                    "]},'renditions':{'renditions':[{'zo:renditionId':'r1'}]}}");
    const auto enclosures = asset->GetEnclosures();
    ASSERT_TRUE(enclosures);
    EXPECT_TRUE(RFL::QueryInterface<IZOCServerResource>(enclosures)->IsLoaded());
    EXPECT_EQ(RFL::QueryInterface<IZOCServerResource>(enclosures)->GetHTTPURL(), HubURL("/a1/enclosures"));
    EXPECT_THAT(enclosures->GetEnclosureNames(), testing::ElementsAre(ImmutableString("x")));
    EXPECT_EQ(RFL::QueryInterface<IZOCWritableEnclosures>(enclosures)->GetEnclosureFactoryURL(),
              HubURL("/a1/enclosures/new"));
    EXPECT_THAT(asset->GetRenditions()->GetRenditionIDs(), testing::ElementsAre(ImmutableString("r1")));
    EXPECT_EQ(Requests(), 0u);
    const auto bare = MakeWith("{'name':'n'}", "," + LinkTo(kRelation_Enclosures, "/e"));
    EXPECT_FALSE(RFL::QueryInterface<IZOCServerResource>(bare->GetEnclosures())->IsLoaded());
    EXPECT_FALSE(bare->GetRenditions());
    EXPECT_FALSE(bare->GetLatestVersion());
}

TEST_F(AssetTest, WriteSideNeedsAWritableAsset) {
    EXPECT_TRUE(RFL::QueryInterface<IZOCWritableAsset>(
        IZOCWritableAsset::Create(HubURL("/a"), server, ResourceWritability::kWritable)));
    const auto readOnly = IZOCWritableAsset::Create(HubURL("/a"), server, ResourceWritability::kReadOnly);
    EXPECT_FALSE(RFL::QueryInterface<IZOCWritableAsset>(readOnly));
    EXPECT_FALSE(IZOCWritableAsset::Create(ImmutableString(), server, ResourceWritability::kReadOnly));
}

TEST_F(AssetTest, CreationPostsAllKeysInOrder) {
    AssetBaseProperties wanted(u"n", u"d", kAssetType_SmartBin, "p", true, ostmediatypes::TickTime(3), "q");
    wanted.mediaLocator = "m";
    wanted.tags = {"t"};
    net->Expect(
        "POST", HubURL("/new").str(),
        JSONAnswer("{'zo:assetId':'a9','properties':{'name':'n'}}").With("Location", HubURL("/a9").str()));
    Outcome outcome;
    ASSERT_TRUE(
        IZOCWritableAsset::Create(Guid::CreateUnique(), HubURL("/new"), server, wanted, outcome.Function()));
    EXPECT_EQ(outcome.Wait(), kResultSuccess);
    EXPECT_EQ(
        LastRequest().body,
        Quote("{'properties':{'name':'n','description':'d','mediaLocator':'m','zo:parent':'p','tags':['t'],"
              "'cdzo:assetType':'smartbin','projectItemProperties':'','mergedClipMediaLocators':[],"
              "'isMulticamEnabled':true,'zeroPoint':{'ticks':3},'smartBinQuery':'q'}}"));
    EXPECT_EQ(LastRequest().Header("Content-Type"), "application/json;charset=utf-8");
    ASSERT_TRUE(RFL::QueryInterface<IZOCWritableAsset>(outcome.Resource()));
    EXPECT_EQ(RFL::QueryInterface<IZOCAsset>(outcome.Resource())->GetAssetIdentifier().view(), "a9");
    EXPECT_EQ(outcome.Resource()->GetHTTPURL(), HubURL("/a9"));
}

TEST_F(AssetTest, FailedCreationsTellWhy) {
    const AssetBaseProperties wanted;
    const auto create = [&](const ScriptedAnswer& inAnswer) {
        net->Expect("POST", "", inAnswer);
        Outcome outcome;
        EXPECT_TRUE(IZOCWritableAsset::Create(Guid::CreateUnique(), HubURL("/new"), server, wanted,
                                              outcome.Function()));
        return outcome.Wait();
    };
    EXPECT_EQ(create(ScriptedAnswer::Status(403)), kResultHTTPForbidden);
    EXPECT_EQ(create(ScriptedAnswer::Status(-1)), kResultRequestCancelled);
    EXPECT_EQ(create(JSONAnswer("{'zo:assetId':7}")), kResultFailure);
    net->Expect("POST", "", ScriptedAnswer::FailStart());
    EXPECT_FALSE(
        IZOCWritableAsset::Create(Guid::CreateUnique(), HubURL("/new"), server, wanted, RequestCompletion()));
    EXPECT_THAT(Assertions(),
                testing::ElementsAre(
                    testing::EndsWith("Create_OnAssetCreated(): failed to create asset, RFL result == " +
                                      std::to_string(kResultHTTPForbidden)),
                    testing::EndsWith("Create_OnAssetCreated(): failed to create asset from server response"),
                    "postStarted: IZOCWritableAsset::Create(): failed to start POST to asset factory"));
}

TEST(AssetBasePropertiesTest, OrderIsTotalAndStartsWithTheNames) {
    std::vector<AssetBaseProperties> values(9);
    values[1].name = u"b";
    values[2].name = u"a";
    values[2].description = u"z";
    values[3].assetType = "bin";
    values[4].parent = "p";
    values[5].mediaLocator = "m";
    values[6].isMulticam = true;
    values[7].zeroPoint = ostmediatypes::TickTime(1);
    values[8].tags = {"t"};
    for (std::size_t i = 0; i < values.size(); ++i) {
        for (std::size_t j = 0; j < values.size(); ++j) {
            EXPECT_EQ(values[i] == values[j], i == j);
            EXPECT_EQ(values[i] != values[j], i != j);
            EXPECT_EQ((values[i] < values[j]) + (values[j] < values[i]), i == j ? 0 : 1) << i << " " << j;
        }
    }
    EXPECT_TRUE(values[2] < values[1]);
}

TEST(AssetNamesTest, GeneratedNamesAreGuidsInBraces) {
    const Guid guid = Guid::CreateUnique();
    const std::string text = guid.ToString();
    const UString inside(text.begin(), text.end());
    EXPECT_TRUE(IsZOAssetName(u"{" + inside + u"}"));
    EXPECT_FALSE(IsZOAssetName(inside));
    EXPECT_FALSE(IsZOAssetName(u"{{" + inside + u"}}"));
    EXPECT_FALSE(IsZOAssetName(u"{no guid}"));
    EXPECT_FALSE(IsZOAssetName(u"{}"));
    EXPECT_FALSE(IsZOAssetName(u""));
}

}  // namespace
}  // namespace ZOCL
