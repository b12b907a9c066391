// Files and directories: bounds, modes, atomic replacement, harmless names.
#include "ostcore/filesupport/File.h"

#include <gtest/gtest.h>

#include <atomic>
#include <string>
#include <thread>

#include <fcntl.h>
#include <signal.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

#include "ostcore/utility/StringConversion.h"
#include "TestSupport.h"

namespace {

using namespace ostcore::filesupport;
using ostcore_test::TemporaryDirectory;

unsigned ModeOf(const std::string& inPath) {
    struct stat status {};
    return ::lstat(inPath.c_str(), &status) == 0 ? status.st_mode & 0777u : 0u;
}

TEST(File, ReplacesWholeAndLeavesNothingAside) {
    const TemporaryDirectory directory;
    const std::string path = directory.Path("state");
    ASSERT_TRUE(File::ReplaceAtomically(path, "first"));
    EXPECT_EQ(ModeOf(path), 0600u);
    ASSERT_TRUE(File::ReplaceAtomically(path, std::string(200000, 'x'), 0644));
    EXPECT_EQ(ModeOf(path), 0644u);
    const auto content = File::Read(path);
    ASSERT_TRUE(content);
    EXPECT_EQ(content->view(), std::string(200000, 'x'));
    EXPECT_EQ(directory.Dir().ListFiles(), std::vector<std::string>{"state"});
}

TEST(File, AFailedReplacementLeavesTheOldContentAndSaysWhy) {
    const TemporaryDirectory directory;
    std::string error;
    EXPECT_FALSE(File::ReplaceAtomically(directory.Path("absent/file"), "x", 0600, &error));
    EXPECT_NE(error.find("absent/file"), std::string::npos);
    // A directory stands in the way of the rename.
    ASSERT_EQ(::mkdir(directory.Path("taken").c_str(), 0700), 0);
    EXPECT_FALSE(File::ReplaceAtomically(directory.Path("taken"), "x", 0600, &error));
    EXPECT_TRUE(directory.Dir().ListFiles().empty());
}

/// Lets no file of the process grow beyond a size, as a full disk would.
class ScopedFileSizeLimit {
public:
    explicit ScopedFileSizeLimit(rlim_t inBytes) : mFormerHandler(::signal(SIGXFSZ, SIG_IGN)) {
        ::getrlimit(RLIMIT_FSIZE, &mFormer);
        const rlimit limit{inBytes, mFormer.rlim_max};
        ::setrlimit(RLIMIT_FSIZE, &limit);
    }
    ~ScopedFileSizeLimit() {
        ::setrlimit(RLIMIT_FSIZE, &mFormer);
        ::signal(SIGXFSZ, mFormerHandler);
    }
    ScopedFileSizeLimit(const ScopedFileSizeLimit&) = delete;
    ScopedFileSizeLimit& operator=(const ScopedFileSizeLimit&) = delete;

private:
    rlimit mFormer{};
    void (*const mFormerHandler)(int);
};

TEST(File, RunningOutOfRoomKeepsTheOldContent) {
    const TemporaryDirectory directory;
    const std::string path = directory.Path("state");
    ASSERT_TRUE(File::ReplaceAtomically(path, "old"));
    std::string error;
    {
        const ScopedFileSizeLimit limit(64 * 1024);
        EXPECT_FALSE(File::ReplaceAtomically(path, std::string(200000, 'n'), 0600, &error));
    }
    EXPECT_EQ(error, "Could not replace the file " + path + ": File too large.");
    ASSERT_TRUE(File::Read(path));
    EXPECT_EQ(File::Read(path)->view(), "old");
    EXPECT_EQ(directory.Dir().ListFiles(), std::vector<std::string>{"state"});
}

// Readers see one of the whole contents, never a mixture or a part.
TEST(File, ReadersNeverSeeAHalfWrittenFile) {
    const TemporaryDirectory directory;
    const std::string path = directory.Path("raced");
    ASSERT_TRUE(File::ReplaceAtomically(path, std::string(50000, 'a')));
    std::atomic<bool> done{false};
    std::atomic<int> wrong{0};
    std::thread reader([&] {
        while (!done) {
            const auto content = File::Read(path);
            const std::string_view text = content ? content->view() : "";
            wrong += text.size() != 50000 || text.find_first_not_of(text[0]) != std::string_view::npos;
        }
    });
    for (int i = 0; i < 40; ++i) {
        ASSERT_TRUE(File::ReplaceAtomically(path, std::string(50000, static_cast<char>('a' + i % 2))));
    }
    done = true;
    reader.join();
    EXPECT_EQ(wrong, 0);
}

TEST(File, WhatIsWrittenToWhileItIsReadIsRefused) {
    const TemporaryDirectory directory;
    const std::string path = directory.Path("growing");
    ASSERT_TRUE(File::ReplaceAtomically(path, std::string(16u << 20, 'x')));
    std::atomic<bool> isOver{false};
    std::thread writer([&] {
        const int file = ::open(path.c_str(), O_WRONLY | O_CLOEXEC);
        while (!isOver) {
            EXPECT_EQ(::pwrite(file, "y", 1, 0), 1);
        }
        ::close(file);
    });
    std::string reason;
    bool isRefused = false;
    // Of a read that fits between two ticks of the file system's clock nothing can be told.
    for (int attempt = 0; attempt < 200 && !isRefused; ++attempt) {
        isRefused = !File::Read(path, kDefaultMaximumFileSize, &reason);
    }
    isOver = true;
    writer.join();
    EXPECT_TRUE(isRefused);
    EXPECT_NE(reason.find("it was changed meanwhile"), std::string::npos) << reason;
    EXPECT_TRUE(File::Read(path));
}

TEST(File, ReadsUpToTheBoundAndRefusesWhatIsNoFile) {
    const TemporaryDirectory directory;
    const std::string path = directory.Path("data");
    ASSERT_TRUE(File::ReplaceAtomically(path, "12345"));
    std::string error;
    ASSERT_TRUE(File::Read(path, 5));
    EXPECT_FALSE(File::Read(path, 4, &error));
    EXPECT_NE(error.find("larger than 4"), std::string::npos) << error;
    EXPECT_FALSE(File::Read(directory.Dir().Path(), 100, &error));
    EXPECT_NE(error.find("not a regular file"), std::string::npos) << error;
    ASSERT_EQ(::mkfifo(directory.Path("pipe").c_str(), 0600), 0);
    EXPECT_FALSE(File::Read(directory.Path("pipe"), 100, &error));  // and does not hang
    EXPECT_FALSE(File::Read(directory.Path("absent"), 100, &error));
    // A file of the kernel says 0 bytes and has more.
    const auto fromKernel = File::Read("/proc/self/status");
    ASSERT_TRUE(fromKernel);
    EXPECT_GT(fromKernel->size(), 0u);
    ASSERT_TRUE(File::ReplaceAtomically(path, ""));
    ASSERT_TRUE(File::Read(path));
    EXPECT_TRUE(File::Read(path)->empty());
    EXPECT_TRUE(File::Remove(path));
    EXPECT_TRUE(File::Remove(path));
    EXPECT_FALSE(File::Exists(path));
}

TEST(Dir, IsMadePrivateWithItsParents) {
    const TemporaryDirectory directory;
    const Dir deep = directory.Dir().SubDir("a").SubDir("b");
    EXPECT_FALSE(deep.Exists());
    ASSERT_TRUE(deep.CreatePrivate());
    EXPECT_EQ(ModeOf(deep.Path()), 0700u);
    EXPECT_EQ(ModeOf(directory.Path("a")), 0700u);
    EXPECT_TRUE(deep.CreatePrivate());
    ASSERT_TRUE(File::ReplaceAtomically(directory.Path("file"), "x"));
    std::string error;
    EXPECT_FALSE(directory.Dir().SubDir("file").SubDir("below").CreatePrivate(&error));
    EXPECT_NE(error.find("file/below"), std::string::npos) << error;
    EXPECT_FALSE(Dir().CreatePrivate());
}

TEST(Dir, RemovalDoesNotFollowLinks) {
    const TemporaryDirectory directory;
    const Dir outside = directory.Dir().SubDir("outside");
    const Dir inside = directory.Dir().SubDir("inside");
    ASSERT_TRUE(outside.CreatePrivate() && inside.CreatePrivate());
    ASSERT_TRUE(File::ReplaceAtomically(outside.FilePath("kept"), "x"));
    ASSERT_EQ(::symlink(outside.Path().c_str(), inside.FilePath("link").c_str()), 0);
    ASSERT_EQ(::symlink(outside.FilePath("kept").c_str(), inside.FilePath("filelink").c_str()), 0);
    EXPECT_TRUE(inside.ListFiles().empty());
    EXPECT_TRUE(inside.RemoveAll());
    EXPECT_TRUE(File::Exists(outside.FilePath("kept")));
}

TEST(SanitizeFileName, GivesAHarmlessNameForAnyText) {
    EXPECT_EQ(SanitizeFileName("Scene 1.mov"), "Scene 1.mov");
    EXPECT_EQ(SanitizeFileName("../../etc/passwd"), "_.._etc_passwd");
    EXPECT_EQ(SanitizeFileName("a/b\\c:d*e?f\"g<h>i|j"), "a_b_c_d_e_f_g_h_i_j");
    EXPECT_EQ(SanitizeFileName(std::string("a\0b\n", 4)), "a_b_");
    EXPECT_EQ(SanitizeFileName(".."), "_");
    EXPECT_EQ(SanitizeFileName(""), "_");
    EXPECT_EQ(SanitizeFileName(" .hidden. "), "hidden");
    EXPECT_EQ(SanitizeFileName("CON.txt"), "_CON.txt");
    EXPECT_EQ(SanitizeFileName("lpt1"), "_lpt1");
    EXPECT_EQ(SanitizeFileName("console"), "console");
    EXPECT_EQ(SanitizeFileName("\xFFx"), "\xEF\xBF\xBDx");
}

TEST(SanitizeFileName, CutsBetweenCharactersAndKeepsTheExtension) {
    std::string umlauts;
    for (int i = 0; i < 300; ++i) {
        umlauts += "\xC3\xA4";
    }
    for (std::size_t longest = 1; longest < 64; ++longest) {
        const std::string name = SanitizeFileName(umlauts + ".mov", longest);
        EXPECT_LE(name.size(), longest);
        EXPECT_TRUE(ostcore::utility::IsValidUTF8(name));
        EXPECT_FALSE(name.empty());
        if (longest > 8) {
            EXPECT_EQ(name.substr(name.size() - 4), ".mov");
        }
    }
}

}  // namespace
