// Polling for changes on the virtual clock: what counts as news, and every way in which it ends.
#include <atomic>

#include "ClientTest.h"
#include "ostcore/debug/DebugDatabase.h"
#include "ostcore/threads/Executor.h"
#include "ostcore/threads/Gate.h"
#include "ostcore/threads/MainThread.h"
#include "ostcore/threads/Scheduler.h"
#include "Resources/PollingResourceMonitor.h"
#include "ZOClient/Library.h"

namespace ZOCL {
namespace {

constexpr std::uint32_t kInterval = 500;
constexpr const char* kSwitch = "ZOClient.DisablePollingResourceMonitor";

class PollingTest : public ClientTest {
protected:
    ~PollingTest() override {
        PollingResourceMonitor::CancelAllOutstandingPolls(true);
        ostcore::debug::DebugDatabase::ClearOverrides();
    }

    InterfaceRef<ServerResource> Loaded(const std::string& inTag) {
        const auto resource = Plain("/r");
        net->Expect("GET", "", TagAnswer(inTag));
        EXPECT_TRUE(resource->Load(true));
        net->ClearRequests();
        return resource;
    }
    static ScriptedAnswer TagAnswer(const std::string& inTag) {
        return ScriptedAnswer::Body("x", "text/plain").With("ETag", inTag);
    }
    /// Lets one interval pass and all that follows from it end.
    void Tick() {
        EXPECT_EQ(clock->Advance(std::chrono::milliseconds(kInterval)), 1u);
        Settle();
    }
    void Settle() {
        EXPECT_TRUE(ostcore::threads::WaitForExecutors(20000));
        EXPECT_TRUE(net->WaitUntilIdle());
    }
    ServerResourceChangeNotifier::Function Count() {
        return [this](const InterfaceRef<IZOCServerResource>& inResource) {
            lastTag = inResource->GetETag(true);
            ++calls;
        };
    }

    const shared_ptr<ostcore::threads::VirtualScheduler> clock =
        boost::make_shared<ostcore::threads::VirtualScheduler>();
    const ostcore::threads::ScopedGlobalScheduler scope{clock};
    std::atomic<int> calls{0};
    ImmutableString lastTag;
};

TEST_F(PollingTest, OnlyAMovedTagIsNews) {
    const auto resource = Loaded("1");
    const auto notifier = resource->SubscribeToChanges(Count(), false, kInterval);
    ASSERT_TRUE(notifier);
    EXPECT_EQ(notifier->GetETag().view(), "1");
    EXPECT_EQ(net->RequestCount(), 0u);
    struct Row {
        ScriptedAnswer answer;
        const char* sentTag;
        int callsAfter;
    };
    const Row rows[] = {{ScriptedAnswer::Status(304), "1", 0},
                        {TagAnswer("2"), "1", 1},
                        {TagAnswer("2"), "2", 1},
                        {ScriptedAnswer::Status(304), "2", 1},
                        {TagAnswer("1"), "2", 2}};
    for (const Row& row : rows) {
        net->Expect("GET", HubURL("/r").str(), row.answer);
        Tick();
        EXPECT_EQ(LastRequest().Header("If-None-Match"), row.sentTag);
        EXPECT_EQ(calls, row.callsAfter);
        ASSERT_TRUE(clock->TimeToNext());
        EXPECT_EQ(*clock->TimeToNext(), std::chrono::milliseconds(kInterval));
    }
    EXPECT_EQ(notifier->GetETag().view(), "1");
    EXPECT_EQ(net->RequestCount(), 5u);
}

TEST_F(PollingTest, FailureIsNewsOnlyForThoseWhoAsked) {
    const auto quiet = Loaded("1");
    const auto resource = Loaded("1");
    std::atomic<int> quietCalls{0};
    quiet->SubscribeToChanges([&](const InterfaceRef<IZOCServerResource>&) { ++quietCalls; }, false,
                              kInterval);
    resource->SubscribeToChanges(Count(), true, kInterval);
    struct Row {
        ScriptedAnswer answer;
        int calls, quietCalls;
    };
    // Gone, still gone, back as it was, unreachable, back with something new.
    const Row rows[] = {{ScriptedAnswer::Status(404), 1, 0},
                        {ScriptedAnswer::Status(500), 1, 0},
                        {TagAnswer("1"), 2, 0},
                        {ScriptedAnswer::NoResponse(), 3, 0},
                        {TagAnswer("2"), 4, 1}};
    for (const Row& row : rows) {
        // Two polls of one URL: one request when they meet, else two.
        net->SetHandler([&row](const RecordedRequest&) { return row.answer; });
        EXPECT_EQ(clock->Advance(std::chrono::milliseconds(kInterval)), 2u);
        Settle();
        EXPECT_EQ(calls, row.calls);
        EXPECT_EQ(quietCalls, row.quietCalls);
    }
}

TEST_F(PollingTest, AChangeSinceTheLastLookIsToldAtOnceAndTheChainOutlivesAThrow) {
    const auto resource = Plain("/r");
    const auto notifier = resource->SubscribeToChanges(
        [this](const InterfaceRef<IZOCServerResource>&) {
            ++calls;
            throw std::runtime_error("from a subscriber");
        },
        false, kInterval);
    // Loaded by somebody else; the poll fails to start, which is no end either.
    net->Expect("GET", "", TagAnswer("1"));
    EXPECT_TRUE(resource->Load(true));
    net->Expect("GET", "", ScriptedAnswer::FailStart());
    Tick();
    EXPECT_EQ(calls, 1);
    EXPECT_TRUE(Traced("from a subscriber"));
    net->Expect("GET", "", TagAnswer("2"));
    Tick();
    EXPECT_EQ(calls, 2);
}

TEST_F(PollingTest, StoppedDuringAPollNothingFollows) {
    const auto resource = Loaded("1");
    auto notifier = resource->SubscribeToChanges(Count(), true, kInterval);
    net->Expect("GET", "", ScriptedAnswer::Hold());
    Tick();
    ASSERT_EQ(net->PendingCount(), 1u);
    EXPECT_FALSE(notifier->IsStopped());
    notifier->StopNotifications();
    notifier->StopNotifications();
    EXPECT_TRUE(notifier->IsStopped());
    EXPECT_FALSE(notifier->Notify(resource));
    notifier.reset();
    net->ReleaseHeld(TagAnswer("2"));
    Settle();
    EXPECT_EQ(calls, 0);
    EXPECT_EQ(clock->PendingCount(), 0u);
}

TEST_F(PollingTest, CancellationEndsWaitingAndRunningPollsAndANewSubscriptionStartsAfresh) {
    const auto resource = Loaded("1");
    const auto waiting = Loaded("1");
    resource->SubscribeToChanges(Count(), true, kInterval);
    net->Expect("GET", "", ScriptedAnswer::Hold());
    Tick();
    waiting->SubscribeToChanges(Count(), true, 3600000);
    EXPECT_EQ(clock->PendingCount(), 1u);
    PollingResourceMonitor::CancelAllOutstandingPolls(true);
    EXPECT_EQ(clock->PendingCount(), 0u);
    net->ReleaseHeld(TagAnswer("2"));
    Settle();
    EXPECT_EQ(calls, 0);
    EXPECT_EQ(clock->PendingCount(), 0u);
    resource->SubscribeToChanges(Count(), false, kInterval);
    net->Expect("GET", "", TagAnswer("3"));
    Tick();
    EXPECT_EQ(calls, 1);
}

TEST_F(PollingTest, CancellationWaitsForARunningFunction) {
    ostcore::debug::DebugDatabase::SetOverride(kSwitch, "true");
    const auto resource = Loaded("1");
    ostcore::threads::Gate inside, goOn;
    std::atomic<bool> hasEnded{false};
    resource->SubscribeToChanges(
        [&](const InterfaceRef<IZOCServerResource>&) {
            inside.Open();
            ostcore::threads::Gate::PassThrough(goOn, ostcore::threads::Gate::kWaitForever);
            for (int i = 0; i < 1000; ++i) {
                std::this_thread::yield();
            }
            hasEnded = true;
        },
        false, kInterval);
    resource->SetETag("2");
    EXPECT_EQ(clock->Advance(std::chrono::milliseconds(kInterval)), 1u);
    ASSERT_TRUE(ostcore::threads::Gate::PassThrough(inside, 20000));
    goOn.Open();
    PollingResourceMonitor::CancelAllOutstandingPolls(true);
    EXPECT_TRUE(hasEnded);
    EXPECT_EQ(clock->PendingCount(), 0u);
}

TEST_F(PollingTest, AFunctionMayCancelEverything) {
    ostcore::debug::DebugDatabase::SetOverride(kSwitch, "true");
    const auto resource = Loaded("1");
    resource->SubscribeToChanges(
        [this](const InterfaceRef<IZOCServerResource>&) {
            ++calls;
            PollingResourceMonitor::CancelAllOutstandingPolls(true);
        },
        false, kInterval);
    resource->SetETag("2");
    Tick();
    EXPECT_EQ(calls, 1);
    EXPECT_EQ(clock->PendingCount(), 0u);
}

TEST_F(PollingTest, SwitchedOffItSeesWhatOthersDoAndSendsNothing) {
    ostcore::debug::DebugDatabase::SetOverride(kSwitch, "true");
    const auto resource = Loaded("1");
    resource->SubscribeToChanges(Count(), false, kInterval);
    Tick();
    EXPECT_EQ(calls, 0);
    resource->SetETag("2");
    Tick();
    EXPECT_EQ(calls, 1);
    EXPECT_EQ(net->RequestCount(), 0u);
    ostcore::debug::DebugDatabase::ClearOverrides();
    net->Expect("GET", "", ScriptedAnswer::Status(304));
    Tick();
    EXPECT_EQ(net->RequestCount(), 1u);
}

TEST_F(PollingTest, TheEndOfUseAndTheEndOfTheLibraryEndAllPolls) {
    for (const bool isShutdown : {false, true}) {
        Initialize();
        const auto held = Loaded("1");
        const auto waiting = Loaded("1");
        held->SubscribeToChanges(Count(), true, kInterval);
        net->Expect("GET", "", ScriptedAnswer::Hold());
        Tick();
        waiting->SubscribeToChanges(Count(), true, kInterval);
        if (!isShutdown) {
            IZOCDataServer::Terminate(false);
            EXPECT_EQ(clock->PendingCount(), 0u);
        }
        Shutdown();
        EXPECT_EQ(clock->PendingCount(), 0u);
        net->ReleaseHeld(ScriptedAnswer::Status(500));
        Settle();
        EXPECT_EQ(calls, 0);
        EXPECT_EQ(clock->PendingCount(), 0u);
    }
    ostcore::threads::ResetMainThread();
}

TEST_F(PollingTest, NobodyWatchesNothing) {
    EXPECT_FALSE(PollingResourceMonitor::Get().SubscribeToChanges(nullptr, Count(), kInterval, true));
    ServerResourceChangeNotifier notifier(Loaded("1"), ServerResourceChangeNotifier::Function(), true);
    EXPECT_FALSE(notifier.Notify(notifier.GetResource()));
    EXPECT_FALSE(notifier.Notify(nullptr));
}

}  // namespace
}  // namespace ZOCL
