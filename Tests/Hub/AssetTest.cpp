// Assets with their enclosures, renditions and media locators.
#include "Base/Digest.h"
#include "HubFixture.h"

namespace zohub::test {

class AssetTest : public HubTest {
protected:
    AssetTest() : mProduction(MakeProduction(mAnna, "Film")) {}

    Json FullList() { return Json::parse(mAnna.Get(LinkOf(mProduction, "/assets#full")).body); }
    std::string HeadCommit() {
        return Json::parse(mAnna.Get(LinkOf(mProduction, "self")).body)["zo:commitId"].get<std::string>();
    }

    Json const mProduction;
};

TEST_F(AssetTest, AnAssetComesBackWithItsPropertiesUnchanged) {
    std::string const properties =
        R"({"name":"Clip – 1","description":"d","mediaLocator":"a-b","zo:parent":"bin1","tags":["x"],)"
        R"("subClip":{"mStartBoundary":{"ticks":254016000000},"mEndBoundary":{"ticks":9007199254740993}},)"
        R"("cdzo:assetType":"subclip","isMulticamEnabled":false,"zeroPoint":{"ticks":-5},"x:later":{"k":[true,null]}})";
    Json const asset = MakeAsset(mAnna, mProduction, properties);
    EXPECT_EQ(asset["properties"].dump(), properties);
    Answer const loaded = mAnna.Get(LinkOf(asset, "self"));
    EXPECT_EQ(Json::parse(loaded.body), asset);
    EXPECT_EQ(loaded.Header("etag"), asset["zo:etag"].get<std::string>());
    EXPECT_NE(LinkOf(asset, "locator").find("/a-b"), std::string::npos);
    EXPECT_EQ(FullList()["assets"][0], asset);
    for (char const* relation : {"self", "edit", "delete", "latest-version", "/enclosures", "/renditions",
                                 "/enclosures/enclosure#create", "/renditions/rendition#create"})
        EXPECT_TRUE(HasLink(asset, relation)) << relation;
    EXPECT_FALSE(HasLink(MakeAsset(mAnna, mProduction, kClip), "locator"));
}

TEST_F(AssetTest, WrongBodiesAreRefusedAndMakeNoCommit) {
    std::string const before = HeadCommit();
    std::string const factory = LinkOf(mProduction, "/assets/asset#create");
    for (char const* body : {"", "null", "{}", R"({"properties":[]})", R"({"properties":{"name":"x"}})",
                             R"({"properties":{"name":1,"cdzo:assetType":"bin"}})",
                             R"({"properties":{"cdzo:assetType":"bin","tags":[2]}})",
                             R"({"properties":{"cdzo:assetType":"bin","isMulticamEnabled":"true"}})",
                             R"({"properties":{"cdzo:assetType":"bin","zeroPoint":{"ticks":"0"}}})",
                             R"({"properties":{"cdzo:assetType":"bin","zo:parent":"../x"}})",
                             R"({"zo:assetId":"a/b","properties":{"cdzo:assetType":"bin"}})",
                             R"({"zo:assetId":"..","properties":{"cdzo:assetType":"bin"}})"})
        EXPECT_EQ(mAnna.PostJson(factory, body).status, 400) << body;
    EXPECT_EQ(HeadCommit(), before);
}

TEST_F(AssetTest, ListsFilterByParentAndCountWhatTheyHold) {
    Json const bin =
        MakeAsset(mAnna, mProduction, R"({"name":"bin","description":"","cdzo:assetType":"bin"})");
    std::string const id = bin["zo:assetId"].get<std::string>();
    MakeAsset(mAnna, mProduction,
              R"({"name":"in","description":"","zo:parent":")" + id + R"(","cdzo:assetType":"masterclip"})");
    for (char const* relation : {"/assets", "/assets#full"}) {
        std::string const href = LinkOf(mProduction, relation);
        Json const all = Json::parse(mAnna.Get(href).body);
        EXPECT_EQ(all["stats"]["totalResults"], 2);
        EXPECT_TRUE(HasLink(all, "create"));
        EXPECT_TRUE(HasLink(all, "/assets#restore"));
        Json const inside = Json::parse(mAnna.Get(href + "?parentId=" + id).body);
        ASSERT_EQ(inside["assets"].size(), 1u);
        EXPECT_EQ(inside["assets"][0]["properties"]["name"], "in");
        EXPECT_EQ(all["assets"][0].contains("enclosures"), std::string(relation) == "/assets#full");
    }
}

TEST_F(AssetTest, EditingNeedsTheCurrentTag) {
    Json const asset = MakeAsset(mAnna, mProduction, kClip);
    std::string const edit = LinkOf(asset, "edit");
    std::string const tag = asset["zo:etag"].get<std::string>();
    Answer const changed = mAnna.PutJson(
        edit, R"({"name":"new","description":"","cdzo:assetType":"masterclip"})", {{"If-Match", tag}});
    ASSERT_EQ(changed.status, 200);
    EXPECT_NE(changed.Header("etag"), tag);
    EXPECT_EQ(mAnna.PutJson(edit, kClip, {{"If-Match", tag}}).status, 412);
    EXPECT_EQ(mAnna.Request("DELETE", edit, {}, {{"If-Match", tag}}).status, 412);

    std::string const commit = HeadCommit();
    EXPECT_EQ(mAnna.PutJson(edit, Json::parse(changed.body)["properties"].dump()).status, 200);
    EXPECT_EQ(HeadCommit(), commit) << "writing what is there already is no commit";
}

TEST_F(AssetTest, ADeletedAssetLivesInOldCommitsAndCanBeRestored) {
    Json const asset = MakeAsset(mAnna, mProduction, kClip);
    std::string const id = asset["zo:assetId"].get<std::string>();
    std::string const before = HeadCommit();
    ASSERT_EQ(mAnna.Request("DELETE", LinkOf(asset, "delete")).status, 204);
    EXPECT_EQ(mAnna.Get(LinkOf(asset, "self")).status, 404);
    EXPECT_EQ(FullList()["assets"].size(), 0u);

    std::string byId = LinkOf(mProduction, "/assets/asset#byId");
    byId.replace(byId.find("{assetId}"), 9, id);
    std::string atCommit = byId;
    atCommit.replace(atCommit.find("{commitId}"), 10, before);
    Json const old = Json::parse(mAnna.Get(atCommit).body);
    EXPECT_EQ(old["properties"], asset["properties"]);
    EXPECT_FALSE(HasLink(old, "edit"));

    std::string restore = LinkOf(FullList(), "/assets#restore");
    restore.replace(restore.find("{assetContentId}"), 16, asset["zo:assetContentId"].get<std::string>());
    Answer const restored = mAnna.PostJson(restore, "{}");
    ASSERT_EQ(restored.status, 201);
    EXPECT_EQ(Json::parse(restored.body), asset);
    EXPECT_EQ(restored.Header("location"), LinkOf(asset, "self"));
    EXPECT_EQ(mAnna.PostJson(restore, "{}").status, 200);
    std::string head = byId;
    head.replace(head.find("{commitId}"), 10, "HEAD");
    EXPECT_EQ(Json::parse(mAnna.Get(head).body), asset);
}

TEST_F(AssetTest, ContentOfAnotherProductionIsOutOfReachEvenByItsHash) {
    Json const asset = MakeAsset(mAnna, mProduction, kClip);
    mAnna.SendForm("POST", LinkOf(asset, "/enclosures/enclosure#create"),
                   Form().Add(":name", "n").Add(":enclosure", "secret text"));
    Client const ben = mHub.SignedIn("ben");
    std::string const base = LinkOf(MakeProduction(ben, "Ben's"), "self");
    std::string const hash = Sha256Hex("secret text");
    EXPECT_EQ(mAnna.Get(LinkOf(mProduction, "self") + "/pe/" + hash).status, 200);
    EXPECT_EQ(ben.Get(base + "/pe/" + hash).status, 404);
    EXPECT_EQ(ben.Get(base + "/ce/" + hash).status, 404);
    EXPECT_EQ(ben.PostJson(base + "/restore/" + asset["zo:assetContentId"].get<std::string>(), "{}").status,
              404);
}

TEST_F(AssetTest, EnclosuresOfAssetsAndProductionsAreMadeReadAndReplaced) {
    std::string const bytes("\0bin\r\n--x\r\n\xff", 12);
    Json const asset = MakeAsset(mAnna, mProduction, kClip);
    for (std::string const& factory :
         {LinkOf(asset, "/enclosures/enclosure#create"), LinkOf(mProduction, "/enclosures")}) {
        Answer const created = mAnna.SendForm(
            "POST", factory,
            Form().Add(":name", "clip_xmp", "text/plain").Add(":enclosure", bytes, "image/x-raw"));
        ASSERT_EQ(created.status, 201) << created.body;
        Json const enclosure = Json::parse(created.body);
        EXPECT_EQ(enclosure["name"], "clip_xmp");
        EXPECT_EQ(enclosure["zo:enclosureContentId"], Sha256Hex(bytes));
        EXPECT_EQ(created.Header("location"), LinkOf(enclosure, "self"));
        EXPECT_EQ(created.Header("etag"), enclosure["zo:etag"].get<std::string>());
        Answer const payload = mAnna.Get(LinkOf(enclosure, "/enclosures/enclosure"));
        EXPECT_EQ(payload.body, bytes);
        EXPECT_EQ(payload.Header("content-type"), "image/x-raw");
        EXPECT_NE(payload.Header("cache-control").find("immutable"), std::string::npos);
        EXPECT_EQ(payload.Header("etag"), "\"" + Sha256Hex(bytes) + "\"");

        Answer const twice =
            mAnna.SendForm("POST", factory, Form().Add(":name", "clip_xmp").Add(":enclosure", "other"));
        EXPECT_EQ(twice.status, 409);

        std::string const edit = LinkOf(enclosure, "edit");
        Answer const replaced = mAnna.SendForm("PUT", edit, Form().Add(":enclosure", "new"),
                                               {{"If-Match", created.Header("etag")}});
        ASSERT_EQ(replaced.status, 200);
        EXPECT_EQ(mAnna.Get(LinkOf(Json::parse(replaced.body), "/enclosures/enclosure")).body, "new");
        EXPECT_EQ(mAnna
                      .SendForm("PUT", edit, Form().Add(":enclosure", "late"),
                                {{"If-Match", created.Header("etag")}})
                      .status,
                  412);
        EXPECT_EQ(mAnna.Get(LinkOf(enclosure, "/enclosures/enclosure")).body, bytes) << "old content stays";

        Json const list = Json::parse(mAnna.Get(factory).body);
        ASSERT_EQ(list["enclosures"].size(), 1u);
        EXPECT_TRUE(HasLink(list, "create"));
        std::string byContent = LinkOf(list, "/enclosures/enclosure#byContentId");
        byContent.replace(byContent.find("{contentId}"), 11, Sha256Hex(bytes));
        Json const found = Json::parse(mAnna.Get(byContent).body);
        EXPECT_EQ(found["name"], "clip_xmp");
        EXPECT_EQ(mAnna.Get(LinkOf(found, "/enclosures/enclosure")).body, bytes);
        EXPECT_EQ(mAnna.Request("DELETE", edit).status, 204);
        EXPECT_EQ(mAnna.Get(edit).status, 404);
    }
}

TEST_F(AssetTest, EnclosureNamesThatLeadElsewhereAreRefused) {
    std::string const factory = LinkOf(mProduction, "/enclosures");
    for (std::string const& name :
         {std::string(), std::string("../x"), std::string("a/../b"), std::string("/etc/x"),
          std::string("a\\b"), std::string("a\0b", 3), std::string("\xff"), std::string(1025, 'n')}) {
        EXPECT_EQ(mAnna.SendForm("POST", factory, Form().Add(":name", name).Add(":enclosure", "x")).status,
                  400)
            << name;
    }
    EXPECT_EQ(mAnna.SendForm("POST", factory, Form().Add(":name", "only a name")).status, 400);
    EXPECT_EQ(
        mAnna.SendForm("POST", factory, Form().Add(":name", "A & B/state.json").Add(":enclosure", "")).status,
        201);
}

TEST_F(AssetTest, RenditionsAreMadeReadAndReplaced) {
    Json const asset = MakeAsset(mAnna, mProduction, kClip);
    std::string const factory = LinkOf(asset, "/renditions/rendition#create");
    Answer const created = mAnna.Request("POST", factory, "jpeg bytes", {{"Content-Type", "image/jpeg"}});
    ASSERT_EQ(created.status, 201);
    Json const rendition = Json::parse(created.body);
    EXPECT_EQ(rendition["properties"]["zo:mimeType"], "image/jpeg");
    EXPECT_EQ(rendition["zo:renditionContentId"], Sha256Hex("jpeg bytes"));
    Answer const payload = mAnna.Get(LinkOf(rendition, "/renditions/rendition"));
    EXPECT_EQ(payload.body, "jpeg bytes");
    EXPECT_EQ(payload.Header("content-type"), "image/jpeg");
    std::string const media = LinkOf(rendition, "edit-media");
    ASSERT_EQ(mAnna.Request("PUT", media, "better", {{"Content-Type", "image/png"}}).status, 200);
    EXPECT_EQ(mAnna.Get(media).body, "better");
    EXPECT_EQ(FullList()["assets"][0]["renditions"]["renditions"][0]["properties"]["zo:mimeType"],
              "image/png");
    EXPECT_EQ(mAnna.Request("POST", factory, "x").status, 415);
    EXPECT_EQ(mAnna.Request("DELETE", LinkOf(rendition, "self")).status, 204);
    EXPECT_EQ(Json::parse(mAnna.Get(LinkOf(asset, "/renditions")).body)["renditions"].size(), 0u);
}

TEST_F(AssetTest, LocatorsAreMadeOnceAndSharedThroughProductions) {
    std::string const id = NewGuid() + "-" + NewGuid();
    Json const properties = {{"href", "zomedia://store/a.mov"}, {"docId", NewGuid()},
                             {"contentStateId", NewGuid()},     {"displayName", "a.mov"},
                             {"stillSequenceParams", nullptr},  {"numberedStills", nullptr}};
    Form const form = Form().Add(":id", id).Add(":medialocator", properties.dump(), "application/json");
    Answer const created = mAnna.SendForm("POST", "/zo/1/l", form);
    ASSERT_EQ(created.status, 201) << created.body;
    Json const locator = Json::parse(created.body);
    EXPECT_EQ(locator["zo:mediaLocatorId"], id);
    EXPECT_EQ(locator["properties"], properties);
    EXPECT_EQ(mAnna.SendForm("POST", "/zo/1/l", form).status, 409);
    std::string const self = LinkOf(locator, "self");

    Client const ben = mHub.SignedIn("ben");
    EXPECT_EQ(ben.Get(self).status, 404);
    EXPECT_EQ(ben.SendForm("POST", "/zo/1/l", form).status, 409);
    MakeAsset(
        mAnna, mProduction,
        R"({"name":"c","description":"","mediaLocator":")" + id + R"(","cdzo:assetType":"masterclip"})");
    EXPECT_EQ(ben.Get(self).status, 404);
    auto const transaction = mHub.Data().BeginWrite();
    transaction->Grant(mProduction["zo:productionId"].get<std::string>(), "ben");
    transaction->Commit();
    EXPECT_EQ(ben.Get(self).status, 200);

    Form const moved =
        Form().Add(":id", id).Add(":medialocator", R"({"href":"zomedia://store/b.mov"})", "application/json");
    EXPECT_EQ(ben.SendForm("PUT", self, moved, {{"If-Match", "\"x\""}}).status, 412);
    EXPECT_EQ(ben.SendForm("PUT", self, moved, {{"If-Match", created.Header("etag")}}).status, 200);
    EXPECT_EQ(Json::parse(mAnna.Get(self).body)["properties"]["href"], "zomedia://store/b.mov");
    EXPECT_EQ(mAnna.SendForm("PUT", self, Form().Add(":id", id).Add(":medialocator", R"({"href":7})")).status,
              400);
    EXPECT_EQ(
        mAnna.SendForm("PUT", "/zo/1/l/no-such", Form().Add(":id", "no-such").Add(":medialocator", "{}"))
            .status,
        404);
    EXPECT_EQ(mAnna.SendForm("POST", "/zo/1/l", Form().Add(":id", "../x").Add(":medialocator", "{}")).status,
              400);
}

}  // namespace zohub::test
