// The login sequence as the server sees it, request by request, and how it ends.
#include "Connection/ConnectRequests.h"
#include "ConnectSupport.h"
#include "Frame/Station.h"
#include "ostnet/HeaderConstants.h"
#include "ZOClient/Library.h"
#include "ZOClient/Messages.h"

namespace ZOCL {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;

TEST_F(ConnectTest, SignsInWithTheExactRequests) {
    ConnectOutcome outcome;
    const Guid id = Connect(outcome);
    ASSERT_EQ(outcome.Wait(), kResultSuccess);
    ASSERT_TRUE(outcome.Server());
    EXPECT_EQ(outcome.ID(), id);
    EXPECT_EQ(outcome.Calls(), 1);
    EXPECT_NE(outcome.Thread(), std::this_thread::get_id());
    const std::vector<RecordedRequest> requests = net->Requests();
    ASSERT_THAT(net->Lines(),
                ElementsAre("GET " + kDiscovery, "GET " + kLinks, "POST " + kLogin, "GET " + kLinks));
    EXPECT_TRUE(requests[0].headers.empty());
    EXPECT_TRUE(requests[1].headers.empty());
    EXPECT_TRUE(requests[2].isForm);
    EXPECT_THAT(requests[2].form, ElementsAre(std::make_pair(std::string("j_username"), std::string("anna")),
                                              std::make_pair(std::string("j_password"), kCanaryPassword)));
    EXPECT_TRUE(requests[2].headers.empty());
    EXPECT_THAT(requests[3].headers,
                ElementsAre(std::make_pair(std::string("Cookie"), std::string("login-token=scripted-1;"))));
    for (const RecordedRequest& request : requests) {
        EXPECT_TRUE(request.decompressPayload);
        EXPECT_FALSE(request.hasObserver);
    }
    const ZOSCredentials held = outcome.Server()->GetCredentials();
    EXPECT_EQ(held.token, ImmutableString("login-token=scripted-1;"));
    EXPECT_TRUE(held.password.empty());
    EXPECT_EQ(IZOCDataServer::GetLoggedInServerRef(), outcome.Server());
    EXPECT_TRUE(IsLoggedIn());
    EXPECT_FALSE(GetConnectRequest(id));
    EXPECT_EQ(outcome.Server()->GetServerName(), ImmutableString("Scripted hub"));
    EXPECT_EQ(outcome.Server()->GetSyslogPort(), 514u);
    EXPECT_TRUE(RFL::QueryInterface<DataServer>(outcome.Server())->SupportsUploadCompression());
}

TEST_F(ConnectTest, AValidTokenNeedsNoForm) {
    SignIn();
    ZOSCredentials credentials;
    credentials.username = ImmutableString("anna");
    credentials.token = ImmutableString("login-token=scripted-1;");
    ConnectOutcome outcome;
    Connect(outcome, credentials);
    EXPECT_EQ(outcome.Wait(), kResultSuccess);
    EXPECT_TRUE(outcome.Server());
    ASSERT_THAT(net->Lines(), ElementsAre("GET " + kDiscovery, "GET " + kLinks));
    EXPECT_EQ(net->Requests()[0].Header("Cookie"), "login-token=scripted-1;");
}

TEST_F(ConnectTest, AStaleTokenIsFollowedByTheForm) {
    ZOSCredentials credentials = AnnasCredentials();
    credentials.token = ImmutableString("login-token=long-gone;");
    ConnectOutcome outcome;
    Connect(outcome, credentials);
    EXPECT_EQ(outcome.Wait(), kResultSuccess);
    EXPECT_THAT(net->Lines(),
                ElementsAre("GET " + kDiscovery, "GET " + kLinks, "POST " + kLogin, "GET " + kLinks));
    EXPECT_EQ(net->Requests()[3].Header("Cookie"), "login-token=scripted-1;");
}

TEST_F(ConnectTest, AWrongPasswordEndsWithTheAnswersResult) {
    ZOSCredentials credentials = AnnasCredentials();
    credentials.password = kCanaryPassword + "x";
    ConnectOutcome outcome;
    Connect(outcome, credentials);
    EXPECT_EQ(outcome.Wait(), kResultHTTPUnauthorized);
    EXPECT_FALSE(outcome.Server());
    EXPECT_FALSE(IsLoggedIn());
    EXPECT_EQ(net->RequestCount(), 3u);
    EXPECT_THAT(Traces(), HasSubstr("OnLoginComplete(): failed to connect to server: http://hub.test:60138"));
}

TEST_F(ConnectTest, ALoginAnswerWithoutTokenIsNoLogin) {
    net->SetHandler([&](const RecordedRequest& inRequest) {
        if (inRequest.url == kDiscovery) {
            return ScriptedAnswer::JSON(
                "{\"links\":[{\"rel\":\"http://ns.meridane.example/zo/rel/discovery/v1\","
                "\"href\":\"" +
                kLinks + "\"}]}");
        }
        if (inRequest.url == kLinks) {
            return ScriptedAnswer::JSON(
                "{\"links\":[{\"rel\":\"http://ns.meridane.example/zo/rel/system/login\","
                "\"href\":\"" +
                kLogin + "\"}]}");
        }
        return ScriptedAnswer::Status(200);
    });
    ConnectOutcome outcome;
    Connect(outcome);
    EXPECT_EQ(outcome.Wait(), kResultSuccess);
    EXPECT_FALSE(outcome.Server());
    EXPECT_FALSE(IsLoggedIn());
}

TEST_F(ConnectTest, AServerThatNeverTreatsUsAsSignedInIsLeft) {
    net->SetHandler([&](const RecordedRequest& inRequest) {
        if (inRequest.url == kDiscovery) {
            return ScriptedAnswer::JSON(
                "{\"links\":[{\"rel\":\"http://ns.meridane.example/zo/rel/discovery/v1\","
                "\"href\":\"" +
                kLinks + "\"}]}");
        }
        if (inRequest.verb == "POST") {
            return ScriptedAnswer::Status(200).With("Set-Cookie", "login-token=scripted-1");
        }
        return ScriptedAnswer::JSON(
            "{\"links\":[{\"rel\":\"http://ns.meridane.example/zo/rel/system/login\","
            "\"href\":\"" +
            kLogin + "\"}]}");
    });
    ConnectOutcome outcome;
    Connect(outcome);
    EXPECT_EQ(outcome.Wait(), kResultFailure);
    EXPECT_FALSE(outcome.Server());
    EXPECT_EQ(net->RequestCount(), 4u);
}

TEST_F(ConnectTest, HeadlessDropsARefusedTokenOnce) {
    HLM::SetIsHeadless(true);
    net->Expect("GET", kDiscovery, ScriptedAnswer::Status(401));
    ZOSCredentials credentials = AnnasCredentials();
    credentials.token = ImmutableString("login-token=long-gone;");
    ConnectOutcome outcome;
    Connect(outcome, credentials);
    EXPECT_EQ(outcome.Wait(), kResultSuccess);
    ASSERT_THAT(net->Lines(), ElementsAre("GET " + kDiscovery, "GET " + kDiscovery, "GET " + kLinks,
                                          "POST " + kLogin, "GET " + kLinks));
    EXPECT_EQ(net->Requests()[0].Header("Cookie"), "login-token=long-gone;");
    EXPECT_EQ(net->Requests()[1].Header("Cookie"), "");
}

TEST_F(ConnectTest, HeadlessIsNotKeptInALoopOfRefusals) {
    HLM::SetIsHeadless(true);
    net->SetHandler([](const RecordedRequest&) { return ScriptedAnswer::Status(401); });
    ZOSCredentials credentials = AnnasCredentials();
    credentials.token = ImmutableString("login-token=long-gone;");
    ConnectOutcome outcome;
    Connect(outcome, credentials);
    EXPECT_EQ(outcome.Wait(), kResultHTTPUnauthorized);
    EXPECT_EQ(net->RequestCount(), 2u);
}

TEST_F(ConnectTest, WithAUserInterfaceARefusalAtTheRootEndsTheConnect) {
    net->SetHandler([](const RecordedRequest&) { return ScriptedAnswer::Status(401); });
    ZOSCredentials credentials = AnnasCredentials();
    credentials.token = ImmutableString("login-token=long-gone;");
    ConnectOutcome outcome;
    Connect(outcome, credentials);
    EXPECT_EQ(outcome.Wait(), kResultHTTPUnauthorized);
    EXPECT_EQ(net->RequestCount(), 1u);
}

TEST_F(ConnectTest, TellsTheStationBeforeTheCaller) {
    Initialize();
    std::vector<std::string> events;
    RFL::Listener listener(GetStationID());
    listener.AddHandler<ZOLoginMessage>([&](const ZOLoginMessage&) { events.push_back("login"); });
    listener.AddHandler<IZOCDataServer::LoginCompleteMessage>(
        [&](const IZOCDataServer::LoginCompleteMessage& inMessage) {
            events.push_back(inMessage.server && inMessage.result == 0 ? "complete" : "failed");
        });
    listener.AddHandler<ZOLogoutMessage>([&](const ZOLogoutMessage&) { events.push_back("logout"); });
    ConnectOutcome outcome;
    Connect(outcome);
    EXPECT_EQ(outcome.Wait(), kResultSuccess);
    ostcore::threads::PumpMainThread();
    EXPECT_THAT(events, ElementsAre("login", "complete"));
    net->WaitUntilIdle();
    net->ClearRequests();
    IZOCDataServer::Terminate(true);
    ostcore::threads::PumpMainThread();
    EXPECT_THAT(events, ElementsAre("login", "complete", "logout"));
    ASSERT_THAT(net->Lines(), ElementsAre("POST " + kLogout));
    EXPECT_EQ(net->Requests()[0].Header("Cookie"), "login-token=scripted-1;");
    EXPECT_TRUE(net->Requests()[0].body.empty());
    EXPECT_FALSE(net->Requests()[0].isForm);
    EXPECT_FALSE(IsLoggedIn());
    EXPECT_TRUE(outcome.Server()->GetCredentials().token.IsNull());
    Shutdown();
    ostcore::threads::ResetMainThread();
}

TEST_F(ConnectTest, AnEmptyServerNameSendsNothing) {
    ConnectOutcome outcome;
    Guid id;
    ASSERT_TRUE(IZOCDataServer::ConnectToServer(ImmutableString(), AnnasCredentials(), id, false,
                                                outcome.Function(), false, true));
    EXPECT_EQ(outcome.Wait(), kResultNotStarted);
    EXPECT_NE(outcome.Thread(), std::this_thread::get_id());
    EXPECT_EQ(net->RequestCount(), 0u);
}

TEST_F(ConnectTest, WithoutLoginOnlyTheDocumentsAreLoaded) {
    std::mutex mutex;
    std::condition_variable changed;
    int result = 1;
    InterfaceRef<IZOCDataServer> server;
    ASSERT_TRUE(IZOCDataServer::CreateUnauthenticatedDataServer(
        Guid::CreateUnique(), ImmutableString("hub.test"),
        [&](int inResult, const InterfaceRef<IZOCDataServer>& inServer) {
            std::lock_guard<std::mutex> lock(mutex);
            server = inServer;
            result = inResult;
            changed.notify_all();
        },
        false));
    std::unique_lock<std::mutex> lock(mutex);
    ASSERT_TRUE(changed.wait_for(lock, std::chrono::seconds(30), [&] { return result != 1; }));
    EXPECT_EQ(result, kResultSuccess);
    ASSERT_TRUE(server);
    EXPECT_FALSE(IsLoggedIn());
    EXPECT_THAT(net->Lines(), ElementsAre("GET " + kDiscovery, "GET " + kLinks));
}

TEST_F(ConnectTest, AnAcceptedLoginIsRemembered) {
    EXPECT_FALSE(IsZOEnabled());
    SignIn();
    UString value;
    ASSERT_TRUE(Registry::GetZORegistryValue(u"HasLoggedIn", value));
    EXPECT_EQ(value, u"true");
    EXPECT_TRUE(IsZOEnabled());
    ZOLoginData data;
    EXPECT_FALSE(Registry::GetLastLoginData(data, true, u"anna"));
}

TEST_F(ConnectTest, AHeadlessLoginIsLeftForTheNextProcessOfThisUserAndServerAlone) {
    HLM::SetIsHeadless(true);
    SignIn();
    ZOLoginData data;
    ASSERT_TRUE(Registry::GetLastLoginData(data, true, u"anna"));
    EXPECT_EQ(data.token, ImmutableString("login-token=scripted-1;"));
    EXPECT_EQ(data.serverURL, ImmutableString("hub.test"));
    EXPECT_FALSE(data.secure);
    EXPECT_EQ(Registry::GetLatestExpectedAuthToken(), data.token);

    const auto same = IZOCDataServer::CreateDataServerRef(ImmutableString(hub.BaseURL()), AnnasCredentials(),
                                                          false, false, false);
    EXPECT_EQ(same->GetCredentials().token, data.token);
    const auto other = IZOCDataServer::CreateDataServerRef(ImmutableString("http://elsewhere.test:60138"),
                                                           AnnasCredentials(), false, false, false);
    EXPECT_TRUE(other->GetCredentials().token.IsNull());
    ZOSCredentials bert;
    bert.username = ImmutableString("bert");
    const auto otherUser =
        IZOCDataServer::CreateDataServerRef(ImmutableString(hub.BaseURL()), bert, false, false, false);
    EXPECT_TRUE(otherUser->GetCredentials().token.IsNull());
}

enum class CancelMoment { kWhileStarting, kWhileWaiting, kAtAnyTime };

class CancelTest : public ConnectTest, public testing::WithParamInterface<std::tuple<int, CancelMoment>> {};

TEST_P(CancelTest, EndsOnceAndGoesNoFurther) {
    const int step = std::get<0>(GetParam());
    const CancelMoment moment = std::get<1>(GetParam());
    Guid id;
    std::atomic<int> count{0};
    std::thread racer;
    net->SetHandler([&](const RecordedRequest& inRequest) {
        ScriptedAnswer answer = hub.Answer(inRequest);
        if (count++ != step) {
            return answer;
        }
        if (moment == CancelMoment::kWhileStarting) {
            IZOCDataServer::CancelConnectRequest(id);
        } else if (moment == CancelMoment::kWhileWaiting) {
            answer.kind = ScriptedAnswer::Kind::kHold;
        } else {
            racer = std::thread([&] { IZOCDataServer::CancelConnectRequest(id); });
        }
        return answer;
    });
    ConnectOutcome outcome;
    ASSERT_TRUE(IZOCDataServer::ConnectToServer(ImmutableString(hub.BaseURL()), AnnasCredentials(), id, false,
                                                outcome.Function(), false, true));
    if (moment == CancelMoment::kWhileWaiting) {
        ASSERT_TRUE(net->WaitForRequests(static_cast<std::size_t>(step) + 1));
        IZOCDataServer::CancelConnectRequest(id);
    }
    const int result = outcome.Wait();
    if (racer.joinable()) {
        racer.join();
    }
    net->WaitUntilIdle();
    EXPECT_EQ(outcome.Calls(), 1);
    EXPECT_FALSE(GetConnectRequest(id));
    EXPECT_EQ(net->PendingCount(), 0u);
    if (moment == CancelMoment::kAtAnyTime && outcome.Server()) {
        EXPECT_EQ(result, kResultSuccess);
        return;
    }
    EXPECT_EQ(result, kResultRequestCancelled);
    EXPECT_FALSE(outcome.Server());
    EXPECT_FALSE(IsLoggedIn());
    if (moment != CancelMoment::kAtAnyTime) {
        EXPECT_EQ(net->RequestCount(), static_cast<std::size_t>(step) + 1);
    }
}

INSTANTIATE_TEST_SUITE_P(AllSteps, CancelTest,
                         testing::Combine(testing::Values(0, 1, 2, 3),
                                          testing::Values(CancelMoment::kWhileStarting,
                                                          CancelMoment::kWhileWaiting,
                                                          CancelMoment::kAtAnyTime)));

}  // namespace
}  // namespace ZOCL
