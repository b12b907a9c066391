// Connecting over real sockets to a hub that runs as a process of its own.
#include <stdlib.h>

#include <future>

#include <gtest/gtest.h>

#include "Connection/DataServer.h"
#include "HubProcess.h"
#include "ostcore/threads/MainThread.h"
#include "Relations.h"
#include "RFL/Registry.h"
#include "ZOClient/Library.h"

namespace ZOCL {
namespace {

using ostnet::http::kWaitForever;

struct Connected {
    int result = 1;
    InterfaceRef<IZOCDataServer> server;
};

class HubConnectTest : public testing::Test {
protected:
    HubConnectTest() {
        setenv("ZOCLIENT_CONFIG_HOME", (hub.Directory() + "/config").c_str(), 1);
        RFL::CloseRegistry();
        Initialize();
    }
    ~HubConnectTest() override {
        IZOCDataServer::Terminate(false);
        ostcore::threads::PumpMainThread();
        Shutdown();
        RFL::CloseRegistry();
    }
    Connected Connect(const char* inPassword, const ImmutableString& inToken = {}, bool inKeep = false) {
        ZOSCredentials credentials;
        credentials.username = ImmutableString("anna");
        credentials.password = inPassword;
        credentials.token = inToken;
        std::promise<Connected> ended;
        Guid id;
        EXPECT_TRUE(IZOCDataServer::ConnectToServer(
            hub.URL(), credentials, id, false,
            [&ended](const Guid&, const InterfaceRef<IZOCDataServer>& inServer, int inResult,
                     const shared_ptr<ostnet::Response>&) {
                ended.set_value({inResult, inServer});
            },
            inKeep, true));
        return ended.get_future().get();
    }
    RunningHub hub;
};

TEST_F(HubConnectTest, SignsInAndOut) {
    const Connected connected = Connect("annas-secret");
    ASSERT_EQ(connected.result, kResultSuccess);
    ASSERT_TRUE(connected.server);
    EXPECT_TRUE(IsLoggedIn());
    EXPECT_TRUE(ServerIsCompatible(connected.server));
    const ImmutableString productions = connected.server->GetLink(kRelation_Productions);
    ASSERT_FALSE(productions.IsNull());
    EXPECT_EQ(connected.server->BlockingGET(productions, {}, kWaitForever)->status, 200);
    const ImmutableString token = connected.server->GetCredentials().token;
    IZOCDataServer::Terminate(true);
    EXPECT_FALSE(IsLoggedIn());
    EXPECT_EQ(connected.server->BlockingGET(productions, {}, kWaitForever)->status, 401);
    EXPECT_EQ(Connect("not-the-secret", token).result, kResultHTTPUnauthorized)
        << "the token outlived the logout";
}

TEST_F(HubConnectTest, AWrongPasswordIsRefused) {
    const Connected connected = Connect("wrong");
    EXPECT_EQ(connected.result, kResultHTTPUnauthorized);
    EXPECT_FALSE(connected.server);
    EXPECT_FALSE(IsLoggedIn());
}

TEST_F(HubConnectTest, ATokenThatTheHubHasForgottenIsRenewed) {
    const Connected first = Connect("annas-secret", {}, true);
    ASSERT_TRUE(first.server);
    const ImmutableString token = first.server->GetCredentials().token;
    const ImmutableString productions = first.server->GetLink(kRelation_Productions);
    // Another process that shares the token signs out with it.
    const Connected second = Connect("", token);
    ASSERT_TRUE(second.server);
    EXPECT_EQ(second.server->GetCredentials().token, token);
    RFL::QueryInterface<DataServer>(second.server)->SendLogout();
    EXPECT_EQ(first.server->BlockingGET(productions, {}, kWaitForever)->status, 200);
    EXPECT_NE(first.server->GetCredentials().token, token);
}

}  // namespace
}  // namespace ZOCL
