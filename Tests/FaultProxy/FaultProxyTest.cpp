// What client and hub see of each fault, and that the same seed brings the same ones.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <chrono>

#include "FaultProxy.h"
#include "net/RawServer.h"
#include "RawClient.h"

namespace faultproxy {
namespace {

using zohub::test::Answer;
using zohub::test::RawConnection;
using zotest::net::RawServer;
using zotest::net::ReceivedRequest;

const std::string kGet = "GET /a?token=canary HTTP/1.1\r\nHost: h\r\nCookie: canary\r\n\r\n";
const std::string kPost =
    "POST /b HTTP/1.1\r\nHost: h\r\nContent-Length: 1000\r\n\r\n" + std::string(1000, 'p');
const std::string kBody(2000, 'x');

/// A hub that answers each request with its path and a filling.
class FaultProxyTest : public testing::Test {
protected:
    FaultProxyTest()
        : mHub(RawServer::Answering([](const ReceivedRequest& inRequest) {
              return RawServer::Answer(200, inRequest.target + kBody);
          })) {}

    /// What a client gets that sends this, in words.
    std::string Outcome(const FaultProxy& inProxy, const std::string& inRequest) {
        RawConnection client(inProxy.Port());
        return OutcomeOn(client, inRequest);
    }
    static std::string OutcomeOn(RawConnection& ioClient, const std::string& inRequest) {
        if (!ioClient.TrySend(inRequest)) {
            return "cut";
        }
        try {
            const Answer answer = ioClient.Receive();
            return std::to_string(answer.status) +
                   (answer.body.find(kBody) != std::string::npos ? " whole" : "");
        } catch (const std::exception&) {
            return "cut";
        }
    }
    /// The first request meets the fault, no other one.
    Schedule Once(const Fault& inFault) { return ScheduleOf({{0, inFault}}); }

    RawServer mHub;
};

TEST_F(FaultProxyTest, EachFaultIsSeenByClientAndHubAsItIsNamed) {
    struct Case {
        Fault fault;
        const char* outcome;
        std::size_t asked;  // of the hub
    };
    const std::vector<Case> cases = {
        {{FaultKind::kNone}, "200 whole", 1},
        {{FaultKind::kRefuse, 1}, "cut", 0},
        {{FaultKind::kOutage, 1}, "cut", 0},
        {{FaultKind::kResetBeforeRequest}, "cut", 0},
        {{FaultKind::kResetInRequestHead, 0, 400}, "cut", 0},
        {{FaultKind::kResetInRequestBody, 0, 400}, "cut", 0},
        {{FaultKind::kResetBeforeAnswer}, "cut", 1},
        {{FaultKind::kResetInAnswerHead, 0, 999}, "cut", 1},
        {{FaultKind::kResetInAnswerBody, 0, 999}, "cut", 1},
        {{FaultKind::kTruncate, 0, 999}, "cut", 1},
        {{FaultKind::kStall, 20, 10}, "cut", 1},
        {{FaultKind::kDelayRequest, 20}, "200 whole", 1},
        {{FaultKind::kDelayAnswer, 20}, "200 whole", 1},
        {{FaultKind::kTrickle, 40}, "200 whole", 1},
        {{FaultKind::kStatusWithoutWork, 0, 0, 401}, "401", 0},
        {{FaultKind::kStatusAfterWork, 0, 0, 502}, "502", 1},
        {{FaultKind::kGarbageWithoutWork}, "cut", 0},
        {{FaultKind::kGarbageAfterWork}, "cut", 1},
        {{FaultKind::kDuplicate}, "200 whole", 1},
        {{FaultKind::kSwap}, "200 whole", 1},
        {{FaultKind::kCloseIdle}, "200 whole", 1},
    };
    for (const std::string& request : {kGet, kPost}) {
        for (const Case& c : cases) {
            SCOPED_TRACE(c.fault.Describe());
            const std::size_t before = mHub.Requests().size();
            FaultProxy proxy(mHub.Port(), Once(c.fault));
            EXPECT_EQ(Outcome(proxy, request), c.outcome);
            EXPECT_EQ(mHub.Requests().size() - before, c.asked);
            if (c.asked == 1) {
                EXPECT_EQ(mHub.Requests().back().Raw(), request);
            }
            proxy.BeGood();
            EXPECT_EQ(Outcome(proxy, request), "200 whole");
            const std::string log = proxy.LogText(true);
            EXPECT_THAT(log, testing::HasSubstr(NameOf(c.fault.kind)));
            EXPECT_THAT(log, testing::Not(testing::HasSubstr("canary")));
        }
    }
}

TEST_F(FaultProxyTest, OnAKeptConnectionAnswersComeTwiceSwappedOrNotAtAll) {
    const std::string other = "GET /other HTTP/1.1\r\nHost: h\r\n\r\n";
    FaultProxy proxy(mHub.Port(), ScheduleOf({{1, {FaultKind::kSwap}}, {2, {FaultKind::kDuplicate}}}));
    RawConnection client(proxy.Port());
    client.Send(other);
    EXPECT_EQ(client.Receive().body, "/other" + kBody);
    client.Send(kGet);
    EXPECT_EQ(client.Receive().body, "/other" + kBody);
    client.Send(other);
    EXPECT_EQ(client.Receive().body, "/other" + kBody);
    EXPECT_EQ(client.Receive().body, "/other" + kBody);

    proxy.Follow(Once({FaultKind::kCloseIdle}));
    client.Send(other);
    EXPECT_EQ(client.Receive().status, 200);
    EXPECT_TRUE(client.IsClosedWithin(std::chrono::seconds(10)));
    EXPECT_EQ(proxy.RequestCount(), 1u);
}

TEST_F(FaultProxyTest, AnOutageEndsEveryConnectionAndIsOverWhenItIsSaidToBe) {
    FaultProxy proxy(mHub.Port(), nullptr);
    RawConnection kept(proxy.Port());
    EXPECT_EQ(OutcomeOn(kept, kGet), "200 whole");
    proxy.Cut();
    EXPECT_EQ(OutcomeOn(kept, kGet), "cut");
    EXPECT_THROW(RawConnection(proxy.Port()), std::runtime_error);
    proxy.Restore();
    EXPECT_EQ(Outcome(proxy, kPost), "200 whole");

    // One that a fault began ends by itself.
    proxy.Follow(Once({FaultKind::kOutage, 30}));
    EXPECT_EQ(Outcome(proxy, kGet), "cut");
    const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(20);
    std::string outcome = "refused";
    while (outcome == "refused" && std::chrono::steady_clock::now() < end) {
        try {
            outcome = Outcome(proxy, kGet);
        } catch (const std::runtime_error&) {
        }
    }
    EXPECT_EQ(outcome, "200 whole");
}

TEST(RandomFaults, FollowFromTheSeedAreFiniteAndReachEveryKind) {
    const auto describe = [](std::uint64_t inSeed) {
        std::string text;
        for (const auto& [place, fault] : RandomFaults(inSeed, {})) {
            text += std::to_string(place) + " " + fault.Describe() + "\n";
        }
        return text;
    };
    std::set<FaultKind> kinds;
    for (std::uint64_t seed = 0; seed < 300; ++seed) {
        EXPECT_EQ(describe(seed), describe(seed));
        const auto faults = RandomFaults(seed, {});
        EXPECT_GE(faults.size(), 1u);
        EXPECT_LE(faults.size(), RandomScheduleLimits().maximumFaults);
        for (const auto& [place, fault] : faults) {
            kinds.insert(fault.kind);
        }
    }
    EXPECT_NE(describe(1), describe(2));
    EXPECT_EQ(kinds.size(), 20u);
    const Schedule spared = ScheduleOf({{0, {FaultKind::kTruncate}}},
                                       [](const RequestLine& inLine) { return inLine.path == "/a"; });
    EXPECT_EQ(spared(0, {"GET", "/a"}).kind, FaultKind::kNone);
    EXPECT_EQ(spared(0, {"GET", "/b"}).kind, FaultKind::kTruncate);
}

}  // namespace
}  // namespace faultproxy
