// One Share from the first window to the last, a cancel in each window, and hosts that take their time.
#include "RoadFixture.h"

#include <gmock/gmock.h>

#include <thread>

#include <QtTest/QtTest>

namespace ZOCL {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::StartsWith;

TEST_F(RoadTest, AShareGetsTheLatestResolvesAndSharesByClicks) {
    BeginWork();
    ExpectWholeRoad();
    EXPECT_TRUE(Share());
    Settle();
    EXPECT_TRUE(user->IsDone());
    EXPECT_THAT(
        user->Shown(),
        ElementsAre("MessageBox: Share \"Harbour Film\"", "ZOProgressDialog: Get Latest Changes",
                    "ZOProgressDialog: Resolve Conflicts", "ZOResolveDialog: Resolve Conflicts: Harbour Film",
                    "ZOProgressDialog: Resolve Conflicts", "ZOProgressDialog: Resolve Conflicts",
                    "ZOProgressDialog: Resolve Conflicts", "MessageBox: Resolve Conflicts",
                    "ZOPublishDialog: Share \"Harbour Film\"", "ZOProgressDialog: Share My Changes"));
    EXPECT_THAT(told, ElementsAre("conflicts", "replaced", "replaced", "kept", "shared"));
    EXPECT_THAT(
        log->Writes(),
        ElementsAre("POST e", "POST pull", "POST e", "POST transactions", StartsWith("PUT "), "POST commit",
                    StartsWith("POST accept-theirs?kind=asset"), StartsWith("POST accept-theirs?kind=asset"),
                    "POST accept-yours?kind=enclosure&name=notes.txt", "POST push"));
    EXPECT_THAT(log->BodyOf("push"), HasSubstr("\":commitMessage\"\r\n\r\nFirst cut, with \"quotes\"\r\n"));

    const auto outcome = tracker->GetOutcome();
    EXPECT_TRUE(outcome.wasShared);
    EXPECT_EQ(Newest(), std::make_pair(std::string("First cut, with \"quotes\""), outcome.commitId));
    const Member elsewhere(hub.URL().str(), "ben");
    EXPECT_THAT(Names(elsewhere.production), testing::IsSupersetOf({u"A of ben", u"C of ben"}));
    EXPECT_EQ(Payload(elsewhere.production, kNotes), kAnnasNotes);
    const std::string packet = Payload(elsewhere.production, kPacketName);
    EXPECT_THAT(packet, HasSubstr("<own:scene>2</own:scene>")) << "Ben's change is lost";
    EXPECT_THAT(packet, HasSubstr("<own:take>7</own:take>")) << "Anna's change is lost";
    Head(annas);
    EXPECT_EQ(packet, Payload(As<IZOCProduction>(annas), kPacketName));
    EXPECT_EQ(CountOpen(annas), 0u);
}

class RoadCancelTest : public RoadTest {
protected:
    void ExpectNothingShared() {
        Settle();
        EXPECT_TRUE(user->IsDone());
        EXPECT_EQ(Newest().first, "His");
        EXPECT_FALSE(tracker->GetOutcome().wasShared);
        EXPECT_EQ(CountOpen(annas), 0u);
        Head(annas);
        EXPECT_EQ(Payload(As<IZOCProduction>(annas), kNotes), kAnnasNotes);
    }
    bool HasConflicts() {
        const auto outgoing = annas->GetOutgoingChanges();
        EXPECT_TRUE(As<IZOCServerResource>(outgoing)->Load(true));
        return outgoing->HasConflicts();
    }
};

TEST_F(RoadCancelTest, WhoDoesNotWantTheLatestHasChangedNothing) {
    BeginWork();
    const ImmutableString before = Head(annas);
    user->Expect("MessageBox", [](QDialog& ioWindow) { User::Click(ioWindow, "Cancel"); });
    EXPECT_FALSE(Share());
    user->Expect("MessageBox", [](QDialog& ioWindow) { QTest::keyClick(&ioWindow, Qt::Key_Escape); });
    EXPECT_FALSE(Share());
    EXPECT_THAT(log->Writes(), IsEmpty());
    EXPECT_THAT(told, IsEmpty());
    EXPECT_EQ(Head(annas), before);
    ExpectNothingShared();
}

TEST_F(RoadCancelTest, WhoResolvesNothingKeepsTheConflicts) {
    BeginWork();
    user->Expect("MessageBox", [](QDialog& ioWindow) { User::Click(ioWindow, "Get Latest Changes"); });
    user->Expect("ZOResolveDialog", [](QDialog& ioWindow) {
        User::Rows(ioWindow, 3);
        User::ClickCell(ioWindow, kNotes);
        ioWindow.close();
    });
    EXPECT_TRUE(Share()) << "the latest is there";
    EXPECT_THAT(told, ElementsAre("conflicts"));
    EXPECT_EQ(log->Writes().back(), "POST commit") << "of the merge of metadata";
    EXPECT_TRUE(HasConflicts());
    ExpectNothingShared();
}

TEST_F(RoadCancelTest, WhoStopsResolvingKeepsWhatIsSettled) {
    BeginWork();
    user->Expect("MessageBox", [](QDialog& ioWindow) { User::Click(ioWindow, "Get Latest Changes"); });
    user->Expect("ZOResolveDialog", [](QDialog& ioWindow) {
        User::ClickCell(ioWindow, "A of anna");
        User::Click(ioWindow, "Take the shared version");
        User::Click(ioWindow, "Resolve");
        User::Click(ioWindow, "Stop Resolving");
    });
    EXPECT_TRUE(Share());
    EXPECT_THAT(told, ElementsAre("conflicts", "replaced"));
    Head(annas);
    EXPECT_THAT(Names(As<IZOCProduction>(annas)), testing::IsSupersetOf({u"A of ben", u"C of anna"}));
    EXPECT_TRUE(HasConflicts());
    ExpectNothingShared();
}

TEST_F(RoadCancelTest, WhoDoesNotShareHasASessionThatIsReadyToBeShared) {
    BeginWork();
    user->Expect("MessageBox", [](QDialog& ioWindow) { User::Click(ioWindow, "Get Latest Changes"); });
    ExpectResolve();
    // There is nothing to decide: however it is closed, the road goes on.
    user->Expect("MessageBox", [](QDialog& ioWindow) { ioWindow.close(); });
    user->Expect("ZOPublishDialog", [](QDialog& ioWindow) {
        User::Type(ioWindow, "Not yet");
        User::Click(ioWindow, "Cancel");
    });
    EXPECT_TRUE(Share());
    EXPECT_THAT(told, ElementsAre("conflicts", "replaced", "replaced", "kept"));
    EXPECT_TRUE(tracker->GetOutcome().wasShown);
    EXPECT_FALSE(HasConflicts());
    ExpectNothingShared();
}

class RoadHostTest : public RoadTest {
protected:
    ~RoadHostTest() override {
        for (std::thread& thread : threads) {
            thread.join();
        }
    }
    std::vector<std::thread> threads;
};

TEST_F(RoadHostTest, TheHostMayAnswerLaterFromAnotherThreadAndTwice) {
    BeginWork();
    user->Expect("MessageBox", [](QDialog& ioWindow) { User::Click(ioWindow, "Get Latest Changes"); });
    Publish::Continuation afterLatest;
    ImmutableString latest;
    hostPart = [&](const Publish::Continuation& inContinue, const ImmutableString& inCommitId) {
        afterLatest = inContinue;
        latest = inCommitId;
    };
    EXPECT_TRUE(Share()) << "the chain runs";
    EXPECT_FALSE(tracker->GetOutcome().wasShown);
    ASSERT_TRUE(afterLatest);

    // Each of the further parts is answered by a thread, twice, while the window is open.
    hostPart = [&](const Publish::Continuation& inContinue, const ImmutableString& inCommitId) {
        threads.emplace_back([inContinue, inCommitId] {
            inContinue(kResultSuccess, inCommitId);
            inContinue(kResultFailure, inCommitId);
        });
    };
    ExpectResolve();
    user->Expect("MessageBox", [](QDialog& ioWindow) { User::Click(ioWindow, "OK"); });
    ExpectShareWindow();
    threads.emplace_back([afterLatest, latest] {
        afterLatest(kResultSuccess, latest);
        afterLatest(kResultSuccess, latest);
    });
    EXPECT_TRUE(QTest::qWaitFor([&] { return tracker->GetOutcome().wasShown; }, 60000));
    EXPECT_TRUE(user->IsDone());
    EXPECT_THAT(told, ElementsAre("conflicts", "replaced", "replaced", "kept", "shared"));
    EXPECT_EQ(Newest().first, "First cut, with \"quotes\"");
    EXPECT_EQ(log->Writes().size(), 10u);
}

TEST_F(RoadHostTest, AHostThatRefusesEndsTheRoadWhereItStands) {
    BeginWork();
    user->Expect("MessageBox", [](QDialog& ioWindow) { User::Click(ioWindow, "Get Latest Changes"); });
    hostPart = [](const Publish::Continuation& inContinue, const ImmutableString& inCommitId) {
        inContinue(kResultFailure, inCommitId);
        inContinue(kResultSuccess, inCommitId);
    };
    EXPECT_TRUE(Share());
    EXPECT_THAT(told, ElementsAre("conflicts"));
    EXPECT_TRUE(user->IsDone());

    // The latest is there; now the host cannot reload what was replaced.
    told.clear();
    hostPart = [this](const Publish::Continuation& inContinue, const ImmutableString& inCommitId) {
        inContinue(told.back() == "replaced" ? kResultFailure : kResultSuccess, inCommitId);
    };
    ExpectWholeRoad();
    EXPECT_TRUE(Share());
    EXPECT_THAT(told, ElementsAre("conflicts", "replaced", "replaced", "kept"));
    EXPECT_FALSE(user->IsDone()) << "the Share window came up over what could not be reloaded";
    user->Forget();
    EXPECT_EQ(Newest().first, "His");
}

}  // namespace
}  // namespace ZOCL
