// Blocks of bytes: content, the zero padding, and reuse.
#include "ostcore/utility/RecycledMemory.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <cstring>
#include <string>
#include <thread>
#include <vector>

namespace {

using ostcore::utility::RecycledMemory;

bool IsPaddingZero(const RecycledMemory& inMemory) {
    const std::string zeros(RecycledMemory::kPadding, '\0');
    return std::memcmp(inMemory.data() + inMemory.size(), zeros.data(), zeros.size()) == 0;
}

TEST(RecycledMemory, PaddingIsZeroThroughEveryChangeOfSize) {
    for (const std::size_t size :
         {std::size_t(1), std::size_t(100), std::size_t(65536), std::size_t(1000003)}) {
        RecycledMemory memory(size);
        std::memset(memory.data(), 0xAA, size);
        EXPECT_TRUE(IsPaddingZero(memory)) << size;
        memory.Resize(size / 2);
        EXPECT_TRUE(IsPaddingZero(memory)) << size;
        memory.Reserve(size * 3);
        EXPECT_TRUE(IsPaddingZero(memory)) << size;
        memory.Append("xyz", 3);
        EXPECT_EQ(memory.view().substr(size / 2), "xyz");
        EXPECT_TRUE(IsPaddingZero(memory)) << size;
    }
}

TEST(RecycledMemory, AppendsPiecesAndItsOwnBytes) {
    RecycledMemory memory;
    std::string expected;
    for (int i = 0; i < 20000; ++i) {
        const std::string piece = std::to_string(i) + ",";
        memory.Append(piece.data(), piece.size());
        expected += piece;
    }
    EXPECT_EQ(memory.view(), expected);
    memory.Append(memory.data(), memory.size());
    EXPECT_EQ(memory.view(), expected + expected);
    EXPECT_EQ(RecycledMemory().view(), "");
    EXPECT_EQ(RecycledMemory::CreateFromBytes("")->size(), 0u);
}

TEST(RecycledMemory, ALargeBlockIsUsedAgain) {
    const char* former = nullptr;
    {
        RecycledMemory memory(5 * 1024 * 1024);
        std::memset(memory.data(), 0xAA, memory.size());
        former = memory.data();
    }
    RecycledMemory again(5 * 1024 * 1024 - 5000);
    EXPECT_EQ(static_cast<const void*>(again.data()), static_cast<const void*>(former));
    EXPECT_TRUE(IsPaddingZero(again));
}

TEST(RecycledMemory, RefusesSizesThatCannotBe) {
    RecycledMemory memory(10);
    EXPECT_THROW(memory.Reserve(static_cast<std::size_t>(-1)), std::bad_alloc);
    EXPECT_THROW(memory.Append("x", static_cast<std::size_t>(-1) / 2), std::bad_alloc);
    EXPECT_EQ(memory.size(), 10u);
}

TEST(RecycledMemory, BlocksOfEverySizeAreNeverSharedByTwo) {
    std::vector<std::thread> threads;
    std::atomic<int> wrong{0};
    for (int t = 0; t < 4; ++t) {
        threads.emplace_back([t, &wrong] {
            std::vector<boost::shared_ptr<RecycledMemory>> held(8);
            for (std::size_t i = 0; i < 4000; ++i) {
                auto& memory = held[i * 7 % held.size()];
                const auto isOwn = [t](char inByte) { return inByte == t + 1; };
                wrong += memory && !std::all_of(memory->data(), memory->data() + memory->size(), isOwn);
                memory = RecycledMemory::Create(900 + i * 2311 % (i % 16 == 0 ? 140000 : 7000));
                std::memset(memory->data(), t + 1, memory->size());
                wrong += !IsPaddingZero(*memory);
            }
        });
    }
    for (std::thread& each : threads) {
        each.join();
    }
    EXPECT_EQ(wrong, 0);
}

}  // namespace
