// The wall clock jumps while deadlines run.
#include <chrono>
#include <future>

#include "Client.h"
#include "ostcore/threads/Scheduler.h"
#include "WallClock.h"

namespace faults {
namespace {

constexpr long kDay = 24 * 60 * 60;
constexpr std::uint32_t kDeadline = 400;

class ClockJumps : public FaultTest, public testing::WithParamInterface<long> {
protected:
    void TearDown() override {
        MoveWallClock(0);
        FaultTest::TearDown();
    }
    static std::chrono::milliseconds Since(std::chrono::steady_clock::time_point inStart) {
        return std::chrono::duration_cast<std::chrono::milliseconds>(std::chrono::steady_clock::now() -
                                                                     inStart);
    }
};

TEST_P(ClockJumps, AndADeadlineOfTheNetworkStaysWhereItWas) {
    const auto before = std::chrono::system_clock::now();
    MoveWallClock(GetParam());
    const auto moved = std::chrono::system_clock::now() - before;
    MoveWallClock(0);
    ASSERT_NEAR(std::chrono::duration<double>(moved).count(), double(GetParam()), 60.0) << "the jump is none";

    ostnet::NetworkLimits limits;
    limits.responseTimeout = kDeadline;
    limits.lowSpeedTime = kDeadline;
    BadHub hub;
    const auto server = SignIn(hub);
    ostnet::SetNetworkLimits(limits);
    // One falls silent before its head, one within its body; the clock jumps when the request has arrived.
    for (const bool isInBody : {false, true}) {
        hub.Interfere(Step::kProductions,
                      [isInBody](Connection& ioConnection, const ReceivedRequest&, const HubAnswer& inGood) {
                          const std::string bytes = inGood.Bytes();
                          ioConnection.Write(isInBody ? bytes.substr(0, bytes.size() - 5) : std::string());
                          MoveWallClock(GetParam());
                          ioConnection.WaitForClose();
                          return false;
                      });
        const auto start = std::chrono::steady_clock::now();
        const Outcome outcome = mClient.Load(server->GetProductionList(false));
        const auto taken = Since(start);
        EXPECT_EQ(outcome.result, ZOCL::kResultNoHTTPResponse);
        EXPECT_TRUE(Response::IsNetworkConnectivityError(outcome.response));
        EXPECT_GE(taken.count(), kDeadline / 2) << "cut before its time";
        EXPECT_LT(taken.count(), 20000) << "not cut in time";
        MoveWallClock(0);
    }
    hub.BeGood();
    EXPECT_EQ(mClient.Load(server->GetProductionList(false)).result, ZOCL::kResultSuccess);
}

TEST_P(ClockJumps, AndABlockingCallWithATimeOutEndsInTime) {
    BadHub hub;
    const auto server = SignIn(hub);
    hub.Interfere(Step::kPayload, [](Connection& ioConnection, const ReceivedRequest&, const HubAnswer&) {
        MoveWallClock(GetParam());
        ioConnection.WaitForClose();
        return false;
    });
    // The main thread waits without limit; any other one has its time-out.
    const auto start = std::chrono::steady_clock::now();
    auto ended = std::async(std::launch::async, [&] {
        return server->BlockingGET(ImmutableString(hub.URL("/e/1")), ostnet::Headers(), kDeadline);
    });
    const auto response = ended.get();
    const auto taken = Since(start);
    ASSERT_TRUE(response);
    EXPECT_EQ(response->status, Response::kStatusCancelled);
    EXPECT_GE(taken.count(), kDeadline / 2);
    EXPECT_LT(taken.count(), 20000);
}

TEST_P(ClockJumps, AndADelayedFunctionComesWhenItWasTo) {
    const auto clock = boost::make_shared<ostcore::threads::VirtualScheduler>();
    const ostcore::threads::ScopedGlobalScheduler scope(clock);
    BadHub hub;
    const auto server = SignIn(hub);
    std::promise<void> hasRun;
    auto run = hasRun.get_future();
    ASSERT_TRUE(server->PostFunction([&] { hasRun.set_value(); }, 10000));
    clock->SetUTC(clock->UTCNow() + boost::posix_time::seconds(GetParam()));
    clock->Advance(std::chrono::milliseconds(9999));
    EXPECT_EQ(run.wait_for(std::chrono::seconds(0)), std::future_status::timeout);
    EXPECT_EQ(clock->PendingCount(), 1u);
    clock->Advance(std::chrono::milliseconds(1));
    EXPECT_EQ(run.wait_for(std::chrono::seconds(30)), std::future_status::ready);
}

INSTANTIATE_TEST_SUITE_P(Faults, ClockJumps, testing::Values(kDay, -kDay),
                         [](const auto& inInfo) { return inInfo.param > 0 ? "ForwardADay" : "BackADay"; });

}  // namespace
}  // namespace faults
