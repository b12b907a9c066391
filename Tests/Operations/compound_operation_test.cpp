// Compound operations: one end, the first failure, order, cancel, sub-operations. The network's worker is the
// test itself, so that every turn is seen.
#include "ostcore/threads/Executor.h"
#include "Steps.h"
#include "ZOClient/IZOCAsset.h"

namespace ZOCL {
namespace {

constexpr int kFirst = kResultHTTPForbidden;
constexpr int kSecond = kResultHTTPConflict;

class CompoundTest : public ClientTest {
protected:
    CompoundTest() : ClientTest(0) {}
    ~CompoundTest() override { net->DeliverAll(); }

    shared_ptr<CompoundAsyncOperation> Make(bool inSerial = false) {
        return CompoundAsyncOperation::Create(finish.Function(), server, inSerial);
    }
    static void Start(const shared_ptr<CompoundAsyncOperation>& inOperation, Step& ioStep) {
        inOperation->Initiate(ioStep.Work(), ioStep.Intermediate(), ioStep.CountCancels());
    }
    /// Runs what was posted, and tells what the final function got.
    std::vector<int> Finals() {
        net->DeliverAll();
        return finish.Results();
    }

    Finish finish;
    Step a, b, c, d;
};

TEST_F(CompoundTest, EndsOnceInATurnOfItsOwn) {
    const auto operation = Make();
    Start(operation, a);
    Start(operation, b);
    b.End(kResultSuccess);
    EXPECT_TRUE(Finals().empty());
    a.End(kResultSuccess);
    EXPECT_TRUE(finish.Results().empty());
    EXPECT_THAT(Finals(), testing::ElementsAre(kResultSuccess));
    operation->TryToCancel();
    EXPECT_EQ(Finals().size(), 1u);
}

TEST_F(CompoundTest, WithoutRequestsThereIsNoEnd) {
    auto operation = Make();
    operation->TryToCancel();
    EXPECT_TRUE(Finals().empty());
    Start(operation, a);
    EXPECT_EQ(a.Starts(), 0);
    EXPECT_THAT(Finals(), testing::ElementsAre(kResultCancelled));
}

TEST_F(CompoundTest, FirstFailureStaysAndCancelsTheSisters) {
    const auto operation = Make();
    for (Step* step : {&a, &b, &c}) {
        Start(operation, *step);
    }
    b.End(kFirst);
    EXPECT_EQ(a.Cancels(), 1);
    EXPECT_EQ(c.Cancels(), 1);
    EXPECT_TRUE(Finals().empty());
    a.End(kSecond);
    EXPECT_EQ(c.Cancels(), 1);
    c.End(kResultSuccess);
    EXPECT_THAT(Finals(), testing::ElementsAre(kFirst));
    EXPECT_THAT(a.Seen(), testing::ElementsAre(kSecond));
    EXPECT_THAT(c.Seen(), testing::ElementsAre(kResultSuccess));
    EXPECT_EQ(operation->GetResult(), kFirst);
}

TEST_F(CompoundTest, RequestsOfTheServerAreCancelledThere) {
    const auto operation = Make();
    net->SetHandler([](const RecordedRequest&) { return ScriptedAnswer::Hold(); });
    std::vector<int> seen;
    const auto resource = Plain("/slow");
    operation->Initiate(
        [resource](const Guid& inID, const RequestCompletion& inDone) {
            return resource->Load(inID, inDone, true);
        },
        [&seen](int inResult) {
            seen.push_back(inResult);
            return inResult;
        });
    operation->TryToCancel();
    EXPECT_THAT(Finals(), testing::ElementsAre(kResultCancelled));
    EXPECT_THAT(seen, testing::ElementsAre(kResultRequestCancelled));
    EXPECT_TRUE(Traced("<ZO.CompoundAsyncOperation> <6> TryToCancel(): mRequestID == " +
                       operation->GetRequestID().ToString()));
    EXPECT_TRUE(Traced(", asking dataserver to cancel request "));
}

TEST_F(CompoundTest, StepAfterAFailureNeverStartsButPassesThrough) {
    const auto operation = Make();
    Start(operation, a);
    operation->SetResult(kFirst);
    Start(operation, b);
    EXPECT_EQ(b.Starts(), 0);
    EXPECT_THAT(b.Seen(), testing::ElementsAre(kFirst));
    EXPECT_TRUE(Finals().empty());
    a.End(kResultSuccess);
    EXPECT_THAT(Finals(), testing::ElementsAre(kFirst));
}

TEST_F(CompoundTest, WorkThatDoesNotStartFailsTheOperation) {
    const auto operation = Make();
    operation->Initiate([](const Guid&, const RequestCompletion&) { return false; }, a.Intermediate());
    EXPECT_THAT(a.Seen(), testing::ElementsAre(kResultNotStarted));
    EXPECT_THAT(Finals(), testing::ElementsAre(kResultNotStarted));
}

TEST_F(CompoundTest, NotModifiedIsForgivenOnRequest) {
    const auto operation = Make();
    operation->Initiate(a.Work(), a.Intermediate(), CompoundAsyncOperation::TryToCancelFunction(), true);
    a.End(kResultHTTPNotModified);
    EXPECT_THAT(a.Seen(), testing::ElementsAre(kResultSuccess));
    EXPECT_THAT(Finals(), testing::ElementsAre(kResultSuccess));
    Finish strictFinish;
    const auto strict = CompoundAsyncOperation::Create(strictFinish.Function(), server, false);
    strict->Initiate(b.Work(), b.Intermediate());
    b.End(kResultHTTPNotModified);
    net->DeliverAll();
    EXPECT_THAT(strictFinish.Results(), testing::ElementsAre(kResultHTTPNotModified));
}

TEST_F(CompoundTest, IntermediateDecidesTheResultAndMayGoOn) {
    const auto operation = Make();
    operation->Initiate(a.Work(), [&](int inResult) {
        EXPECT_EQ(inResult, kFirst);
        Start(operation, b);
        return kResultSuccess;
    });
    a.End(kFirst);
    EXPECT_EQ(b.Starts(), 1);
    EXPECT_TRUE(Finals().empty());
    b.End(kResultSuccess);
    EXPECT_THAT(Finals(), testing::ElementsAre(kResultSuccess));
}

TEST_F(CompoundTest, IntermediatesGetTheInterfaceThatTheyName) {
    const auto operation = Make();
    const InterfaceRef<IZOCAsset> asset =
        IZOCWritableAsset::Create(HubURL("/a"), server, ResourceWritability::kReadOnly);
    const auto complete = [&](const InterfaceRef<IZOCServerResource>& inResource) {
        return [inResource](const Guid& inID, const RequestCompletion& inDone) {
            inDone(inID, kResultSuccess, inResource, make_shared<ostnet::Response>(200));
            return true;
        };
    };
    int calls = 0;
    // Keeps the operation from ending between the steps.
    Start(operation, d);
    operation->Initiate(
        complete(RFL::QueryInterface<IZOCServerResource>(asset)),
        [&](int, const InterfaceRef<IZOCAsset>& inAsset, const shared_ptr<ostnet::Response>& inAnswer) {
            EXPECT_EQ(inAsset, asset);
            EXPECT_EQ(inAnswer->status, 200);
            return ++calls;
        });
    operation->Initiate(complete(Plain("/x")), [&](int, const InterfaceRef<IZOCAsset>& inAsset,
                                                   const shared_ptr<ostnet::Response>&) {
        EXPECT_FALSE(inAsset);
        return ++calls;
    });
    operation->Initiate(complete(nullptr), [&](int, const shared_ptr<ostnet::Response>& inAnswer) {
        EXPECT_EQ(inAnswer->status, 200);
        return ++calls;
    });
    const function<int(int, const InterfaceRef<IZOCAsset>&, const shared_ptr<ostnet::Response>&)> empty;
    operation->Initiate(complete(nullptr), empty);
    operation->Initiate(complete(nullptr), nullptr);
    EXPECT_EQ(calls, 3);
    d.End(kResultSuccess);
    EXPECT_THAT(Finals(), testing::ElementsAre(kResultSuccess));
}

TEST_F(CompoundTest, NoLockIsHeldInFunctionsOfTheUser) {
    const auto operation = Make();
    const auto lockIsFree = [] {
        bool free = false;
        std::thread([&] {
            free = IZOCDataServer::GetLock().TryLock("CompoundTest");
            if (free) {
                IZOCDataServer::GetLock().Unlock();
            }
        }).join();
        return free;
    };
    shared_ptr<CompoundAsyncOperation> sub;
    int checks = 0;
    operation->CreateSubOperation(
        sub,
        [&](int inResult) {
            EXPECT_TRUE(lockIsFree());
            ++checks;
            return inResult;
        },
        false);
    sub->Initiate(
        [&](const Guid& inID, const RequestCompletion& inDone) {
            EXPECT_TRUE(lockIsFree());
            ++checks;
            return a.Work()(inID, inDone);
        },
        [&](int inResult) {
            EXPECT_TRUE(lockIsFree());
            ++checks;
            return inResult;
        },
        [&](const Guid&) {
            EXPECT_TRUE(lockIsFree());
            ++checks;
        });
    operation->TryToCancel();
    a.End(kResultSuccess);
    EXPECT_THAT(Finals(), testing::ElementsAre(kResultCancelled));
    EXPECT_EQ(checks, 4);
}

TEST_F(CompoundTest, SerialRequestsRunInOrderAndTheNextStartsFirst) {
    const auto operation = Make(true);
    std::vector<std::string> order;
    const auto note = [&](Step& ioStep, const std::string& inName) {
        operation->Initiate(
            [&, inName](const Guid& inID, const RequestCompletion& inDone) {
                order.push_back("start " + inName);
                return ioStep.Work()(inID, inDone);
            },
            [&, inName](int inResult) {
                order.push_back("end " + inName);
                return inResult;
            });
    };
    note(a, "a");
    note(b, "b");
    note(c, "c");
    EXPECT_THAT(order, testing::ElementsAre("start a"));
    a.End(kResultSuccess);
    b.End(kResultSuccess);
    c.End(kResultSuccess);
    EXPECT_THAT(order, testing::ElementsAre("start a", "start b", "end a", "start c", "end b", "end c"));
    EXPECT_THAT(Finals(), testing::ElementsAre(kResultSuccess));
}

TEST_F(CompoundTest, FailureDropsWhatWaitsInQueueOrder) {
    const auto operation = Make(true);
    std::vector<std::string> order;
    Start(operation, a);
    for (const char* name : {"b", "c"}) {
        operation->Initiate(d.Work(), [&order, name](int inResult) {
            order.push_back(name + std::to_string(inResult));
            return inResult;
        });
    }
    operation->SetResult(kFirst);
    EXPECT_EQ(d.Starts(), 0);
    EXPECT_THAT(order, testing::ElementsAre("b" + std::to_string(kFirst), "c" + std::to_string(kFirst)));
    EXPECT_TRUE(Finals().empty());
    a.End(kResultSuccess);
    EXPECT_THAT(Finals(), testing::ElementsAre(kFirst));
}

TEST_F(CompoundTest, QueuedWorkThatDoesNotStartFails) {
    const auto operation = Make(true);
    Start(operation, a);
    operation->Initiate([](const Guid&, const RequestCompletion&) { return false; }, b.Intermediate());
    Start(operation, c);
    a.End(kResultSuccess);
    EXPECT_THAT(b.Seen(), testing::ElementsAre(kResultNotStarted));
    // The third took its turn when the second ended, and was cancelled by that end.
    EXPECT_EQ(c.Starts(), 1);
    EXPECT_EQ(c.Cancels(), 1);
    c.End(kResultCancelled);
    EXPECT_THAT(Finals(), testing::ElementsAre(kResultNotStarted));
}

TEST_F(CompoundTest, AsynchronousWorkRunsOnceOrIsCancelledOnce) {
    ostcore::threads::ManualExecutor manual;
    const shared_ptr<ostcore::threads::Executor> executor(&manual, [](ostcore::threads::Executor*) {});
    int runs = 0;
    const auto work = [&runs] {
        ++runs;
        return kSecond;
    };
    const auto operation = Make();
    Start(operation, a);
    ASSERT_TRUE(operation->CallAsynchronously(executor, work, true));
    operation->TryToCancel();
    EXPECT_EQ(manual.RunAll(), 1u);
    EXPECT_EQ(runs, 0);
    EXPECT_FALSE(operation->CallAsynchronously(executor, work, true));
    a.End(kResultSuccess);
    EXPECT_THAT(Finals(), testing::ElementsAre(kResultCancelled));

    Finish second;
    const auto stubborn = CompoundAsyncOperation::Create(second.Function(), server, false);
    ASSERT_TRUE(stubborn->CallAsynchronously(executor, work, false));
    stubborn->TryToCancel();
    net->DeliverAll();
    EXPECT_TRUE(second.Results().empty());
    EXPECT_EQ(manual.RunAll(), 1u);
    net->DeliverAll();
    EXPECT_EQ(runs, 1);
    EXPECT_THAT(second.Results(), testing::ElementsAre(kResultCancelled));

    Finish third;
    const auto refused = CompoundAsyncOperation::Create(third.Function(), server, false);
    manual.Stop();
    EXPECT_FALSE(refused->CallAsynchronously(executor, work, true));
    net->DeliverAll();
    EXPECT_THAT(third.Results(), testing::ElementsAre(kResultNotStarted));
    EXPECT_EQ(runs, 1);
}

TEST_F(CompoundTest, ResultOfASubOperationPassesUnlessReplaced) {
    const auto operation = Make();
    shared_ptr<CompoundAsyncOperation> failing;
    shared_ptr<CompoundAsyncOperation> forgiven;
    operation->CreateSubOperation(
        forgiven, [](int) { return kResultSuccess; }, false);
    Start(forgiven, a);
    a.End(kSecond);
    net->DeliverAll();
    EXPECT_EQ(operation->GetResult(), kResultSuccess);
    // The parent ended with its only request: a second one belongs into an operation of its own.
    EXPECT_THAT(finish.Results(), testing::ElementsAre(kResultSuccess));

    Finish second;
    const auto parent = CompoundAsyncOperation::Create(second.Function(), server, false);
    parent->CreateSubOperation(failing, nullptr, false);
    Start(parent, c);
    Start(failing, b);
    b.End(kFirst);
    net->DeliverAll();
    EXPECT_EQ(c.Cancels(), 1);
    c.End(kResultSuccess);
    net->DeliverAll();
    EXPECT_THAT(second.Results(), testing::ElementsAre(kFirst));
}

TEST_F(CompoundTest, CancelReachesTheChildrenOneLevelAtATime) {
    const auto operation = Make();
    shared_ptr<CompoundAsyncOperation> child;
    shared_ptr<CompoundAsyncOperation> grandchild;
    operation->CreateSubOperation(child, nullptr, false);
    child->CreateSubOperation(grandchild, nullptr, true);
    Start(grandchild, a);
    Start(grandchild, b);
    operation->TryToCancel();
    EXPECT_EQ(grandchild->GetResult(), kResultCancelled);
    EXPECT_EQ(a.Cancels(), 1);
    EXPECT_EQ(b.Starts(), 0);
    EXPECT_TRUE(Finals().empty());
    a.End(kResultRequestCancelled);
    EXPECT_THAT(Finals(), testing::ElementsAre(kResultCancelled));
    shared_ptr<CompoundAsyncOperation> tooLate = operation;
    operation->CreateSubOperation(tooLate, nullptr, false);
    EXPECT_FALSE(tooLate);
}

TEST_F(CompoundTest, SubOperationMayEndBeforeItsTurnInASerialParent) {
    const auto operation = Make(true);
    Start(operation, a);
    shared_ptr<CompoundAsyncOperation> sub;
    operation->CreateSubOperation(sub, nullptr, false);
    Start(sub, b);
    b.End(kFirst);
    net->DeliverAll();
    a.End(kResultSuccess);
    EXPECT_THAT(Finals(), testing::ElementsAre(kFirst));
}

TEST_F(CompoundTest, CancelFunctionCanBeReplacedWhileTheRequestRuns) {
    const auto operation = Make();
    Start(operation, a);
    operation->SetTryToCancelFunction(a.ID(), b.CountCancels());
    operation->SetTryToCancelFunction(Guid::CreateUnique(), c.CountCancels());
    operation->TryToCancel();
    EXPECT_EQ(a.Cancels(), 0);
    EXPECT_EQ(b.Cancels(), 1);
    EXPECT_EQ(c.Cancels(), 0);
    a.End(kResultSuccess);
    EXPECT_THAT(Finals(), testing::ElementsAre(kResultCancelled));
}

TEST_F(CompoundTest, UnknownRequestAssertsAndDoesNoHarm) {
    const auto operation = Make();
    Start(operation, a);
    operation->Completion(Guid::CreateUnique(), kResultSuccess, nullptr, nullptr, false);
    EXPECT_EQ(Assertions().size(), 1u);
    EXPECT_THAT(Assertions()[0],
                testing::StartsWith("it != mRequestIDs.end() || inRequestID == mRequestID: "));
    EXPECT_TRUE(Finals().empty());
    a.End(kResultSuccess);
    EXPECT_THAT(Finals(), testing::ElementsAre(kResultSuccess));
}

TEST_F(CompoundTest, FinalRunsHereWhenTheWorkerRefuses) {
    const auto operation = Make();
    Start(operation, a);
    net->Shutdown();
    a.End(kResultSuccess);
    EXPECT_THAT(finish.Results(), testing::ElementsAre(kResultSuccess));
    EXPECT_THAT(Assertions(), testing::ElementsAre("posted: Failed to call completion asynchronously."));
}

TEST_F(CompoundTest, IsGoneWithItsLastFunction) {
    weak_ptr<CompoundAsyncOperation> watch;
    {
        const auto operation = Make();
        watch = operation;
        shared_ptr<CompoundAsyncOperation> sub;
        operation->CreateSubOperation(sub, nullptr, true);
        Start(sub, a);
        Start(sub, b);
    }
    EXPECT_FALSE(watch.expired());
    a.End(kResultSuccess);
    b.End(kResultSuccess);
    EXPECT_EQ(Finals().size(), 1u);
    EXPECT_TRUE(watch.expired());
}

}  // namespace
}  // namespace ZOCL
