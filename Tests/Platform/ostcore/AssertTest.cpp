// One-shot assertions.
#include "ostcore/debug/Assert.h"

#include <gtest/gtest.h>

#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

namespace {

using namespace ostcore::debug;

class AssertTest : public testing::Test {
protected:
    void SetUp() override {
        ResetAssertionSites();
        mFormer =
            SetAssertionHandler([this](const AssertionFailure& inFailure) { mSeen.push_back(inFailure); });
    }
    void TearDown() override { SetAssertionHandler(mFormer); }

    void Check(bool inCondition) {
        ZO_ASSERT_ONCE(inCondition, "it != end", "message " + std::to_string(++mMessagesMade));
    }

    std::vector<AssertionFailure> mSeen;
    AssertionHandler mFormer;
    int mMessagesMade = 0;
};

TEST_F(AssertTest, EachSiteSpeaksOnceAndOnlyOnFailure) {
    Check(true);
    EXPECT_EQ(mMessagesMade, 0);
    Check(false);
    Check(false);
    ZO_ASSERT_ONCE(false, "other", "another site");
    ASSERT_EQ(mSeen.size(), 2u);
    EXPECT_EQ(mSeen[0].expression, "it != end");
    EXPECT_EQ(mSeen[0].message, "message 1");
    EXPECT_NE(mSeen[0].file.find("AssertTest.cpp"), std::string::npos);
    EXPECT_NE(mSeen[0].line, mSeen[1].line);
    ResetAssertionSites();
    Check(false);
    EXPECT_EQ(mSeen.size(), 3u);
}

TEST_F(AssertTest, AHandlerThatThrowsStopsNothing) {
    SetAssertionHandler([](const AssertionFailure&) { throw std::runtime_error("of a handler"); });
    EXPECT_NO_THROW(Check(false));
}

TEST_F(AssertTest, ThreadsAtOneSiteMakeOneCall) {
    std::atomic<int> calls{0};
    SetAssertionHandler([&](const AssertionFailure&) { ++calls; });
    std::vector<std::thread> threads;
    for (int t = 0; t < 4; ++t) {
        threads.emplace_back([] { ZO_ASSERT_ONCE(false, "raced", "one of four"); });
    }
    for (std::thread& each : threads) {
        each.join();
    }
    EXPECT_EQ(calls, 1);
}

}  // namespace
