// The map that forgets: when a sweep comes, what it drops, and that nothing is released under the lock.
#include <gtest/gtest.h>

#include <thread>

#include "ostnet/http/ExpiringEntryMap.h"

namespace {

using ostcore::threads::ManualExecutor;
using ostcore::threads::ScopedGlobalScheduler;
using ostcore::threads::VirtualScheduler;
using std::chrono::seconds;

class ExpiringEntryMapTest : public testing::Test {
protected:
    using Map = ostnet::http::ExpiringEntryMap<int, boost::shared_ptr<void>>;

    Map MakeMap() { return Map({3, 100, 10}, mExecutor); }
    void Pass(int inSeconds) {
        mTime->Advance(seconds(inSeconds));
        mExecutor->RunAll();
    }
    static boost::shared_ptr<void> Anything() { return boost::make_shared<int>(1); }

    const boost::shared_ptr<VirtualScheduler> mTime = boost::make_shared<VirtualScheduler>();
    const ScopedGlobalScheduler mScope{mTime};
    const boost::shared_ptr<ManualExecutor> mExecutor = boost::make_shared<ManualExecutor>();
};

TEST_F(ExpiringEntryMapTest, DropsOnlyWhatIsBothBeyondTheNumberAndTooOld) {
    Map map = MakeMap();
    for (int key = 0; key < 6; ++key) {
        map.Insert(key, Anything());
        mTime->Advance(seconds(1));
    }
    Pass(60);
    EXPECT_EQ(map.Size(), 6u) << "beyond the number, but young";
    EXPECT_TRUE(map.Lookup(1)) << "counts as used now";
    Pass(80);
    EXPECT_EQ(map.Size(), 3u);
    EXPECT_TRUE(map.Lookup(1) && map.Lookup(4) && map.Lookup(5)) << "the three that were used last";
    Pass(1000);
    EXPECT_EQ(map.Size(), 3u) << "old, but within the number";
}

TEST_F(ExpiringEntryMapTest, SweepsOnceAnIntervalAndOnlyWhileThereIsReason) {
    Map map = MakeMap();
    for (int key = 0; key < 3; ++key) {
        map.Insert(key, Anything());
    }
    EXPECT_EQ(mTime->PendingCount(), 0u) << "few entries need no sweep";
    for (int key = 3; key < 6; ++key) {
        map.Insert(key, Anything());
    }
    EXPECT_EQ(mTime->PendingCount(), 1u);
    mTime->Advance(seconds(9));
    EXPECT_EQ(mExecutor->PendingCount(), 0u);
    Pass(1);
    EXPECT_EQ(mTime->PendingCount(), 1u) << "too many entries wait for their age";
    while (mTime->AdvanceToNext() > 0) {
        mExecutor->RunAll();
    }
    EXPECT_EQ(map.Size(), 3u);
}

TEST_F(ExpiringEntryMapTest, ReleasesOutsideItsLock) {
    Map map = MakeMap();
    int released = 0;
    const auto probe = [&] {
        return boost::shared_ptr<void>(static_cast<void*>(nullptr), [&](void*) {
            std::thread([&] { map.Size(); }).join();  // hangs when the lock is held
            ++released;
        });
    };
    map.Insert(0, probe());
    map.Insert(0, probe());
    EXPECT_EQ(released, 1) << "a value that is replaced";
    for (int key = 1; key < 5; ++key) {
        map.Insert(key, probe());
    }
    Pass(200);
    EXPECT_EQ(released, 3) << "values that are swept";
    map.Clear();
    EXPECT_EQ(released, 6);
}

TEST_F(ExpiringEntryMapTest, MayGoWhileItsSweepWaitsOrRuns) {
    boost::weak_ptr<void> value;
    {
        Map map = MakeMap();
        for (int key = 0; key < 5; ++key) {
            const auto held = Anything();
            value = held;
            map.Insert(key, held);
        }
        mTime->Advance(seconds(10));
    }
    EXPECT_TRUE(value.expired());
    EXPECT_EQ(mExecutor->RunAll(), 1u);
    EXPECT_EQ(mTime->PendingCount(), 0u);
}

}  // namespace
