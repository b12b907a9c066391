// A disk that fails under the hub: full, or broken, at each write of a request in turn.
#include <errno.h>
#include <sqlite3.h>
#include <unistd.h>

#include <array>
#include <atomic>

#include "SessionFixture.h"

namespace zohub::test {

namespace {

/// Makes SQLite's own calls of the system fail from the Nth on, as a disk would.
class Disk {
public:
    Disk() {
        mSystem = sqlite3_vfs_find(nullptr);
        for (auto& call : kCalls) {
            call.real = mSystem->xGetSystemCall(mSystem, call.name);
            if (call.real)
                mSystem->xSetSystemCall(mSystem, call.name, call.failing);
        }
    }
    ~Disk() {
        mFailure = 0;
        for (auto const& call : kCalls)
            mSystem->xSetSystemCall(mSystem, call.name, nullptr);
    }
    Disk(Disk const&) = delete;
    Disk& operator=(Disk const&) = delete;

    void FailFrom(int inNumber, int inError) {
        mLeft = inNumber;
        mFailures = 0;
        mFailure = inError;
    }
    void Mend() { mFailure = 0; }
    int Failures() const { return mFailures; }

private:
    struct Call {
        char const* name;
        sqlite3_syscall_ptr failing;
        sqlite3_syscall_ptr real;
    };
    enum { kWrite, kPwrite, kPwrite64, kFallocate };

    static bool Fails() {
        int const error = mFailure;
        if (error == 0 || --mLeft > 0)
            return false;
        ++mFailures;
        errno = error;
        return true;
    }
    template <typename Function>
    static Function Real(int inCall) {
        return reinterpret_cast<Function>(kCalls[inCall].real);
    }
    static ssize_t Write(int inFile, void const* inBytes, size_t inSize) {
        return Fails() ? -1 : Real<ssize_t (*)(int, void const*, size_t)>(kWrite)(inFile, inBytes, inSize);
    }
    template <int CallNumber>
    static ssize_t WriteAt(int inFile, void const* inBytes, size_t inSize, off_t inOffset) {
        using Function = ssize_t (*)(int, void const*, size_t, off_t);
        return Fails() ? -1 : Real<Function>(CallNumber)(inFile, inBytes, inSize, inOffset);
    }
    static int Allocate(int inFile, off_t inOffset, off_t inSize) {
        return Fails() ? errno : Real<int (*)(int, off_t, off_t)>(kFallocate)(inFile, inOffset, inSize);
    }

    static std::array<Call, 4> kCalls;
    static std::atomic<int> mFailure;
    static std::atomic<int> mLeft;
    static std::atomic<int> mFailures;
    sqlite3_vfs* mSystem;
};

std::array<Disk::Call, 4> Disk::kCalls{
    {{"write", reinterpret_cast<sqlite3_syscall_ptr>(&Disk::Write), nullptr},
     {"pwrite", reinterpret_cast<sqlite3_syscall_ptr>(&Disk::WriteAt<kPwrite>), nullptr},
     {"pwrite64", reinterpret_cast<sqlite3_syscall_ptr>(&Disk::WriteAt<kPwrite64>), nullptr},
     {"fallocate", reinterpret_cast<sqlite3_syscall_ptr>(&Disk::Allocate), nullptr}}};
std::atomic<int> Disk::mFailure{0};
std::atomic<int> Disk::mLeft{0};
std::atomic<int> Disk::mFailures{0};

}  // namespace

class DiskTest : public SessionTest {
protected:
    DiskTest() {
        mProduction = MakeSharedProduction();
        mSession = MakeSession(mAnna, mProduction);
        mTransaction = MakeTransaction(mAnna, mSession);
    }

    Answer TryToAdd(std::string const& inId, std::string const& inPayload) const {
        Json const body = {
            {"zo:assetId", inId},
            {"properties", {{"name", inId}, {"description", inPayload}, {"cdzo:assetType", "masterclip"}}}};
        return mAnna.PostJson(LinkOf(mTransaction, "/assets/asset#create"), JsonText(body));
    }

    Json mProduction;
    Json mSession;
    Json mTransaction;
};

TEST_F(DiskTest, WhatDoesNotFitIsRefusedWholeAndTheRestGoesOn) {
    Disk disk;
    std::map<std::string, std::string> answered;
    std::string const large(100000, 'x');
    int refused = 0;
    // The failing write moves on until a request needs no more writes than are left to it.
    for (int number = 1, unharmed = 0; unharmed < 3 && number < 500; ++number) {
        std::string const id = "asset" + std::to_string(number);
        disk.FailFrom(number, ENOSPC);
        Answer const answer = TryToAdd(id, large);
        EXPECT_EQ(mAnna.Get(LinkOf(mTransaction, "self")).status, 200) << "reading while the disk is full";
        unharmed = disk.Failures() == 0 ? unharmed + 1 : 0;
        disk.Mend();
        if (answer.status == 201) {
            answered[id] = id;
        } else {
            ++refused;
            EXPECT_EQ(answer.status, 507) << answer.body;
            EXPECT_EQ(ErrorCode(answer), "storage-full");
        }
        ASSERT_EQ(Names(mAnna, mTransaction), answered) << "after write " << number;
    }
    EXPECT_GT(refused, 3);
    EXPECT_GE(answered.size(), 3u);

    disk.FailFrom(1, ENOSPC);
    Answer const answer = TryCommit(mAnna, mTransaction);
    EXPECT_EQ(answer.status, 507) << answer.body;
    disk.Mend();
    Commit(mAnna, mTransaction);
    EXPECT_EQ(Push(mAnna, Load(mAnna, mSession), "shared").status, 200);
    EXPECT_EQ(Names(mAnna, Load(mAnna, mProduction)), answered);
    EXPECT_TRUE(Problems().empty()) << Problems().front();
}

TEST_F(DiskTest, ABrokenWriteIsAFaultOfTheHubAndNothingIsHalfDone) {
    Disk disk;
    std::map<std::string, std::string> answered;
    for (int number = 1, unharmed = 0; unharmed < 3 && number < 500; ++number) {
        std::string const id = "asset" + std::to_string(number);
        disk.FailFrom(number, EIO);
        Answer const answer = TryToAdd(id, "small");
        unharmed = disk.Failures() == 0 ? unharmed + 1 : 0;
        disk.Mend();
        if (answer.status == 201)
            answered[id] = id;
        else
            EXPECT_EQ(answer.status, 500) << answer.body;
        EXPECT_EQ(answer.body.find("sqlite"), std::string::npos) << answer.body;
        ASSERT_EQ(Names(mAnna, mTransaction), answered) << "after write " << number;
    }
    EXPECT_TRUE(Problems().empty()) << Problems().front();
}

}  // namespace zohub::test
