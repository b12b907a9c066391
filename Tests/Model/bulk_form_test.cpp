// What bulk transactions put on the wire: every kind of part, the sizes of forms, and what is known
// afterwards.
#include "BulkTest.h"
#include "Model/Asset.h"
#include "Model/BulkForm.h"

namespace ZOCL {
namespace {

using testing::Each;
using testing::ElementsAre;

using BulkFormTest = BulkTest;

TEST_F(BulkFormTest, NewAssetsWithEverythingThatTheyStartWith) {
    const auto transaction = MakeTransaction();
    BulkRun run(transaction);
    BulkNewAsset full;
    full.properties = AssetBaseProperties(u"Gr\u00fcn", u"d", kAssetType_SubClip, "P1", true,
                                          ostmediatypes::TickTime(7), "q = 1");
    full.properties.tags = {"t1", "t2"};
    full.mediaLocator = "L1";
    full.subClip = SubClip{ostmediatypes::TickTime(1), ostmediatypes::TickTime(2), false};
    full.enclosures = {{"b", Bytes("data-b")}, {"a", Bytes("data-a")}, {"", Bytes("none")}};
    full.renditions = {{IZOCRendition::kFlavorPNG, Bytes("picture")}, {"image/none", nullptr}};
    Calls first;
    Calls second;
    ASSERT_TRUE(run.bulk->CreateNewAsset(first.Asset(), full));
    ASSERT_TRUE(Add(run.bulk, second.Asset(), u"Plain", "", "without a name"));
    run.bulk->AddEnclosureToNewAsset(1, "late", nullptr);
    run.bulk->AddEnclosureToNewAsset(2, "nowhere", Bytes("x"));
    EXPECT_EQ(run.Finish(), kResultSuccess);

    EXPECT_THAT(net->Lines(),
                ElementsAre("GET " + HubURL("/t1/assets").str(), "POST " + HubURL("/t1/bulk/create").str()));
    ExpectForm(LastRequest(),
               {{"assets+0+properties", kJSONType,
                 Quote("{'name':'Gr\u00fcn','description':'d','mediaLocator':'L1','zo:parent':'P1',"
                       "'tags':['t1','t2'],'subClip':{'mStartBoundary':{'ticks':1},'mEndBoundary':"
                       "{'ticks':2},'mBoundaryIsHard':false},'cdzo:assetType':'subclip',"
                       "'projectItemProperties':'','mergedClipMediaLocators':[],'isMulticamEnabled':true,"
                       "'zeroPoint':{'ticks':7},'smartBinQuery':'q = 1'}")},
                {"assets+0+enclosure+0+name", kTextType, "a"},
                {"assets+0+enclosure+0+data", kJSONType, "data-a"},
                {"assets+0+enclosure+1+name", kTextType, "b"},
                {"assets+0+enclosure+1+data", kJSONType, "data-b"},
                {"assets+0+rendition+0+data", "image/png", "picture"},
                {"assets+1+properties", kJSONType, NamedJSON("Plain")},
                {"assets+1+enclosure+0+name", kTextType, "late"},
                {"assets+1+enclosure+0+data", kJSONType, ""}});

    EXPECT_THAT(first.Results(), ElementsAre(kResultSuccess));
    ASSERT_THAT(second.Results(), ElementsAre(kResultSuccess));
    const auto asset = first.Assets()[0];
    EXPECT_EQ(asset->GetAssetIdentifier().view(), "A-0");
    EXPECT_EQ(asset->GetName(), u"Gr\u00fcn");
    SubClip subClip;
    EXPECT_TRUE(asset->GetSubClip(subClip));
    EXPECT_FALSE(second.Assets()[0]->GetSubClip(subClip)) << "no boundaries, no sub-clip";
    EXPECT_EQ(RFL::QueryInterface<IZOCServerResource>(asset)->GetHTTPURL(), HubURL("/t1/at/HEAD/a/A-0"));
    EXPECT_TRUE(IsHeld("C-data-a", "data-a"));
    EXPECT_TRUE(IsHeld("C-data-b", "data-b"));
}

TEST_F(BulkFormTest, Deletions) {
    BulkRun run(MakeTransaction());
    Calls calls;
    EXPECT_TRUE(run.bulk->DeleteAsset(calls.Result(), "A1"));
    EXPECT_TRUE(run.bulk->DeleteAsset(calls.Result(), "A2"));
    EXPECT_EQ(run.Finish(), kResultSuccess);
    ExpectForm(Last("POST", "/t1/bulk/delete"), {{"assets+A1", kTextType, ""}, {"assets+A2", kTextType, ""}});
    EXPECT_THAT(calls.Results(), ElementsAre(kResultSuccess, kResultSuccess));

    BulkRun without(MakeTransaction(BulkLinks()));
    EXPECT_FALSE(without.bulk->DeleteAsset(calls.Result(), "A1"));
    EXPECT_EQ(without.Finish(), kResultSuccess);
    EXPECT_EQ(CountOf("POST", "/t1/bulk/delete"), 1u);
}

TEST_F(BulkFormTest, EditsAreSplitIntoWhatIsThereAndWhatIsNew) {
    BulkRun run(MakeTransaction());
    AssetBaseProperties changed = Named(u"New");
    changed.tags = {"y"};
    Calls calls;
    const auto done = calls.Result();
    EXPECT_TRUE(run.bulk->SetAssetProperties(done, "A1", changed, boost::none, boost::none));
    EXPECT_TRUE(run.bulk->SetAssetEnclosure(done, "A1", "notes", Bytes("n1")));
    EXPECT_TRUE(run.bulk->SetAssetEnclosure(done, "A1", "fresh", Bytes("f1")));
    run.bulk->SetAssetRendition("A1", "image/jpeg", Bytes("j1"));
    run.bulk->SetAssetRendition("A1", "image/png", Bytes("p1"));
    EXPECT_TRUE(run.bulk->SetAssetEnclosure(done, "A2", "notes", Bytes("first")));
    EXPECT_TRUE(run.bulk->SetAssetEnclosure(done, "A2", "notes", Bytes("n2")));
    EXPECT_TRUE(run.bulk->SetAssetProperties(
        done, "A2", boost::none, SubClip{ostmediatypes::TickTime(3), ostmediatypes::TickTime(4), true},
        ImmutableString("L9")));
    run.bulk->SetProductionEnclosure("there_xmp", Bytes("px"), false);
    run.bulk->SetProductionEnclosure("new_xmp", Bytes("nx"), true);
    EXPECT_EQ(run.Finish(), kResultSuccess);

    // The first kind ends in the form that the second one goes on in.
    ExpectForm(Last("POST", "/t1/bulk/create"), {{"assets+A1+enclosure+0+name", kTextType, "fresh"},
                                                 {"assets+A1+enclosure+0+data", kJSONType, "f1"},
                                                 {"assets+A1+rendition+0+data", "image/png", "p1"},
                                                 {"enclosures+0+name", kTextType, "new_xmp"},
                                                 {"enclosures+0+data", kJSONType, "nx"}});
    const std::string rest =
        "'cdzo:assetType':'masterclip','projectItemProperties':'pip','mergedClipMediaLocators':['M1'],"
        "'isMulticamEnabled':false,'foreign':{'kept':[1,2]}}";
    ExpectForm(Last("PUT", "/t1/bulk/edit"),
               {{"assets+A1+properties", kJSONType,
                 Quote("{'name':'New','description':'','mediaLocator':'L0','zo:parent':'','tags':['y'],"
                       "'subClip':{'mStartBoundary':{'ticks':-9223372036854775808},'mEndBoundary':"
                       "{'ticks':-9223372036854775808}}," +
                       rest)},
                {"assets+A1+enclosure+E1+data", kJSONType, "n1"},
                {"assets+A1+rendition+R1+data", "image/jpeg", "j1"},
                {"assets+A2+properties", kJSONType,
                 Quote("{'name':'Old','description':'D','mediaLocator':'L9','zo:parent':'P0','tags':['x'],"
                       "'subClip':{'mStartBoundary':{'ticks':3},'mEndBoundary':{'ticks':4}}," +
                       rest)},
                {"assets+A2+enclosure+E2+data", kJSONType, "n2"},
                {"enclosures+EP+data", kJSONType, "px"}});
    EXPECT_THAT(calls.Results(), testing::AllOf(testing::SizeIs(6), Each(kResultSuccess)));
    for (const char* data : {"f1", "nx", "n1", "n2", "px"}) {
        EXPECT_TRUE(IsHeld(std::string("C-") + data, data)) << data;
    }
    // The lists of A1 came with it.
    EXPECT_EQ(CountOf("GET", "/A1/enclosures"), 0u);
    EXPECT_EQ(CountOf("GET", "/A2/enclosures"), 1u);
    EXPECT_EQ(CountOf("GET", "/t1/enclosures"), 1u);
}

TEST_F(BulkFormTest, AFormClosesBehindTheItemThatFillsItAndIndicesBeginAnew) {
    BulkRun run(MakeTransaction());
    const auto megabyte = Bytes(std::string(1 << 20, 'm'));
    Calls calls;
    for (int i = 0; i < 40; ++i) {
        BulkNewAsset asset;
        asset.properties = Named(u"N");
        asset.enclosures.emplace("big", megabyte);
        run.bulk->CreateNewAsset(calls.Asset(), asset);
    }
    EXPECT_EQ(run.Finish(), kResultSuccess);
    EXPECT_THAT(calls.Results(), testing::AllOf(testing::SizeIs(40), Each(kResultSuccess)));
    std::vector<std::pair<std::size_t, std::string>> forms;
    for (const RecordedRequest& request : net->Requests()) {
        if (request.verb == "POST") {
            const FormParts parts = PartsOf(request);
            forms.emplace_back(parts.size() / 3, parts[0].name);
        }
    }
    EXPECT_THAT(forms, testing::UnorderedElementsAre(std::make_pair(33u, "assets+0+properties"),
                                                     std::make_pair(7u, "assets+0+properties")));
}

TEST_F(BulkFormTest, TheSecondKindFollowsWhereTheFirstLeavesRoom) {
    BulkRun run(MakeTransaction());
    run.bulk->SetAssetEnclosure({}, "A1", "big", Bytes(std::string(BulkForm::kPayloadLimit + 1, 'b')));
    run.bulk->SetAssetEnclosure({}, "A2", "small", Bytes("s"));
    run.bulk->SetProductionEnclosure("new_xmp", Bytes("nx"), false);
    EXPECT_EQ(run.Finish(), kResultSuccess);
    std::vector<std::string> names;
    for (const RecordedRequest& request : net->Requests()) {
        if (request.verb == "POST") {
            std::string line;
            for (const FormPart& part : PartsOf(request)) {
                line += part.name + " ";
            }
            names.push_back(line);
        }
    }
    EXPECT_THAT(names, testing::UnorderedElementsAre(
                           "assets+A1+enclosure+0+name assets+A1+enclosure+0+data ",
                           "assets+A2+enclosure+0+name assets+A2+enclosure+0+data enclosures+0+name "
                           "enclosures+0+data "));
}

TEST_F(BulkFormTest, WhatWasCreatedHereIsEditedByItsIdentifiers) {
    BulkRun run(MakeTransaction());
    Calls edited;
    const auto bulk = run.bulk;
    const auto onCreated = [bulk, edited](int, const InterfaceRef<IZOCAsset>& inAsset) {
        const ImmutableString id = inAsset->GetAssetIdentifier();
        bulk->SetAssetEnclosure(edited.Result(), id, "notes", Bytes("second"));
        bulk->SetAssetProperties(edited.Result(), id, Named(u"After"), boost::none, boost::none);
        bulk->FinishedEditing();
    };
    ASSERT_TRUE(Add(run.bulk, onCreated, u"Before", "notes", "first"));
    run.bulk->FinishedCreatingNewAssets();
    EXPECT_EQ(run.Wait(), kResultSuccess);
    ExpectForm(LastRequest(), {{"assets+A-0+properties", kJSONType, NamedJSON("After")},
                               {"assets+A-0+enclosure+E-0+data", kJSONType, "second"}});
    EXPECT_THAT(Writes(), ElementsAre("POST /t1/bulk/create", "PUT /t1/bulk/edit"));
    EXPECT_THAT(edited.Results(), ElementsAre(kResultSuccess, kResultSuccess));
}

TEST_F(BulkFormTest, ARestoredAssetIsEditedAsOneThatIsThere) {
    BulkRun run(MakeTransaction());
    On("GET /A3/enclosures", JSONAnswer("{'enclosures':[" + EnclosureItem("E3", "notes") + "]}"));
    On("GET /A3/renditions", JSONAnswer("{'renditions':[]}"));
    run.bulk->NotifyOfRestoredAsset(Make<Asset>(AssetBody("A3", "")));
    run.bulk->NotifyOfRestoredAsset(nullptr);
    run.bulk->SetAssetEnclosure({}, "A3", "notes", Bytes("r"));
    EXPECT_EQ(run.Finish(), kResultSuccess);
    EXPECT_THAT(Writes(), ElementsAre("PUT /t1/bulk/edit"));
    ExpectForm(LastRequest(), {{"assets+A3+enclosure+E3+data", kJSONType, "r"}});
}

class BulkSourceTest : public BulkTest {
protected:
    BulkSourceTest() {
        ServiceDocument document;
        document.links.push_back({kRelation_Productions_Production_ByIdAndCommitId, ImmutableString(),
                                  HubURL("/p/{productionId}/{commitId}"), ImmutableString(),
                                  ImmutableString()});
        RFL::QueryInterface<DataServer>(server)->TakeLinksDocument(document);
        On("GET /p/p7/c3",
           JSONAnswer("{'zo:productionId':'p7','links':[" + Lists("/p7") + "," +
                      LinkTo(kRelation_Assets_Asset_ById, "/p7/at/{commitId}/{assetId}") + "]}"));
        On("GET /p7/assets", JSONAnswer("{'assets':[" + Source() + "],'links':[]}"));
        On("GET /src/enclosures", JSONAnswer("{'enclosures':[" + Payload("one") + "," + Payload("two") + "," +
                                             Payload("own") + "],'links':[]}"));
        On("GET /payload/one", ScriptedAnswer::Body("from source", "text/plain"));
        On("GET /payload/two", ScriptedAnswer::Status(403));
        On("GET /payload/own", ScriptedAnswer::Body("from source", "text/plain"));
    }
    static std::string Source() {
        return "{'zo:assetId':'src','properties':{'name':'S','description':'','cdzo:assetType':'bin'},"
               "'links':[" +
               LinkTo(kRelation_Enclosures, "/src/enclosures") + "]}";
    }
    static std::string Payload(const std::string& inName) {
        return "{'zo:enclosureId':'" + inName + "','name':'" + inName + "','links':[" +
               LinkTo(kRelation_Enclosures_Enclosure, "/payload/" + inName) + "]}";
    }
    /// Copies from an asset; the answer is the names of the parts.
    std::vector<std::string> Copy(const char* inAsset) {
        BulkRun run(MakeTransaction());
        BulkNewAsset asset;
        asset.properties = Named(u"Copy");
        asset.enclosures.emplace("own", Bytes("own"));
        asset.source = {"p7", "c3", inAsset};
        EXPECT_TRUE(run.bulk->CreateNewAsset({}, asset));
        EXPECT_EQ(run.Finish(), kResultSuccess);
        std::vector<std::string> bodies;
        for (const FormPart& part : PartsOf(LastRequest())) {
            bodies.push_back(part.body);
        }
        bodies.erase(bodies.begin());
        return bodies;
    }
};

TEST_F(BulkSourceTest, EnclosuresOfTheSourceAreCopiedAsFarAsTheyCanBeHad) {
    EXPECT_THAT(Copy("src"), ElementsAre("one", "from source", "own", "own"));
    EXPECT_EQ(CountOf("GET", "/p7/at/c3/src"), 0u);
    // The list does not hold it: it is asked for alone, once.
    On("GET /p7/assets", JSONAnswer("{'assets':[],'links':[]}"));
    On("GET /p7/at/c3/src", JSONAnswer(Source()));
    EXPECT_THAT(Copy("src"), ElementsAre("one", "from source", "own", "own"));
    On("GET /p7/at/c3/src", ScriptedAnswer::Status(404));
    EXPECT_THAT(Copy("src"), ElementsAre("own", "own"));
    EXPECT_EQ(CountOf("GET", "/p7/at/c3/src"), 2u);
}

}  // namespace
}  // namespace ZOCL
