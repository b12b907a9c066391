// Identifiers from a hub that would reach other keys of the registry, or other places of the hub.
#include <algorithm>

#include "Client.h"
#include "ZOClient/Registry.h"

namespace faults {
namespace {

class HostileNames : public FaultTest {};

TEST_F(HostileNames, OfMediaLocatorsReachNoOtherKey) {
    BadHub hub;
    const auto server = SignIn(hub);
    ASSERT_TRUE(ZOCL::Registry::StoreRecentServers({{true, u"the-one.example"}}));
    ASSERT_TRUE(ZOCL::Registry::SetZORegistryValue(u"LocalPath", u"mine"));
    const std::string local = "zomedia://localhost-here/clip.mov";
    const std::string names[] = {"..\\RecentServers\\RecentServer0",
                                 "..\\..",
                                 "\\",
                                 "\\\\RecentServers",
                                 "..\\",
                                 "a\\b",
                                 std::string("m\0n", 3),
                                 "",
                                 std::string(300, 'n'),
                                 "%2e%2e%5cRecentServers",
                                 "../RecentServers/RecentServer0",
                                 "..",
                                 "m 1\r\nX-Injected: 1"};
    for (const std::string& name : names) {
        // The name comes as an asset of the hub's list names its media.
        std::string body = hub.GoodAnswer(Step::kAssets).body;
        const auto at = body.find(R"("m1")");
        ASSERT_NE(at, std::string::npos);
        hub.ChangeBody(Step::kAssets, body.replace(at, 4, Quote(name)));
        const auto production = LoadProduction(server, hub);
        const auto assets = production->GetAssetsWithParent(ImmutableString("any"));
        ASSERT_TRUE(AsResource(assets)->Load(true)) << name;
        const auto asset = assets->GetAssetByIdentifier(ImmutableString("a1"));
        ASSERT_TRUE(asset);
        if (const auto locator = asset->GetMediaLocator(true)) {
            locator->SetMediaHRef(ImmutableString(local));
            const std::string href = locator->GetMediaHRef().str();
            EXPECT_TRUE(href.empty() || href == local) << href;
            locator->SetMediaHRef(ImmutableString());
            ZOCL::IZOCMediaLocator::ClearLocalMediaLinkFromCache(locator->GetID());
        }
        std::vector<ZOCL::Registry::RecentServer> servers;
        ASSERT_TRUE(ZOCL::Registry::GetRecentServers(servers));
        // The login remembers its own server, now or a moment ago.
        const auto ours = std::remove_if(servers.begin(), servers.end(), [&](const auto& inServer) {
            return inServer.server.find(u"127.0.0.1") != ostcore::UString::npos;
        });
        servers.erase(ours, servers.end());
        ASSERT_EQ(servers.size(), 1u) << name;
        EXPECT_EQ(servers[0].server, u"the-one.example") << name;
        ostcore::UString value;
        ASSERT_TRUE(ZOCL::Registry::GetZORegistryValue(u"LocalPath", value));
        EXPECT_EQ(value, u"mine") << name;
    }
    for (const ReceivedRequest& request : hub.Requests()) {
        EXPECT_FALSE(request.Header("X-Injected")) << request.head;
        EXPECT_EQ(request.target.find_first_of(std::string(" \r\n\0", 4)), std::string::npos);
    }
    ExpectSecretsInTheirPlaces(hub.Requests());
}

}  // namespace
}  // namespace faults
