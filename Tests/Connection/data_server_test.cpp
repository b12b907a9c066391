// The data server in use: links, verbs, blocking calls, renewal of tokens, and the objects that it keeps.
#include "Connection/ServiceDocument.h"
#include "Connection/SynchronousRequest.h"
#include "ConnectSupport.h"
#include "Links.h"
#include "Model/ModelResourceFactory.h"
#include "Relations.h"
#include "ResourceCaches.h"
#include "ResourceFactory.h"
#include "ZOClient/Library.h"
#include "ZOClient/ServerFeatureReport.h"

namespace ZOCL {
namespace {

using ostnet::http::kWaitForever;
using testing::ElementsAre;
using testing::Not;

const ImmutableString kAssets("http://hub.test:60138/assets/1");

ServiceDocument DocumentWith(const std::vector<std::pair<ImmutableString, const char*>>& inLinks) {
    ServiceDocument document;
    for (const auto& entry : inLinks) {
        Link link;
        link.relation = entry.first;
        link.href = ImmutableString(entry.second);
        document.links.push_back(link);
    }
    return document;
}

class DataServerTest : public ConnectTest {
protected:
    DataServerTest() { GetCompositionRoot().resources = GetModelResourceFactory(); }
    ~DataServerTest() override {
        if (server) {
            RFL::QueryInterface<DataServer>(server)->ReleaseCaches();
        }
    }
    void UseServer(bool inKeepCredentials = false) { server = SignIn(inKeepCredentials); }
    InterfaceRef<IZOCDataServer> server;
};

TEST_F(DataServerTest, TheFullerDocumentComesFirst) {
    const ImmutableString relation("http://example/rel");
    const auto made = DataServer::Create({ImmutableString(kDiscovery), {}, false, false, false});
    made->TakeRootDocument(DocumentWith({{relation, "http://root"}, {ImmutableString("r"), "http://r"}}));
    EXPECT_STREQ(made->GetLink(relation).c_str(), "http://root");
    made->TakeLinksDocument(DocumentWith({{relation, "http://login"}, {kRelation_System_Login, "http://l"}}));
    EXPECT_STREQ(made->GetLink(relation).c_str(), "http://login");
    EXPECT_TRUE(made->GetFilledTables().loginLinks);
    made->TakeLinksDocument(DocumentWith({{relation, "http://signed-in"}}));
    EXPECT_STREQ(made->GetLink(relation).c_str(), "http://signed-in");
    EXPECT_STREQ(made->GetLink(ImmutableString("r")).c_str(), "http://r");
    EXPECT_TRUE(made->GetLink(ImmutableString("none")).IsNull());
}

TEST_F(DataServerTest, UploadsAreCompressedByTheRuleOfVersions) {
    const auto made = DataServer::Create({ImmutableString(kDiscovery), {}, false, false, false});
    struct Row {
        std::uint32_t major, minor;
        bool supported;
    };
    for (const Row& row : {Row{0, 0, false}, Row{1, 0, false}, Row{1, 1, false}, Row{1, 2, true},
                           Row{2, 0, false}, Row{2, 1, true}, Row{0, 2, false}}) {
        ServiceDocument document;
        document.majorVersion = row.major;
        document.minorVersion = row.minor;
        made->TakeLinksDocument(document);
        EXPECT_EQ(made->SupportsUploadCompression(), row.supported) << row.major << "." << row.minor;
    }
}

TEST_F(DataServerTest, EachBlockingVerbBringsItsAnswer) {
    UseServer();
    for (const char* verb : {"GET", "HEAD", "PUT", "POST", "DELETE"}) {
        hub.AddRoute(verb, "/assets/1", [](const RecordedRequest& inRequest) {
            return ScriptedAnswer::Body(inRequest.verb + inRequest.body + inRequest.Field("f"), "text/plain",
                                        201);
        });
    }
    const auto payload = RecycledMemory::CreateFromBytes("-body");
    const ostnet::http::Form form{{ImmutableString("f"), "-field"}};
    EXPECT_EQ(server->BlockingGET(kAssets, {}, kWaitForever)->GetPayloadAsUTF8String(), "GET");
    const auto content = server->BlockingGETByContentID(ImmutableString("c"), kAssets, kWaitForever);
    EXPECT_EQ(content->status, 200);
    EXPECT_EQ(content->GetPayloadAsUTF8String(), "GET");
    EXPECT_EQ(server->BlockingHEAD(kAssets, {}, kWaitForever)->status, 201);
    EXPECT_EQ(server->BlockingPUT(kAssets, {}, payload, kWaitForever)->GetPayloadAsUTF8String(), "PUT-body");
    const auto put = server->BlockingPUT(kAssets, {}, form, kWaitForever);
    EXPECT_THAT(put->GetPayloadAsUTF8String(), testing::HasSubstr("-field"));
    EXPECT_EQ(server->BlockingPOST(kAssets, {}, payload, kWaitForever)->GetPayloadAsUTF8String(),
              "POST-body");
    const auto post = server->BlockingPOST(kAssets, {}, form, kWaitForever);
    EXPECT_THAT(post->GetPayloadAsUTF8String(), testing::HasSubstr("-field"));
    EXPECT_EQ(server->BlockingDELETE(kAssets, {}, kWaitForever)->GetPayloadAsUTF8String(), "DELETE");
    EXPECT_EQ(server->GetPayloadFromURL(kAssets)->view(), "GET");
    EXPECT_FALSE(server->GetPayloadFromURL(ImmutableString("http://hub.test:60138/none")));
    EXPECT_EQ(CountOfBlockedWaits(), 0);
}

TEST_F(DataServerTest, AWaitThatTimesOutCancelsAndStillEnds) {
    UseServer();
    hub.AddRoute("GET", "/assets/1", [](const RecordedRequest&) { return ScriptedAnswer::Hold(); });
    const auto response = server->BlockingGET(kAssets, {}, 20);
    ASSERT_TRUE(response);
    EXPECT_EQ(response->status, ostnet::Response::kStatusCancelled);
    EXPECT_TRUE(net->WaitUntilIdle());
    EXPECT_EQ(net->PendingCount(), 0u);
}

TEST_F(DataServerTest, TheMainThreadWaitsPastItsTimeOut) {
    UseServer();
    hub.AddRoute("GET", "/assets/1", [](const RecordedRequest&) { return ScriptedAnswer::Hold(); });
    shared_ptr<ostnet::Response> response;
    std::thread host([&] {
        ostcore::threads::SetMainThread();
        response = server->BlockingGET(kAssets, {}, 1);
    });
    ASSERT_TRUE(net->WaitForRequests(1));
    // A second reader whose time-out is longer shows that the first one's has passed.
    EXPECT_EQ(server->BlockingGET(kAssets, {}, 50)->status, ostnet::Response::kStatusCancelled);
    EXPECT_EQ(net->PendingCount(), 1u);
    EXPECT_EQ(CountOfBlockedWaits(), 1);
    net->ReleaseHeld(ScriptedAnswer::Status(204));
    host.join();
    ASSERT_TRUE(response);
    EXPECT_EQ(response->status, 204);
    ostcore::threads::ResetMainThread();
}

TEST_F(DataServerTest, AnExpiredTokenIsRenewedOnceForAll) {
    UseServer(true);
    hub.AddRoute("GET", "/assets/1", [](const RecordedRequest&) { return ScriptedAnswer::Status(200); });
    hub.ExpireTokens();
    constexpr int kCount = 200;
    std::atomic<int> succeeded{0};
    std::atomic<int> completed{0};
    for (int i = 0; i < kCount; ++i) {
        ASSERT_TRUE(server->GET(Guid::CreateUnique(),
                                [&](const Guid&, const shared_ptr<ostnet::Response>& inResponse) {
                                    succeeded += inResponse && inResponse->status == 200 ? 1 : 0;
                                    ++completed;
                                },
                                kAssets, {}));
    }
    EXPECT_EQ(server->BlockingGET(kAssets, {}, kWaitForever)->status, 200);
    net->WaitUntilIdle();
    EXPECT_EQ(completed, kCount);
    EXPECT_EQ(succeeded, kCount);
    EXPECT_EQ(hub.LoginCount(), 2u);
    EXPECT_EQ(server->GetCredentials().token, ImmutableString("login-token=scripted-2;"));
}

TEST_F(DataServerTest, ARenewalThatFailsEndsWhatIsParked) {
    UseServer(true);
    hub.ExpireTokens();
    hub.AddUser("anna", "another password");
    EXPECT_EQ(server->BlockingGET(kAssets, {}, kWaitForever)->status, 401);
    EXPECT_EQ(hub.LoginCount(), 1u);
    EXPECT_EQ(server->BlockingGET(kAssets, {}, kWaitForever)->status, 401);
}

TEST_F(DataServerTest, WithoutCredentialsARefusalReachesTheCaller) {
    UseServer();
    hub.ExpireTokens();
    EXPECT_EQ(server->BlockingGET(kAssets, {}, kWaitForever)->status, 401);
    EXPECT_THAT(net->Lines(), ElementsAre("GET " + kAssets.str()));
}

TEST_F(DataServerTest, AServerThatIsGoneLeavesNoRequestParked) {
    ConnectOutcome outcome;
    Connect(outcome, AnnasCredentials(), true, false);
    ASSERT_EQ(outcome.Wait(), kResultSuccess);
    std::atomic<int> completed{0};
    std::atomic<int> status{0};
    auto short_lived = RFL::QueryInterface<DataServer>(outcome.Server());
    outcome = ConnectOutcome();
    net->WaitUntilIdle();
    // The message of the connect's end, which nobody reads here, holds the server too.
    ostcore::threads::ResetMainThread();
    hub.ExpireTokens();
    net->SetHandler([&](const RecordedRequest& inRequest) {
        return inRequest.url == kAssets.view() ? ScriptedAnswer::Hold() : hub.Answer(inRequest);
    });
    ASSERT_TRUE(short_lived->GET(Guid::CreateUnique(),
                                 [&](const Guid&, const shared_ptr<ostnet::Response>& inResponse) {
                                     status = inResponse->status;
                                     ++completed;
                                 },
                                 kAssets, {}));
    short_lived.Reset();
    net->ReleaseHeld(ScriptedAnswer::Status(401));
    net->WaitUntilIdle();
    EXPECT_EQ(completed, 1);
    EXPECT_EQ(status, 401);
}

TEST_F(DataServerTest, OneURLIsOneProduction) {
    hub.AddServiceLink("/medialocator#byMediaLocatorId", "http://other.name/locators/{mediaLocatorId}");
    hub.AddServiceLink("/productions/production#byIdAndCommitId", "http://x/p/{productionId}/c/{commitId}");
    UseServer();
    hub.AddRoute("GET", "/productions/1", [](const RecordedRequest&) {
        return ScriptedAnswer::JSON(
            "{\"properties\":{\"name\":\"One\"},\"links\":[{\"rel\":\"self\",\"href\":"
            "\"http://hub.test:60138/productions/one\"}]}");
    });
    const ImmutableString url("http://hub.test:60138/productions/1");
    const auto first = server->GetProductionFromURL(url);
    ASSERT_TRUE(first);
    EXPECT_EQ(server->GetProductionFromURL(url), first);
    EXPECT_EQ(net->RequestCount(), 1u);
    const auto caches = RFL::QueryInterface<ResourceCaches>(server);
    EXPECT_EQ(caches->GetCachedProduction(url), first);
    const auto locator = server->GetMediaLocator(ImmutableString("a-b"));
    ASSERT_TRUE(locator);
    EXPECT_EQ(server->GetMediaLocator(ImmutableString("a-b")), locator);
    const auto head = RFL::QueryInterface<IZOCServerResource>(
        server->GetProductionByIdAndCommitId(ImmutableString("p1"), ImmutableString()));
    EXPECT_STREQ(head->GetHTTPURL().c_str(), "http://x/p/p1/c/HEAD");
    IZOCDataServer::Terminate(false);
    EXPECT_FALSE(caches->GetCachedProduction(url));
    EXPECT_NE(server->GetMediaLocator(ImmutableString("a-b")), locator);
}

TEST_F(DataServerTest, WithoutLinksThereIsNothingToGive) {
    UseServer();
    EXPECT_FALSE(server->GetProductionList(false));
    EXPECT_FALSE(server->GetProductionTemplateList(false));
    EXPECT_FALSE(server->GetEnclosures());
    EXPECT_FALSE(server->GetMediaLocators());
    EXPECT_FALSE(server->GetLoggedInUser());
    EXPECT_FALSE(server->CanCreateUsers());
    EXPECT_FALSE(server->GetProductionByIdAndCommitId(ImmutableString("p"), ImmutableString("c")));
    EXPECT_EQ(server->GetLoggedInUserName(), u"anna");
    EXPECT_EQ(net->RequestCount(), 0u);
}

TEST_F(DataServerTest, TerminateWithoutEndOfSessionSendsNothing) {
    UseServer(true);
    IZOCDataServer::Terminate(false);
    EXPECT_FALSE(IsLoggedIn());
    EXPECT_EQ(net->RequestCount(), 0u);
    EXPECT_TRUE(server->GetLoginData().username.IsNull());
    // A refusal does not bring the session back.
    hub.ExpireTokens();
    EXPECT_EQ(server->BlockingGET(kAssets, {}, kWaitForever)->status, 401);
    EXPECT_EQ(hub.LoginCount(), 1u);
    EXPECT_FALSE(IsLoggedIn());
}

TEST_F(DataServerTest, CompatibilityIsAMatterOfVersions) {
    hub.SetVersion("2.0.5");
    UseServer();
    EXPECT_TRUE(ServerIsCompatible(server));
    ASSERT_TRUE(Registry::SetZORegistryValue(u"ServerVersion", u"1.9.0"));
    EXPECT_TRUE(ServerIsCompatible(server));
    ASSERT_TRUE(Registry::SetZORegistryValue(u"ServerVersion", u"2.1.0"));
    EXPECT_FALSE(ServerIsCompatible(server));
    ASSERT_TRUE(Registry::SetZORegistryValue(u"ServerVersion", u"9"));
    EXPECT_TRUE(ServerIsCompatible(server));
}

TEST_F(DataServerTest, AReportIsHeldOnceTheServerHasAnswered) {
    shared_ptr<ServerFeatureReport const> report;
    SetCompatibleMediaProtocolVersions(1, 1);
    EXPECT_FALSE(GetServerFeatureReport(ImmutableString(hub.BaseURL()), report));
    ASSERT_TRUE(net->WaitForRequests(2));
    net->WaitUntilIdle();
    ASSERT_TRUE(GetServerFeatureReport(ImmutableString(hub.BaseURL()), report));
    EXPECT_EQ(report->version, ImmutableString("1.0.0"));
    EXPECT_THAT(report->renderProtocolVersions, ElementsAre(1u));
    net->WaitUntilIdle();
    SetCompatibleMediaProtocolVersions(2, 1);
    GetServerFeatureReport(ImmutableString(hub.BaseURL()), report);
    net->WaitUntilIdle();
    ASSERT_TRUE(GetServerFeatureReport(ImmutableString(hub.BaseURL()), report));
    EXPECT_TRUE(report->renderProtocolVersions.empty());
    SetCompatibleMediaProtocolVersions(0, 0);
    net->WaitUntilIdle();
    for (const RecordedRequest& request : net->Requests()) {
        EXPECT_TRUE(request.headers.empty());
    }
}

}  // namespace
}  // namespace ZOCL
