// A network that is down: the warning and its three ends, the limit of a headless process, and what the main
// thread sees while it is blocked. The reports come from the test, but for the cases of whole outages.
#include <atomic>

#include "Connection/WaitForNetworkRecoveryOperation.h"
#include "ConnectSupport.h"
#include "Frame/ProgressWindow.h"
#include "Frame/Station.h"
#include "ostcore/threads/Executor.h"
#include "ostcore/threads/Scheduler.h"
#include "ostcore/utility/StringConversion.h"
#include "OutageMinder.h"
#include "ResourceFactory.h"
#include "ZOClient/Library.h"
#include "ZOClient/Messages.h"
#include "ZOClientTesting/ScriptedWindows.h"

namespace ZOCL {
namespace {

using ostcore::threads::VirtualScheduler;
using std::chrono::milliseconds;
using std::chrono::seconds;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using ZOClientTesting::ScriptedWindow;
using ZOClientTesting::ScriptedWindows;

const ImmutableString kAssets("http://hub.test:60138/assets/1");
const char kWarning[] = "ZONetworkUnavailableDialog";
const char kPrompt[] = "ZOReconnectDialog";

class NetworkRecovery : public ConnectTest {
protected:
    NetworkRecovery() {
        ostcore::threads::SetMainThread();
        RegisterStation();
        mListener = std::make_unique<RFL::Listener>(GetStationID());
        mListener->AddHandler<ZOTerminateConnectionMessage>(
            [this](const ZOTerminateConnectionMessage& inMessage) {
                terminated += inMessage.forced ? 1 : 0;
            });
        mListener->AddHandler<ZONetworkStateMessage>(
            [this](const ZONetworkStateMessage& inMessage) { states.push_back(inMessage.isDown); });
        hub.AddRoute("GET", "/assets/1",
                     [this](const RecordedRequest&) { return ScriptedAnswer::Status(isDown ? 503 : 200); });
        HLM::SetEndProcessFunction([this] { ++ended; });
        server = SignIn();
        dataServer = RFL::QueryInterface<DataServer>(server);
        server->SetHeadlessFatalErrorReportingFunction(
            [this](const UString& inText) { fatal.push_back(ostcore::utility::ToUTF8(inText)); });
        Pump();
    }
    ~NetworkRecovery() override {
        dataServer->EndUse();
        HLM::SetEndProcessFunction({});
        HLM::SetWaitsForNetwork(false);
        EXPECT_THAT(windows.Mismatches(), IsEmpty());
    }

    void Report(bool inDetected) { dataServer->WarnAboutRecoverableErrors(inDetected); }
    void Pump() {
        net->WaitUntilIdle();
        while (ostcore::threads::PumpMainThread() > 0) {
            net->WaitUntilIdle();
        }
    }
    bool RetriesAreEnabled() const {
        return dataServer->Chain().recoverableError->IsRecoverableError(
            boost::make_shared<ostnet::Response>(503));
    }
    void Ask(int inCount) {
        for (int i = 0; i < inCount; ++i) {
            ASSERT_TRUE(server->GET(Guid::CreateUnique(),
                                    [this](const Guid&, const shared_ptr<ostnet::Response>& inResponse) {
                                        (inResponse && inResponse->status == 200 ? succeeded : failed)++;
                                    },
                                    kAssets, {}));
        }
    }
    /// Moves the time on in steps, with what is due on the workers done after each.
    void MoveTime(milliseconds inSpan, milliseconds inStep = milliseconds(100)) {
        for (milliseconds gone{0}; gone < inSpan; gone += inStep) {
            clock->Advance(inStep);
            net->WaitUntilIdle();
        }
    }
    /// The same with all reports delivered; not below a window, whose wait is a function of an executor.
    void Advance(milliseconds inSpan, milliseconds inStep = milliseconds(100)) {
        for (milliseconds gone{0}; gone < inSpan; gone += inStep) {
            MoveTime(inStep, inStep);
            ostcore::threads::WaitForExecutors(20000);
        }
    }

    const shared_ptr<VirtualScheduler> clock = boost::make_shared<VirtualScheduler>();
    ostcore::threads::ScopedGlobalScheduler scope{clock};
    ScriptedWindows windows;
    std::atomic<bool> isDown{false};
    std::atomic<int> succeeded{0};
    std::atomic<int> failed{0};
    InterfaceRef<IZOCDataServer> server;
    InterfaceRef<DataServer> dataServer;
    std::vector<bool> states;
    std::vector<std::string> fatal;
    int terminated = 0;
    int ended = 0;

private:
    std::unique_ptr<RFL::Listener> mListener;
};

TEST_F(NetworkRecovery, TheWarningClosesByItselfAndComesAgain) {
    for (int outage = 1; outage <= 2; ++outage) {
        windows.Answer(kWarning, [this](ScriptedWindow& ioWindow) {
            EXPECT_EQ(ioWindow.Text("progressStaticText"),
                      "Communication with the Meridane Collaboration Hub was interrupted due to network "
                      "issues. Please wait for the connection to re-establish or press \"Sign Out\" to sign "
                      "out of the current Meridane server.");
            EXPECT_EQ(ioWindow.Text("cancelButton"), "Sign Out");
            Report(true);
            EXPECT_FALSE(ioWindow.IsClosed()) << "another report of the same failure is no news";
            Report(false);
            EXPECT_TRUE(ioWindow.WaitUntil([&] { return ioWindow.IsClosed(); }));
        });
        Report(true);
        Pump();
        EXPECT_EQ(windows.Shown().size(), static_cast<std::size_t>(outage));
    }
    EXPECT_THAT(states, ElementsAre(true, false, true, false));
    EXPECT_EQ(terminated, 0);
    EXPECT_TRUE(RetriesAreEnabled());
}

TEST_F(NetworkRecovery, AFailureThatIsOverBeforeTheMainThreadComesToItShowsNothing) {
    Report(true);
    Report(false);
    Pump();
    EXPECT_THAT(windows.Shown(), IsEmpty());
}

TEST_F(NetworkRecovery, SignOutEndsTheConnectionAndAllRetries) {
    isDown = true;
    Ask(20);
    windows.AnswerWith(kWarning, "cancelButton");
    Advance(milliseconds(1200));
    Pump();
    ASSERT_EQ(windows.Shown().size(), 1u);
    EXPECT_EQ(terminated, 1);
    EXPECT_FALSE(RetriesAreEnabled());
    // Those that wait for their delay end at their next failure.
    Advance(seconds(40), milliseconds(1000));
    EXPECT_EQ(failed, 20);
    Pump();
    EXPECT_EQ(windows.Shown().size(), 1u);
}

TEST_F(NetworkRecovery, AnOutageOfTheHubIsRiddenOut) {
    isDown = true;
    windows.Answer(kWarning, [this](ScriptedWindow& ioWindow) {
        MoveTime(seconds(3));
        EXPECT_FALSE(ioWindow.IsClosed());
        EXPECT_EQ(succeeded + failed, 0);
        isDown = false;
        MoveTime(seconds(6));
        EXPECT_TRUE(ioWindow.WaitUntil([&] { return ioWindow.IsClosed(); }));
    });
    Ask(20);
    Advance(milliseconds(600));
    Pump();
    EXPECT_EQ(windows.Shown().size(), 1u);
    EXPECT_EQ(succeeded, 20);
    EXPECT_EQ(terminated, 0);
}

TEST_F(NetworkRecovery, TwoFailuresInARowShowNothing) {
    std::atomic<int> left{2};
    hub.AddRoute("GET", "/assets/1", [&left](const RecordedRequest&) {
        return left-- > 0 ? ScriptedAnswer::NoResponse() : ScriptedAnswer::Status(200);
    });
    Ask(1);
    Advance(seconds(2));
    Pump();
    EXPECT_EQ(succeeded, 1);
    EXPECT_THAT(windows.Shown(), IsEmpty());
    EXPECT_THAT(states, IsEmpty());
}

TEST_F(NetworkRecovery, AProgressWindowStandsInForTheWarningAsLongAsItIsOpen) {
    GetCompositionRoot().outages = GetOutageMinder();
    for (const bool isSignOut : {false, true}) {
        const InterfaceRef<WaitForNetworkRecoveryOperation> work(new WaitForNetworkRecoveryOperation);
        windows.Answer(kProgressWindowID, [&](ScriptedWindow& ioWindow) {
            const std::size_t shown = windows.Shown().size();
            Report(true);
            ioWindow.WaitUntil([&] { return ioWindow.Text(kProgressCancelButton) == "Sign Out"; });
            ioWindow.WaitUntil([] { return ostcore::threads::MainThreadQueueSize() == 0; });
            EXPECT_EQ(windows.Shown().size(), shown) << "the user was told twice";
            isSignOut ? ioWindow.Press(kProgressCancelButton) : work->NetworkIsBack();
        });
        if (!isSignOut) {
            windows.Answer(kWarning, [this](ScriptedWindow& ioWindow) {
                Report(false);
                ioWindow.WaitUntil([&] { return ioWindow.IsClosed(); });
            });
        }
        RunProgressWindow(work, {});
        Pump();
        EXPECT_EQ(work->GetResult(), isSignOut ? kResultCancelled : kResultSuccess);
        EXPECT_EQ(terminated, isSignOut ? 1 : 0);
        EXPECT_NE(RetriesAreEnabled(), isSignOut);
    }
    GetCompositionRoot().outages = nullptr;
}

TEST_F(NetworkRecovery, ALogoutClosesTheWarning) {
    windows.Answer(kWarning, [this](ScriptedWindow& ioWindow) {
        IZOCDataServer::Terminate(false);
        EXPECT_TRUE(ioWindow.WaitUntil([&] { return ioWindow.IsClosed(); }));
        Report(true);
    });
    Report(true);
    Pump();
    EXPECT_EQ(windows.Shown().size(), 1u) << "nobody is told of a network that nobody uses";
    EXPECT_EQ(terminated, 0) << "the host ended it itself";
}

TEST_F(NetworkRecovery, AQuestionForThePasswordWaitsForTheNetwork) {
    windows.Answer(kWarning, [this](ScriptedWindow& ioWindow) {
        dataServer->ScheduleWarnings();
        ioWindow.WaitUntil([] { return ostcore::threads::MainThreadQueueSize() == 0; });
        EXPECT_EQ(windows.Shown().size(), 1u);
        Report(false);
        ioWindow.WaitUntil([&] { return ioWindow.IsClosed(); });
    });
    windows.AnswerWith(kPrompt, "cancelButton");
    Report(true);
    Pump();
    EXPECT_EQ(windows.Shown().size(), 2u);
    EXPECT_EQ(terminated, 1);
}

TEST_F(NetworkRecovery, WithoutWindowsTheMainThreadGoesOn) {
    const auto former = ostui::SetBackEnd(nullptr);
    Report(true);
    Pump();
    ostui::SetBackEnd(former);
    EXPECT_THAT(states, ElementsAre(true));
    EXPECT_TRUE(RetriesAreEnabled());
}

TEST_F(NetworkRecovery, ABlockedMainThreadShowsTheWarning) {
    hub.AddRoute("GET", "/assets/1", [](const RecordedRequest&) { return ScriptedAnswer::Hold(); });
    windows.Answer(kWarning, [this](ScriptedWindow& ioWindow) {
        Report(false);
        ioWindow.WaitUntil([&] { return ioWindow.IsClosed(); });
        net->ReleaseHeld(ScriptedAnswer::Status(200));
    });
    Report(true);
    const auto response = server->BlockingGET(kAssets, {}, 1);
    ASSERT_TRUE(response);
    EXPECT_EQ(response->status, 200);
}

TEST_F(NetworkRecovery, AHeadlessProcessEndsAfterFifteenSeconds) {
    HLM::SetIsHeadless(true);
    Report(true);
    Pump();
    EXPECT_THAT(Traces(), HasSubstr("Detected recoverable errors. Network may be unavailable"));
    clock->SetUTC(clock->UTCNow() + boost::posix_time::hours(24));
    clock->Advance(seconds(14));
    Report(true);
    Pump();
    EXPECT_EQ(ended, 0) << "the wall clock counts";
    // A success begins the count anew.
    Report(false);
    Report(true);
    clock->Advance(seconds(14));
    Report(true);
    Pump();
    EXPECT_EQ(ended, 0);
    EXPECT_TRUE(RetriesAreEnabled());
    clock->Advance(seconds(2));
    Report(true);
    Report(true);
    Pump();
    EXPECT_EQ(ended, 1);
    EXPECT_FALSE(RetriesAreEnabled());
    EXPECT_THAT(fatal, ElementsAre("Failed to receive a valid network response for more than 15 seconds."));
    EXPECT_THAT(Traces(), HasSubstr("Exiting process: Failed to receive a valid network response for more "
                                    "than 15 seconds."));
    EXPECT_THAT(windows.Shown(), IsEmpty());
}

TEST_F(NetworkRecovery, AHeadlessProcessThatSomebodyWatchesWaits) {
    HLM::SetIsHeadless(true);
    HLM::SetWaitsForNetwork(true);
    server->SetHeadlessFatalErrorReportingFunction({});
    Report(true);
    clock->Advance(std::chrono::hours(3));
    Report(true);
    Pump();
    EXPECT_EQ(ended, 0);
    EXPECT_TRUE(RetriesAreEnabled());
    HLM::SetWaitsForNetwork(false);
    Report(true);
    Pump();
    EXPECT_EQ(ended, 1) << "without a function that is told";
}

TEST_F(NetworkRecovery, OfALoneRequestTheHeadlessLimitIsKeptToo) {
    HLM::SetIsHeadless(true);
    isDown = true;
    Ask(1);
    Advance(seconds(14));
    Pump();
    EXPECT_EQ(ended, 0);
    Advance(seconds(4));
    Pump();
    EXPECT_EQ(ended, 1);
    Advance(seconds(33));
    EXPECT_EQ(failed, 1) << "with retries off it ends at its next failure";
}

TEST_F(NetworkRecovery, AChangeCarriesOneKeyThroughAllItsSendings) {
    isDown = true;
    for (const char* verb : {"POST", "PUT", "DELETE"}) {
        hub.AddRoute(verb, "/assets/1", [this](const RecordedRequest&) {
            return isDown ? ScriptedAnswer::NoResponse() : ScriptedAnswer::Status(204);
        });
    }
    std::vector<Guid> ids;
    const auto done = [this](const Guid&, const shared_ptr<ostnet::Response>& inResponse) {
        (inResponse && inResponse->status == 204 ? succeeded : failed)++;
    };
    const auto id = [&ids] { return ids.emplace_back(Guid::CreateUnique()); };
    const ostnet::http::Form form{{ImmutableString("a"), "b"}};
    const auto body = RecycledMemory::CreateFromBytes("{}");
    ASSERT_TRUE(server->POST(id(), done, kAssets, {}, body));
    ASSERT_TRUE(server->POST(id(), done, kAssets, {}, form));
    ASSERT_TRUE(server->PUT(id(), done, kAssets, {}, body));
    ASSERT_TRUE(server->PUT(id(), done, kAssets, {}, form));
    ASSERT_TRUE(server->DELETE(id(), done, kAssets, {}));
    ASSERT_TRUE(server->PUT(id(), done, kAssets,
                            {{ImmutableString("idempotency-key"), ImmutableString("own")}}, body));
    Advance(milliseconds(40), milliseconds(4));
    // The token is refused on top of it: the password is asked for, and all is sent with the new token.
    hub.ExpireTokens();
    isDown = false;
    windows.Answer(kPrompt, [](ScriptedWindow& ioWindow) {
        ioWindow.Enter("passwordTextEdit", kCanaryPassword);
        ioWindow.Press("okButton");
    });
    Advance(milliseconds(1000));
    Pump();
    Advance(milliseconds(1000));
    EXPECT_EQ(succeeded, 6);
    std::map<std::string, int> sendings;
    for (const RecordedRequest& request : net->Requests()) {
        if (request.url == kAssets.str()) {
            ASSERT_EQ(request.CountHeader("Idempotency-Key"), 1u) << request.Line();
            ++sendings[request.Header("Idempotency-Key")];
        } else {
            EXPECT_EQ(request.CountHeader("Idempotency-Key"), 0u) << request.Line();
        }
    }
    ASSERT_EQ(sendings.size(), 6u);
    for (std::size_t i = 0; i < 6; ++i) {
        const std::string key = i < 5 ? ids[i].ToString() : "own";
        EXPECT_GE(sendings[key], 3) << key;
    }
}

}  // namespace
}  // namespace ZOCL
