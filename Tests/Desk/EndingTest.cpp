// However the desk ends, nothing of it stays.
#include "DeskTest.h"
#include "ZOClient/Library.h"

namespace Desk {
namespace {

/// Without those that Qt paints with, which come and go as it likes.
std::size_t CountThreads() {
    namespace fs = std::filesystem;
    std::size_t count = 0;
    for (const auto& thread : fs::directory_iterator("/proc/self/task")) {
        std::string name;
        std::getline(std::ifstream(thread.path() / "comm"), name);
        count += name.empty() || name == "Thread (pooled)" ? 0 : 1;
    }
    return count;
}

class EndingTest : public DeskTest {
protected:
    EndingTest() {
        // What the process keeps for good is there after the first run.
        OpenDesk();
        host.reset();
        mThreads = CountThreads();
    }
    void ExpectNothingLeft() {
        host.reset();
        QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
        EXPECT_TRUE(QApplication::topLevelWidgets().isEmpty());
        EXPECT_FALSE(ZOCL::IsLoggedIn());
        WaitFor("the end of the threads", [this] { return CountThreads() <= mThreads; });
    }
    /// With the login that the first run has left.
    void OpenAgain() {
        StartDesk();
        WaitFor("the assets", [this] { return Tree().model()->rowCount() > 0; });
        WaitForStatus("statusWork", "Nothing to share");
    }

private:
    std::size_t mThreads = 0;
};

TEST_F(EndingTest, ClosingWhileALoadIsUnderWayLeavesNoWindowAndNoThread) {
    OpenAgain();
    hub.Signal(SIGSTOP);
    Window().findChild<QAction*>(QStringLiteral("refresh"))->trigger();
    WaitFor("the load", [this] { return Find(Window(), "statusCancel")->isVisible(); });
    Click(Find(Window(), "historyButton"));
    ASSERT_NE(FindTop<QDialog>("historyWindow"), nullptr);
    Window().close();
    ExpectNothingLeft();
    hub.Signal(SIGCONT);
}

TEST_F(EndingTest, ClosingWhileItSignsInOrOpensLeavesNothingEither) {
    hub.Signal(SIGSTOP);
    StartDesk();
    WaitFor("the sign-in", [this] { return FindButton(Window(), "Cancel") != nullptr; });
    ExpectNothingLeft();

    StartDesk();
    WaitFor("the sign-in", [this] { return FindButton(Window(), "Cancel") != nullptr; });
    Click(FindButton(Window(), "Cancel"));
    WaitFor("the sign-in window", [] { return FindTop<QDialog>("signInWindow") != nullptr; });
    ExpectNothingLeft();
    hub.Signal(SIGCONT);
}

TEST_F(EndingTest, ALoadCanBeCancelledAndSignedOutOf) {
    OpenAgain();
    hub.Signal(SIGSTOP);
    Window().findChild<QAction*>(QStringLiteral("refresh"))->trigger();
    WaitFor("the load", [this] { return Find(Window(), "statusCancel")->isVisible(); });
    Click(Find(Window(), "statusCancel"));
    EXPECT_FALSE(Find(Window(), "statusCancel")->isVisible());
    hub.Signal(SIGCONT);
    Window().findChild<QAction*>(QStringLiteral("refresh"))->trigger();
    WaitFor("the load", [this] { return !Find(Window(), "statusCancel")->isVisible(); });
    EXPECT_GT(Tree().model()->rowCount(), 0);

    Window().findChild<QAction*>(QStringLiteral("refresh"))->trigger();
    Window().findChild<QAction*>(QStringLiteral("signOut"))->trigger();
    WaitFor("the sign-in window", [] { return FindTop<QDialog>("signInWindow") != nullptr; });
    EXPECT_FALSE(ZOCL::IsLoggedIn());
    ExpectNothingLeft();
}

TEST_F(EndingTest, AnOutageIsShownAndSigningOutOfItLeadsBackToTheLogin) {
    OpenAgain();
    EXPECT_EQ(Status("statusNetwork"), QString());
    hub.End(SIGKILL);
    InNextWindow([this](QDialog& ioWindow) {
        return Status("statusNetwork") == QStringLiteral("Offline: waiting for the server") &&
               Press(ioWindow, "Sign Out");
    });
    Window().findChild<QAction*>(QStringLiteral("refresh"))->trigger();
    WaitFor("the sign-in window", [] { return FindTop<QDialog>("signInWindow") != nullptr; });
    EXPECT_EQ(Tree().model()->rowCount(), 0);
    EXPECT_FALSE(Window().findChild<QAction*>(QStringLiteral("share"))->isEnabled());
    ExpectNothingLeft();
}

}  // namespace
}  // namespace Desk
