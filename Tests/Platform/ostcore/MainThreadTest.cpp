// The main thread's queue.
#include "ostcore/threads/MainThread.h"

#include <gtest/gtest.h>

#include <stdexcept>
#include <thread>
#include <vector>

#include "ostcore/threads/Gate.h"

namespace {

using namespace ostcore::threads;

class MainThreadTest : public testing::Test {
protected:
    void SetUp() override {
        ResetMainThread();
        ASSERT_TRUE(SetMainThread());
    }
    void TearDown() override { ResetMainThread(); }
    std::vector<int> mRan;
};

TEST_F(MainThreadTest, TheFirstToDeclareItselfIsIt) {
    bool otherDeclared = true;
    bool otherIs = true;
    std::thread([&] {
        otherDeclared = SetMainThread();
        otherIs = IsMainThread();
    }).join();
    EXPECT_FALSE(otherDeclared);
    EXPECT_FALSE(otherIs);
    EXPECT_TRUE(IsMainThread());
    ResetMainThread();
    EXPECT_FALSE(IsMainThread());
}

TEST_F(MainThreadTest, RunsInOrderAndLosesNothingToAnException) {
    AsyncCallFromMainThread([&] { mRan.push_back(1); });
    AsyncCallFromMainThread([] { throw std::runtime_error("of a call"); });
    AsyncCallFromMainThread([&] {
        mRan.push_back(2);
        AsyncCallFromMainThread([&] { mRan.push_back(3); });
    });
    EXPECT_TRUE(mRan.empty());  // never on the caller's stack
    EXPECT_EQ(PumpMainThread(), 3u);
    EXPECT_EQ(mRan, (std::vector<int>{1, 2}));
    EXPECT_EQ(PumpMainThread(), 1u);
    EXPECT_EQ(mRan.back(), 3);
    EXPECT_EQ(PumpMainThread(), 0u);
}

TEST_F(MainThreadTest, APumpInsideACallGoesOnInOrder) {
    AsyncCallFromMainThread([&] {
        mRan.push_back(1);
        PumpMainThread();
        mRan.push_back(4);
    });
    AsyncCallFromMainThread([&] { mRan.push_back(2); });
    AsyncCallFromMainThread([&] { mRan.push_back(3); });
    PumpMainThread();
    EXPECT_EQ(mRan, (std::vector<int>{1, 2, 3, 4}));
}

TEST_F(MainThreadTest, OtherThreadsCannotPump) {
    AsyncCallFromMainThread([&] { mRan.push_back(1); });
    std::size_t pumped = 1;
    std::thread([&] { pumped = PumpMainThread() + WaitAndPumpMainThread(0xFFFFFFFFu); }).join();
    EXPECT_EQ(pumped, 0u);
    EXPECT_EQ(MainThreadQueueSize(), 1u);
}

TEST_F(MainThreadTest, WaitEndsWithWorkOrWithTheTime) {
    EXPECT_EQ(WaitAndPumpMainThread(1), 0u);
    std::thread caller([&] { AsyncCallFromMainThread([&] { mRan.push_back(1); }); });
    EXPECT_EQ(WaitAndPumpMainThread(0xFFFFFFFFu), 1u);
    EXPECT_EQ(mRan.size(), 1u);
    caller.join();
}

TEST_F(MainThreadTest, WakesTheHostOutsideTheLock) {
    AsyncCallFromMainThread([] {});
    int wakes = 0;
    SetMainThreadWakeFunction([&] {
        ++wakes;
        EXPECT_GT(MainThreadQueueSize(), 0u);  // would hang under the queue's lock
    });
    EXPECT_EQ(wakes, 1);  // work was there already
    AsyncCallFromMainThread([] {});
    EXPECT_EQ(wakes, 2);
    SetMainThreadWakeFunction({});
    AsyncCallFromMainThread([] {});
    EXPECT_EQ(wakes, 2);
}

TEST_F(MainThreadTest, ManyThreadsLoseNothing) {
    std::vector<std::thread> callers;
    for (int t = 0; t < 4; ++t) {
        callers.emplace_back([&] {
            for (int i = 0; i < 1000; ++i) {
                AsyncCallFromMainThread([&] { mRan.push_back(1); });
            }
        });
    }
    while (mRan.size() < 4000) {
        WaitAndPumpMainThread(0xFFFFFFFFu);
    }
    for (std::thread& each : callers) {
        each.join();
    }
    EXPECT_EQ(MainThreadQueueSize(), 0u);
}

}  // namespace
