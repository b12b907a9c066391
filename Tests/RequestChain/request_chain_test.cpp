// The chain as a whole: its order, a storm of failures, and cancels in every state that a request can be in.
#include <atomic>
#include <cstdlib>
#include <mutex>
#include <random>
#include <thread>

#include "ChainSupport.h"
#include "RequestChain/RequestChain.h"

namespace ZOCL {
namespace {

using ostnet::Response;
using ZOClientTesting::ScopedProcessor;

TEST(RequestChain, AStormOfFailuresKeepsTheLoadBoundedAndLosesNothing) {
    constexpr int kRequests = 10000;
    const auto time = boost::make_shared<VirtualScheduler>();
    const ScopedGlobalScheduler scope(time);
    const ScopedProcessor net(0);
    const RequestChain chain = BuildRequestChain({}, ImmutableString("login-token=t;"));
    chain.recoverableError->SetRetriesEnabled(true);
    std::size_t most = 0;
    net->SetHandler([&](const RecordedRequest&) {
        most = std::max(most, net->PendingCount());
        return ScriptedAnswer::Status(503);
    });
    int succeeded = 0;
    int completed = 0;
    for (int i = 0; i < kRequests; ++i) {
        ASSERT_TRUE(chain.common->GET(Guid::CreateUnique(),
                                      [&](const Guid&, const shared_ptr<Response>& inResponse) {
                                          ++completed;
                                          succeeded += inResponse && inResponse->status == 200 ? 1 : 0;
                                      },
                                      URLOf("/" + std::to_string(i)), {}, {}));
    }
    const auto pass = [&](int inMilliseconds) {
        for (int i = 0; i < inMilliseconds; i += 4) {
            net->DeliverAll();
            time->Advance(milliseconds(4));
        }
        net->DeliverAll();
    };
    pass(20000);
    EXPECT_LE(most, 50u);
    // Each of 50: seven retries within half a second, then one every 512 milliseconds.
    EXPECT_LE(net->RequestCount(), 50u * (8 + 20000 / 512 + 1));
    EXPECT_EQ(completed, 0) << "they wait for the network";
    net->SetHandler([](const RecordedRequest&) { return ScriptedAnswer::Status(200); });
    pass(1000);
    EXPECT_EQ(completed, kRequests);
    EXPECT_EQ(succeeded, kRequests);
    EXPECT_EQ(chain.readThrottle->GetLoad().inFlight, 0);
}

/// A network of moods, requests from two threads, cancels from three, and time that jumps.
class Turmoil {
public:
    explicit Turmoil(std::uint64_t inSeed) : mSeed(inSeed) {
        ChainCallbacks callbacks;
        callbacks.tokenNotification = [this] { OnTokenRefused(); };
        mChain = BuildRequestChain(callbacks, ImmutableString("login-token=0;"));
        mChain.recoverableError->SetRetriesEnabled(true);
        mNet->SetHandler([this](const RecordedRequest&) { return Mood(); });
    }
    ~Turmoil() { mNet->Shutdown(); }

    void Run() {
        std::thread first([this] { Ask(1); });
        std::thread second([this] { Ask(2); });
        std::mt19937_64 random(mSeed);
        while (mAsking > 0) {
            if (random() % 3 == 0) {
                mNet->ReleaseHeld(ScriptedAnswer::Status(random() % 2 == 0 ? 200 : 503));
            }
            CancelOne(random);
            mTime->Advance(milliseconds(random() % 64));
            CheckInvariants();
        }
        first.join();
        second.join();
        Settle();
    }

private:
    struct Asked {
        Guid id;
        std::atomic<int> calls{0};
        std::atomic<bool> isStarted{false};
    };

    std::uint64_t Draw() {
        std::mt19937_64 random(mSeed * 1000003 + ++mDraws);
        return random();
    }
    ScriptedAnswer Mood() {
        switch (Draw() % 16) {
            case 0:
                return ScriptedAnswer::FailStart();
            case 1:
                return ScriptedAnswer::Status(401);
            case 2:
            case 3:
                return ScriptedAnswer::Status(503);
            case 4:
                return ScriptedAnswer::NoResponse();
            case 5:
                return ScriptedAnswer::NullResponse();
            case 6:
            case 7:
                return ScriptedAnswer::Status(200).With("ETag", "\"1\"");
            default:
                return ScriptedAnswer::Hold();
        }
    }
    void OnTokenRefused() {
        mNet->PostFunction(
            [this] {
                mChain.authorization->SetAuthToken(
                    ImmutableString("login-token=" + std::to_string(++mTokens) + ";"));
            },
            0);
    }
    void Ask(std::uint64_t inThread) {
        std::mt19937_64 random(mSeed * 31 + inThread);
        // Some seeds read, others write, so that each throttle has its line.
        const std::uint64_t reads = random() % 10;
        for (int i = 0; i < 80; ++i) {
            const auto asked = boost::make_shared<Asked>();
            asked->id = Guid::CreateUnique();
            {
                const std::lock_guard<std::mutex> lock(mMutex);
                mAsked.push_back(asked);
            }
            asked->isStarted = Start(asked, random() % 10 < reads, random);
            if (random() % 4 == 0) {
                CancelOne(random);
            }
        }
        --mAsking;
    }
    bool Start(const shared_ptr<Asked>& inAsked, bool inReads, std::mt19937_64& ioRandom) {
        const auto note = [inAsked](const Guid&, const shared_ptr<Response>&) { ++inAsked->calls; };
        const ImmutableString url = URLOf("/" + std::to_string(ioRandom() % 90));
        if (inReads) {
            return mChain.common->GET(inAsked->id, note, url, {}, {});
        }
        switch (ioRandom() % 3) {
            case 0:
                return mChain.common->DELETE(inAsked->id, note, url, {}, {});
            case 1:
                return mChain.upload->PUT(inAsked->id, note, url, {}, RecycledMemory::CreateFromBytes("body"),
                                          {});
            default:
                return mChain.upload->POST(inAsked->id, note, url, {}, Large(), {});
        }
    }
    static shared_ptr<RecycledMemory const> Large() {
        static const auto large = RecycledMemory::CreateFromBytes(std::string(70000, 'x'));
        return large;
    }
    void CancelOne(std::mt19937_64& ioRandom) {
        Guid id;
        {
            const std::lock_guard<std::mutex> lock(mMutex);
            if (mAsked.empty()) {
                return;
            }
            id = mAsked[ioRandom() % mAsked.size()]->id;
        }
        mChain.upload->TryToCancelRequest(id);
    }
    void CheckInvariants() {
        for (const ThrottlingProcessor* const throttle :
             {static_cast<ThrottlingProcessor*>(mChain.readThrottle.get()),
              static_cast<ThrottlingProcessor*>(mChain.writeThrottle.get())}) {
            const auto load = throttle->GetLoad();
            ASSERT_LE(load.inFlight, throttle->Limit());
            ASSERT_TRUE(load.waiting == 0 || load.inFlight == throttle->Limit());
        }
    }
    bool IsOver() {
        const std::lock_guard<std::mutex> lock(mMutex);
        for (const auto& asked : mAsked) {
            if (asked->isStarted && asked->calls == 0) {
                return false;
            }
        }
        return true;
    }
    bool IsIdle() {
        return mChain.readThrottle->GetLoad().inFlight == 0 &&
               mChain.writeThrottle->GetLoad().inFlight == 0 && mNet->PendingCount() == 0;
    }
    /// From now on all is well; everything must come to its end, and every slot back.
    void Settle() {
        mNet->SetHandler([](const RecordedRequest&) { return ScriptedAnswer::Status(200); });
        // A read whose callers have all cancelled can still be out, or wait for its retry.
        for (int i = 0; i < 1000 && !(IsOver() && IsIdle()); ++i) {
            mNet->ReleaseHeld(ScriptedAnswer::Status(200));
            EXPECT_TRUE(mNet->WaitUntilIdle());
            mTime->AdvanceToNext();
        }
        EXPECT_TRUE(mNet->WaitUntilIdle());
        for (const auto& asked : mAsked) {
            EXPECT_EQ(asked->calls, asked->isStarted ? 1 : 0);
        }
        EXPECT_TRUE(IsIdle()) << "slots are lost";
        EXPECT_EQ(mChain.readThrottle->GetLoad().waiting, 0u);
        EXPECT_EQ(mChain.writeThrottle->GetLoad().waiting, 0u);
        ostcore::threads::WaitForExecutors(20000);
    }

    const std::uint64_t mSeed;
    std::atomic<std::uint64_t> mDraws{0};
    std::atomic<int> mTokens{0};
    std::atomic<int> mAsking{2};
    shared_ptr<VirtualScheduler> mTime = boost::make_shared<VirtualScheduler>();
    ScopedGlobalScheduler mScope{mTime};
    ScopedProcessor mNet{2};
    RequestChain mChain;
    std::mutex mMutex;
    std::vector<shared_ptr<Asked>> mAsked;
};

TEST(RequestChain, CancelsInEveryStateCompleteOnceAndGiveTheSlotsBack) {
    const char* const wanted = std::getenv("ZOCLIENT_TEST_CANCEL_SEEDS");
    const std::uint64_t seeds = wanted ? std::strtoull(wanted, nullptr, 10) : 100;
    for (std::uint64_t seed = 1; seed <= seeds && !testing::Test::HasFailure(); ++seed) {
        SCOPED_TRACE("seed " + std::to_string(seed));
        Turmoil(seed).Run();
    }
}

}  // namespace
}  // namespace ZOCL
