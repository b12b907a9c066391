// A lost token and what follows: the question for the password, another process's token, the end of a
// headless process, and a logout in the middle of it all.
#include <atomic>

#include "Connection/AutoAuthentication.h"
#include "ConnectSupport.h"
#include "Frame/Station.h"
#include "Model/ModelResourceFactory.h"
#include "ostcore/debug/DebugDatabase.h"
#include "ostcore/utility/StringConversion.h"
#include "ostui/BackEnd.h"
#include "ResourceFactory.h"
#include "ZOClient/Authentication.h"
#include "ZOClient/Library.h"
#include "ZOClient/Messages.h"
#include "ZOClientTesting/ScriptedWindows.h"

namespace ZOCL {
namespace {

using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using ZOClientTesting::ScriptedWindow;
using ZOClientTesting::ScriptedWindows;

const ImmutableString kAssets("http://hub.test:60138/assets/1");
const char kPrompt[] = "ZOReconnectDialog";

class RenewalTest : public ConnectTest {
protected:
    RenewalTest() {
        ostcore::threads::SetMainThread();
        RegisterStation();
        mListener = std::make_unique<RFL::Listener>(GetStationID());
        mListener->AddHandler<ZOTerminateConnectionMessage>(
            [this](const ZOTerminateConnectionMessage& inMessage) {
                terminated += inMessage.forced ? 1 : 0;
            });
        mListener->AddHandler<ZOInitializeConnectionMessage>(
            [this](const ZOInitializeConnectionMessage&) { ++initialized; });
        hub.AddRoute("GET", "/assets/1", [](const RecordedRequest&) { return ScriptedAnswer::Status(200); });
        HLM::SetEndProcessFunction([this] { ++ended; });
    }
    ~RenewalTest() override {
        HLM::SetEndProcessFunction({});
        EXPECT_THAT(windows.Mismatches(), IsEmpty());
    }
    void UseServer(bool inKeepCredentials = false) {
        server = SignIn(inKeepCredentials);
        dataServer = RFL::QueryInterface<DataServer>(server);
        PumpAll();
    }
    void Ask(int inCount) {
        for (int i = 0; i < inCount; ++i) {
            ids.push_back(Guid::CreateUnique());
            // Of one URL they would be one request.
            const std::string path = "/assets/of-many-" + std::to_string(ids.size());
            hub.AddRoute("GET", path, [](const RecordedRequest&) { return ScriptedAnswer::Status(200); });
            ASSERT_TRUE(server->GET(ids.back(),
                                    [this](const Guid&, const shared_ptr<ostnet::Response>& inResponse) {
                                        statuses[inResponse ? inResponse->status : -2]++;
                                        ++completed;
                                    },
                                    ImmutableString(hub.BaseURL() + path), {}));
        }
    }
    /// Runs the main thread until so many requests have completed.
    void PumpUntilCompleted(int inCount) {
        for (int i = 0; i < 20000 && completed < inCount; ++i) {
            ostcore::threads::WaitAndPumpMainThread(1);
        }
        net->WaitUntilIdle();
        EXPECT_EQ(completed, inCount);
    }
    void PumpAll() {
        net->WaitUntilIdle();
        while (ostcore::threads::PumpMainThread() > 0) {
            net->WaitUntilIdle();
        }
    }
    static void Store(const std::string& inUser, const ImmutableString& inToken,
                      const std::string& inServer = "hub.test") {
        ZOLoginData data;
        data.serverURL = ImmutableString(inServer);
        data.username = ImmutableString(inUser);
        data.token = inToken;
        ASSERT_TRUE(Registry::StoreLoginData(data, UString()));
    }
    static ImmutableString StoredToken() {
        ZOLoginData data;
        return Registry::GetLastLoginData(data, true, UString()) ? data.token : ImmutableString();
    }
    std::string LastCookie() const { return net->Requests().back().Header("Cookie"); }
    /// Another process signs in and stores its token.
    ImmutableString SignInElsewhere() {
        ConnectOutcome outcome;
        Connect(outcome, AnnasCredentials(), false, false);
        EXPECT_EQ(outcome.Wait(), kResultSuccess);
        const ImmutableString token = outcome.Server()->GetCredentials().token;
        Store("anna", token);
        return token;
    }

    ScriptedWindows windows;
    InterfaceRef<IZOCDataServer> server;
    InterfaceRef<DataServer> dataServer;
    std::vector<Guid> ids;
    std::map<int, std::atomic<int>> statuses = [] {
        std::map<int, std::atomic<int>> all;
        for (const int status : {-2, -1, 0, 200, 401}) {
            all[status] = 0;
        }
        return all;
    }();
    std::atomic<int> completed{0};
    int terminated = 0;
    int initialized = 0;
    int ended = 0;

private:
    std::unique_ptr<RFL::Listener> mListener;
};

TEST_F(RenewalTest, ThePasswordIsAskedUntilItIsRightAndAllGoesOn) {
    UseServer();
    Store("anna", server->GetCredentials().token);
    hub.ExpireTokens();
    windows.Answer(kPrompt, [](ScriptedWindow& ioWindow) {
        EXPECT_EQ(ioWindow.Text("messageText"),
                  "You have been signed out from the current Orvane Meridane session.\n\nPlease re-enter the "
                  "password for the user \"anna\" on the server \"hub.test\":");
        ioWindow.Press("okButton");
        EXPECT_FALSE(ioWindow.IsClosed()) << "no password, no sign-in";
        ioWindow.Enter("passwordTextEdit", "wrong");
        ioWindow.Press("okButton");
    });
    windows.Answer(kPrompt, [](ScriptedWindow& ioWindow) {
        EXPECT_EQ(ioWindow.Text("passwordTextEdit"), "");
        ioWindow.Enter("passwordTextEdit", kCanaryPassword);
        ioWindow.Press("okButton");
    });
    Ask(200);
    PumpUntilCompleted(200);
    EXPECT_EQ(statuses[200], 200);
    EXPECT_EQ(hub.LoginCount(), 2u);
    EXPECT_EQ(IZOCDataServer::GetLoggedInServerRef(), server) << "what hangs on the server must stay good";
    EXPECT_EQ(StoredToken(), server->GetCredentials().token);
    ASSERT_EQ(windows.Shown().size(), 4u) << "prompt and progress, twice";
    EXPECT_EQ(windows.Shown()[1].Text("progressStaticText"), "Connecting to hub.test...");
    EXPECT_EQ(terminated, 0);

    // It can be lost again.
    hub.ExpireTokens();
    windows.AnswerWith(kPrompt, "cancelButton");
    Ask(50);
    PumpUntilCompleted(250);
    EXPECT_EQ(statuses[401], 50);
    EXPECT_EQ(terminated, 1);
    Ask(1);
    PumpUntilCompleted(251);
    PumpAll();
    EXPECT_EQ(windows.Shown().size(), 5u) << "who has given up is not asked again";
}

TEST_F(RenewalTest, ACancelledRequestLeavesTheQueueWhileTheUserThinks) {
    UseServer();
    hub.ExpireTokens();
    windows.Answer(kPrompt, [this](ScriptedWindow& ioWindow) {
        ioWindow.WaitUntil([this] { return net->PendingCount() == 0; });
        server->TryToCancelRequest(ids[3]);
        ioWindow.WaitUntil([this] { return completed == 1; });
        EXPECT_EQ(statuses[-1], 1);
        ioWindow.Enter("passwordTextEdit", kCanaryPassword);
        ioWindow.Press("okButton");
    });
    Ask(10);
    PumpUntilCompleted(10);
    EXPECT_EQ(statuses[200], 9);
}

TEST_F(RenewalTest, ATokenFromAnotherProcessAnswersTheQuestion) {
    UseServer();
    Store("anna", server->GetCredentials().token);
    hub.ExpireTokens();
    ImmutableString token;
    windows.Answer(kPrompt, [&](ScriptedWindow& ioWindow) {
        token = SignInElsewhere();
        HandleAutoAuthentication();
        EXPECT_TRUE(ioWindow.IsClosed());
    });
    Ask(20);
    PumpUntilCompleted(20);
    EXPECT_EQ(statuses[200], 20);
    EXPECT_EQ(server->GetCredentials().token, token);
    EXPECT_EQ(server->GetLoginData().token, token);
    EXPECT_EQ(hub.LoginCount(), 2u);
    PumpAll();
    EXPECT_EQ(initialized, 1);
    EXPECT_EQ(terminated, 0);
    net->ClearRequests();
    HandleAutoAuthentication();
    EXPECT_EQ(net->RequestCount(), 0u) << "what is known already was asked again";
}

TEST_F(RenewalTest, AnotherUserOrServerEndsThePresentLogin) {
    UseServer();
    Store("berta", ImmutableString("login-token=b;"));
    windows.AnswerWith(kPrompt, "cancelButton");
    HandleAutoAuthentication();
    PumpAll();
    EXPECT_EQ(terminated, 1);
    EXPECT_EQ(windows.Shown().size(), 1u);
    for (const RecordedRequest& request : net->Requests()) {
        EXPECT_NE(request.Header("Cookie"), "login-token=b;") << "a foreign token was used";
    }
}

TEST_F(RenewalTest, TheLoginOfAnotherProcessIsTakenOverWhenNobodyIsSignedIn) {
    HandleAutoAuthentication();
    EXPECT_EQ(net->RequestCount(), 0u) << "nothing is stored, nothing to do";
    const ImmutableString token = SignInElsewhere();
    HandleAutoAuthentication();
    PumpAll();
    ASSERT_TRUE(IsLoggedIn());
    EXPECT_EQ(IZOCDataServer::GetLoggedInServerRef()->GetCredentials().token, token);
    EXPECT_EQ(initialized, 1);
    ASSERT_EQ(windows.Shown().size(), 1u);
    EXPECT_EQ(windows.Shown()[0].Text("progressStaticText"), "Automatically connecting to hub.test...");
    EXPECT_EQ(hub.LoginCount(), 1u);

    IZOCDataServer::Terminate(false);
    hub.ExpireTokens();
    HandleAutoAuthentication();
    EXPECT_FALSE(IsLoggedIn());
    EXPECT_TRUE(StoredToken().IsNull()) << "a token that is refused is forgotten";
}

TEST_F(RenewalTest, ATokenGoesToNoServerButItsOwn) {
    Store("anna", ImmutableString("login-token=mine;"), "hub.test");
    EXPECT_FALSE(StoredToken().IsNull());
    // The list of servers changes without the token, as it does between the two writes of a login.
    ASSERT_TRUE(Registry::StoreRecentServers({{false, u"elsewhere"}, {false, u"hub.test"}}));
    EXPECT_TRUE(StoredToken().IsNull());
    ASSERT_TRUE(Registry::StoreRecentServers({{true, u"hub.test"}}));
    EXPECT_TRUE(StoredToken().IsNull()) << "the same name over TLS is another server";
}

TEST_F(RenewalTest, AHeadlessProcessReportsAndEnds) {
    HLM::SetIsHeadless(true);
    UseServer();
    std::vector<std::string> reports;
    server->SetHeadlessFatalErrorReportingFunction(
        [&](const UString& inText) { reports.push_back(ostcore::utility::ToUTF8(inText)); });
    hub.ExpireTokens();
    Ask(5);
    PumpUntilCompleted(5);
    PumpAll();
    EXPECT_EQ(statuses[401], 5);
    EXPECT_EQ(ended, 1);
    EXPECT_THAT(reports, ElementsAre("The authentication token has expired and we were not able to "
                                     "re-authenticate automatically."));
    EXPECT_THAT(Traces(), testing::HasSubstr("Exiting process: The authentication token"));
    EXPECT_THAT(windows.Shown(), IsEmpty());
}

TEST_F(RenewalTest, AHeadlessProcessWhoseSignInFailsReportsThat) {
    HLM::SetIsHeadless(true);
    UseServer(true);
    hub.ExpireTokens();
    hub.AddUser("anna", "another password");
    Ask(5);
    PumpUntilCompleted(5);
    PumpAll();
    EXPECT_EQ(statuses[401], 5);
    EXPECT_EQ(ended, 1);
    EXPECT_THAT(Traces(), testing::HasSubstr("Exiting process: The authentication token has expired and the "
                                             "attempt to re-authenticate failed."));
}

TEST_F(RenewalTest, ALogoutWhileTheUserIsAskedEndsWhatWaits) {
    UseServer();
    hub.ExpireTokens();
    windows.Answer(kPrompt, [](ScriptedWindow& ioWindow) {
        IZOCDataServer::Terminate(true);
        EXPECT_TRUE(ioWindow.IsClosed());
    });
    Ask(20);
    PumpUntilCompleted(20);
    EXPECT_EQ(statuses[401], 20);
    EXPECT_EQ(terminated, 0) << "the host ended it itself";
    EXPECT_FALSE(IsLoggedIn());
}

TEST_F(RenewalTest, ALogoutInTheMiddleOfASignInLeavesNoToken) {
    UseServer(true);
    net->SetHandler([this](const RecordedRequest& inRequest) {
        return inRequest.url == kLogin ? ScriptedAnswer::Hold() : hub.Answer(inRequest);
    });
    hub.ExpireTokens();
    Ask(20);
    ASSERT_TRUE(net->WaitForRequests(21));
    EXPECT_THAT(net->Lines(), Contains("POST " + kLogin));
    IZOCDataServer::Terminate(true);
    PumpUntilCompleted(20);
    EXPECT_EQ(statuses[401], 20);
    EXPECT_EQ(net->PendingCount(), 0u) << "the sign-in went on";
    EXPECT_TRUE(server->GetCredentials().token.IsNull());

    // An answer that was on its way brings a token that nobody will use; the hub is told so.
    net->ClearRequests();
    const auto late = boost::make_shared<ostnet::Response>(200);
    late->headers.emplace(ImmutableString("Set-Cookie"), ImmutableString("login-token=late; Path=/"));
    EXPECT_FALSE(dataServer->TakeTokenFromResponse(late));
    EXPECT_TRUE(server->GetCredentials().token.IsNull());
    net->WaitUntilIdle();
    ASSERT_THAT(net->Lines(), ElementsAre("POST " + kLogout));
    EXPECT_EQ(LastCookie(), "login-token=late;");
}

TEST_F(RenewalTest, TheMainThreadIsAskedWhileItWaitsForAnAnswer) {
    UseServer();
    hub.ExpireTokens();
    windows.Answer(kPrompt, [](ScriptedWindow& ioWindow) {
        ioWindow.Enter("passwordTextEdit", kCanaryPassword);
        ioWindow.Press("okButton");
    });
    const auto response = server->BlockingGET(kAssets, {}, 1);
    ASSERT_TRUE(response);
    EXPECT_EQ(response->status, 200);
}

TEST_F(RenewalTest, SeveralLoginsAreShownAndTheUserDecides) {
    GetCompositionRoot().resources = GetModelResourceFactory();
    hub.AddServiceLink("/users/user#current", "http://hub.test:60138/users/anna");
    std::string logins = "{\"ip\":\"10.0.0.1\",\"hostname\":\"edit-1\",\"useragent\":\"\"}";
    bool isThere = true;
    hub.AddRoute("GET", "/users/anna", [&](const RecordedRequest&) {
        return isThere ? ScriptedAnswer::JSON("{\"zo:userId\":\"anna\",\"logins\":[" + logins + "]}")
                       : ScriptedAnswer::Status(404);
    });
    EXPECT_FALSE(HandleMultipleLogins()) << "nobody is signed in";
    UseServer();
    EXPECT_TRUE(HandleMultipleLogins());
    logins += ",{\"ip\":\"10.0.0.2\",\"hostname\":\"\",\"useragent\":\"\"}";
    windows.Answer("ZOCurrentLoginsDialog", [](ScriptedWindow& ioWindow) {
        EXPECT_EQ(
            ioWindow.Text("infoLabelText"),
            "The user \"anna\" is currently signed in to the Meridane server \"hub.test\" from more than "
            "one machine:");
        EXPECT_THAT(ioWindow.Find("currentLoginsTree")->items,
                    ElementsAre("edit-1\t10.0.0.1", "10.0.0.2\t10.0.0.2"));
        ioWindow.Press("okButton");
    });
    EXPECT_TRUE(HandleMultipleLogins());
    EXPECT_EQ(terminated, 0);
    windows.AnswerWith("ZOCurrentLoginsDialog", "cancelButton");
    EXPECT_FALSE(HandleMultipleLogins());
    EXPECT_EQ(terminated, 1);
    ostcore::debug::DebugDatabase::SetOverride("ZOClient.ShouldSuppressUI", "true");
    const std::size_t shown = windows.Shown().size();
    EXPECT_TRUE(HandleMultipleLogins());
    EXPECT_EQ(windows.Shown().size(), shown);
    ostcore::debug::DebugDatabase::ClearOverrides();
    isThere = false;
    EXPECT_FALSE(HandleMultipleLogins()) << "a user who cannot be loaded";
    IZOCDataServer::Terminate(false);
    GetCompositionRoot().resources = nullptr;
}

}  // namespace
}  // namespace ZOCL
