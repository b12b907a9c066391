// Delayed, deferred and repeating calls on virtual time.
#include "ostcore/threads/DelayedCall.h"

#include <gtest/gtest.h>

#include <thread>
#include <vector>

#include "ostcore/threads/Gate.h"

namespace {

using namespace ostcore::threads;
using namespace std::chrono_literals;

class DelayedCallTest : public testing::Test {
protected:
    const ostcore::shared_ptr<VirtualScheduler> mTime = boost::make_shared<VirtualScheduler>();
    const ScopedGlobalScheduler mScope{mTime};
    const ostcore::shared_ptr<ManualExecutor> mExecutor = boost::make_shared<ManualExecutor>();
    int mCalls = 0;
    const ostcore::function<void()> mCount = [this] { ++mCalls; };
};

TEST_F(DelayedCallTest, RunsOnTheExecutorWhenItsTimeHasCome) {
    ASSERT_TRUE(PostDelayed(mExecutor, mCount, 500));
    mTime->Advance(499ms);
    EXPECT_EQ(mExecutor->PendingCount(), 0u);
    mTime->Advance(1ms);
    EXPECT_EQ(mCalls, 0);  // the timer only posts
    mExecutor->RunAll();
    EXPECT_EQ(mCalls, 1);
    EXPECT_FALSE(PostDelayed(mExecutor, {}, 1));
}

TEST_F(DelayedCallTest, CancelWorksUntilTheFunctionBegins) {
    const auto waiting = PostDelayed(mExecutor, mCount, 10);
    EXPECT_TRUE(waiting->Cancel());
    EXPECT_FALSE(waiting->Cancel());
    EXPECT_EQ(mTime->PendingCount(), 0u);

    const auto posted = PostDelayed(mExecutor, mCount, 10);
    mTime->Advance(10ms);
    EXPECT_TRUE(posted->Cancel());  // on the executor's queue, not begun
    mExecutor->RunAll();
    EXPECT_EQ(mCalls, 0);

    const auto ran = PostDelayed(mExecutor, mCount, 10);
    mTime->Advance(10ms);
    mExecutor->RunAll();
    EXPECT_FALSE(ran->Cancel());
    EXPECT_EQ(mCalls, 1);
}

TEST_F(DelayedCallTest, WhatTheFunctionHoldsIsReleasedInEveryCase) {
    const auto held = boost::make_shared<int>(0);
    const auto cancelled = PostDelayed(
        mExecutor, [held] {}, 10);
    cancelled->Cancel();
    EXPECT_EQ(held.use_count(), 1);
    const auto ran = PostDelayed(
        mExecutor, [held] {}, 10);
    mTime->Advance(10ms);
    mExecutor->RunAll();
    EXPECT_EQ(held.use_count(), 1);
    const auto refused = PostDelayed(
        mExecutor, [held] {}, 10);
    mExecutor->Stop();
    mTime->Advance(10ms);
    EXPECT_EQ(held.use_count(), 1);
}

TEST_F(DelayedCallTest, CancelRacesWithTheBeginning) {
    for (int round = 0; round < 500; ++round) {
        std::atomic<int> runs{0};
        const auto call = PostDelayed(
            {}, [&] { ++runs; }, 10);
        bool cancelled = false;
        std::thread canceller([&] { cancelled = call->Cancel(); });
        mTime->Advance(10ms);
        canceller.join();
        ASSERT_EQ(runs, cancelled ? 0 : 1);
    }
}

TEST_F(DelayedCallTest, DeferredCallerQueuesOnceUntilTheCallBegins) {
    DeferredCaller caller(mExecutor, mCount);
    EXPECT_TRUE(caller.QueueOnlyOnce(500));
    mTime->Advance(300ms);
    EXPECT_TRUE(caller.QueueOnlyOnce(500));  // does not move the first
    mTime->Advance(200ms);
    mExecutor->RunAll();
    EXPECT_EQ(mCalls, 1);
    mTime->Advance(10s);
    mExecutor->RunAll();
    EXPECT_EQ(mCalls, 1);
    caller.QueueOnlyOnce(500);
    caller.Cancel();
    caller.QueueOnlyOnce(700);
    mTime->Advance(699ms);
    mExecutor->RunAll();
    EXPECT_EQ(mCalls, 1);
    mTime->Advance(1ms);
    mExecutor->RunAll();
    EXPECT_EQ(mCalls, 2);
}

TEST_F(DelayedCallTest, DeferredCallerCanBeQueuedFromItsCallAndIsRefusedAfterAStop) {
    std::unique_ptr<DeferredCaller> caller;
    caller = std::make_unique<DeferredCaller>(mExecutor, [&] {
        if (++mCalls < 3) {
            caller->QueueOnlyOnce(1000);
        }
    });
    caller->QueueOnlyOnce(0);
    for (int i = 0; i < 5; ++i) {
        mTime->Advance(1s);
        mExecutor->RunAll();
    }
    EXPECT_EQ(mCalls, 3);
    caller->QueueOnlyOnce(0);
    mExecutor->Stop();
    mTime->Advance(1s);  // the executor refuses: the place is free again
    EXPECT_TRUE(caller->QueueOnlyOnce(0));
    EXPECT_EQ(mTime->PendingCount(), 1u);
    caller.reset();
    EXPECT_EQ(mTime->PendingCount(), 0u);
}

TEST_F(DelayedCallTest, RepeatsEveryPeriodUntilStopped) {
    RepeatDelayFunction repeat({}, mCount, 5000);
    mTime->Advance(4999ms);
    EXPECT_EQ(mCalls, 0);
    mTime->Advance(15001ms);
    EXPECT_EQ(mCalls, 4);
    repeat.Stop();
    mTime->Advance(1h);
    EXPECT_EQ(mCalls, 4);
    EXPECT_EQ(mTime->PendingCount(), 0u);
}

TEST_F(DelayedCallTest, APeriodThatFindsTheCallBusyIsSkipped) {
    const RepeatDelayFunction repeat(mExecutor, mCount, 1000);
    mTime->Advance(3500ms);  // the executor is slow: one call waits
    EXPECT_EQ(mExecutor->RunAll(), 1u);
    mTime->Advance(500ms);  // and the beat stays at full seconds
    EXPECT_EQ(mExecutor->RunAll(), 1u);
    EXPECT_EQ(mCalls, 2);
}

TEST_F(DelayedCallTest, StopInsideTheCallDoesNotHang) {
    std::unique_ptr<RepeatDelayFunction> repeat;
    repeat = std::make_unique<RepeatDelayFunction>(
        nullptr,
        [&] {
            ++mCalls;
            repeat->Stop();
        },
        10);
    mTime->Advance(1s);
    EXPECT_EQ(mCalls, 1);
}

TEST_F(DelayedCallTest, StopWaitsForTheCallThatRuns) {
    const auto executor = CreateIOBoundExecutor("test");
    Gate began;
    Gate mayEnd;
    std::atomic<bool> ended{false};
    RepeatDelayFunction repeat(
        executor,
        [&] {
            began.Open();
            Gate::PassThrough(mayEnd, Gate::kWaitForever);
            ended = true;
        },
        10);
    mTime->Advance(10ms);
    ASSERT_TRUE(Gate::PassThrough(began, 60000));
    std::thread opener([&] { mayEnd.Open(); });
    repeat.Stop();
    EXPECT_TRUE(ended);
    opener.join();
}

// On real time, the whole road: timer thread, executor thread, stop.
TEST(RepeatDelayFunction, OnTheSystemsTime) {
    Gate third;
    std::atomic<int> calls{0};
    {
        const RepeatDelayFunction repeat(
            CreateCPUBoundExecutor("test"),
            [&] {
                if (++calls == 3) {
                    third.Open();
                }
            },
            1);
        EXPECT_TRUE(Gate::PassThrough(third, 60000));
    }
    const int atStop = calls;
    EXPECT_TRUE(WaitForExecutors(60000));
    EXPECT_EQ(calls, atStop);
}

}  // namespace
