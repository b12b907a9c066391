// Files that are not what was written, and directories that are not ours: nothing of them is ever given out.
#include "CacheFixture.h"

#include <unistd.h>

namespace {

using namespace QM;

class DamagedFile : public CacheFixture {
protected:
    DamagedFile() {
        Open();
        EXPECT_TRUE(Write(1));
        mFile = Files().front();
        mWhole = BytesOf(mFile);
    }
    /// The file is there, is not delivered, is gone afterwards, and can be stored again.
    void ExpectDropped(const std::string& inWhat) {
        EXPECT_FALSE(Read(KeyOf(1))) << inWhat;
        struct stat status {};
        EXPECT_NE(lstat(mFile.c_str(), &status), 0) << inWhat << ": the file is still there";
        EXPECT_TRUE(cache->ListNames(KeyOf(1)).empty()) << inWhat;
        EXPECT_TRUE(Write(1)) << inWhat;
        EXPECT_TRUE(Has(1)) << inWhat;
    }

    std::string mFile;
    std::string mWhole;
};

TEST_F(DamagedFile, IsDroppedWhateverByteIsWrong) {
    for (std::size_t at = 0; at < mWhole.size(); at += at < 70 ? 1 : 531) {
        std::string bytes = mWhole;
        bytes[at] = static_cast<char>(bytes[at] ^ 0x10);
        SetBytes(mFile, bytes);
        ExpectDropped("byte " + std::to_string(at));
    }
}

TEST_F(DamagedFile, IsDroppedWhereverItIsCut) {
    for (std::size_t size = 0; size < mWhole.size(); size += size < 70 ? 1 : 531) {
        SetBytes(mFile, mWhole.substr(0, size));
        ExpectDropped("cut at " + std::to_string(size));
    }
    SetBytes(mFile, mWhole + "x");
    ExpectDropped("a byte too many");
    SetBytes(mFile, mWhole);
    std::filesystem::resize_file(mFile, std::uintmax_t(1) << 40);
    ExpectDropped("a terabyte that is not there");
    SetBytes(mFile, std::string(mWhole.size(), '\0'));
    ExpectDropped("nothing but zeros");
}

TEST_F(DamagedFile, OfAnotherKeyIsNotThisOne) {
    EXPECT_TRUE(Write(2));
    for (const std::string& file : Files()) {
        if (file != mFile) {
            SetBytes(mFile, BytesOf(file));
        }
    }
    ExpectDropped("a sound file under the name of another");
}

TEST_F(DamagedFile, ThatIsNoFileIsNotFollowedOrWaitedFor) {
    const std::string elsewhere = mDirectory + "/elsewhere";
    SetBytes(elsewhere, mWhole);
    std::filesystem::remove(mFile);
    std::filesystem::create_symlink(elsewhere, mFile);
    ExpectDropped("a link to a sound file");
    EXPECT_EQ(BytesOf(elsewhere), mWhole);
    std::filesystem::remove(mFile);
    ASSERT_EQ(mkfifo(mFile.c_str(), 0600), 0);
    ExpectDropped("a pipe");
    std::filesystem::remove(mFile);
    std::filesystem::create_directory(mFile);
    EXPECT_FALSE(Read(KeyOf(1)));
    Open();
    EXPECT_FALSE(Read(KeyOf(1)));
    EXPECT_TRUE(cache->ListNames(KeyOf(1)).empty() || !Read(KeyOf(1)));
}

TEST_F(DamagedFile, ADirectoryBelowThatIsALinkIsNotUsed) {
    const std::filesystem::path shard = std::filesystem::path(mFile).parent_path();
    std::filesystem::rename(shard, mDirectory + "/moved");
    std::filesystem::create_directory_symlink(mDirectory + "/moved", shard);
    Open();
    EXPECT_FALSE(Read(KeyOf(1)));
    Write(1);
    EXPECT_FALSE(Read(KeyOf(1)));
    EXPECT_EQ(BytesOf(mDirectory + "/moved/" + std::filesystem::path(mFile).filename().string()), mWhole);
    EXPECT_TRUE(Write(2)) << "the others are";
    EXPECT_TRUE(Has(2));
}

class CacheDirectoryTest : public CacheFixture {
protected:
    /// The reason why it cannot be used; empty when it can.
    std::string Refusal(const std::string& inPath) {
        shared_ptr<DiskCacheManager::ManagedDirectory> manager;
        const auto made = CreateDataCacheInFilesystemAndManageDirectory(inPath, manager, true);
        EXPECT_EQ(made == nullptr, manager == nullptr);
        if (made) {
            made->Close(0);
            return {};
        }
        std::string error;
        detail::CacheDirectory::Open(inPath, true, boost::make_shared<detail::FileOperations>(), error);
        return error;
    }
};

TEST_F(CacheDirectoryTest, ThatIsALinkIsNotUsed) {
    std::filesystem::create_directories(mDirectory + "/real/content");
    std::filesystem::create_directory_symlink(mDirectory + "/real/content", mPath);
    EXPECT_NE(Refusal(mPath), "");
    EXPECT_NE(Refusal(mPath + "/"), "") << "a slash at the end would follow it";
    std::filesystem::create_directory_symlink(mDirectory + "/real", mDirectory + "/link");
    EXPECT_NE(Refusal(mDirectory + "/link/content"), "");
    EXPECT_EQ(Refusal(mDirectory + "/real/content"), "");
    EXPECT_TRUE(std::filesystem::is_empty(mDirectory + "/real/content"));
}

TEST_F(CacheDirectoryTest, ThatCannotBeMadeOrIsNotOursIsNotUsed) {
    SetBytes(mPath, "a file");
    EXPECT_NE(Refusal(mPath), "");
    EXPECT_EQ(BytesOf(mPath), "a file");
    EXPECT_NE(Refusal("/proc/no-such-place"), "");
    EXPECT_NE(Refusal(""), "");
    // Belongs to root, whoever runs this but root itself, for whom it is given away.
    std::string foreign = "/usr/share";
    if (geteuid() == 0) {
        foreign = mDirectory + "/foreign";
        std::filesystem::create_directory(foreign);
        ASSERT_EQ(chown(foreign.c_str(), 12345, 12345), 0);
    }
    EXPECT_EQ(Refusal(foreign), "it belongs to another user");
}

}  // namespace
