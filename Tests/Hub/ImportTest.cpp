// Import, re-import, export and check, on real media.
#include <sqlite3.h>

#include "Base/Clock.h"
#include "Base/Digest.h"
#include "Commands/Checker.h"
#include "Commands/Importer.h"
#include "HubFixture.h"

namespace zohub::test {

namespace fs = std::filesystem;

namespace {

char const kNoJpeg[] = "this is no picture";

std::string SampleJpeg() {
    return ReadFile(fs::path(ZOHUB_SAMPLE_MEDIA) / "broll" / "gulls.jpg");
}

}  // namespace

class ImportTest : public HubTest {
protected:
    ImportReport Run(fs::path const& inDirectory, std::string const& inOwner = "anna") {
        ImportRequest request;
        request.directory = inDirectory.string();
        request.production = "Film";
        request.owner = inOwner;
        request.mount = "store";
        return Import(mHub.Data(), request, SystemClock()(), [](std::size_t, std::size_t) {});
    }

    Json Assets(ImportReport const& inReport) {
        Json const list = Json::parse(mAnna.Get("/zo/1/p/" + inReport.productionId + "/full").body);
        Json byName = Json::object();
        for (auto const& asset : list["assets"])
            byName[asset["properties"]["name"].get<std::string>()] = asset;
        return byName;
    }

    void Damage(char const* inSql) {
        sqlite3* database = nullptr;
        ASSERT_EQ(sqlite3_open((mHub.DataPath() / "hub.sqlite").c_str(), &database), SQLITE_OK);
        EXPECT_EQ(sqlite3_exec(database, inSql, nullptr, nullptr, nullptr), SQLITE_OK)
            << sqlite3_errmsg(database);
        EXPECT_GT(sqlite3_changes(database), 0);
        sqlite3_close(database);
    }

    TemporaryDirectory mFolder;
};

TEST_F(ImportTest, TheSampleBecomesAProductionThatGivesItsBytesBack) {
    ImportReport const report = Run(ZOHUB_SAMPLE_MEDIA);
    EXPECT_TRUE(report.isNewProduction);
    EXPECT_EQ(report.added, 8u);
    EXPECT_TRUE(report.notes.empty());
    Json const assets = Assets(report);
    ASSERT_EQ(assets.size(), 8u);
    EXPECT_EQ(assets["broll"]["properties"]["cdzo:assetType"], "bin");
    Json const& clip = assets["anna-take1.mp4"];
    EXPECT_EQ(clip["properties"]["cdzo:assetType"], "masterclip");
    EXPECT_EQ(clip["properties"]["zo:parent"], assets["interviews"]["zo:assetId"]);
    std::string const locatorId = clip["properties"]["mediaLocator"].get<std::string>();
    Json const locator = Json::parse(mAnna.Get(LinkOf(clip, "locator")).body);
    EXPECT_EQ(locator["zo:mediaLocatorId"], locatorId);
    EXPECT_EQ(locator["properties"]["href"], "zomedia://store/interviews/anna-take1.mp4");
    EXPECT_EQ(locatorId, locator["properties"]["docId"].get<std::string>() + "-" +
                             locator["properties"]["contentStateId"].get<std::string>());

    Json const& enclosure = clip["enclosures"]["enclosures"][0];
    EXPECT_EQ(enclosure["name"], locatorId + "_xmp");
    fs::path const root = ZOHUB_SAMPLE_MEDIA;
    EXPECT_EQ(mAnna.Get(LinkOf(enclosure, "/enclosures/enclosure")).body,
              ReadFile(root / "interviews" / "anna-take1.xmp"));
    Json const& rendition = clip["renditions"]["renditions"][0];
    EXPECT_EQ(rendition["properties"]["zo:mimeType"], "video/mp4");
    EXPECT_EQ(mAnna.Get(LinkOf(rendition, "/renditions/rendition")).body,
              ReadFile(root / "interviews" / "anna-take1.mp4"));
    EXPECT_EQ(assets["room-tone.wav"]["renditions"]["renditions"].size(), 0u);
    EXPECT_EQ(assets["room-tone.wav"]["enclosures"]["enclosures"].size(), 1u);
    EXPECT_EQ(assets["slate.png"]["renditions"]["renditions"][0]["properties"]["zo:mimeType"], "image/png");
    EXPECT_TRUE(CheckStorage(mHub.Data()).problems.empty());
}

TEST_F(ImportTest, ASecondImportTakesWhatIsNewOrChangedInOneCommit) {
    WriteFile(mFolder.Path() / "a.jpg", SampleJpeg());
    WriteFile(mFolder.Path() / "a.xmp", "<one/>");
    WriteFile(mFolder.Path() / "day 1" / "b.jpg", SampleJpeg() + "b");
    ImportReport const first = Run(mFolder.Path());
    EXPECT_EQ(first.added, 3u);
    ImportReport const idle = Run(mFolder.Path());
    EXPECT_EQ(idle.commitId, first.commitId);
    EXPECT_EQ(idle.unchanged, 3u);

    Json const before = Assets(first);
    // What people do in the production stays theirs.
    Json properties = before["a.jpg"]["properties"];
    properties["description"] = "the best one";
    ASSERT_EQ(mAnna.PutJson(LinkOf(before["a.jpg"], "edit"), properties.dump()).status, 200);
    WriteFile(mFolder.Path() / "a.xmp", "<two/>");
    WriteFile(mFolder.Path() / "day 1" / "b.jpg", SampleJpeg() + "b changed");
    WriteFile(mFolder.Path() / "day 2" / "c.jpg", SampleJpeg());
    ImportReport const second = Run(mFolder.Path());
    EXPECT_FALSE(second.isNewProduction);
    EXPECT_EQ(second.productionId, first.productionId);
    EXPECT_EQ(second.added, 2u);
    EXPECT_EQ(second.changed, 2u);
    EXPECT_EQ(second.unchanged, 1u);

    Json const after = Assets(second);
    EXPECT_EQ(after["a.jpg"]["properties"]["description"], "the best one");
    EXPECT_EQ(after["a.jpg"]["properties"]["mediaLocator"], before["a.jpg"]["properties"]["mediaLocator"]);
    Json const& sidecar = after["a.jpg"]["enclosures"]["enclosures"];
    ASSERT_EQ(sidecar.size(), 1u);
    EXPECT_EQ(mAnna.Get(LinkOf(sidecar[0], "/enclosures/enclosure")).body, "<two/>");
    EXPECT_EQ(after["b.jpg"]["zo:assetId"], before["b.jpg"]["zo:assetId"]);
    EXPECT_NE(after["b.jpg"]["properties"]["mediaLocator"], before["b.jpg"]["properties"]["mediaLocator"]);
    EXPECT_EQ(after["b.jpg"]["renditions"]["renditions"].size(), 1u);
    EXPECT_TRUE(CheckStorage(mHub.Data()).problems.empty());
}

TEST_F(ImportTest, NothingOutsideTheFolderIsTaken) {
    TemporaryDirectory outside;
    WriteFile(outside.Path() / "secret.jpg", SampleJpeg());
    WriteFile(outside.Path() / "secret.xmp", "<secret/>");
    WriteFile(mFolder.Path() / "in.jpg", SampleJpeg());
    fs::create_symlink(outside.Path() / "secret.jpg", mFolder.Path() / "link.jpg");
    fs::create_symlink(outside.Path() / "secret.xmp", mFolder.Path() / "in.xmp");
    fs::create_directory_symlink(outside.Path(), mFolder.Path() / "folder");
    WriteFile(mFolder.Path() / "bad\nname.jpg", SampleJpeg());
    WriteFile(mFolder.Path() / "bad\xff.jpg", SampleJpeg());
    WriteFile(mFolder.Path() / ".hidden.jpg", SampleJpeg());
    WriteFile(mFolder.Path() / "notes.txt", "no media");
    WriteFile(mFolder.Path() / "fake.jpg", kNoJpeg);
    WriteFile(mFolder.Path() / (std::string(250, 'n') + ".jpg"), SampleJpeg());
    ImportReport const report = Run(mFolder.Path());
    Json const assets = Assets(report);
    EXPECT_EQ(assets.size(), 3u);
    EXPECT_EQ(assets["in.jpg"]["enclosures"]["enclosures"].size(), 0u);
    EXPECT_EQ(assets["fake.jpg"]["renditions"]["renditions"].size(), 0u);
    EXPECT_EQ(report.notes.size(), 7u);
    EXPECT_EQ(mAnna.Get("/zo/1/p/" + report.productionId + "/pe/" + Sha256Hex("<secret/>")).status, 404);
}

TEST_F(ImportTest, AnImportThatFailsLeavesNothingToSee) {
    WriteFile(mFolder.Path() / "a.jpg", SampleJpeg());
    EXPECT_THROW(Run(mFolder.Path(), "nobody"), std::runtime_error);
    EXPECT_THROW(Run(mFolder.Path() / "missing"), std::runtime_error);
    EXPECT_EQ(Json::parse(mAnna.Get("/zo/1/p").body)["productions"].size(), 0u);
    EXPECT_TRUE(CheckStorage(mHub.Data()).problems.empty());
}

TEST_F(ImportTest, CheckFindsWhatWasDamaged) {
    Run(ZOHUB_SAMPLE_MEDIA);
    auto const problems = [this] {
        std::string all;
        for (auto const& problem : CheckStorage(mHub.Data()).problems)
            all += problem + "\n";
        return all;
    };
    EXPECT_EQ(problems(), "");
    Damage("UPDATE content SET data=CAST('other' AS BLOB) WHERE id=1");
    EXPECT_NE(problems().find("does not have the bytes"), std::string::npos);
    Damage("DELETE FROM content WHERE id=2");
    EXPECT_NE(problems().find("refers to content that is missing"), std::string::npos);
    Damage("DELETE FROM refs WHERE kind='asset'");
    EXPECT_NE(problems().find("not listed as part"), std::string::npos);
    Damage("UPDATE commits SET title='forged' WHERE parent<>''");
    EXPECT_NE(problems().find("does not have the fields"), std::string::npos);
    Damage(
        "UPDATE objects SET data=CAST('leaf' || char(10) || 'x y' || char(10) AS BLOB) "
        "WHERE substr(CAST(data AS TEXT),1,4)='leaf'");
    EXPECT_NE(problems().find("the tree of commit"), std::string::npos);
    Damage("UPDATE lines SET head='gone'");
    EXPECT_NE(problems().find("stands on a commit that is missing"), std::string::npos);
}

}  // namespace zohub::test
