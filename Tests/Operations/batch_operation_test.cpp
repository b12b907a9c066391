// Long operations: results, ends that are posted once, and the wait for other clients' transactions.
#include "Connection/LoggedInServer.h"
#include "Model/TransactionList.h"
#include "ModelTest.h"
#include "Operations/PrepareOperationBase.h"
#include "Operations/WaitForPendingTransactionOperation.h"
#include "ostcore/threads/MainThread.h"
#include "ostcore/threads/Scheduler.h"
#include "Resources/PollingResourceMonitor.h"

namespace ZOCL {
namespace {

class BatchOperationTest : public ModelTest {
protected:
    BatchOperationTest() {
        ostcore::threads::ResetMainThread();
        ostcore::threads::SetMainThread();
    }
    ~BatchOperationTest() override {
        PollingResourceMonitor::CancelAllOutstandingPolls(true);
        ExchangeLoggedInServer(nullptr);
        ostcore::threads::ResetMainThread();
    }

    /// Counts the ends that an operation posts.
    struct Ends {
        explicit Ends(RFL::IBatchOperation& inOperation) : listener(inOperation.GetStationID()) {
            listener.AddHandler<RFL::OperationCompleteMessage>(
                [this](const RFL::OperationCompleteMessage&) { ++count; });
        }
        RFL::Listener listener;
        int count = 0;
    };
    void Settle() {
        EXPECT_TRUE(net->WaitUntilIdle());
        EXPECT_TRUE(ostcore::threads::WaitForExecutors(20000));
        EXPECT_TRUE(net->WaitUntilIdle());
        ostcore::threads::PumpMainThread();
    }
};

class ProbeOperation final : public ZOPrepareOperationBase {
public:
    using ZOPrepareOperationBase::AddPendingRequest;
    using ZOPrepareOperationBase::Finish;
    using ZOPrepareOperationBase::FinishOperation;
    using ZOPrepareOperationBase::RemovePendingRequest;
    void Run() override {
        thread = std::this_thread::get_id();
        if (IsCanceled()) {
            Finish();
            return;
        }
        FinishOperation(kResultSuccess);
    }
    std::thread::id thread;
};

TEST_F(BatchOperationTest, TheResultIsAFailureUntilThereIsOneAndCancelledAfterAnAbort) {
    const InterfaceRef<ProbeOperation> operation(new ProbeOperation);
    const InterfaceRef<ProbeOperation> other(new ProbeOperation);
    EXPECT_NE(operation->GetStationID(), other->GetStationID());
    EXPECT_EQ(operation->GetResult(), kResultFailure);
    Ends ends(*operation);
    ASSERT_TRUE(operation->Start());
    Settle();
    EXPECT_EQ(ends.count, 1);
    EXPECT_EQ(operation->GetResult(), kResultSuccess);
    EXPECT_NE(operation->thread, std::this_thread::get_id());
    operation->Abort();
    operation->Abort();
    EXPECT_EQ(operation->GetResult(), kResultCancelled);
    Ends otherEnds(*other);
    other->Abort();
    ASSERT_TRUE(other->Start());
    Settle();
    EXPECT_EQ(otherEnds.count, 1);
    EXPECT_EQ(other->GetResult(), kResultCancelled);
    const auto unknown = RFL::QueryInterface<RFL::RFLUnknown>(operation);
    EXPECT_TRUE(RFL::QueryInterface<RFL::IThreadedQueueRequest>(unknown));
    EXPECT_TRUE(RFL::QueryInterface<ZOOperationBase>(unknown));
    EXPECT_FALSE(RFL::QueryInterface<IZOCServerResource>(unknown));
}

TEST_F(BatchOperationTest, AnAbortCancelsWhatIsInFlight) {
    ExchangeLoggedInServer(server);
    const InterfaceRef<ProbeOperation> operation(new ProbeOperation);
    Outcome held, finished;
    net->Expect("GET", "", ScriptedAnswer::Hold());
    net->Expect("GET", "", ScriptedAnswer::Hold());
    const Guid first = Guid::CreateUnique(), second = Guid::CreateUnique();
    operation->AddPendingRequest(first);
    operation->AddPendingRequest(second);
    Plain("/1")->Load(first, finished.Function(), false);
    Plain("/2")->Load(second, held.Function(), false);
    EXPECT_EQ(operation->RemovePendingRequest(first), 1u);
    EXPECT_EQ(operation->RemovePendingRequest(Guid::CreateUnique()), 2u);
    operation->Abort();
    EXPECT_EQ(held.Wait(), kResultRequestCancelled);
    EXPECT_EQ(finished.Calls(), 0);
    net->ReleaseHeld(ScriptedAnswer::Status(500));
    EXPECT_EQ(finished.Wait(), kResultHTTPInternalServerError);
}

TEST_F(BatchOperationTest, ALoadEndsWithTheResultOfTheLoad) {
    net->Expect("GET", "", ScriptedAnswer::Status(403));
    const InterfaceRef<ZOLoadServerResourceOperation> operation(
        new ZOLoadServerResourceOperation(Plain("/r"), Guid::CreateUnique()));
    Ends ends(*operation);
    EXPECT_EQ(operation->GetDescription(), u"ZOLoadServerResourceOperation");
    ASSERT_TRUE(operation->Start());
    Settle();
    EXPECT_EQ(ends.count, 1);
    EXPECT_EQ(operation->GetResult(), kResultHTTPForbidden);
    const InterfaceRef<ZOLoadServerResourceOperation> aborted(
        new ZOLoadServerResourceOperation(Plain("/r"), Guid::CreateUnique()));
    aborted->Abort();
    EXPECT_FALSE(aborted->Start());
    net->Expect("GET", "", ScriptedAnswer::FailStart());
    const InterfaceRef<ZOLoadServerResourceOperation> refused(
        new ZOLoadServerResourceOperation(Plain("/r"), Guid::CreateUnique()));
    EXPECT_FALSE(refused->Start());
    EXPECT_EQ(refused->GetResult(), kResultFailure);
    const InterfaceRef<ZOLoadServerResourceOperation> nothing(
        new ZOLoadServerResourceOperation(nullptr, Guid::CreateUnique()));
    EXPECT_FALSE(nothing->Start());
}

// --- The wait for transactions, on the virtual clock.

class WaitForPendingTest : public BatchOperationTest {
protected:
    static std::string Item(const std::string& inID, const std::string& inType) {
        return "{'zo:sessionId':'s','zo:transactionId':'" + inID + "','metadata':{'transactionType':'" +
               inType + "'}}";
    }
    static std::string List(const std::string& inItems) { return "{'transactions':[" + inItems + "]}"; }

    /// A wait on a list that was loaded with these items.
    void MakeWait(const std::string& inItems) {
        list = TransactionList::Make(HubURL("/t"), server, ImmutableString("s"));
        net->Expect("GET", "", JSONAnswer(List(inItems)));
        ASSERT_TRUE(RFL::QueryInterface<IZOCServerResource>(list)->Load(true));
        wait = InterfaceRef<WaitForPendingTransactionOperation>(
            new WaitForPendingTransactionOperation(RFL::StationRegistry::RegisterUniqueStation()));
        ASSERT_TRUE(wait->Init(list, kNoConflictTransactionTypes));
        ends.reset(new Ends(*wait));
        net->ClearRequests();
    }
    void Tick(const ScriptedAnswer& inAnswer) {
        net->Expect("GET", HubURL("/t").str(), inAnswer);
        EXPECT_EQ(clock->Advance(std::chrono::milliseconds(500)), 1u);
        Settle();
        EXPECT_TRUE(ostcore::threads::WaitForExecutors(20000));
        Settle();
    }

    const shared_ptr<ostcore::threads::VirtualScheduler> clock =
        boost::make_shared<ostcore::threads::VirtualScheduler>();
    const ostcore::threads::ScopedGlobalScheduler scope{clock};
    InterfaceRef<TransactionList> list;
    InterfaceRef<WaitForPendingTransactionOperation> wait;
    shared_ptr<Ends> ends;
};

TEST_F(WaitForPendingTest, EndsAtOnceWhenNothingCounts) {
    for (const std::string& items : {std::string(), Item("1", "ingest")}) {
        MakeWait(items);
        ASSERT_TRUE(wait->Start());
        Settle();
        EXPECT_EQ(ends->count, 1);
        EXPECT_EQ(wait->GetResult(), kResultSuccess);
        EXPECT_EQ(clock->PendingCount(), 0u);
        EXPECT_EQ(net->RequestCount(), 0u);
        wait->Abort();
        EXPECT_EQ(wait->GetResult(), kResultSuccess);
        EXPECT_FALSE(wait->Start());
    }
    EXPECT_FALSE(wait->Init(Plain("/no/list"), {}));
}

TEST_F(WaitForPendingTest, EndsWhenTheListIsFoundEmptyAndNotWhenItCannotBeRead) {
    MakeWait(Item("1", "edit") + "," + Item("2", "edit") + "," + Item("3", "ingest"));
    EXPECT_EQ(wait->GetPendingItems().size(), 2u);
    ASSERT_TRUE(wait->Start());
    Tick(ScriptedAnswer::Status(304));
    Tick(JSONAnswer(List(Item("2", "edit")), "\"t2\""));
    Tick(ScriptedAnswer::Status(500));
    Tick(ScriptedAnswer::NoResponse());
    EXPECT_EQ(ends->count, 0);
    Tick(JSONAnswer(List(Item("3", "ingest")), "\"t3\""));
    EXPECT_EQ(ends->count, 1);
    EXPECT_EQ(wait->GetResult(), kResultSuccess);
    EXPECT_EQ(clock->PendingCount(), 0u);
}

TEST_F(WaitForPendingTest, AnAbortEndsItOnceAndAForcedOneSaysNothing) {
    for (const bool isForced : {false, true}) {
        MakeWait(Item("1", "edit"));
        ASSERT_TRUE(wait->Start());
        net->Expect("GET", "", ScriptedAnswer::Hold());
        clock->Advance(std::chrono::milliseconds(500));
        Settle();
        ASSERT_TRUE(net->WaitForRequests(1));
        if (isForced) {
            wait->ForceAbort(kResultDialogAlternativeCancelled);
        }
        wait->Abort();
        wait->Abort();
        // The poll that was in flight finds the list empty, and is too late.
        net->ReleaseHeld(JSONAnswer(List(""), "\"t2\""));
        Settle();
        EXPECT_EQ(ends->count, isForced ? 0 : 1);
        EXPECT_EQ(wait->GetResult(), isForced ? kResultFailure : kResultCancelled);
        EXPECT_EQ(wait->WasForceAborted(), isForced);
        EXPECT_EQ(wait->GetForceAbortResult(), isForced ? kResultDialogAlternativeCancelled : kResultFailure);
        EXPECT_EQ(clock->PendingCount(), 0u);
    }
}

TEST_F(WaitForPendingTest, AWaitThatCannotStartPostsNothing) {
    MakeWait(Item("1", "edit"));
    // Unloaded since, so that the wait loads it.
    bool changed = false;
    net->Expect("GET", "", ScriptedAnswer::Status(500));
    RFL::QueryInterface<IZOCServerResource>(list)->Refresh(changed, false);
    net->Expect("GET", "", ScriptedAnswer::FailStart());
    EXPECT_FALSE(wait->Start());
    Settle();
    EXPECT_EQ(ends->count, 0);
    EXPECT_EQ(wait->GetResult(), kResultFailure);
}

}  // namespace
}  // namespace ZOCL
