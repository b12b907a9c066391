// An end at every request and at every window of the flows.
#include <thread>

#include "EndingsTest.h"
#include "ThreadsLeft.h"
#include "ZOClient/Library.h"

namespace ZOCL {
namespace {

const testing::Environment* const kThreadsLeft = testing::AddGlobalTestEnvironment(new ThreadsLeft);

constexpr Moment kMoments[] = {Moment::kBeforeTheRequest, Moment::kInFlight, Moment::kWhenAnswered};

TEST_F(EndingsTest, UndisturbedTheFlowsDoAllThatTheHubExpects) {
    EXPECT_FALSE(Run([this] { Share(); }, {}));
    EXPECT_THAT(windows->shown,
                testing::ElementsAre(
                    "MessageBox: Share \"Film\"", "ZOProgressDialog: Get Latest Changes",
                    "ZOProgressDialog: Resolve Conflicts", "ZOResolveDialog: Resolve Conflicts: Film",
                    "ZOProgressDialog: Resolve Conflicts", "ZOProgressDialog: Resolve Conflicts",
                    "MessageBox: Resolve Conflicts", "ZOPublishDialog: Share \"Film\"",
                    "ZOProgressDialog: Share My Changes"));
    EXPECT_EQ(published + synced + resolved, 4u);
    EXPECT_EQ(CountOf("POST /t1/commit") + CountOf("POST /theirs/asset/a") + CountOf("POST /mine/asset/b") +
                  CountOf("POST /s1/push"),
              4u);
    EXPECT_FALSE(Run([this] { ResolveOneByOne(); }, {}));
    EXPECT_EQ(hub->CountSettled(), 2u);
    EXPECT_EQ(resolved, 2u);
}

TEST_F(EndingsTest, AShareIsSignedOutOfAtEachRequest) {
    for (const Moment moment : kMoments) {
        EXPECT_GT(EndAtEachRequest([this] { Share(); }, EndingKind::kSignOut, moment), 30u);
    }
}

TEST_F(EndingsTest, AShareLosesItsServerAtEachRequest) {
    for (const Moment moment : kMoments) {
        EXPECT_GT(EndAtEachRequest([this] { Share(); }, EndingKind::kTerminate, moment), 30u);
    }
}

TEST_F(EndingsTest, AShareLosesItsConnectionAtEachRequest) {
    for (const Moment moment : kMoments) {
        EXPECT_GT(EndAtEachRequest([this] { Share(); }, EndingKind::kDrop, moment), 30u);
    }
}

TEST_F(EndingsTest, AShareIsCancelledAtEachRequest) {
    for (const Moment moment : kMoments) {
        EXPECT_GT(EndAtEachRequest([this] { Share(); }, EndingKind::kCancel, moment), 30u);
    }
}

TEST_F(EndingsTest, AHubThatDoesNotAnswerHoldsUpNoEndOfTheSession) {
    for (const EndingKind kind : {EndingKind::kSignOut, EndingKind::kTerminate}) {
        for (const Moment moment : {Moment::kNeverAnswered, Moment::kWhileItStarts}) {
            EXPECT_GT(EndAtEachRequest([this] { Share(); }, kind, moment), 30u);
        }
    }
}

TEST_F(EndingsTest, FlowsThatShowLittleOrNothingEndAtEachRequest) {
    for (const EndingKind kind : {EndingKind::kSignOut, EndingKind::kTerminate, EndingKind::kDrop}) {
        for (const Moment moment : kMoments) {
            EXPECT_GT(EndAtEachRequest([this] { ResolveOneByOne(); }, kind, moment), 20u);
        }
    }
}

TEST_F(EndingsTest, AHostThatGoesOnAfterTheEndGoesNowhere) {
    continuesLater = true;
    for (const EndingKind kind : {EndingKind::kSignOut, EndingKind::kTerminate}) {
        EXPECT_FALSE(Run([this] { Share(); }, {}));
        ASSERT_EQ(later.size(), 1u) << "the latest is there, and the host has its part";
        const std::size_t shown = windows->shown.size();
        EndNow(kind);
        const std::size_t sent = net->RequestCount();
        std::thread([this] {
            later[0](kResultSuccess, ImmutableString("c40"));
            later[0](kResultSuccess, ImmutableString("c40"));
        }).join();
        Settle();
        EXPECT_EQ(windows->shown.size(), shown) << "it went on to " << windows->shown.back();
        EXPECT_EQ(net->RequestCount(), sent);
    }
}

TEST_F(EndingsTest, TheLibraryEndsWhileTheHostStillHasItsPart) {
    Initialize();
    continuesLater = true;
    EXPECT_FALSE(Run([this] { Share(); }, {}));
    ASSERT_EQ(later.size(), 1u);
    EndNow(EndingKind::kSignOut);
    Shutdown();
    const std::size_t shown = windows->shown.size();
    later[0](kResultSuccess, ImmutableString("c40"));
    Settle();
    EXPECT_EQ(windows->shown.size(), shown);
    // The last that knows the flow lets go of it on another thread.
    std::thread([last = std::move(later)]() mutable { last.clear(); }).join();
}

TEST_F(EndingsTest, AShareEndsAtEachWindow) {
    for (const EndingKind kind :
         {EndingKind::kCancel, EndingKind::kSignOut, EndingKind::kTerminate, EndingKind::kDrop}) {
        EXPECT_GE(EndAtEachWindow([this] { Share(); }, kind), 8u);
    }
}

}  // namespace
}  // namespace ZOCL
