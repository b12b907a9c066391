// The pool of interned strings: identity, and the races between look-ups and last drops.
#include "ostcore/utility/ImmutableString.h"

#include <gtest/gtest.h>

#include <atomic>
#include <string>
#include <thread>
#include <unordered_set>
#include <vector>

namespace {

using ostcore::utility::ImmutableString;

void RunOnThreads(int inCount, const std::function<void(int)>& inBody) {
    std::vector<std::thread> threads;
    for (int i = 0; i < inCount; ++i) {
        threads.emplace_back(inBody, i);
    }
    for (std::thread& each : threads) {
        each.join();
    }
}

TEST(ImmutableString, EqualTextsAreOneEntryAndOthersAreNot) {
    const std::string bytes("a\0b", 3);
    const ImmutableString first(bytes);
    const ImmutableString second(bytes.data(), bytes.size());
    EXPECT_EQ(first, second);
    EXPECT_EQ(first.c_str(), second.c_str());
    EXPECT_EQ(first.size(), 3u);
    EXPECT_EQ(first.c_str()[3], '\0');
    EXPECT_NE(first, ImmutableString("a"));
    EXPECT_NE(ImmutableString("Case"), ImmutableString("case"));
    EXPECT_EQ(ImmutableString(""), ImmutableString());
    EXPECT_EQ(ImmutableString(static_cast<const char*>(nullptr)), ImmutableString());
    EXPECT_STREQ(ImmutableString().c_str(), "");
}

TEST(ImmutableString, AssignmentToItselfAndMovesKeepTheText) {
    ImmutableString text("kept through assignment");
    ImmutableString& alias = text;
    text = alias;
    EXPECT_EQ(text.view(), "kept through assignment");
    ImmutableString moved(std::move(text));
    moved = std::move(*&moved);
    EXPECT_EQ(moved.view(), "kept through assignment");
}

TEST(ImmutableString, ManyTextsSurviveTheGrowthOfTheTables) {
    const std::size_t before = ImmutableString::PoolSize();
    {
        std::vector<ImmutableString> held;
        for (int i = 0; i < 50000; ++i) {
            held.emplace_back("growth " + std::to_string(i));
        }
        EXPECT_EQ(ImmutableString::PoolSize(), before + held.size());
        for (int i = 0; i < 50000; ++i) {
            ASSERT_EQ(held[static_cast<std::size_t>(i)], ImmutableString("growth " + std::to_string(i)));
        }
        std::unordered_set<ImmutableString> set(held.begin(), held.end());
        EXPECT_EQ(set.size(), held.size());
    }
    EXPECT_EQ(ImmutableString::PoolSize(), before);
}

// One text is born and dies all the time, so that look-ups meet last drops in every way.
TEST(ImmutableString, LookUpsRaceWithLastDropsAndThePoolComesBackToItsSize) {
    const std::size_t before = ImmutableString::PoolSize();
    const std::string text = "the raced text";
    std::atomic<int> wrong{0};
    RunOnThreads(4, [&](int) {
        for (int i = 0; i < 200000; ++i) {
            const ImmutableString one(text);
            wrong += one.size() != text.size();
        }
    });
    RunOnThreads(4, [&](int inThread) {
        for (int i = 0; i < 20000; ++i) {
            const std::string mine = text + std::to_string((i + inThread) % 3);
            const ImmutableString one(mine);
            const ImmutableString copy = one;
            const ImmutableString two(mine);
            wrong += one != two || copy.view() != mine;
        }
    });
    EXPECT_EQ(wrong, 0);
    EXPECT_EQ(ImmutableString::PoolSize(), before);
}

// The last reference is dropped by a thread other than its maker's while others copy it.
TEST(ImmutableString, CopiesMadeAndDroppedOnDifferentThreads) {
    const std::size_t before = ImmutableString::PoolSize();
    for (int round = 0; round < 300; ++round) {
        std::vector<ImmutableString> handed(4, ImmutableString("handed over"));
        RunOnThreads(4, [&](int inThread) {
            ImmutableString mine = std::move(handed[static_cast<std::size_t>(inThread)]);
            for (int i = 0; i < 20; ++i) {
                ImmutableString copy = mine;
                mine = ImmutableString(copy.view());
            }
        });
    }
    EXPECT_EQ(ImmutableString::PoolSize(), before);
}

}  // namespace
