// The debug database, localised texts, directories, and who this process is.
#include <gtest/gtest.h>

#include <unistd.h>

#include "HLM/HLM.h"
#include "ostcore/config/ClientInfo.h"
#include "ostcore/config/StateDirectories.h"
#include "ostcore/config/ZString.h"
#include "ostcore/debug/DebugDatabase.h"
#include "ostcore/filesupport/File.h"
#include "ostmediatypes/TickTime.h"
#include "TestSupport.h"

namespace {

using namespace ostcore;
using debug::DebugDatabase;
using ostcore_test::ScopedVariable;
using ostcore_test::TemporaryDirectory;

class DebugDatabaseTest : public testing::Test {
protected:
    void TearDown() override {
        DebugDatabase::ClearOverrides();
        DebugDatabase::Reload();
    }
    void WriteFile(const std::string& inText) {
        ASSERT_TRUE(filesupport::File::ReplaceAtomically(mDirectory.Path("debug.conf"), inText));
        DebugDatabase::Reload();
    }
    TemporaryDirectory mDirectory;
    ScopedVariable mFile{"ZOCLIENT_DEBUG_DB", mDirectory.Path("debug.conf")};
};

TEST_F(DebugDatabaseTest, OverridesGoOverTheEnvironmentAndThatOverTheFile) {
    WriteFile(
        "# switches\n  ZOClient.A = yes \nZOClient.B=0\nostnet.Size = 0x20\nbroken line\nText = a = b\n");
    EXPECT_TRUE(DebugDatabase::GetBool("ZOClient.A", false));
    EXPECT_FALSE(DebugDatabase::GetBool("ZOClient.B", true));
    EXPECT_EQ(DebugDatabase::GetUInt32("ostnet.Size", 1), 32u);
    EXPECT_EQ(DebugDatabase::GetString("Text", ""), "a = b");
    EXPECT_EQ(DebugDatabase::GetString("Absent", "default"), "default");

    const ScopedVariable variable("ZOCLIENT_DEBUG_ZOClient_A", "off");
    EXPECT_TRUE(DebugDatabase::GetBool("ZOClient.A", false));  // read once
    DebugDatabase::Reload();
    EXPECT_FALSE(DebugDatabase::GetBool("ZOClient.A", true));
    DebugDatabase::SetOverride("ZOClient.A", "1");
    EXPECT_TRUE(DebugDatabase::GetBool("ZOClient.A", false));
    DebugDatabase::ClearOverrides();
    EXPECT_FALSE(DebugDatabase::GetBool("ZOClient.A", true));
}

TEST_F(DebugDatabaseTest, AValueThatDoesNotReadCountsAsAbsent) {
    WriteFile("N = 4294967296\nM = 12x\nK = -1\nB = maybe\nE =\n");
    for (const char* key : {"N", "M", "K", "E", "B"}) {
        EXPECT_EQ(DebugDatabase::GetUInt32(key, 7), 7u) << key;
    }
    EXPECT_TRUE(DebugDatabase::GetBool("B", true));
    EXPECT_EQ(DebugDatabase::GetString("E", "default"), "");
}

class ZStringTest : public testing::Test {
protected:
    void TearDown() override { config::Localizer::Reset(); }
};

TEST_F(ZStringTest, EnglishTextIsTheDefaultAndMalformedKeysStay) {
    EXPECT_EQ(ZString("$$$/ZOCL/Sync=Get Latest Changes").AsUTF8(), "Get Latest Changes");
    EXPECT_EQ(ZString("$$$/ZOCL/Eq=a=b").AsUTF8(), "a=b");
    EXPECT_EQ(ZString("plain = text").AsUTF8(), "plain = text");
    EXPECT_EQ(ZString("$$$/ZOCL/NoText").AsUTF8(), "$$$/ZOCL/NoText");
    EXPECT_EQ(ZString("$$$/ZOCL/A=\xC3\xA4").AsString(), u"\u00E4");
}

TEST_F(ZStringTest, ArgumentsAreFilledInOnce) {
    EXPECT_EQ(ZString("$$$/ZOCL/X=@1 by @0, @0; @2", {"@1", "b"}).AsUTF8(), "b by @1, @1; @2");
}

TEST_F(ZStringTest, DictionariesByLanguageWithFallback) {
    TemporaryDirectory directory;
    ASSERT_TRUE(filesupport::File::ReplaceAtomically(
        directory.Path("pt.txt"),
        "\xEF\xBB\xBF$$$/ZOCL/X=@0: l\xC3\xAD\\nnova \\\\n\r\n# note\n$$$/ZOCL/Y=y\n"));
    ASSERT_TRUE(config::Localizer::LoadDictionary("pt", directory.Path("pt.txt")));
    EXPECT_FALSE(config::Localizer::LoadDictionary("pt", directory.Path("absent.txt")));
    EXPECT_EQ(ZString("$$$/ZOCL/X=@0: english", {"a"}).AsUTF8(), "a: english");
    config::Localizer::SetLanguage("pt_BR");
    EXPECT_EQ(ZString("$$$/ZOCL/X=@0: english", {"a"}).AsUTF8(), "a: l\xC3\xAD\nnova \\n");
    config::Localizer::AddText("pt_BR", "$$$/ZOCL/X", "brasil");
    EXPECT_EQ(ZString("$$$/ZOCL/X=english").AsUTF8(), "brasil");
    EXPECT_EQ(ZString("$$$/ZOCL/Z=english").AsUTF8(), "english");
}

TEST(StateDirectories, OverrideThenXDGThenHome) {
    const ScopedVariable home("HOME", "/home/ann");
    const ScopedVariable relative("XDG_CACHE_HOME", "not/absolute");
    const ScopedVariable xdg("XDG_CONFIG_HOME", "/etc/ann");
    const ScopedVariable own("ZOCLIENT_STATE_HOME", "/srv/state");
    EXPECT_EQ(config::GetCacheDirectory().Path(), "/home/ann/.cache/zoclient");
    EXPECT_EQ(config::GetConfigDirectory().Path(), "/etc/ann/zoclient");
    EXPECT_EQ(config::GetStateDirectory().Path(), "/srv/state");
}

TEST(ClientInfo, NamesCannotBreakAHeader) {
    const std::string former = config::GetClientName();
    config::SetClientName("Host\r\nX-Evil: 1");
    EXPECT_EQ(config::GetClientName(), "HostX-Evil: 1");
    config::SetClientName(former);
    EXPECT_EQ(config::GetProcessInstanceID(), config::GetProcessInstanceID());
    EXPECT_FALSE(config::GetProcessInstanceID().IsNull());
}

TEST(TickTime, InvalidComesBeforeAll) {
    using namespace ostmediatypes;
    EXPECT_LT(kTime_Invalid, TickTime(-1));
    EXPECT_FALSE(kTime_Invalid.IsValid());
    EXPECT_EQ(kTime_Zero, TickTime());
    EXPECT_GE(TickTime(5), TickTime(5));
}

TEST(Headless, IsWhatTheHostSaid) {
    const bool former = HLM::GetIsHeadless();
    HLM::SetIsHeadless(true);
    EXPECT_TRUE(HLM::GetIsHeadless());
    HLM::SetIsHeadless(false);
    EXPECT_FALSE(HLM::GetIsHeadless());
    HLM::SetIsHeadless(former);
}

// In a process of its own, since the variable is read once.
int HeadlessWith(const char* inValue) {
    ::setenv("ZOCLIENT_HEADLESS", inValue, 1);
    return HLM::GetIsHeadless() ? 1 : 0;
}

TEST(HeadlessDeathTest, TheEnvironmentIsAskedUntilTheHostSpeaks) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(::_exit(HeadlessWith("1")), testing::ExitedWithCode(1), "");
    EXPECT_EXIT(::_exit(HeadlessWith("yes")), testing::ExitedWithCode(1), "");
    EXPECT_EXIT(::_exit(HeadlessWith("0")), testing::ExitedWithCode(0), "");
    EXPECT_EXIT(::_exit(HeadlessWith("False")), testing::ExitedWithCode(0), "");
}

}  // namespace
