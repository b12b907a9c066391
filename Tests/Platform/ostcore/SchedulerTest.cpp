// Time: the virtual one's order and the real one's life cycle; the gate.
#include "ostcore/threads/Scheduler.h"

#include <gtest/gtest.h>

#include <thread>
#include <vector>

#include "ostcore/threads/Gate.h"

namespace {

using namespace ostcore::threads;
using namespace std::chrono_literals;

TEST(VirtualScheduler, RunsInTimeOrderAndEachSeesItsTime) {
    VirtualScheduler scheduler;
    const MonotonicTime start = scheduler.Now();
    std::vector<std::pair<char, Duration>> ran;
    const auto note = [&](char inName) { ran.emplace_back(inName, scheduler.Now() - start); };
    scheduler.Schedule(30ms, [&] { note('c'); });
    scheduler.Schedule(10ms, [&] {
        note('a');
        scheduler.Schedule(5ms, [&] { note('b'); });
    });
    scheduler.Schedule(30ms, [&] { note('d'); });
    scheduler.Schedule(31ms, [&] { note('e'); });
    EXPECT_EQ(scheduler.Advance(30ms), 4u);
    const std::vector<std::pair<char, Duration>> expected{{'a', 10ms}, {'b', 15ms}, {'c', 30ms}, {'d', 30ms}};
    EXPECT_EQ(ran, expected);
    EXPECT_EQ(scheduler.Now() - start, 30ms);
    EXPECT_EQ(*scheduler.TimeToNext(), 1ms);
    EXPECT_EQ(scheduler.AdvanceToNext(), 1u);
    EXPECT_EQ(scheduler.PendingCount(), 0u);
    EXPECT_EQ(scheduler.AdvanceToNext(), 0u);
}

TEST(VirtualScheduler, CancelTellsWhetherItCameInTime) {
    VirtualScheduler scheduler;
    int runs = 0;
    const Scheduler::TimerID first = scheduler.Schedule(1s, [&] { ++runs; });
    Scheduler::TimerID second = Scheduler::kNoTimer;
    second = scheduler.Schedule(2s, [&] {
        ++runs;
        EXPECT_FALSE(scheduler.Cancel(second));  // it runs now
    });
    EXPECT_TRUE(scheduler.Cancel(first));
    EXPECT_FALSE(scheduler.Cancel(first));
    scheduler.Advance(1h);
    EXPECT_EQ(runs, 1);
    EXPECT_FALSE(scheduler.Cancel(second));
    EXPECT_EQ(scheduler.Schedule(1s, {}), Scheduler::kNoTimer);
}

TEST(VirtualScheduler, TheWallClockJumpsAndTheMonotonicOneDoesNot) {
    VirtualScheduler scheduler;
    const auto before = scheduler.UTCNow();
    const MonotonicTime start = scheduler.Now();
    scheduler.Advance(90s);
    EXPECT_EQ(scheduler.UTCNow() - before, boost::posix_time::seconds(90));
    scheduler.SetUTC(before - boost::posix_time::hours(24));
    EXPECT_EQ(scheduler.Now() - start, 90s);
    scheduler.Advance(1s);
    EXPECT_EQ(scheduler.UTCNow(), before - boost::posix_time::hours(24) + boost::posix_time::seconds(1));
}

TEST(VirtualScheduler, ADelayBeyondAllTimeStaysFarAway) {
    VirtualScheduler scheduler;
    scheduler.Schedule(Duration::max(), [] { FAIL() << "ran"; });
    scheduler.Schedule(-5s, [] {});
    EXPECT_EQ(scheduler.Advance(24h * 365), 1u);
    EXPECT_EQ(scheduler.PendingCount(), 1u);
}

TEST(SystemScheduler, RunsInOrderOnAnotherThread) {
    SystemScheduler scheduler;
    Gate done;
    std::vector<int> order;
    std::thread::id thread;
    scheduler.Schedule(20ms, [&] {
        order.push_back(2);
        done.Open();
    });
    scheduler.Schedule(1ms, [&] {
        order.push_back(1);
        thread = std::this_thread::get_id();
    });
    ASSERT_TRUE(Gate::PassThrough(done, 60000));
    EXPECT_EQ(order, (std::vector<int>{1, 2}));
    EXPECT_NE(thread, std::this_thread::get_id());
}

TEST(SystemScheduler, ItsEndDropsWhatWaitsAndWaitsForWhatRuns) {
    const auto held = boost::make_shared<int>(1);
    Gate began;
    Gate mayEnd;
    bool ended = false;
    auto scheduler = std::make_unique<SystemScheduler>();
    scheduler->Schedule(1h, [held] { FAIL() << "ran"; });
    scheduler->Schedule(0ms, [&] {
        began.Open();
        Gate::PassThrough(mayEnd, Gate::kWaitForever);
        ended = true;
    });
    ASSERT_TRUE(Gate::PassThrough(began, 60000));
    std::thread opener([&] { mayEnd.Open(); });
    scheduler.reset();
    EXPECT_TRUE(ended);
    EXPECT_EQ(held.use_count(), 1);
    opener.join();
}

TEST(SystemScheduler, CanEndOnItsOwnThread) {
    Gate done;
    auto scheduler = boost::make_shared<SystemScheduler>();
    SystemScheduler* const raw = scheduler.get();
    raw->Schedule(0ms, [&done, held = std::move(scheduler)]() mutable {
        held.reset();
        done.Open();
    });
    EXPECT_TRUE(Gate::PassThrough(done, 60000));
}

TEST(SystemScheduler, AnExceptionDoesNotEndTheThread) {
    SystemScheduler scheduler;
    Gate done;
    scheduler.Schedule(0ms, [] { throw std::runtime_error("of a timer"); });
    scheduler.Schedule(0ms, [&] { done.Open(); });
    EXPECT_TRUE(Gate::PassThrough(done, 60000));
}

TEST(GlobalScheduler, IsReplacedAndRestored) {
    const auto system = GetGlobalScheduler();
    {
        const auto mine = boost::make_shared<VirtualScheduler>();
        const ScopedGlobalScheduler scope(mine);
        EXPECT_EQ(GetGlobalScheduler(), mine);
    }
    EXPECT_EQ(GetGlobalScheduler(), system);
}

TEST(Gate, TimesOutWhileClosedAndLetsAllThroughOnceOpen) {
    const auto gate = boost::make_shared<Gate>();
    const auto begin = std::chrono::steady_clock::now();
    EXPECT_FALSE(Gate::PassThrough(gate, 20));
    EXPECT_GE(std::chrono::steady_clock::now() - begin, 20ms);
    std::atomic<int> through{0};
    std::vector<std::thread> waiters;
    for (int i = 0; i < 3; ++i) {
        waiters.emplace_back([&] { through += Gate::PassThrough(gate, Gate::kWaitForever); });
    }
    EXPECT_EQ(through, 0);
    gate->Open();
    for (std::thread& each : waiters) {
        each.join();
    }
    EXPECT_EQ(through, 3);
    EXPECT_TRUE(Gate::PassThrough(gate, 0));
}

// A waiter may destroy the gate as soon as it is through, while Open has not returned yet.
TEST(Gate, MayBeDestroyedByItsWaiter) {
    for (int i = 0; i < 2000; ++i) {
        auto gate = std::make_unique<Gate>();
        std::thread opener([raw = gate.get()] { raw->Open(); });
        Gate::PassThrough(*gate, Gate::kWaitForever);
        gate.reset();
        opener.join();
    }
}

}  // namespace
