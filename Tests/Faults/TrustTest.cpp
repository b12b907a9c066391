// What a hub says of other places: links, redirects and cookies that would lead a client, or its token, away.
#include "Client.h"
#include "net/Certificates.h"

namespace faults {
namespace {

/// Somebody else's server. Whoever comes here has been led astray.
class Trap {
public:
    Trap()
        : mServer(RawServer::Answering([](const ReceivedRequest&) { return RawServer::Answer(200, "{}"); })) {
    }
    std::string Host() const { return "127.0.0.1:" + std::to_string(mServer.Port()); }
    bool SawNobody() const { return mServer.ConnectionCount() == 0; }

private:
    RawServer mServer;
};

class LedAstray : public FaultTest {
protected:
    void TearDown() override {
        EXPECT_TRUE(mTrap.SawNobody()) << "a connection went to another host";
        FaultTest::TearDown();
    }
    std::vector<std::string> HostileHRefs(const BadHub& inHub) const {
        const std::string trap = mTrap.Host();
        const std::string hub = "127.0.0.1:" + std::to_string(inHub.Port());
        std::vector<std::string> hrefs{"http://" + trap + "/x",
                                       "http://" + trap,
                                       "http://" + trap + "?a=b",
                                       "http://" + trap + "#/x",
                                       "https://" + trap + "/x",
                                       "//" + trap + "/x",
                                       "http:\\\\" + trap + "\\x",
                                       "http:/" + trap + "/x",
                                       "http:" + trap + "/x",
                                       "http://" + hub + "@" + trap + "/x",
                                       "http://" + hub + "@" + trap,
                                       "http://" + hub + "\\@" + trap + "/x",
                                       "http://ann:" + std::string("pw") + "@" + trap + "/x",
                                       "http://" + hub + " @" + trap + "/x",
                                       "http://" + hub + "#@" + trap + "/x",
                                       "http://" + hub + "." + trap + "/x",
                                       "HTTP://" + trap + "/x",
                                       "javascript:alert(1)",
                                       "javascript://" + trap + "/%0aalert(1)",
                                       "file:///etc/passwd",
                                       "file:/etc/passwd",
                                       "ftp://" + trap + "/x",
                                       "gopher://" + trap + "/x",
                                       "zomedia://" + trap + "/x",
                                       "data:application/json,{}",
                                       " http://" + trap + "/x",
                                       "http://" + hub + "/x y",
                                       "http://" + hub + "/x\r\nX-Injected: 1",
                                       "http://" + hub + "/x\nX-Injected: 1",
                                       "http://" + hub + "/x HTTP/1.1\r\nX-Injected: 1\r\n\r\nGET /second",
                                       "http://" + hub + "/x\tX-Injected",
                                       "http://" + hub + "\r\nX-Injected: 1/x",
                                       "http://" + hub + "/\xff\xfe",
                                       "/x",
                                       "x",
                                       "",
                                       "http://",
                                       "://",
                                       std::string(1 << 16, 'h')};
        hrefs.push_back("http://" + hub + std::string("/x\0y", 4));
        return hrefs;
    }
    static void ExpectNothingInjected(const BadHub& inHub) {
        for (const ReceivedRequest& request : inHub.Requests()) {
            EXPECT_FALSE(request.Header("X-Injected")) << request.head;
            EXPECT_EQ(request.target.find('\0'), std::string::npos);
            EXPECT_EQ(request.target.compare(0, 1, "/"), 0) << request.target;
            EXPECT_NE(request.target, "/second");
            EXPECT_EQ(request.Header("Host"), "127.0.0.1:" + std::to_string(inHub.Port()));
            EXPECT_FALSE(request.Header("Authorization")) << "user information of a link was sent";
        }
        ExpectSecretsInTheirPlaces(inHub.Requests());
    }
    static std::string WithHRef(const std::string& inBody, const std::string& inFrom,
                                const std::string& inTo) {
        std::string body = inBody;
        const std::string from = Quote(inFrom);
        EXPECT_NE(body.find(from), std::string::npos) << from;
        for (auto at = body.find(from); at != std::string::npos; at = body.find(from, at + 1)) {
            body.replace(at, from.size(), Quote(inTo));
        }
        return body;
    }

    Trap mTrap;
};

TEST_F(LedAstray, ByALinkOfTheLoginSequence) {
    BadHub hub;
    const std::pair<Step, std::string> links[] = {{Step::kDiscovery, hub.URL("/links")},
                                                  {Step::kLinks, hub.URL("/login")}};
    for (const auto& [step, href] : links) {
        for (const std::string& hostile : HostileHRefs(hub)) {
            hub.ChangeBody(step, WithHRef(hub.GoodAnswer(step).body, href, hostile));
            const Outcome outcome = mClient.Connect(hub.URL(""));
            EXPECT_FALSE(outcome.server) << NameOf(step) << ": " << hostile;
            EXPECT_LT(outcome.result, 0) << NameOf(step) << ": " << hostile;
            hub.BeGood();
        }
    }
    for (const ReceivedRequest& request : hub.Requests()) {
        // A link that is moved onto the hub may carry the form there, and the hub has the password anyway.
        EXPECT_FALSE(request.Header("X-Injected"));
        EXPECT_EQ(request.Header("Host"), "127.0.0.1:" + std::to_string(hub.Port()));
        EXPECT_EQ(request.head.find(kPassword), std::string::npos);
    }
}

TEST_F(LedAstray, ByALinkOfADocument) {
    BadHub hub;
    for (const std::string& hostile : HostileHRefs(hub)) {
        hub.BeGood();
        hub.ChangeBody(Step::kSignedInLinks, WithHRef(WithHRef(hub.GoodAnswer(Step::kSignedInLinks).body,
                                                               hub.URL("/p/1/e"), hostile),
                                                      hub.URL("/logout"), hostile));
        const auto server = mClient.Connect(hub.URL("")).server;
        if (!server) {
            const bool isText = hostile.find('\xff') == std::string::npos;
            EXPECT_TRUE(hostile.empty() || !isText)
                << "only a login without the link to sign out is none: " << hostile;
            continue;
        }
        if (const auto enclosures = AsResource(server->GetEnclosures())) {
            mClient.Load(enclosures);
            EXPECT_FALSE(enclosures->IsLoaded()) << hostile;
        }
        hub.ChangeBody(Step::kProductions,
                       WithHRef(hub.GoodAnswer(Step::kProductions).body, hub.URL("/p/1"), hostile));
        const auto list = server->GetProductionList(true);
        ASSERT_TRUE(list && list->GetAllItems().size() == 1) << hostile;
        if (const auto production = AsResource(list->GetProduction(list->GetAllItems()[0]))) {
            EXPECT_FALSE(production->Load(true)) << hostile;
        }
        std::string body = hub.GoodAnswer(Step::kProduction).body;
        for (const char* const path : {"/p/1/full", "/p/1/a", "/p/1/e", "/p/1"}) {
            body = WithHRef(body, hub.URL(path), hostile);
        }
        hub.ChangeBody(Step::kProduction, body);
        const auto production = server->GetProductionFromURL(ImmutableString(hub.URL("/p/1")));
        ASSERT_TRUE(production && AsResource(production)->IsLoaded()) << hostile;
        for (const auto& resource :
             {AsResource(production->GetAssets()), AsResource(production->GetEnclosures()),
              AsResource(production->GetLatestVersion())}) {
            if (resource) {
                EXPECT_FALSE(resource->Load(true)) << hostile;
            }
        }
        EXPECT_FALSE(server->GetPayloadFromURL(ImmutableString(hostile))) << hostile;
        IZOCDataServer::Terminate(true);
    }
    ExpectNothingInjected(hub);
}

TEST_F(LedAstray, ByARedirectAtAnyStep) {
    BadHub hub;
    const auto server = SignIn(hub);
    const auto production = LoadProduction(server, hub);
    for (const int status : {300, 301, 302, 303, 305, 306, 307, 308}) {
        for (const std::string& place :
             {"http://" + mTrap.Host() + "/content/zo/api/discovery.json", "//" + mTrap.Host() + "/x",
              hub.URL("/content/zo/api/discovery.json")}) {
            const auto redirect = [&](const HubAnswer&) {
                return HubAnswer{status, "Location: " + place + "\r\n", ""};
            };
            const std::string where = std::to_string(status) + " to " + place;
            for (const Step step : kConnectSteps) {
                hub.BeGood();
                hub.Change(step, redirect);
                const std::size_t before = hub.Requests().size();
                const Outcome outcome = mClient.Connect(hub.URL(""));
                EXPECT_FALSE(outcome.server) << NameOf(step) << ", " << where;
                EXPECT_LT(outcome.result, 0) << NameOf(step) << ", " << where;
                EXPECT_EQ(outcome.response ? outcome.response->status : -1, status) << NameOf(step);
                EXPECT_EQ(hub.Requests().size(), before + 1 + static_cast<std::size_t>(step))
                    << "a redirect was followed at " << NameOf(step);
            }
            for (const Step step : kLoadSteps) {
                hub.Change(step, redirect);
                const auto resource = ResourceOf(step, server, production, hub);
                EXPECT_LT(mClient.Load(resource).result, 0) << NameOf(step) << ", " << where;
                EXPECT_FALSE(resource->IsLoaded());
            }
        }
    }
}

TEST_F(LedAstray, ByTheLocationOfAnAnswer) {
    BadHub hub;
    const auto server = SignIn(hub);
    for (const std::string& hostile : HostileHRefs(hub)) {
        if (hostile.find_first_of(std::string("\r\n\0", 3)) != std::string::npos || hostile.size() > 1000) {
            continue;  // these end the header line, which is a fault of another kind
        }
        hub.Change(Step::kProductions, [&](const HubAnswer& inGood) {
            return inGood.WithHeaders(inGood.headers + "Location: " + hostile + "\r\n");
        });
        const auto list = AsResource(server->GetProductionList(true));
        ASSERT_TRUE(list);
        mClient.Refresh(list);
        bool changed = false;
        list->Refresh(changed, false);
    }
    ExpectNothingInjected(hub);
}

TEST_F(LedAstray, ByTagsThatWouldBreakOutOfTheirHeader) {
    BadHub hub;
    const auto server = SignIn(hub);
    const auto production = LoadProduction(server, hub);
    for (const std::string& tag :
         {std::string("\"t\"\r\nX-Injected: 1"), std::string("\"t\"\nX-Injected: 1"),
          std::string("\"t\0u\"", 5), std::string("\"t\"\r\n\r\nGET /second HTTP/1.1")}) {
        std::string body = hub.GoodAnswer(Step::kAssets).body;
        const std::string sound = R"("zo:etag":"\"t1\"")";
        ASSERT_NE(body.find(sound), std::string::npos);
        body.replace(body.find(sound), sound.size(), R"("zo:etag":)" + Quote(tag));
        hub.ChangeBody(Step::kAssets, body);
        const auto assets = production->GetAssetsWithParent(ImmutableString("x"));
        ASSERT_TRUE(AsResource(assets)->Load(true));
        const auto asset = assets->GetAssetByIdentifier(ImmutableString("a1"));
        ASSERT_TRUE(asset);
        // The cache asks with tags of its own only.
        EXPECT_EQ(mClient.Refresh(AsResource(asset)).calls, 1);
    }
    ExpectNothingInjected(hub);
}

TEST_F(LedAstray, FromTLSToAPlainConnection) {
    const zotest::net::CertificateAuthority authority;
    ostnet::SetCertificateAuthorityFile(authority.File());
    BadHub hub(authority.Issue("127.0.0.1"));
    const std::string trap = "http://" + mTrap.Host();
    const std::string plain = "http://127.0.0.1:" + std::to_string(hub.Port());
    for (const std::string& base : {trap, plain}) {
        hub.BeGood();
        for (const Step step : {Step::kDiscovery, Step::kLinks, Step::kSignedInLinks, Step::kProductions}) {
            std::string body = hub.GoodAnswer(step).body;
            for (auto at = body.find(hub.URL("")); at != std::string::npos; at = body.find(hub.URL(""))) {
                body.replace(at, hub.URL("").size(), base);
            }
            hub.ChangeBody(step, body);
        }
        // Links to plain places are moved onto the connection that has been proven.
        const auto server = SignIn(hub);
        ASSERT_TRUE(server);
        const auto list = server->GetProductionList(true);
        ASSERT_TRUE(list && list->GetAllItems().size() == 1);
        EXPECT_TRUE(AsResource(list->GetProduction(list->GetAllItems()[0]))->Load(true));
        for (const Step step : kConnectSteps) {
            hub.BeGood();
            hub.Change(step, [&](const HubAnswer&) {
                return HubAnswer{307, "Location: " + base + "/x\r\n", ""};
            });
            EXPECT_EQ(mClient.Connect(hub.URL("")).result, ZOCL::kResultHTTPTemporaryRedirect);
        }
    }
    // An authority that nobody vouches for gets neither name nor password.
    const zotest::net::CertificateAuthority stranger;
    ostnet::SetCertificateAuthorityFile(stranger.File());
    const std::size_t before = hub.Requests().size();
    hub.BeGood();
    const Outcome refused = mClient.Connect(hub.URL(""));
    EXPECT_FALSE(refused.server);
    EXPECT_TRUE(Response::IsBadSSLCACert(refused.response));
    EXPECT_EQ(hub.Requests().size(), before);
    ostnet::SetCertificateAuthorityFile("");
}

}  // namespace
}  // namespace faults
