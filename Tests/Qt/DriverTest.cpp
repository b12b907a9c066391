// The main-thread queue on Qt's event loop.
#include <atomic>
#include <thread>

#include "WindowTest.h"

namespace {

using ostcore::threads::AsyncCallFromMainThread;

/// A loop of its own, that a queued function leaves.
void RunLoopUntil(const std::function<bool()>& inCondition) {
    ASSERT_TRUE(QTest::qWaitFor(inCondition, 20000));
}

TEST(MainThreadDriverTest, WhatAnyThreadQueuesRunsInOrderOnTheLoopsThread) {
    const auto driver = ZOClientQt::DriveMainThread();
    constexpr int kCount = 20000;
    std::vector<int> order;
    std::thread worker([&] {
        for (int i = 0; i < kCount; ++i) {
            AsyncCallFromMainThread([&order, i] {
                EXPECT_TRUE(ostcore::threads::IsMainThread());
                order.push_back(i);
            });
        }
    });
    RunLoopUntil([&] { return order.size() == kCount; });
    worker.join();
    EXPECT_TRUE(std::is_sorted(order.begin(), order.end()));
}

TEST(MainThreadDriverTest, RunsWhatWasQueuedBeforeAndNothingOnceItIsGone) {
    int runs = 0;
    AsyncCallFromMainThread([&] { ++runs; });
    auto driver = ZOClientQt::DriveMainThread();
    auto second = ZOClientQt::DriveMainThread();
    RunLoopUntil([&] { return runs == 1; });
    driver.reset();
    AsyncCallFromMainThread([&] { ++runs; });
    RunLoopUntil([&] { return runs == 2; });
    second.reset();
    AsyncCallFromMainThread([&] { ++runs; });
    QCoreApplication::processEvents();
    EXPECT_EQ(runs, 2);
    ostcore::threads::PumpMainThread();
    EXPECT_EQ(runs, 3);
}

TEST(MainThreadDriverTest, AFunctionThatQueuesItselfForEverLetsTheLoopsOwnWorkThrough) {
    const auto driver = ZOClientQt::DriveMainThread();
    bool isOver = false;
    int rounds = 0;
    std::function<void()> again = [&] {
        ++rounds;
        if (!isOver) {
            AsyncCallFromMainThread(again);
        }
    };
    AsyncCallFromMainThread(again);
    QEventLoop loop;
    QTimer::singleShot(5, &loop, [&] {
        isOver = true;
        loop.quit();
    });
    loop.exec();
    EXPECT_GT(rounds, 1);
    ostcore::threads::PumpMainThread();
}

TEST(MainThreadDriverTest, MayGoFromWithinTheQueueAndWhileOthersQueue) {
    std::atomic<bool> isOver{false};
    std::thread worker([&] {
        while (!isOver) {
            AsyncCallFromMainThread([] {});
        }
    });
    for (int round = 0; round < 200; ++round) {
        auto driver = ZOClientQt::DriveMainThread();
        AsyncCallFromMainThread([&] { driver.reset(); });
        RunLoopUntil([&] { return !driver; });
    }
    isOver = true;
    worker.join();
    ostcore::threads::PumpMainThread();
    QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
    EXPECT_EQ(ostcore::threads::MainThreadQueueSize(), 0u);
}

}  // namespace
