// campaign: runs many schedules of faults, several teams at a time, and tells which of them went wrong.
#include <signal.h>

#include <atomic>
#include <chrono>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <mutex>
#include <thread>

#include "Walk.h"
#include "Worker.h"

namespace campaign {

namespace {

using Clock = std::chrono::steady_clock;

constexpr const char* kUsage =
    "usage: campaign [--schedules N] [--first SEED] [--seed SEED] [--jobs N] [--batch N] [--patience "
    "SECONDS]\n"
    "                [--swaps] [--log] [--hub-faults SCRIPT]\n"
    "  --schedules N   so many, with the seeds from --first on; 500 without it\n"
    "  --seed SEED     this one alone, with the whole log of both proxies\n"
    "  --jobs N        so many teams at a time, each a hub and two users; 2 without it\n"
    "  --batch N       schedules that one team does before the next one takes over; 250 without it\n"
    "  --patience S    a call that takes longer hangs; 60 seconds without it\n"
    "  --swaps         answers may also be swapped, which no client can tell: to see what happens then\n"
    "  --hub-faults F  a script for zohub serve --faults: a hub that lies must be found out\n"
    "  --log           the whole log of both proxies for each schedule that goes wrong or leaves doubts\n";

// Caches find their size first; from then on a schedule leaves nothing behind but its names in the index of
// the payload cache. Answers of a quarter of an hour are kept by rule and do not count: both measurements are
// taken right after a new sign-in, which drops them. What counts is what is allocated: of the memory that a
// hundred thousand answers had, the heap keeps some, more or less as it happens.
constexpr std::uint64_t kWarmUp = 40;
constexpr unsigned long kMayGrow = 2ul << 20;
constexpr unsigned long kMayGrowEach = 4ul << 10;
constexpr int kMostWaits = 20;

#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
constexpr bool kMeasuresMemory = false;  // Freed memory is kept on purpose; LeakSanitizer looks instead.
#else
constexpr bool kMeasuresMemory = true;
#endif

struct Options {
    unsigned long schedules = 500;
    unsigned long first = 1;
    unsigned long jobs = 2;
    unsigned long batch = 250;
    unsigned long patience = 60;
    bool withSwaps = false;
    bool withLog = false;
    std::string hubFaults;
};

bool ReadNumber(const char* inText, unsigned long& outNumber) {
    char* end = nullptr;
    outNumber = inText ? std::strtoul(inText, &end, 10) : 0;
    return inText && end != inText && *end == '\0';
}

bool ReadOptions(int inCount, char** inWords, Options& outOptions) {
    for (int i = 1; i < inCount; ++i) {
        const std::string word = inWords[i];
        if (word == "--swaps" || word == "--log") {
            (word == "--swaps" ? outOptions.withSwaps : outOptions.withLog) = true;
            continue;
        }
        if (word == "--hub-faults" && i + 1 < inCount) {
            outOptions.hubFaults = inWords[++i];
            continue;
        }
        unsigned long number = 0;
        if (!ReadNumber(i + 1 < inCount ? inWords[++i] : nullptr, number)) {
            return false;
        }
        if (word == "--schedules") {
            outOptions.schedules = number;
        } else if (word == "--first") {
            outOptions.first = number;
        } else if (word == "--seed") {
            outOptions.first = number;
            outOptions.schedules = 1;
            outOptions.withLog = true;
        } else if (word == "--jobs") {
            outOptions.jobs = number;
        } else if (word == "--batch") {
            outOptions.batch = number;
        } else if (word == "--patience") {
            outOptions.patience = number;
        } else {
            return false;
        }
    }
    return outOptions.schedules > 0 && outOptions.jobs > 0 && outOptions.jobs <= 64 && outOptions.batch > 0;
}

/// What all teams add up to. Threads: any.
class Tally {
public:
    void Add(const Outcome& inOutcome) {
        const std::lock_guard<std::mutex> lock(mMutex);
        ++mSchedules;
        mSum.acknowledged += inOutcome.acknowledged;
        mSum.failures += inOutcome.failures;
        mSum.faults += inOutcome.faults;
        mSum.requests += inOutcome.requests;
    }
    void Problem(const std::string& inText) {
        const std::lock_guard<std::mutex> lock(mMutex);
        ++mProblems;
        std::printf("campaign: %s\n", inText.c_str());
        std::fflush(stdout);
    }
    void Growth(unsigned long inBytes, std::uint64_t inSchedules) {
        const std::lock_guard<std::mutex> lock(mMutex);
        if (inBytes >= mLargestGrowth) {
            mLargestGrowth = inBytes;
            mGrowthOver = inSchedules;
        }
    }
    int Finish(const Options& inOptions, double inSeconds) const {
        std::printf(
            "campaign: %lu schedules from seed %lu with %lu jobs in %.1f s: %u faults on %u requests, "
            "%u calls acknowledged, %u ended in doubt; what a worker holds grew by at most %lu KiB over %lu "
            "schedules; %s\n",
            mSchedules, inOptions.first, inOptions.jobs, inSeconds, mSum.faults, mSum.requests,
            mSum.acknowledged, mSum.failures, mLargestGrowth >> 10, static_cast<unsigned long>(mGrowthOver),
            mProblems == 0 ? "nothing lost, nothing twice, no hang"
                           : (std::to_string(mProblems) + " problems").c_str());
        return mProblems == 0 ? 0 : 1;
    }

private:
    std::mutex mMutex;
    unsigned long mSchedules = 0;
    unsigned long mProblems = 0;
    unsigned long mLargestGrowth = 0;
    std::uint64_t mGrowthOver = 0;
    Outcome mSum;
};

/// A directory that goes with the object.
struct TemporaryDirectory {
    TemporaryDirectory() {
        std::string pattern = (std::filesystem::temp_directory_path() / "zo-campaign-XXXXXX").string();
        path = mkdtemp(pattern.data());
    }
    ~TemporaryDirectory() {
        std::error_code ignored;
        std::filesystem::remove_all(path, ignored);
    }
    std::filesystem::path path;
};

/// One hub, two users, and the schedules of one batch.
class Team {
public:
    Team(const Setting& inSetting, Tally& ioTally, bool inWithLog, bool inIsReplay)
        : mSetting(inSetting),
          mTally(ioTally),
          mWithLog(inWithLog),
          mIsReplay(inIsReplay),
          mHub(inSetting, mDirectory.path, {"anna", "ben"}),
          mAnna(inSetting, mDirectory.path, "anna", mHub.Port()),
          mBen(inSetting, mDirectory.path, "ben", mHub.Port()) {
        Connect(mAnna);
        Connect(mBen);
    }

    /// So that a schedule that is played alone meets workers that have worked before, which ask for less: its
    /// faults go by the number of the request.
    void WarmUp(std::uint64_t inSeed) {
        try {
            Walk(inSeed, mHub, mAnna, mBen, mSetting.withSwaps).Run();
        } catch (const std::runtime_error& error) {
            mTally.Problem(std::string("the schedule before broke off: ") + error.what());
        }
    }

    void Run(std::uint64_t inSeed) {
        Walk walk(inSeed, mHub, mAnna, mBen, mSetting.withSwaps);
        try {
            walk.Run();
        } catch (const std::runtime_error& error) {
            Tell(inSeed, {std::string("the walk broke off: ") + error.what()}, {});
        } catch (const ProcessFailure& failure) {
            Tell(inSeed, {failure.what}, {});
            mAnna.Abort();
            mBen.Abort();
            throw;
        }
        Tell(inSeed, walk.Result().problems, walk.Result().doubts);
        mTally.Add(walk.Result());
        ++mDone;
        for (User* user : {&mAnna, &mBen}) {
            AfterSchedule(*user);
        }
    }

    void End() {
        for (User* user : {&mAnna, &mBen}) {
            if (kMeasuresMemory && mDone > kWarmUp) {
                CheckGrowth(*user);
            }
            const int ended = user->End();
            if (ended != 0) {
                mTally.Problem("the worker of " + user->Name() + " ended with " + std::to_string(ended));
            }
        }
        const std::string wrong = mHub.EndAndCheck();
        if (!wrong.empty()) {
            mTally.Problem(wrong);
        }
    }

private:
    void Connect(User& ioUser) {
        const Reply reply = ioUser.Connect();
        if (!reply.Succeeded()) {
            throw std::runtime_error(ioUser.Name() + " cannot sign in: " + reply.Describe());
        }
    }

    // A headless host whose sign-in was lost would end here; this one begins anew.
    void AfterSchedule(User& ioUser) {
        const json counts = ioUser.Do({{"do", "counts"}}).content;
        if (counts.at("wasEnded") == true) {
            Connect(ioUser);
        }
        if (mDone == kWarmUp) {
            mAllocated[ioUser.Name()] = AllocatedAfterSignIn(ioUser);
        }
    }

    unsigned long AllocatedAfterSignIn(User& ioUser) {
        Connect(ioUser);
        return AllocatedNow(ioUser);
    }
    static unsigned long AllocatedNow(User& ioUser) {
        return ioUser.Do({{"do", "counts"}}).content.at("allocated");
    }

    /// What a server held that was left behind, other threads of the worker let go a moment later.
    void CheckGrowth(User& ioUser) {
        const unsigned long before = mAllocated[ioUser.Name()];
        const unsigned long bound = before + kMayGrow + kMayGrowEach * (mDone - kWarmUp);
        unsigned long now = AllocatedAfterSignIn(ioUser);
        for (int wait = 0; now > bound && wait < kMostWaits; ++wait) {
            std::this_thread::sleep_for(std::chrono::milliseconds(500));
            now = AllocatedNow(ioUser);
        }
        const unsigned long growth = now > before ? now - before : 0;
        mTally.Growth(growth, mDone - kWarmUp);
        if (now > bound) {
            mTally.Problem("what the worker of " + ioUser.Name() + " holds grew by " +
                           std::to_string(growth >> 10) + " KiB over " + std::to_string(mDone - kWarmUp) +
                           " schedules");
        }
    }

    void Tell(std::uint64_t inSeed, const std::vector<std::string>& inProblems,
              const std::vector<std::string>& inDoubts) {
        if (inProblems.empty() && !(mWithLog && !inDoubts.empty()) && !mIsReplay) {
            return;
        }
        for (const std::string& problem : inProblems) {
            mTally.Problem("seed " + std::to_string(inSeed) + ": " + problem);
        }
        for (const std::string& doubt : inDoubts) {
            std::printf("  in doubt: %s\n", doubt.c_str());
        }
        for (User* user : {&mAnna, &mBen}) {
            std::printf("  what %s's requests met:\n%s", user->Name().c_str(),
                        user->Proxy().LogText(mWithLog).c_str());
        }
        std::printf("  again: campaign --seed %lu\n", static_cast<unsigned long>(inSeed));
        std::fflush(stdout);
    }

    const Setting& mSetting;
    Tally& mTally;
    const bool mWithLog;
    const bool mIsReplay;
    const TemporaryDirectory mDirectory;
    RunningHub mHub;
    User mAnna;
    User mBen;
    std::uint64_t mDone = 0;
    std::map<std::string, unsigned long> mAllocated;
};

/// Does batches until all schedules are done.
void RunJob(const Options& inOptions, const Setting& inSetting, std::atomic<std::uint64_t>& ioNext,
            Tally& ioTally) {
    const std::uint64_t end = inOptions.first + inOptions.schedules;
    std::unique_ptr<Team> team;
    std::uint64_t left = 0;
    for (std::uint64_t seed = ioNext++; seed < end; seed = ioNext++) {
        try {
            if (left == 0) {
                if (team) {
                    team->End();
                }
                team =
                    std::make_unique<Team>(inSetting, ioTally, inOptions.withLog, inOptions.schedules == 1);
                left = inOptions.batch;
            }
            --left;
            if (inOptions.schedules == 1) {
                team->WarmUp(seed - 1);
            }
            team->Run(seed);
        } catch (const ProcessFailure&) {
            // Told already. The next schedule begins with a fresh team.
            team.reset();
            left = 0;
        }
    }
    if (team) {
        team->End();
    }
}

int RunCampaign(const Options& inOptions) {
    signal(SIGPIPE, SIG_IGN);
    Setting setting;
    setting.hubProgram = ZO_HUB_PROGRAM;
    setting.ownProgram = std::filesystem::read_symlink("/proc/self/exe").string();
    setting.patience = std::chrono::seconds(inOptions.patience);
    setting.withSwaps = inOptions.withSwaps;
    setting.hubFaults = inOptions.hubFaults;
    const Clock::time_point begin = Clock::now();
    Tally tally;
    std::atomic<std::uint64_t> next{inOptions.first};
    std::vector<std::thread> jobs;
    for (unsigned long job = 0; job < inOptions.jobs; ++job) {
        jobs.emplace_back([&] {
            try {
                RunJob(inOptions, setting, next, tally);
            } catch (const ProcessFailure& failure) {
                tally.Problem(failure.what);
            } catch (const std::exception& error) {
                tally.Problem(error.what());
            }
        });
    }
    for (std::thread& job : jobs) {
        job.join();
    }
    return tally.Finish(inOptions, std::chrono::duration<double>(Clock::now() - begin).count());
}

}  // namespace
}  // namespace campaign

int main(int inCount, char** inWords) {
    if (inCount == 2 && std::strcmp(inWords[1], "--worker") == 0) {
        return campaign::RunWorker();
    }
    campaign::Options options;
    if (!campaign::ReadOptions(inCount, inWords, options)) {
        std::fputs(campaign::kUsage, stderr);
        return 2;
    }
    return campaign::RunCampaign(options);
}
