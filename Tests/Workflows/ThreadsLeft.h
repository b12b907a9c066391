// Looks at the end of a test program whether the threads that it used have gone.
#pragma once

#include <algorithm>
#include <chrono>
#include <filesystem>
#include <thread>

#include <gtest/gtest.h>

namespace ZOCL {

/// What stays as long as the process is the set of threads for computing and the one of the scheduler; those
/// for work that blocks idle for some seconds before they go, as does whatever they have left.
class ThreadsLeft : public testing::Environment {
public:
    void SetUp() override { mAtStart = Count(); }
    void TearDown() override {
        std::size_t kept = std::max<std::size_t>(2, std::thread::hardware_concurrency()) + 1;
#if defined(__SANITIZE_THREAD__)
        ++kept;  // the sanitizer's own, which begins with the first other thread
#endif
        const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(60);
        while (Count() > mAtStart + kept && std::chrono::steady_clock::now() < deadline) {
            std::this_thread::sleep_for(std::chrono::milliseconds(50));
        }
        EXPECT_LE(Count(), mAtStart + kept) << "threads are left";
    }

private:
    static std::size_t Count() {
        namespace fs = std::filesystem;
        return static_cast<std::size_t>(
            std::distance(fs::directory_iterator("/proc/self/task"), fs::directory_iterator()));
    }
    std::size_t mAtStart = 0;
};

}  // namespace ZOCL
