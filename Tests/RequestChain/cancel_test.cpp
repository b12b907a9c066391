// Cancels through the whole chain over a scripted network: none is lost in whatever state it finds its
// request, and what was cancelled neither stays at the network nor comes back to it.
#include <algorithm>
#include <atomic>
#include <cstdlib>
#include <mutex>
#include <random>
#include <set>
#include <thread>

#include "ChainSupport.h"
#include "RequestChain/RequestChain.h"

namespace ZOCL {
namespace {

using ostnet::Response;
using testing::ElementsAre;
using ZOClientTesting::ScopedProcessor;

constexpr int kNull = -100;
constexpr int kStartFailed = -101;

/// A request of the host and how it went.
struct Asked {
    Guid id;
    bool isRead = false;
    ImmutableString url;
    std::atomic<int> calls{0};
    std::atomic<int> status{0};
    std::atomic<bool> isStarted{false};
    std::atomic<bool> isCancelAsked{false};
    /// The cancel came after the start had returned: from then on it must find the request.
    std::atomic<bool> isCancelBinding{false};
};
using AskedRef = shared_ptr<Asked>;

/// All requests, and what the network said of each: of a write by its ID, of a read by its URL, since the
/// cache makes one of many under an ID of its own.
class Ledger {
public:
    void Add(const AskedRef& inAsked) {
        const std::lock_guard<std::mutex> lock(mMutex);
        mAll.push_back(inAsked);
        mByID[inAsked->id] = inAsked;
    }
    /// One of all, or one of the newest.
    AskedRef Pick(std::mt19937_64& ioRandom) const {
        const std::lock_guard<std::mutex> lock(mMutex);
        if (mAll.empty()) {
            return nullptr;
        }
        const std::size_t span = ioRandom() % 2 == 0 ? mAll.size() : std::min<std::size_t>(mAll.size(), 6);
        return mAll[mAll.size() - 1 - ioRandom() % span];
    }
    std::vector<AskedRef> All() const {
        const std::lock_guard<std::mutex> lock(mMutex);
        return mAll;
    }
    void NoteAnswers(const RecordedRequest& inRequest, std::initializer_list<int> inStatuses) {
        const std::lock_guard<std::mutex> lock(mMutex);
        const auto write = mByID.find(inRequest.requestID);
        mReturned += write != mByID.end() && write->second->calls > 0 ? 1 : 0;
        auto& said = write != mByID.end() ? mOfWrites[inRequest.requestID] : mOfReads[inRequest.url];
        said.insert(inStatuses.begin(), inStatuses.end());
    }
    /// A cancel that was asked for, or something that the network said.
    void ExpectHonestEnd(const Asked& inAsked) const {
        const std::lock_guard<std::mutex> lock(mMutex);
        const auto said = Find(inAsked);
        const int status = inAsked.status;
        const bool isCancel = inAsked.isCancelAsked && status == Response::kStatusCancelled;
        const bool isFailedStart = said.count(kStartFailed) > 0 && (status == Response::kStatusCancelled ||
                                                                    status == Response::kStatusNoResponse);
        EXPECT_TRUE(isCancel || isFailedStart || said.count(status) > 0) << "ended with " << status;
    }
    int Returned() const {
        const std::lock_guard<std::mutex> lock(mMutex);
        return mReturned;
    }

private:
    std::set<int> Find(const Asked& inAsked) const {
        const auto read = mOfReads.find(inAsked.url.str());
        const auto write = mOfWrites.find(inAsked.id);
        if (inAsked.isRead) {
            return read == mOfReads.end() ? std::set<int>() : read->second;
        }
        return write == mOfWrites.end() ? std::set<int>() : write->second;
    }

    mutable std::mutex mMutex;
    std::vector<AskedRef> mAll;
    std::map<Guid, AskedRef> mByID;
    std::map<Guid, std::set<int>> mOfWrites;
    std::map<std::string, std::set<int>> mOfReads;
    /// Writes that reached the network when they had ended.
    int mReturned = 0;
};

/// A network of moods, requests from two threads, cancels from three, and time that jumps.
class Turmoil {
public:
    explicit Turmoil(std::uint64_t inSeed) : mSeed(inSeed) {
        ChainCallbacks callbacks;
        callbacks.tokenNotification = [this] { OnTokenRefused(); };
        mChain = BuildRequestChain(callbacks, ImmutableString("login-token=0;"));
        mChain.recoverableError->SetRetriesEnabled(true);
        mNet->SetHandler([this](const RecordedRequest& inRequest) { return Mood(inRequest); });
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
        ExpectCancelsFound();
        if (mSeed % 2 == 0) {
            CancelAll();
        }
        Settle();
        for (const AskedRef& asked : mLedger.All()) {
            EXPECT_EQ(asked->calls, asked->isStarted ? 1 : 0);
            if (asked->calls > 0) {
                mLedger.ExpectHonestEnd(*asked);
            }
        }
        EXPECT_EQ(mLedger.Returned(), 0) << "a request came to the network after its end";
        ostcore::threads::WaitForExecutors(20000);
    }

private:
    std::uint64_t Draw() {
        std::mt19937_64 random(mSeed * 1000003 + ++mDraws);
        return random();
    }
    ScriptedAnswer Mood(const RecordedRequest& inRequest) {
        // Without starts that fail, nothing but a cancel can end a request with the status of one.
        const bool startsFail = mSeed % 4 < 2;
        const auto say = [&](int inStatus, ScriptedAnswer inAnswer) {
            mLedger.NoteAnswers(inRequest, {inStatus});
            return inAnswer;
        };
        switch (Draw() % 16) {
            case 0:
                return startsFail ? say(kStartFailed, ScriptedAnswer::FailStart())
                                  : say(412, ScriptedAnswer::Status(412));
            case 1:
                return say(401, ScriptedAnswer::Status(401));
            case 2:
            case 3:
                return say(503, ScriptedAnswer::Status(503));
            case 4:
                return say(0, ScriptedAnswer::NoResponse());
            case 5:
                return say(kNull, ScriptedAnswer::NullResponse());
            case 6:
            case 7:
                return say(200, ScriptedAnswer::Status(200).With("ETag", "\"1\""));
            default:
                mLedger.NoteAnswers(inRequest, {200, 503});
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
        const std::uint64_t reads = random() % 11;
        for (int i = 0; i < 80; ++i) {
            const auto asked = boost::make_shared<Asked>();
            asked->id = Guid::CreateUnique();
            asked->isRead = random() % 10 < reads;
            asked->url = URLOf("/" + std::to_string(random() % 90));
            mLedger.Add(asked);
            asked->isStarted = Start(asked, random);
            if (random() % 4 == 0) {
                CancelOne(random);
            }
        }
        --mAsking;
    }
    bool Start(const AskedRef& inAsked, std::mt19937_64& ioRandom) {
        const auto note = [inAsked](const Guid&, const shared_ptr<Response>& inResponse) {
            inAsked->status = inResponse ? inResponse->status : kNull;
            ++inAsked->calls;
        };
        if (inAsked->isRead) {
            return mChain.common->GET(inAsked->id, note, inAsked->url, {}, {});
        }
        switch (ioRandom() % 3) {
            case 0:
                return mChain.common->DELETE(inAsked->id, note, inAsked->url, {}, {});
            case 1:
                return mChain.upload->PUT(inAsked->id, note, inAsked->url, {},
                                          RecycledMemory::CreateFromBytes("body"), {});
            default:
                return mChain.upload->POST(inAsked->id, note, inAsked->url, {}, Large(), {});
        }
    }
    static shared_ptr<RecycledMemory const> Large() {
        static const auto large = RecycledMemory::CreateFromBytes(std::string(70000, 'x'));
        return large;
    }
    void Cancel(Asked& ioAsked) {
        const bool binds = ioAsked.isStarted;
        ioAsked.isCancelAsked = true;
        mChain.upload->TryToCancelRequest(ioAsked.id);
        if (binds) {
            ioAsked.isCancelBinding = true;
        }
    }
    void CancelOne(std::mt19937_64& ioRandom) {
        if (const AskedRef asked = mLedger.Pick(ioRandom)) {
            Cancel(*asked);
        }
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
    /// Time stands still and the network says nothing more: what is to end now ends by its cancel alone.
    void ExpectCancelsFound() {
        EXPECT_TRUE(mNet->WaitUntilIdle());
        for (const AskedRef& asked : mLedger.All()) {
            EXPECT_TRUE(asked->calls == 1 || !asked->isCancelBinding) << "a cancel was lost";
        }
    }
    void CancelAll() {
        for (const AskedRef& asked : mLedger.All()) {
            Cancel(*asked);
        }
        ExpectCancelsFound();
        EXPECT_TRUE(IsIdle()) << "a cancelled request is still at the network, or holds a slot";
        const std::size_t requests = mNet->RequestCount();
        for (int i = 0; i < 1000 && mTime->AdvanceToNext() > 0; ++i) {
            EXPECT_TRUE(mNet->WaitUntilIdle());
        }
        EXPECT_EQ(mNet->RequestCount(), requests) << "a cancelled request was sent again";
    }
    bool IsOver() {
        const auto all = mLedger.All();
        return std::all_of(all.begin(), all.end(),
                           [](const AskedRef& inAsked) { return !inAsked->isStarted || inAsked->calls > 0; });
    }
    bool IsIdle() {
        for (const auto& load : {mChain.readThrottle->GetLoad(), mChain.writeThrottle->GetLoad()}) {
            if (load.inFlight != 0 || load.waiting != 0) {
                return false;
            }
        }
        return mNet->PendingCount() == 0;
    }
    /// From now on all is well; everything must come to its end, and every slot back.
    void Settle() {
        mNet->SetHandler([this](const RecordedRequest& inRequest) {
            mLedger.NoteAnswers(inRequest, {200});
            return ScriptedAnswer::Status(200);
        });
        for (int i = 0; i < 1000 && !(IsOver() && IsIdle()); ++i) {
            mNet->ReleaseHeld(ScriptedAnswer::Status(200));
            EXPECT_TRUE(mNet->WaitUntilIdle());
            mTime->AdvanceToNext();
        }
        EXPECT_TRUE(mNet->WaitUntilIdle());
        EXPECT_TRUE(IsIdle()) << "slots are lost";
    }

    const std::uint64_t mSeed;
    std::atomic<std::uint64_t> mDraws{0};
    std::atomic<int> mTokens{0};
    std::atomic<int> mAsking{2};
    shared_ptr<VirtualScheduler> mTime = boost::make_shared<VirtualScheduler>();
    ScopedGlobalScheduler mScope{mTime};
    Ledger mLedger;
    ScopedProcessor mNet{2};
    RequestChain mChain;
};

TEST(RequestChain, CancelsInEveryStateCompleteOnceAndGiveTheSlotsBack) {
    const char* const wanted = std::getenv("ZOCLIENT_TEST_CANCEL_SEEDS");
    const char* const first = std::getenv("ZOCLIENT_TEST_CANCEL_FIRST");
    const std::uint64_t begin = first ? std::strtoull(first, nullptr, 10) : 1;
    const std::uint64_t end = begin + (wanted ? std::strtoull(wanted, nullptr, 10) : 100);
    for (std::uint64_t seed = begin; seed < end && !testing::Test::HasFailure(); ++seed) {
        SCOPED_TRACE("seed " + std::to_string(seed));
        Turmoil(seed).Run();
    }
}

class ChainCancel : public LayerTest {
protected:
    ChainCancel() { chain.recoverableError->SetRetriesEnabled(true); }

    int renewals = 0;
    ScopedProcessor global{0};
    RequestChain chain = BuildRequestChain({[this] { ++renewals; }, {}}, ImmutableString("login-token=1;"));
};

// The replay was cancelled and could not start either: what it had been refused with is no answer any more.
TEST_F(ChainCancel, OfWhatCannotBeSentAgainIsToldAsACancel) {
    for (const int refusal : {401, 503}) {
        Guid id;
        global->SetHandler([&](const RecordedRequest&) { return ScriptedAnswer::Status(refusal); });
        id = Start(*chain.common, Verb::kDelete);
        global->DeliverAll();
        global->SetHandler([&](const RecordedRequest&) {
            chain.upload->TryToCancelRequest(id);
            return ScriptedAnswer::FailStart();
        });
        chain.authorization->SetAuthToken(ImmutableString("login-token=2;"));
        time->Advance(milliseconds(4));
        global->DeliverAll();
    }
    EXPECT_EQ(renewals, 1);
    EXPECT_THAT(statuses, ElementsAre(Response::kStatusCancelled, Response::kStatusCancelled));
    EXPECT_EQ(chain.writeThrottle->GetLoad().inFlight, 0);
}

// Of two requests under one ID a cancel could reach one only.
TEST_F(ChainCancel, ReachesTheOneRequestOfItsID) {
    for (const int refusal : {401, 503}) {
        global->SetHandler([&](const RecordedRequest&) { return ScriptedAnswer::Status(refusal); });
        const Guid id = Start(*chain.common, Verb::kDelete);
        global->DeliverAll();
        EXPECT_FALSE(chain.common->DELETE(id, Note(), URLOf("/b"), {}, {}))
            << "the network does not know it now";
        chain.upload->TryToCancelRequest(id);
        global->DeliverAll();
        EXPECT_EQ(statuses.back(), Response::kStatusCancelled);
    }
    time->Advance(milliseconds(70000));
    global->DeliverAll();
    EXPECT_EQ(statuses.size(), 2u);
    EXPECT_EQ(chain.writeThrottle->GetLoad().inFlight, 0);
}

}  // namespace
}  // namespace ZOCL
