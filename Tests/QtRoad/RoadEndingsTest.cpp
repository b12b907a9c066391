// The end of the session, and the death of the hub, at each window and at each write of a Share.
#include "RoadFixture.h"

#include <gmock/gmock.h>

#include <atomic>

#include <QtTest/QtTest>

#include "Connection/LoggedInServer.h"
#include "Frame/Station.h"
#include "ostcore/threads/Executor.h"
#include "ostcore/threads/Gate.h"
#include "ThreadsLeft.h"
#include "ZOClient/Dialogs.h"
#include "ZOClient/Messages.h"

namespace ZOCL {
namespace {

using ostcore::threads::Gate;

const testing::Environment* const kThreadsLeft = testing::AddGlobalTestEnvironment(new ThreadsLeft);

constexpr std::uint32_t kLongestWait = 20000;
/// Of the windows that wait for their user, and of the writes.
constexpr int kWindows = 4;
constexpr int kWrites = 10;

class RoadEndingsTest : public RoadTest, public testing::WithParamInterface<int> {
protected:
    RoadEndingsTest() : mHost(CurrentStation()) {
        // A host that is told of the end clears the screen and gives up the server.
        mHost.AddHandler<ZOTerminateConnectionMessage>([this](const ZOTerminateConnectionMessage&) {
            ++ends;
            shownAtEnd = user->Shown().size();
            CloseModalDialogs([this] { IZOCDataServer::Terminate(!isDead); });
        });
    }
    static void SignOut() {
        ZOTerminateConnectionMessage message;
        message.forced = true;
        PostLibraryMessage(message);
    }
    void Kill() {
        isDead = true;
        hub.End(SIGKILL);
    }
    /// In the window of that number, of those that wait for their user.
    void EndAtWindow(std::function<void()> inEnd) {
        user->first = [inEnd, count = 0](ostui::Dialog& ioDialog) mutable {
            if (ioDialog.ClosesByItself()) {
                return false;
            }
            if (count++ != GetParam()) {
                return false;
            }
            inEnd();
            EXPECT_TRUE(QTest::qWaitFor([&] { return ioDialog.IsClosed(); }, kLongestWait));
            return true;
        };
    }
    /// Before the write of that number goes to the network.
    void EndAtWrite(std::function<void()> inEnd, bool inOnMain) {
        const auto writes = std::make_shared<std::atomic<int>>(0);
        log->SetOnRequest([this, inEnd, inOnMain, writes] {
            if (log->All().back().verb == "GET" || (*writes)++ != GetParam()) {
                return;
            }
            if (!inOnMain) {
                return inEnd();
            }
            const auto hasEnded = make_shared<Gate>();
            ostcore::threads::AsyncCallFromMainThread([inEnd, hasEnded] {
                inEnd();
                hasEnded->Open();
            });
            EXPECT_TRUE(Gate::PassThrough(hasEnded, kLongestWait));
        });
    }
    void ExpectEnd() {
        EXPECT_TRUE(QTest::qWaitFor([&] { return !IsLoggedIn(); }, kLongestWait));
        Settle();
        user->Forget();
        log->SetOnRequest({});
        EXPECT_GE(ends, 1);
        EXPECT_EQ(user->Shown().size(), shownAtEnd) << user->Shown().back() << " was shown to nobody";
        EXPECT_TRUE(ostui::GetRunningDialogs().empty());
    }
    /// As another host of Anna's finds it.
    void ExpectNothingOpen() {
        const Member again(hub.URL().str(), "anna");
        EXPECT_EQ(CountOpen(again.OpenSession()), 0u);
    }

    int ends = 0;
    std::size_t shownAtEnd = 0;
    std::atomic<bool> isDead{false};

private:
    RFL::Listener mHost;
};

class RoadWindowEndingsTest : public RoadEndingsTest {};
class RoadWriteEndingsTest : public RoadEndingsTest {};
class RoadHungHubTest : public RoadEndingsTest {};

TEST_P(RoadWindowEndingsTest, TheSessionEndsInAWindow) {
    BeginWork();
    ExpectWholeRoad();
    EndAtWindow([] { SignOut(); });
    Share();
    ExpectEnd();
    EXPECT_EQ(Newest().first, "His");
    ExpectNothingOpen();
}

TEST_P(RoadWriteEndingsTest, TheSessionEndsAtAWrite) {
    BeginWork();
    ExpectWholeRoad();
    EndAtWrite([] { SignOut(); }, true);
    Share();
    ExpectEnd();
    // A share that is on its way is not called back.
    EXPECT_EQ(Newest().first, GetParam() == kWrites - 1 ? "First cut, with \"quotes\"" : "His");
    ExpectNothingOpen();
}

TEST_P(RoadWriteEndingsTest, TheHubDiesAtAWriteAndTheUserSignsOut) {
    BeginWork();
    ExpectWholeRoad();
    EndAtWrite([this] { Kill(); }, false);
    user->first = [](ostui::Dialog& ioDialog) {
        auto* const window = qobject_cast<QDialog*>(QApplication::activeModalWidget());
        if (!ioDialog.ClosesByItself() || !window) {
            return false;
        }
        const auto offersSignOut = [&] { return ioDialog.GetText("cancelButton") == "Sign Out"; };
        EXPECT_TRUE(QTest::qWaitFor([&] { return ioDialog.IsClosed() || offersSignOut(); }, kLongestWait));
        if (!ioDialog.IsClosed()) {
            User::Click(*window, "Sign Out");
        }
        return true;
    };
    Share();
    ExpectEnd();
    EXPECT_FALSE(tracker->GetOutcome().wasShared);
    hub.Start();
    EXPECT_EQ(Newest().first, "His");
}

TEST_P(RoadHungHubTest, TheHubHangsAtAWriteAndTheLibraryEnds) {
    BeginWork();
    ExpectWholeRoad();
    EndAtWrite(
        [this] {
            hub.Signal(SIGSTOP);
            SignOut();
        },
        true);
    Share();
    EXPECT_GE(ends, 1);
    EXPECT_EQ(user->Shown().size(), shownAtEnd);
    EXPECT_TRUE(ostui::GetRunningDialogs().empty());
    user->Forget();
    log->SetOnRequest({});
    // The request is still out; the end of the library does not wait for the hub.
    annas.Reset();
    anna.reset();
    ben.reset();
    IZOCDataServer::Terminate(false);
    Shutdown();
    EXPECT_TRUE(ostcore::threads::WaitForExecutors(kLongestWait)) << "something waits for the hub";
    hub.Signal(SIGCONT);
    Initialize();
}

/// The writes of the operations that are torn down; a merge of metadata waits for its rollback.
INSTANTIATE_TEST_SUITE_P(Each, RoadHungHubTest, testing::Values(1, 6, 9));
INSTANTIATE_TEST_SUITE_P(Each, RoadWindowEndingsTest, testing::Range(0, kWindows));
INSTANTIATE_TEST_SUITE_P(Each, RoadWriteEndingsTest, testing::Range(0, kWrites));

}  // namespace
}  // namespace ZOCL
