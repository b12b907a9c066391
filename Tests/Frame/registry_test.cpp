// What the client remembers between runs.
#include <stdlib.h>

#include <filesystem>

#include <gtest/gtest.h>

#include "RFL/Registry.h"
#include "ZOClient/Registry.h"

namespace ZOCL {
namespace {

using RFL::RegistryKey;
using RFL::RegistryRoot;

const UString kBase = u"Software\\Orvane\\Orvane Meridane\\2.0\\";
const UString kPrevious = u"Software\\Orvane\\Orvane Meridane\\1.5\\";

class RegistryTest : public testing::Test {
protected:
    RegistryTest() {
        std::string pattern = (std::filesystem::temp_directory_path() / "zoclient-registry-XXXXXX").string();
        mDirectory = mkdtemp(pattern.data());
        setenv("ZOCLIENT_CONFIG_HOME", (mDirectory + "/config").c_str(), 1);
        setenv("ZOCLIENT_MACHINE_CONFIG", (mDirectory + "/machine/registry.sqlite").c_str(), 1);
        RFL::CloseRegistry();
        Registry::ResetIsZOEnabled();
    }
    ~RegistryTest() override {
        RFL::CloseRegistry();
        std::error_code ignored;
        std::filesystem::remove_all(mDirectory, ignored);
    }
    static RegistryKey Make(const UString& inPath) {
        RegistryKey key;
        EXPECT_EQ(RegistryKey::Create(RegistryRoot::User, inPath, key), 0);
        return key;
    }
    static ZOLoginData Data(const char* inServer, const char* inToken) {
        ZOLoginData data;
        data.serverURL = ImmutableString(inServer);
        data.username = ImmutableString("anna");
        data.token = ImmutableString(inToken);
        data.secure = true;
        return data;
    }
    std::string mDirectory;
};

TEST_F(RegistryTest, ValuesStandUnderTheBaseKey) {
    EXPECT_EQ(Registry::GetZORegistryBaseKey(), kBase);
    UString value = u"kept";
    EXPECT_FALSE(Registry::GetZORegistryValue(u"X", value));
    ASSERT_TRUE(Registry::SetZORegistryValue(u"X", u"1"));
    ASSERT_TRUE(Registry::GetZORegistryValue(u"X", value));
    EXPECT_EQ(value, u"1");
    ASSERT_TRUE(Registry::GetZORegistryValue(u"Y", value));
    EXPECT_TRUE(value.empty());
}

TEST_F(RegistryTest, IsEnabledIsKeptUntilReset) {
    EXPECT_FALSE(Registry::IsZOEnabled());
    Registry::SetZORegistryValue(Registry::kRegistryHasLoggedInValue, u"no");
    EXPECT_FALSE(Registry::IsZOEnabled());
    Registry::SetZORegistryValue(Registry::kRegistryHasLoggedInValue, u"true");
    EXPECT_FALSE(Registry::IsZOEnabled());
    Registry::ResetIsZOEnabled();
    EXPECT_TRUE(Registry::IsZOEnabled());
}

TEST_F(RegistryTest, AnUnreadableAnswerIsNotKept) {
    Make(kBase);
    EXPECT_FALSE(Registry::IsZOEnabled());
    Registry::SetZORegistryValue(Registry::kRegistryHasLoggedInValue, u"true");
    EXPECT_TRUE(Registry::IsZOEnabled());
}

TEST_F(RegistryTest, ThePreviousVersionIsTakenOver) {
    RegistryKey previous = Make(kPrevious);
    previous.SetStringValue(u"HasLoggedIn", u"true");
    previous.SetStringValue(u"LastServer", u"old-host");
    previous.SetUInt32Value(u"LastServerSecureConnection", 1);
    EXPECT_TRUE(Registry::IsZOEnabled());
    std::vector<Registry::RecentServer> servers;
    ASSERT_TRUE(Registry::GetRecentServers(servers));
    ASSERT_EQ(servers.size(), 1u);
    EXPECT_EQ(servers[0].server, u"old-host");
    EXPECT_TRUE(servers[0].secure);
    RegistryKey base = Make(kBase);
    UString text;
    EXPECT_EQ(base.GetStringValue(u"LastServer", text), RFL::kResultRegistryMissing);
    std::uint32_t number = 0;
    EXPECT_EQ(base.GetUInt32Value(u"LastServerSecureConnection", number), RFL::kResultRegistryMissing);
    RegistryKey entry = Make(kBase + u"RecentServers\\RecentServer0");
    ASSERT_EQ(entry.GetStringValue(u"Server", text), 0);
    EXPECT_EQ(text, u"old-host");
}

TEST_F(RegistryTest, TheMachineAnswersForWantOfTheUser) {
    RegistryKey machine;
    ASSERT_EQ(RegistryKey::Create(RegistryRoot::Machine, kBase, machine), 0);
    ASSERT_EQ(machine.SetStringValue(u"HasLoggedIn", u"true"), 0);
    EXPECT_TRUE(Registry::IsZOEnabled());
}

TEST_F(RegistryTest, TenServersAreRememberedNewestFirst) {
    for (int i = 0; i < 12; ++i) {
        ASSERT_TRUE(Registry::StoreLoginData(Data(("host" + std::to_string(i)).c_str(), "t"), u""));
    }
    ASSERT_TRUE(Registry::StoreLoginData(Data("host5", "t"), u""));
    std::vector<Registry::RecentServer> servers;
    ASSERT_TRUE(Registry::GetRecentServers(servers));
    ASSERT_EQ(servers.size(), 10u);
    EXPECT_EQ(servers[0].server, u"host5");
    EXPECT_EQ(servers[1].server, u"host11");
    EXPECT_EQ(servers[9].server, u"host2");
    std::vector<UString> names;
    RegistryKey key = Make(kBase + u"RecentServers");
    ASSERT_EQ(key.EnumerateSubKeys(names), 0);
    EXPECT_EQ(names.size(), 10u);
}

TEST_F(RegistryTest, LoginDataAreKeptPerUserOfHeadlessProcesses) {
    ZOLoginData read;
    EXPECT_FALSE(Registry::GetLastLoginData(read, true, u""));
    ASSERT_TRUE(Registry::StoreLoginData(Data("host", "login-token=1"), u"anna"));
    EXPECT_FALSE(Registry::GetLastLoginData(read, true, u""));
    EXPECT_FALSE(Registry::GetLastLoginData(read, true, u"bert"));
    ASSERT_TRUE(Registry::GetLastLoginData(read, true, u"anna"));
    EXPECT_EQ(read.serverURL, ImmutableString("host"));
    EXPECT_EQ(read.token, ImmutableString("login-token=1"));
    EXPECT_TRUE(read.secure);
    ASSERT_TRUE(Registry::StoreLoginData(Data("other", "login-token=2"), u"bert"));
    ASSERT_TRUE(Registry::GetLastLoginData(read, true, u"anna"));
    EXPECT_EQ(read.serverURL, ImmutableString("host")) << "the token of one server under the name of another";
}

TEST_F(RegistryTest, ATokenThatWasReplacedIsNotCleared) {
    ASSERT_TRUE(Registry::StoreLoginData(Data("host", "login-token=1"), u""));
    EXPECT_EQ(Registry::GetLatestExpectedAuthToken(), ImmutableString("login-token=1"));
    Registry::ClearAuthToken(ImmutableString("login-token=2"));
    Registry::ClearAuthToken(ImmutableString());
    ZOLoginData read;
    ASSERT_TRUE(Registry::GetLastLoginData(read, false, u""));
    EXPECT_EQ(read.token, ImmutableString("login-token=1"));
    Registry::ClearAuthToken(ImmutableString("login-token=1"));
    ASSERT_TRUE(Registry::GetLastLoginData(read, false, u""));
    EXPECT_TRUE(read.token.IsNull());
}

}  // namespace
}  // namespace ZOCL
