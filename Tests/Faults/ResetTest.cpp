// The connection breaks off at any byte of any answer on the way from the discovery document to a payload.
#include <atomic>

#include "Client.h"
#include "ostcore/debug/DebugDatabase.h"

namespace faults {
namespace {

/// Whether a connection that ends here is ended by a reset, or closed in good order.
enum class Ending { kReset, kClose };

class BrokenOffAnswer : public FaultTest, public testing::WithParamInterface<Ending> {
protected:
    /// All bytes of the head, every third one of the body, and the last.
    static std::vector<std::size_t> Cuts(const std::string& inAnswer) {
        const std::size_t body = inAnswer.find("\r\n\r\n") + 4;
        std::vector<std::size_t> cuts;
        for (std::size_t at = 0; at < inAnswer.size() - 1; at += at < body ? 1 : 3) {
            cuts.push_back(at);
        }
        cuts.push_back(inAnswer.size() - 1);
        return cuts;
    }
    static void BreakOff(BadHub& ioHub, Step inStep, std::size_t inAt) {
        ioHub.Interfere(inStep,
                        [inAt](Connection& ioConnection, const ReceivedRequest&, const HubAnswer& inGood) {
                            ioConnection.Write(inGood.Bytes().substr(0, inAt));
                            if (GetParam() == Ending::kReset) {
                                ioConnection.Reset();
                            }
                            return false;
                        });
    }
    static void ExpectHonestEnd(const Outcome& inOutcome, const std::string& inWhere) {
        EXPECT_EQ(inOutcome.result, ZOCL::kResultNoHTTPResponse) << inWhere;
        EXPECT_TRUE(Response::IsNetworkConnectivityError(inOutcome.response))
            << inWhere << " ends with transport error " << inOutcome.CurlError();
        EXPECT_FALSE(inOutcome.response && inOutcome.response->payload) << inWhere;
    }
};

TEST_P(BrokenOffAnswer, EndsTheConnectAndTheLoginFormGoesOutOnce) {
    BadHub hub;
    std::size_t logins = 0;
    for (const Step step : kConnectSteps) {
        const std::string answer = hub.GoodAnswer(step).Bytes();
        for (const std::size_t at : Cuts(answer)) {
            const std::string where = std::string(NameOf(step)) + " at byte " + std::to_string(at);
            hub.BeGood();
            BreakOff(hub, step, at);
            const Outcome outcome = mClient.Connect(hub.URL(""));
            EXPECT_FALSE(outcome.server) << where;
            ExpectHonestEnd(outcome, where);
            logins += step >= Step::kLogin ? 1 : 0;
            ASSERT_EQ(hub.CountRequests("POST", "/login"), logins) << where;
        }
    }
    EXPECT_FALSE(ZOCL::IZOCDataServer::GetLoggedInServerRef());
    hub.BeGood();
    EXPECT_TRUE(SignIn(hub)) << "nothing of the failures stays behind";
    ExpectSecretsInTheirPlaces(hub.Requests());
}

TEST_P(BrokenOffAnswer, LeavesWhatWasToBeLoadedUnloaded) {
    BadHub hub;
    const auto server = SignIn(hub);
    const auto production = LoadProduction(server, hub);
    for (const Step step :
         {Step::kProductions, Step::kProduction, Step::kAssets, Step::kEnclosures, Step::kPayload}) {
        hub.BeGood();
        const std::string answer = hub.GoodAnswer(step).Bytes();
        const auto resource = ResourceOf(step, server, production, hub);
        ASSERT_TRUE(resource);
        for (const std::size_t at : Cuts(answer)) {
            const std::string where = std::string(NameOf(step)) + " at byte " + std::to_string(at);
            BreakOff(hub, step, at);
            ExpectHonestEnd(mClient.Load(resource), where);
            ASSERT_FALSE(resource->IsLoaded()) << where;
        }
        hub.BeGood();
        EXPECT_EQ(mClient.Load(resource).result, ZOCL::kResultSuccess);
        EXPECT_TRUE(resource->IsLoaded());
    }
}

TEST_P(BrokenOffAnswer, IsAskedForAgainUntilItComesWhole) {
    ostcore::debug::DebugDatabase::SetOverride("ZOClient.DisableRetries", "false");
    BadHub hub;
    const auto server = SignIn(hub);
    ostcore::debug::DebugDatabase::SetOverride("ZOClient.DisableRetries", "true");
    const std::string answer = hub.GoodAnswer(Step::kProductions).Bytes();
    const auto resource = AsResource(server->GetProductionList(false));
    for (const std::size_t at : {std::size_t(0), std::size_t(9), answer.size() / 2, answer.size() - 1}) {
        const std::size_t before = hub.CountRequests("GET", "/p");
        const auto left = std::make_shared<std::atomic<int>>(2);
        hub.Interfere(Step::kProductions,
                      [at, left](Connection& ioConnection, const ReceivedRequest&, const HubAnswer& inGood) {
                          if (left->fetch_sub(1) <= 0) {
                              return ioConnection.Write(inGood.Bytes());
                          }
                          ioConnection.Write(inGood.Bytes().substr(0, at));
                          if (GetParam() == Ending::kReset) {
                              ioConnection.Reset();
                          }
                          return false;
                      });
        EXPECT_EQ(mClient.Refresh(resource).result, ZOCL::kResultSuccess) << at;
        EXPECT_EQ(hub.CountRequests("GET", "/p"), before + 3) << at;
    }
}

TEST_P(BrokenOffAnswer, ToACreationIsNotAskedForTwice) {
    BadHub hub;
    const auto server = SignIn(hub);
    const std::string answer = hub.GoodAnswer(Step::kProductions).Bytes();
    std::size_t posts = 0;
    for (const std::size_t at :
         {std::size_t(0), std::size_t(1), std::size_t(9), answer.size() / 2, answer.size() - 1}) {
        BreakOff(hub, Step::kProductions, at);
        EXPECT_FALSE(server->CreateProduction(u"New", u"", false)) << at;
        EXPECT_EQ(hub.CountRequests("POST", "/p"), ++posts) << at;
    }
}

INSTANTIATE_TEST_SUITE_P(Faults, BrokenOffAnswer, testing::Values(Ending::kReset, Ending::kClose),
                         [](const auto& inInfo) {
                             return inInfo.param == Ending::kReset ? "ByReset" : "ByClose";
                         });

}  // namespace
}  // namespace faults
