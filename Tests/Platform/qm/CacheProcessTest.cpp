// Several processes on one cache directory, and processes that are killed while they write.
#include "CacheFixture.h"

#include <csignal>
#include <cstdlib>
#include <memory>
#include <thread>

#include "../rfl/Process.h"
#include "CacheWorker.h"

namespace {

using namespace QM;

int SizeOfRun(const char* inVariable, int inDefault) {
    const char* const value = std::getenv(inVariable);
    return value ? std::atoi(value) : inDefault;
}

class CacheProcesses : public CacheFixture {
protected:
    std::unique_ptr<Process> Start(int inCap, int inFirst, int inCount, int inFactor = 1) const {
        return std::make_unique<Process>(
            std::vector<std::string>{kCacheWorkerFlag, mPath, std::to_string(inCap), std::to_string(inFirst),
                                     std::to_string(inCount), std::to_string(inFactor)});
    }
};

/// Multiples of this number have the large payloads, which take long to write.
constexpr int kLargeOnes = 8;

TEST_F(CacheProcesses, ThatAreKilledWhileTheyWriteLeaveNoTornFile) {
    std::mt19937 random(20160401);
    int first = 0;
    int halves = 0;
    for (int round = SizeOfRun("ZOCLIENT_TEST_CACHE_KILLS", 25); round > 0; --round) {
        const auto writer = Start(100000, first, 0, kLargeOnes);
        std::string line;
        for (int lines = std::uniform_int_distribution<int>(1, 5)(random); lines > 0; --lines) {
            ASSERT_TRUE(writer->ReadLine(line));
        }
        // At any point of a write: the kill comes so many microseconds after a payload was written.
        const auto end = std::chrono::steady_clock::now() +
                         std::chrono::microseconds(std::uniform_int_distribution<int>(0, 3000)(random));
        while (std::chrono::steady_clock::now() < end) {
        }
        writer->Signal(SIGKILL);
        EXPECT_EQ(writer->Wait(), 128 + SIGKILL);
        while (writer->ReadLine(line)) {
        }
        const int last = std::stoi(line);
        Open();
        for (int number = first; number <= last; ++number) {
            EXPECT_TRUE(Has(number * kLargeOnes)) << number << " was written and is lost";
        }
        for (int number = last + 1; number <= last + 16; ++number) {
            Has(number * kLargeOnes);
        }
        for (const std::string& file : Files()) {
            halves += IsAside(file) ? 1 : 0;
        }
        // Every file under a name of the cache is whole: none was dropped as damaged by the reads above.
        EXPECT_GE(CountReadableFiles(), static_cast<std::size_t>(last - first + 1));
        Close();
        std::filesystem::remove_all(mPath);
        first = last + 1;
    }
    RecordProperty("left half-written under a name that nobody reads", halves);
    std::printf("%d files were left half-written, none of them under a name that is read\n", halves);
}

TEST_F(CacheProcesses, ShareOneDirectory) {
    constexpr int kEach = 150;
    std::vector<std::unique_ptr<Process>> writers;
    for (int writer = 0; writer < 3; ++writer) {
        // The third writes what the first writes.
        writers.push_back(Start(100000, writer % 2 * 1000, kEach));
    }
    Open();
    for (int number = 0; number < kEach; ++number) {
        Has(number);
        Has(1000 + number);
    }
    for (const auto& writer : writers) {
        EXPECT_EQ(writer->Wait(), 0);
    }
    for (int number = 0; number < kEach; ++number) {
        EXPECT_TRUE(Has(number)) << "written by another process after this one had opened the directory";
        EXPECT_TRUE(Has(1000 + number));
    }
    EXPECT_EQ(Files().size(), 2u * kEach);
}

TEST_F(CacheProcesses, ComeDownToTheBoundOfTheDirectory) {
    constexpr int kCap = 100;
    std::vector<std::unique_ptr<Process>> writers;
    for (int writer = 0; writer < 3; ++writer) {
        writers.push_back(Start(kCap, writer * 1000, 300));
    }
    for (const auto& writer : writers) {
        EXPECT_EQ(writer->Wait(), 0);
    }
    // Each knew its own files, and those of the others as of its last look.
    EXPECT_LE(Files().size(), static_cast<std::size_t>(3 * kCap));
    Open();
    cache->SetMaxFileCount(kCap);
    EXPECT_TRUE(Write(5000));
    EXPECT_EQ(Files().size(), static_cast<std::size_t>(kCap));
    EXPECT_TRUE(Has(5000));
}

}  // namespace
