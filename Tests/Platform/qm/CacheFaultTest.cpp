// Calls to the system that fail, each in turn, once and for good: the cache loses, and never lies.
#include "CacheFixture.h"

#include <fcntl.h>
#include <cerrno>

namespace {

using namespace QM;
using testing::IsEmpty;
using testing::SizeIs;

/// Fails one call, or that and all after it, with an error.
class FailingOperations : public detail::FileOperations {
public:
    void Arm(int inCall, bool inForGood, int inError) {
        mIsForGood = inForGood;
        mError = inError;
        mCountdown = inCall;
    }
    void Disarm() { mCountdown = -1; }
    /// How many calls were made since the construction.
    int Calls() const { return mCalls; }
    bool HasFailed() const { return mHasFailed; }

    int OpenAt(int inDirectory, const char* inPath, int inFlags, mode_t inMode) override {
        return Fails() ? -1 : FileOperations::OpenAt(inDirectory, inPath, inFlags, inMode);
    }
    int OpenBeneath(int inDirectory, const char* inPath, int inFlags) override {
        return Fails() ? -1 : FileOperations::OpenBeneath(inDirectory, inPath, inFlags);
    }
    /// A descriptor is gone whatever close says.
    int Close(int inFile) override {
        const int result = FileOperations::Close(inFile);
        return Fails() ? -1 : result;
    }
    int FStat(int inFile, struct stat& outStatus) override {
        return Fails() ? -1 : FileOperations::FStat(inFile, outStatus);
    }
    int StatAt(int inDirectory, const char* inName, struct stat& outStatus) override {
        return Fails() ? -1 : FileOperations::StatAt(inDirectory, inName, outStatus);
    }
    int MkDirAt(int inDirectory, const char* inName, mode_t inMode) override {
        return Fails() ? -1 : FileOperations::MkDirAt(inDirectory, inName, inMode);
    }
    ssize_t ReadV(int inFile, const iovec* inParts, int inCount) override {
        return Fails() ? -1 : FileOperations::ReadV(inFile, inParts, inCount);
    }
    ssize_t WriteV(int inFile, const iovec* inParts, int inCount) override {
        return Fails() ? -1 : FileOperations::WriteV(inFile, inParts, inCount);
    }
    int RenameAt(int inDirectory, const char* inFrom, const char* inTo) override {
        return Fails() ? -1 : FileOperations::RenameAt(inDirectory, inFrom, inTo);
    }
    int UnlinkAt(int inDirectory, const char* inName) override {
        return Fails() ? -1 : FileOperations::UnlinkAt(inDirectory, inName);
    }
    int Touch(int inFile) override { return Fails() ? -1 : FileOperations::Touch(inFile); }
    DIR* OpenDirectory(int inFile) override {
        if (Fails()) {
            const int error = errno;
            FileOperations::Close(inFile);
            errno = error;
            return nullptr;
        }
        return FileOperations::OpenDirectory(inFile);
    }
    const dirent* ReadDirectory(DIR* inDirectory) override {
        return Fails() ? nullptr : FileOperations::ReadDirectory(inDirectory);
    }

private:
    bool Fails() {
        ++mCalls;
        const int left = mCountdown.load();
        if (left < 0 || (left > 0 && --mCountdown > 0)) {
            return false;
        }
        mCountdown = mIsForGood ? 0 : -1;
        mHasFailed = true;
        errno = mError;
        return true;
    }

    std::atomic<int> mCountdown{-1};
    std::atomic<bool> mIsForGood{false};
    std::atomic<int> mError{EIO};
    std::atomic<int> mCalls{0};
    std::atomic<bool> mHasFailed{false};
};

class CacheFaults : public CacheFixture {
protected:
    /// Two payloads that were there, two that are written, reads of all, at the bound.
    void Walk() {
        cache->SetMaxFileCount(3);
        Write(3);
        for (int number = 1; number <= 4; ++number) {
            Has(number);
        }
        Write(4);
        cache->ListNames(KeyOf(4));
        Has(4);
    }
    void StartWithTwo() {
        Close();
        std::filesystem::remove_all(mPath);
        Open();
        EXPECT_TRUE(Write(1));
        EXPECT_TRUE(Write(2));
        Close();
    }
};

TEST_F(CacheFaults, NeverGiveOutWhatWasNotStoredAndEndWithTheFault) {
    const auto counting = boost::make_shared<FailingOperations>();
    StartWithTwo();
    Open(counting);
    const int opened = counting->Calls();
    Walk();
    const int calls = counting->Calls() - opened;
    ASSERT_GT(calls, 256) << "the walk looks at the whole directory";
    int failed = 0;
    const int errors[] = {EIO, ENOSPC, EMFILE, EROFS};
    for (const bool isForGood : {false, true}) {
        // The look at 256 directories is the same call over and over; two of three are left out there.
        for (int call = 1; call <= calls + 10; call += call > 20 && call < calls - 60 ? 3 : 1) {
            StartWithTwo();
            const auto operations = boost::make_shared<FailingOperations>();
            Open(operations);
            operations->Arm(call, isForGood, errors[call % 4]);
            Walk();
            EXPECT_LE(CountReadableFiles(), 3u) << "call " << call << ", for good: " << isForGood;
            failed += operations->HasFailed() ? 1 : 0;
            operations->Disarm();
            cache->SetMaxFileCount(100);
            EXPECT_TRUE(Write(5)) << "call " << call << " was the last to fail";
            EXPECT_TRUE(Has(5));
            Open();
            EXPECT_TRUE(Write(6));
            EXPECT_EQ(cache->GetFileCount(), CountReadableFiles()) << "call " << call;
            for (int number = 1; number <= 6; ++number) {
                Has(number);
            }
        }
    }
    EXPECT_GT(failed, 200);
}

/// A disk with so many bytes of room, as the system shows it: a write is cut short, the next one refused.
class SmallDisk : public detail::FileOperations {
public:
    ssize_t WriteV(int inFile, const iovec* inParts, int inCount) override {
        const std::size_t size = std::min<std::size_t>(inParts[inCount - 1].iov_len, mRoom);
        if (size == 0) {
            errno = ENOSPC;
            return -1;
        }
        const iovec part{inParts[inCount > 1 ? 0 : inCount - 1].iov_base,
                         inCount > 1 ? inParts[0].iov_len : size};
        const ssize_t written = FileOperations::WriteV(inFile, &part, 1);
        mRoom -= std::min<std::size_t>(static_cast<std::size_t>(std::max<ssize_t>(written, 0)), mRoom);
        return written;
    }
    std::atomic<std::size_t> mRoom{0};
};

TEST_F(CacheFaults, AFullDiskLeavesNothingHalf) {
    const auto disk = boost::make_shared<SmallDisk>();
    disk->mRoom = 100000;
    Open(disk);
    EXPECT_TRUE(Write(1));
    EXPECT_TRUE(Has(1));
    Write(8);
    EXPECT_FALSE(Has(8));
    EXPECT_THAT(Files(), SizeIs(1)) << "the part that was written takes no room";
    disk->mRoom = 1 << 20;
    Write(8);
    EXPECT_TRUE(Has(8));
}

/// Moves one byte at a time.
class SlowOperations : public detail::FileOperations {
public:
    ssize_t ReadV(int inFile, const iovec* inParts, int) override {
        const iovec one{inParts->iov_base, std::min<std::size_t>(inParts->iov_len, 1)};
        return FileOperations::ReadV(inFile, &one, 1);
    }
    ssize_t WriteV(int inFile, const iovec* inParts, int) override {
        if (++mCalls % 3 == 0) {
            errno = EINTR;
            return -1;
        }
        const iovec one{inParts->iov_base, std::min<std::size_t>(inParts->iov_len, 1)};
        return FileOperations::WriteV(inFile, &one, 1);
    }

private:
    int mCalls = 0;
};

TEST_F(CacheFaults, PiecesAndInterruptionsMakeAWhole) {
    Open(boost::make_shared<SlowOperations>());
    EXPECT_TRUE(Write(1));
    EXPECT_TRUE(Has(1));
    Open();
    EXPECT_TRUE(Has(1));
}

TEST_F(CacheFaults, WhatIsReadAndGoneAtTheSameTimeIsAMiss) {
    Open();
    EXPECT_TRUE(Write(1));
    std::filesystem::remove_all(std::filesystem::path(Files().front()).parent_path());
    EXPECT_FALSE(Has(1)) << "somebody emptied the cache";
    EXPECT_THAT(cache->ListNames(KeyOf(1)), IsEmpty());
    EXPECT_TRUE(Write(1));
    EXPECT_TRUE(Has(1));
}

}  // namespace
