// Many compound operations at once on several workers: started, failed, cancelled and nested at random. Each
// ends once, with its first failure.
#include <random>

#include "ostcore/threads/Executor.h"
#include "Steps.h"

namespace ZOCL {
namespace {

using Operation = shared_ptr<CompoundAsyncOperation>;

/// One tree of operations with what the test knows of it. The first failure is told by the order in which
/// the intermediate functions return, which the operation follows when they run one at a time, so a tree is
/// judged by the set of its failures and exactly when there was but one.
struct Tree {
    std::atomic<int> finals{0};
    std::atomic<int> finalResult{1};
    std::atomic<int> started{0};
    std::atomic<int> intermediates{0};
    std::mutex mutex;
    std::vector<int> failures;
    std::atomic<bool> cancelled{false};
    /// Steps that may still be started, so that a tree is finite.
    std::atomic<int> budget{0};

    void NoteFailure(int inResult) {
        std::lock_guard<std::mutex> lock(mutex);
        failures.push_back(inResult);
    }
};

class RandomSource {
public:
    explicit RandomSource(unsigned inSeed) : mRandom(inSeed) {}
    unsigned Below(unsigned inBound) {
        std::lock_guard<std::mutex> lock(mMutex);
        return static_cast<unsigned>(mRandom() % inBound);
    }

private:
    std::mutex mMutex;
    std::mt19937 mRandom;
};

class CompoundRandomTest : public ClientTest {
protected:
    CompoundRandomTest() : ClientTest(4) { ostcore::debug::SetTraceLevel("*", 0); }

    static unsigned Seed() {
        const char* given = std::getenv("ZO_TEST_SEED");
        return given ? static_cast<unsigned>(std::strtoul(given, nullptr, 10)) : std::random_device()();
    }

    /// Starts one step: a request, work on an executor, or a sub-operation with steps of its own.
    void StartStep(const Operation& inOperation, const shared_ptr<Tree>& inTree, int inDepth) {
        if (inTree->budget.fetch_sub(1) <= 0) {
            return;
        }
        switch (mRandom->Below(inDepth < 3 ? 8 : 6)) {
            case 0:
                ++inTree->started;
                inOperation->Initiate([](const Guid&, const RequestCompletion&) { return false; },
                                      MakeIntermediate(inOperation, inTree, inDepth));
                break;
            case 1: {
                const int result = mRandom->Below(10) == 0 ? kResultHTTPConflict : kResultSuccess;
                inOperation->CallAsynchronously(
                    mExecutor,
                    [inTree, result] {
                        if (result < 0) {
                            inTree->NoteFailure(result);
                        }
                        return result;
                    },
                    mRandom->Below(2) == 0);
                break;
            }
            case 6:
            case 7:
                StartSubOperation(inOperation, inTree, inDepth);
                break;
            default:
                ++inTree->started;
                inOperation->Initiate(MakeRequest(), MakeIntermediate(inOperation, inTree, inDepth));
        }
    }

    void StartSubOperation(const Operation& inOperation, const shared_ptr<Tree>& inTree, int inDepth) {
        Operation sub;
        ++inTree->started;
        inOperation->CreateSubOperation(
            sub,
            [inTree](int inResult) {
                ++inTree->intermediates;
                return inResult;
            },
            mRandom->Below(2) == 0);
        if (!sub) {
            --inTree->started;
            return;
        }
        ++inTree->started;
        sub->Initiate(MakeRequest(), MakeIntermediate(sub, inTree, inDepth + 1));
        for (unsigned i = mRandom->Below(3); i > 0; --i) {
            // The first request may have ended the sub-operation by now; only inside of its steps more may
            // follow, so these go to the parent.
            StartStep(inOperation, inTree, inDepth);
        }
    }

    CompoundAsyncOperation::WorkFunction MakeRequest() {
        const auto resource = Plain("/r");
        return [resource](const Guid& inID, const RequestCompletion& inDone) {
            return resource->Load(inID, inDone, false);
        };
    }

    CompoundAsyncOperation::IntermediateCompletion MakeIntermediate(const Operation& inOperation,
                                                                    const shared_ptr<Tree>& inTree,
                                                                    int inDepth) {
        return [this, inOperation, inTree, inDepth](int inResult, const InterfaceRef<IZOCServerResource>&,
                                                    const shared_ptr<ostnet::Response>&) {
            ++inTree->intermediates;
            if (mRandom->Below(20) == 0) {
                inTree->cancelled = true;
                inTree->NoteFailure(kResultCancelled);
                inOperation->TryToCancel();
            }
            for (unsigned i = mRandom->Below(3); i > 0; --i) {
                StartStep(inOperation, inTree, inDepth);
            }
            if (inResult < 0) {
                inTree->NoteFailure(inResult);
            }
            return inResult;
        };
    }

    std::unique_ptr<RandomSource> mRandom;
    shared_ptr<ostcore::threads::AsyncThreadedExecutor> mExecutor =
        ostcore::threads::CreateIOBoundExecutor("compound random test");
};

TEST_F(CompoundRandomTest, EveryTreeEndsOnceWithAFailureOfItsOwn) {
    const unsigned seed = Seed();
    SCOPED_TRACE("ZO_TEST_SEED=" + std::to_string(seed));
    mRandom = std::make_unique<RandomSource>(seed);
    net->SetHandler([this](const RecordedRequest&) {
        switch (mRandom->Below(40)) {
            case 0:
                return ScriptedAnswer::Status(403);
            case 1:
                return ScriptedAnswer::NullResponse();
            case 2:
                return ScriptedAnswer::FailStart();
            default:
                return ScriptedAnswer::Body("x", "text/plain");
        }
    });
    constexpr int kTrees = 400;
    std::vector<shared_ptr<Tree>> trees;
    Finish finish;
    for (int i = 0; i < kTrees; ++i) {
        const auto tree = make_shared<Tree>();
        tree->budget = 30;
        trees.push_back(tree);
        const auto done = finish.Function();
        const Operation operation = CompoundAsyncOperation::Create(
            [tree, done](int inResult) {
                tree->finalResult = inResult;
                ++tree->finals;
                done(inResult);
            },
            server, mRandom->Below(2) == 0);
        // The first request holds the operation open while the others are started beside it.
        ++tree->started;
        operation->Initiate(MakeRequest(), [this, operation, tree](int inResult) {
            ++tree->intermediates;
            for (int step = 0; step < 4; ++step) {
                StartStep(operation, tree, 0);
            }
            if (inResult < 0) {
                tree->NoteFailure(inResult);
            }
            return inResult;
        });
        if (mRandom->Below(10) == 0) {
            tree->cancelled = true;
            tree->NoteFailure(kResultCancelled);
            operation->TryToCancel();
        }
    }
    EXPECT_TRUE(finish.WaitForCalls(kTrees));
    EXPECT_TRUE(mExecutor->Wait(30000));
    EXPECT_TRUE(net->WaitUntilIdle(30000));
    for (int i = 0; i < kTrees; ++i) {
        Tree& tree = *trees[static_cast<std::size_t>(i)];
        ASSERT_EQ(tree.finals.load(), 1) << "tree " << i;
        EXPECT_EQ(tree.intermediates.load(), tree.started.load()) << "tree " << i;
        std::lock_guard<std::mutex> lock(tree.mutex);
        if (tree.failures.empty()) {
            EXPECT_EQ(tree.finalResult.load(), kResultSuccess) << "tree " << i;
        } else if (tree.finalResult.load() != kResultSuccess) {
            EXPECT_THAT(tree.failures, testing::Contains(tree.finalResult.load())) << "tree " << i;
        } else {
            // A cancel that came when all was over changes nothing.
            EXPECT_TRUE(tree.cancelled.load()) << "tree " << i;
            EXPECT_THAT(tree.failures, testing::Each(kResultCancelled)) << "tree " << i;
        }
    }
}

TEST_F(CompoundRandomTest, OfManyRacingFailuresOneIsTheResult) {
    for (int round = 0; round < 200; ++round) {
        Finish finish;
        const Operation operation = CompoundAsyncOperation::Create(finish.Function(), server, false);
        std::vector<Step> steps(4);
        for (Step& step : steps) {
            operation->Initiate(step.Work(), step.Intermediate(), step.CountCancels());
        }
        std::vector<std::thread> threads;
        for (std::size_t i = 0; i < steps.size(); ++i) {
            threads.emplace_back([&, i] { steps[i].End(kResultHTTPBadRequest + static_cast<int>(i)); });
        }
        for (std::thread& thread : threads) {
            thread.join();
        }
        ASSERT_TRUE(finish.WaitForCalls(1));
        ASSERT_TRUE(net->WaitUntilIdle());
        ASSERT_EQ(finish.Results().size(), 1u);
        EXPECT_EQ(finish.Results()[0], operation->GetResult());
        EXPECT_GE(finish.Results()[0], kResultHTTPBadRequest);
        EXPECT_LE(finish.Results()[0], kResultHTTPBadRequest + 3);
    }
}

}  // namespace
}  // namespace ZOCL
