// Executors: order, stopping, waiting, and handles that end in awkward places.
#include "ostcore/threads/Executor.h"

#include <gtest/gtest.h>

#include <atomic>
#include <set>
#include <thread>
#include <vector>

#include "ostcore/threads/Gate.h"

namespace {

using namespace ostcore::threads;
using ostcore::shared_ptr;

constexpr std::uint32_t kLong = 60000;

TEST(Executor, IOBoundWorkIsNotHeldUpByWorkThatBlocks) {
    const auto blocked = CreateIOBoundExecutor("test blocked");
    const auto other = CreateIOBoundExecutor("test other");
    Gate release;
    std::vector<std::unique_ptr<Gate>> began;
    for (int i = 0; i < 20; ++i) {
        began.push_back(std::make_unique<Gate>());
        ASSERT_TRUE(blocked->Post([&, gate = began.back().get()] {
            gate->Open();
            Gate::PassThrough(release, Gate::kWaitForever);
        }));
    }
    for (const auto& gate : began) {
        EXPECT_TRUE(Gate::PassThrough(*gate, kLong));  // all twenty run at once
    }
    Gate ran;
    ASSERT_TRUE(other->Post([&] { ran.Open(); }));
    EXPECT_TRUE(Gate::PassThrough(ran, kLong));
    EXPECT_FALSE(blocked->Wait(1));
    release.Open();
    EXPECT_TRUE(blocked->Wait(kLong));
}

TEST(Executor, SubExecutorKeepsTheOrderAndNeverOverlaps) {
    const auto parent = CreateCPUBoundExecutor("test parent");
    const auto sub = CreateSubExecutor(parent);
    std::vector<int> order;
    std::atomic<int> inside{0};
    std::atomic<int> overlaps{0};
    for (int i = 0; i < 2000; ++i) {
        ASSERT_TRUE(sub->Post([&, i] {
            overlaps += inside.fetch_add(1) != 0;
            order.push_back(i);  // unguarded: the executor is the guard
            inside.fetch_sub(1);
        }));
    }
    ASSERT_TRUE(sub->Wait(kLong));
    ASSERT_EQ(order.size(), 2000u);
    EXPECT_TRUE(std::is_sorted(order.begin(), order.end()));
    EXPECT_EQ(overlaps, 0);
}

TEST(Executor, EachPostersOrderIsKeptWhenSeveralPost) {
    const auto sub = CreateSubExecutor(CreateIOBoundExecutor("test"));
    std::vector<std::pair<int, int>> ran;
    std::vector<std::thread> posters;
    for (int t = 0; t < 3; ++t) {
        posters.emplace_back([&, t] {
            for (int i = 0; i < 500; ++i) {
                sub->Post([&ran, t, i] { ran.emplace_back(t, i); });
            }
        });
    }
    for (std::thread& each : posters) {
        each.join();
    }
    ASSERT_TRUE(sub->Wait(kLong));
    ASSERT_EQ(ran.size(), 1500u);
    int next[3] = {0, 0, 0};
    for (const auto& [thread, number] : ran) {
        EXPECT_EQ(number, next[thread]++);
    }
}

TEST(Executor, AcceptedWorkRunsAfterTheHandleIsGone) {
    Gate ran;
    CreateCPUBoundExecutor("test dropped")->Post([&] { ran.Open(); });
    EXPECT_TRUE(Gate::PassThrough(ran, kLong));
    Gate second;
    {
        const auto sub = CreateSubExecutor(CreateIOBoundExecutor("test"));
        sub->Post([] {});
        sub->Post([&] { second.Open(); });
    }
    EXPECT_TRUE(Gate::PassThrough(second, kLong));
}

TEST(Executor, TheLastReferenceMayDieOnItsOwnThread) {
    for (const auto& make :
         {+[] { return CreateIOBoundExecutor("test"); }, +[] { return CreateCPUBoundExecutor("test"); },
          +[] { return CreateAsyncEventLoopExecutor("test"); },
          +[] { return CreateSubExecutor(CreateIOBoundExecutor("test")); }}) {
        Gate handed;
        Gate done;
        auto executor = make();
        ASSERT_TRUE(executor);
        auto* const raw = executor.get();
        const auto slot = boost::make_shared<shared_ptr<AsyncThreadedExecutor>>();
        raw->Post([&handed, &done, slot] {
            Gate::PassThrough(handed, Gate::kWaitForever);
            slot->reset();
            done.Open();
        });
        *slot = std::move(executor);
        handed.Open();
        EXPECT_TRUE(Gate::PassThrough(done, kLong));
    }
    EXPECT_TRUE(WaitForExecutors(kLong));
}

TEST(Executor, StopDropsWhatWaitsAndRefusesWhatComes) {
    const auto sub = CreateSubExecutor(CreateIOBoundExecutor("test"));
    const auto held = boost::make_shared<int>(0);
    Gate began;
    Gate release;
    sub->Post([&] {
        began.Open();
        Gate::PassThrough(release, Gate::kWaitForever);
    });
    ASSERT_TRUE(Gate::PassThrough(began, kLong));
    sub->Post([held] { ++*held; });
    sub->Stop();
    EXPECT_TRUE(sub->IsStopped());
    EXPECT_EQ(held.use_count(), 1);  // released before Stop returned
    EXPECT_FALSE(sub->Post([held] { ++*held; }));
    EXPECT_EQ(held.use_count(), 1);
    EXPECT_FALSE(sub->Wait(1));  // one still runs
    release.Open();
    EXPECT_TRUE(sub->Wait(kLong));
    EXPECT_EQ(*held, 0);
}

TEST(Executor, AStoppedParentStopsItsSubExecutors) {
    const auto parent = boost::make_shared<ManualExecutor>();
    const auto sub = CreateSubExecutor(parent);
    int runs = 0;
    sub->Post([&] { ++runs; });
    sub->Post([&] { ++runs; });
    EXPECT_TRUE(parent->RunOne());
    EXPECT_EQ(runs, 1);
    parent->Stop();  // the turn of the second function is dropped
    EXPECT_TRUE(sub->IsStopped());
    EXPECT_FALSE(sub->Post([&] { ++runs; }));
    EXPECT_TRUE(sub->Wait(0));
    EXPECT_EQ(runs, 1);
    EXPECT_FALSE(CreateSubExecutor(parent)->Post([&] { ++runs; }));
    EXPECT_FALSE(CreateSubExecutor({}));
}

TEST(Executor, WaitFromItsOwnFunctionIsRefusedInsteadOfHanging) {
    const auto parent = CreateIOBoundExecutor("test");
    const auto sub = CreateSubExecutor(parent);
    Gate done;
    bool ownWait = true;
    bool parentWait = true;
    sub->Post([&] {
        ownWait = sub->Wait(kForever);
        parentWait = parent->Wait(kForever);
        done.Open();
    });
    ASSERT_TRUE(Gate::PassThrough(done, kLong));
    EXPECT_FALSE(ownWait);
    EXPECT_FALSE(parentWait);
}

TEST(Executor, EventLoopStaysOnOneThread) {
    const auto loop = CreateAsyncEventLoopExecutor("test loop");
    std::set<std::thread::id> threads;
    for (int i = 0; i < 50; ++i) {
        loop->Post([&] { threads.insert(std::this_thread::get_id()); });
    }
    ASSERT_TRUE(loop->Wait(kLong));
    EXPECT_EQ(threads.size(), 1u);
    EXPECT_FALSE(threads.count(std::this_thread::get_id()));
}

TEST(Executor, AnExceptionEndsItsFunctionOnly) {
    const auto sub = CreateSubExecutor(CreateCPUBoundExecutor("test"));
    bool ran = false;
    sub->Post([] { throw std::runtime_error("of a function"); });
    sub->Post([&] { ran = true; });
    ASSERT_TRUE(sub->Wait(kLong));
    EXPECT_TRUE(ran);
}

TEST(Executor, NobodyStopsTheSharedOne) {
    GetIOBoundExecutor()->Stop();
    Gate ran;
    EXPECT_TRUE(GetIOBoundExecutor()->Post([&] { ran.Open(); }));
    EXPECT_TRUE(Gate::PassThrough(ran, kLong));
    EXPECT_FALSE(GetIOBoundExecutor()->Post({}));
}

// Stop against Post from other threads: what was accepted either ran or was released.
TEST(Executor, StopRacesWithPost) {
    for (int round = 0; round < 200; ++round) {
        const auto sub = CreateSubExecutor(CreateIOBoundExecutor("test"));
        const auto held = boost::make_shared<int>(0);
        std::thread poster([&] {
            for (int i = 0; i < 20; ++i) {
                sub->Post([held] {});
            }
        });
        sub->Stop();
        poster.join();
        ASSERT_TRUE(sub->Wait(kLong));
        EXPECT_EQ(held.use_count(), 1);
    }
    EXPECT_TRUE(WaitForExecutors(kLong));
}

}  // namespace
