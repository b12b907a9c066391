// File names made from foreign names, and files that appear whole or not at all.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <sstream>

#include "Failure.h"
#include "FileNames.h"
#include "FileWriter.h"
#include "ostcore/utility/StringConversion.h"
#include "State.h"

namespace zo {
namespace {

namespace fs = std::filesystem;

class InDirectory : public ::testing::Test {
protected:
    void SetUp() override {
        std::string pattern = (fs::temp_directory_path() / "zo-parts.XXXXXX").string();
        ASSERT_NE(::mkdtemp(pattern.data()), nullptr);
        mRoot = pattern;
    }
    void TearDown() override { fs::remove_all(mRoot); }

    std::string Path(const std::string& inName) const { return (mRoot / inName).string(); }
    static std::string Content(const std::string& inPath) {
        std::ifstream file(inPath, std::ios::binary);
        std::ostringstream text;
        text << file.rdbuf();
        return text.str();
    }
    std::size_t EntryCount() const {
        return static_cast<std::size_t>(
            std::distance(fs::directory_iterator(mRoot), fs::directory_iterator()));
    }

    fs::path mRoot;
};

using FileWriterTest = InDirectory;
using StateTest = InDirectory;

AssetItem Item(const std::string& inID, const std::string& inName, const std::string& inParent) {
    AssetItem item;
    item.assetIdentifier = ZOCL::ImmutableString(inID);
    item.name = ostcore::utility::ToUTF16(inName);
    item.parentIdentifier = ZOCL::ImmutableString(inParent);
    return item;
}

TEST_F(FileWriterTest, WritesWholeFilesAndNothingBeside) {
    const std::string bytes("a\0b\xff", 4);
    WriteFileWhole(Path("file"), bytes, Overwrite::Never);
    EXPECT_EQ(Content(Path("file")), bytes);
    EXPECT_EQ(EntryCount(), 1u);
}

TEST_F(FileWriterTest, NeverReplacesUnlessToldTo) {
    WriteFileWhole(Path("file"), "old", Overwrite::Never);
    EXPECT_THROW(WriteFileWhole(Path("file"), "new", Overwrite::Never), Failure);
    EXPECT_EQ(Content(Path("file")), "old");
    WriteFileWhole(Path("file"), "new", Overwrite::Replace);
    EXPECT_EQ(Content(Path("file")), "new");
    fs::create_symlink("nowhere", Path("link"));
    EXPECT_THROW(WriteFileWhole(Path("link"), "new", Overwrite::Never), Failure);
    fs::create_directory(Path("folder"));
    EXPECT_THROW(WriteFileWhole(Path("folder"), "new", Overwrite::Replace), Failure);
    EXPECT_EQ(EntryCount(), 3u);
}

TEST_F(FileWriterTest, AFailureNamesTheFileAndLeavesNothing) {
    try {
        WriteFileWhole(Path("missing/file"), "x", Overwrite::Never);
        FAIL() << "the folder does not exist";
    } catch (const Failure& failure) {
        EXPECT_NE(std::string(failure.what()).find("missing/file"), std::string::npos);
    }
    EXPECT_EQ(EntryCount(), 0u);
}

TEST(FileNames, AreMadeOfAssetNames) {
    EXPECT_EQ(RenditionFileName("gulls.jpg", "image/jpeg"), "gulls.jpg");
    EXPECT_EQ(RenditionFileName("gulls.JPEG", "image/jpeg"), "gulls.JPEG");
    EXPECT_EQ(RenditionFileName("anna.mov", "image/png"), "anna.mov.png");
    EXPECT_EQ(EnclosureFileName("gulls.jpg", "1-2", "1-2_xmp"), "gulls.jpg.xmp");
    EXPECT_EQ(EnclosureFileName("gulls.jpg", "1-2", "notes"), "gulls.jpg.notes");
    for (const std::string hostile : {"../../x", "/etc/passwd", "..", "a/../b", "a\\b"}) {
        for (const std::string& name :
             {RenditionFileName(hostile, "../" + hostile), EnclosureFileName("a", "", hostile),
              EnclosureFileName(hostile, "", "n")}) {
            EXPECT_EQ(name.find('/'), std::string::npos) << name;
            EXPECT_NE(name.front(), '.') << name;
        }
    }
}

TEST(BinFolders, FollowParentsAndSurviveARing) {
    const std::vector<AssetItem> items{
        Item("1", "broll", ""),   Item("2", "birds", "1"),  Item("3", "gulls.jpg", "2"),
        Item("4", "ring a", "5"), Item("5", "ring b", "4"), Item("6", "x", "4"),
        Item("7", "../up", ""),   Item("8", "y", "7"),      Item("9", "z", "gone")};
    const BinFolders folders(items);
    EXPECT_EQ(folders.FolderOf(items[2]), "broll/birds/");
    EXPECT_EQ(folders.FolderOf(items[0]), "");
    EXPECT_LT(folders.FolderOf(items[5]).size(), 1000u);
    EXPECT_EQ(folders.FolderOf(items[7]).find(".."), std::string::npos);
    EXPECT_EQ(folders.FolderOf(items[8]), "");
}

TEST(UniquePaths, GiveEveryPathOnce) {
    UniquePaths paths;
    EXPECT_EQ(paths.Claim("a/clip.jpg"), "a/clip.jpg");
    EXPECT_EQ(paths.Claim("a/clip.jpg"), "a/clip~2.jpg");
    EXPECT_EQ(paths.Claim("a/CLIP.jpg"), "a/CLIP~3.jpg");
    EXPECT_EQ(paths.Claim("b/clip.jpg"), "b/clip.jpg");
    EXPECT_EQ(paths.Claim("dir.x/noext"), "dir.x/noext");
    EXPECT_EQ(paths.Claim("dir.x/noext"), "dir.x/noext~2");
}

TEST_F(StateTest, KeepsOneLoginForEachUserNameNewestFirst) {
    ::setenv("ZOCLIENT_STATE_HOME", Path("state").c_str(), 1);
    State state;
    EXPECT_TRUE(state.Logins().empty());
    state.SetLogin({"https://a:1", "ada", true, "/ca.pem"});
    state.SetLogin({"http://b:2", "bob", false, ""});
    state.SetLogin({"http://c:3", "ada", false, ""});
    const auto logins = State().Logins();
    ASSERT_EQ(logins.size(), 2u);
    EXPECT_EQ(logins[0].server, "http://c:3");
    EXPECT_EQ(logins[1].user, "bob");
    state.SetOpen({"http://c:3", "ada", "p1", "Film", "c1"});
    state.SetOpen({"http://b:2", "bob", "p1", "Film", "c2"});
    state.SetOpen({"http://c:3", "ada", "p2", "Other", "c3"});
    EXPECT_EQ(state.Open("http://c:3", "ada")->production, "p2");
    EXPECT_EQ(state.Open("http://b:2", "bob")->commit, "c2");
    EXPECT_FALSE(state.Open("http://b:2", "ada"));
    struct stat found;
    ASSERT_EQ(::stat(state.Path().c_str(), &found), 0);
    EXPECT_EQ(found.st_mode & 0777, 0600u);

    std::ofstream(state.Path()) << "{\"logins\": [";
    EXPECT_THROW(state.Logins(), Failure);
    ::unsetenv("ZOCLIENT_STATE_HOME");
}

}  // namespace
}  // namespace zo
