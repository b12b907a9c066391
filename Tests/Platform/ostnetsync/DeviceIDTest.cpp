// The identifier of a machine: the same for all that ask, whatever stands in its file's place.
#include <stdlib.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>

#include <gtest/gtest.h>

#include "ostcore/filesupport/File.h"
#include "ostcore/utility/Guid.h"
#include "ostnetsync/detail/DeviceIDFile.h"
#include "ostnetsync/IDVConnection.h"

namespace ostnetsync {
namespace {

using ostcore::filesupport::Dir;
using ostcore::filesupport::File;
using ostcore::utility::Guid;

class DeviceIDTest : public testing::Test {
protected:
    DeviceIDTest() {
        std::string pattern = testing::TempDir() + "zo-device-XXXXXX";
        mRoot = mkdtemp(pattern.data());
    }
    ~DeviceIDTest() override { std::filesystem::remove_all(mRoot); }

    static bool IsID(const std::string& inText) {
        Guid id;
        return Guid::Parse(inText, id) && !id.IsNull();
    }
    std::string Path() const { return State().FilePath("machine-id"); }
    Dir State() const { return Dir(mRoot + "/below/state"); }

    std::string mRoot;
};

TEST_F(DeviceIDTest, IsMadeOnceForTheUserAlone) {
    const std::string id = ReadOrMakeDeviceID(State());
    EXPECT_TRUE(IsID(id)) << id;
    EXPECT_EQ(ReadOrMakeDeviceID(State()), id);
    struct stat status {};
    ASSERT_EQ(::stat(Path().c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 07777u, 0600u);
    EXPECT_EQ(State().ListFiles().size(), 1u) << "nothing is left beside it";
}

TEST_F(DeviceIDTest, WhatIsNoIdentifierIsReplacedAndNoLinkIsFollowed) {
    ASSERT_TRUE(State().CreatePrivate());
    for (const char* damaged : {"", "short", "00000000-0000-0000-0000-000000000000\n",
                                "../../../../../../etc/passwd-and-more-of-that"}) {
        ASSERT_TRUE(File::ReplaceAtomically(Path(), damaged));
        const std::string id = ReadOrMakeDeviceID(State());
        EXPECT_TRUE(IsID(id)) << damaged;
        EXPECT_EQ(ReadOrMakeDeviceID(State()), id);
    }
    const std::string elsewhere = mRoot + "/elsewhere";
    const std::string theirs = Guid::CreateUnique().ToString();
    ASSERT_TRUE(File::ReplaceAtomically(elsewhere, theirs));
    ASSERT_TRUE(File::Remove(Path()));
    ASSERT_EQ(::symlink(elsewhere.c_str(), Path().c_str()), 0);
    const std::string id = ReadOrMakeDeviceID(State());
    EXPECT_TRUE(IsID(id));
    EXPECT_NE(id, theirs);
    EXPECT_EQ(File::Read(elsewhere)->view(), theirs);
}

TEST_F(DeviceIDTest, WithoutAPlaceThereIsNoneToKeep) {
    std::ofstream(mRoot + "/file") << "in the way";
    EXPECT_EQ(ReadOrMakeDeviceID(Dir(mRoot + "/file/state")), "");
}

TEST_F(DeviceIDTest, ProcessesThatMakeItAtOnceAgree) {
    constexpr int children = 8;
    int start[2];
    int answers[2];
    ASSERT_EQ(::pipe(start), 0);
    ASSERT_EQ(::pipe(answers), 0);
    setenv("ZOCLIENT_STATE_HOME", State().Path().c_str(), 1);
    for (int child = 0; child < children; ++child) {
        if (::fork() == 0) {
            char go = 0;
            ::close(start[1]);
            const bool waited = ::read(start[0], &go, 1) == 0;
            const std::string id = IDVConnection::GetIDVDeviceID();
            const bool told = ::write(answers[1], id.data(), id.size()) == 36;
            ::_exit(waited && told ? 0 : 1);
        }
    }
    ::close(start[1]);
    for (int child = 0; child < children; ++child) {
        int status = -1;
        EXPECT_GT(::wait(&status), 0);
        EXPECT_EQ(status, 0);
    }
    ::close(answers[1]);
    ::close(start[0]);
    unsetenv("ZOCLIENT_STATE_HOME");
    char text[36];
    const std::string kept = ReadOrMakeDeviceID(State());
    for (int child = 0; child < children; ++child) {
        ASSERT_EQ(::read(answers[0], text, sizeof text), 36);
        EXPECT_EQ(std::string(text, sizeof text), kept);
    }
    ::close(answers[0]);
}

}  // namespace
}  // namespace ostnetsync
