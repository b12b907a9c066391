// Cancels over real sockets, at any moment of a request: none is lost, none is late, and nothing stays out.
#include <sched.h>

#include <algorithm>
#include <cstdlib>
#include <random>
#include <thread>

#include "ostcore/debug/DebugDatabase.h"
#include "ostnet/http/NetworkProcessor.h"
#include "TokenHub.h"

namespace faults {
namespace {

using ostcore::utility::RecycledMemory;
using ostnet::http::CompletionFunction;
using ostnet::http::NetworkProcessor;

constexpr std::chrono::seconds kLongestWait(60);

/// What the hub has done with each target. Handlers hold it, so it outlives the hub's connections.
class Ledger {
public:
    struct Entry {
        int received = 0;
        std::map<int, int> answers;  // by status
        int Answers(int inStatus) const {
            const auto found = answers.find(inStatus);
            return found == answers.end() ? 0 : found->second;
        }
    };
    using Entries = std::map<std::string, Entry>;

    /// From now on only what is below this path may be asked for. Returns what was done up to now.
    Entries Begin(const std::string& inRoot) {
        const std::lock_guard<std::mutex> lock(mMutex);
        mRoot = inRoot;
        return std::exchange(mEntries, {});
    }
    bool IsStray(const std::string& inTarget) const {
        const std::lock_guard<std::mutex> lock(mMutex);
        return inTarget.rfind(mRoot, 0) != 0;
    }
    void NoteStray() { ++mStrays; }
    int Strays() const { return mStrays; }
    void Receive(const std::string& inTarget) {
        const std::lock_guard<std::mutex> lock(mMutex);
        ++mEntries[inTarget].received;
    }
    bool Answer(Connection& ioConnection, const ReceivedRequest& inRequest, int inStatus) {
        {
            const std::lock_guard<std::mutex> lock(mMutex);
            ++mEntries[inRequest.target].answers[inStatus];
        }
        return ioConnection.Write(HubAnswer{inStatus, "", inRequest.target}.Bytes());
    }
    bool WasBusy(const std::string& inTarget) const {
        const std::lock_guard<std::mutex> lock(mMutex);
        const auto found = mEntries.find(inTarget);
        return found != mEntries.end() && found->second.Answers(503) > 0;
    }
    /// Says nothing until the client has gone.
    bool Hold(Connection& ioConnection) {
        ChangeHeld(1);
        ioConnection.WaitForClose();
        ChangeHeld(-1);
        return false;
    }
    bool WaitUntilHeld(int inLeast, int inMost) {
        std::unique_lock<std::mutex> lock(mMutex);
        return mChanged.wait_for(lock, kLongestWait, [&] { return inLeast <= mHeld && mHeld <= inMost; });
    }

private:
    void ChangeHeld(int inBy) {
        const std::lock_guard<std::mutex> lock(mMutex);
        mHeld += inBy;
        mChanged.notify_all();
    }

    mutable std::mutex mMutex;
    std::condition_variable mChanged;
    std::string mRoot;
    Entries mEntries;
    int mHeld = 0;
    std::atomic<int> mStrays{0};
};

/// Answers what ends in "ok" with 200, what ends in "busy" first with a 503, and what ends in "hold" never.
bool AnswerByName(Ledger& ioLedger, TokenHub& ioHub, Connection& ioConnection,
                  const ReceivedRequest& inRequest) {
    // In this order: what a client sent before it cancelled may be read late, but then its token is an old
    // one.
    const bool isStray = ioLedger.IsStray(inRequest.target);
    ioLedger.Receive(inRequest.target);
    if (!ioHub.Accepts(inRequest)) {
        return ioLedger.Answer(ioConnection, inRequest, 401);
    }
    if (isStray) {
        ioLedger.NoteStray();
    }
    const std::string name = inRequest.target.substr(inRequest.target.rfind('/') + 1);
    if (name == "hold") {
        return ioLedger.Hold(ioConnection);
    }
    const bool isBusy = name == "busy" && !ioLedger.WasBusy(inRequest.target);
    return ioLedger.Answer(ioConnection, inRequest, isBusy ? 503 : 200);
}

/// Requests of all kinds, with what was asked of each and how it ended.
class Crowd {
public:
    struct Asked {
        Guid id;
        std::string target;
        bool isHold = false;
        bool isCancelled = false;
        int calls = 0;
        int status = 0;
    };

    Crowd(InterfaceRef<IZOCDataServer> inServer, const TokenHub& inHub, std::string inRoot)
        : mServer(std::move(inServer)), mHub(inHub), mRoot(std::move(inRoot)) {}
    ~Crowd() {
        CancelIf([](const Asked&) { return true; });
    }

    void StartOne(std::mt19937& ioRandom, unsigned inReadsOfTen) {
        static const char* const kNames[] = {"ok", "ok", "busy", "hold"};
        const auto asked = std::make_shared<Asked>();
        const char* const name = kNames[ioRandom() % 4];
        asked->id = Guid::CreateUnique();
        asked->target = mRoot + std::to_string(mAsked.size()) + "/" + name;
        asked->isHold = std::string(name) == "hold";
        mAsked.push_back(asked);
        const CompletionFunction done = [state = mState, asked](const Guid&,
                                                                const shared_ptr<Response>& inResponse) {
            const std::lock_guard<std::mutex> lock(state->mutex);
            ++asked->calls;
            asked->status = inResponse ? inResponse->status : -2;
            state->changed.notify_all();
        };
        const ImmutableString url(mHub.URL(asked->target));
        const auto body =
            RecycledMemory::CreateFromBytes(std::string(ioRandom() % 2 == 0 ? 100 : 70000, 'b'));
        bool isStarted = false;
        if (ioRandom() % 10 < inReadsOfTen) {
            isStarted = mServer->GET(asked->id, done, url, {});
        } else if (ioRandom() % 3 == 0) {
            isStarted = mServer->DELETE(asked->id, done, url, {});
        } else {
            isStarted = mServer->PUT(asked->id, done, url, {}, body);
        }
        ASSERT_TRUE(isStarted);
    }
    void CancelAny(std::mt19937& ioRandom) { Cancel(*mAsked[ioRandom() % mAsked.size()]); }
    template <typename Condition>
    void CancelIf(const Condition& inCondition) {
        for (const auto& asked : mAsked) {
            if (inCondition(*asked)) {
                Cancel(*asked);
            }
        }
    }
    /// Whether all have ended for which the condition holds.
    template <typename Condition>
    bool WaitFor(const Condition& inCondition) {
        std::unique_lock<std::mutex> lock(mState->mutex);
        return mState->changed.wait_for(lock, kLongestWait, [&] {
            return std::all_of(mAsked.begin(), mAsked.end(), [&](const auto& inAsked) {
                return inAsked->calls > 0 || !inCondition(*inAsked);
            });
        });
    }
    const std::vector<std::shared_ptr<Asked>>& All() const { return mAsked; }

private:
    struct State {
        std::mutex mutex;
        std::condition_variable changed;
    };
    void Cancel(Asked& ioAsked) {
        ioAsked.isCancelled = true;
        mServer->TryToCancelRequest(ioAsked.id);
    }

    const InterfaceRef<IZOCDataServer> mServer;
    const TokenHub& mHub;
    const std::string mRoot;
    const std::shared_ptr<State> mState = std::make_shared<State>();
    std::vector<std::shared_ptr<Asked>> mAsked;
};

/// Each has ended once, with a cancel that was asked for or with what the hub said of it; nothing was done
/// twice, and nothing sent again without an answer that explains it.
void ExpectHonestEnds(const Crowd& inCrowd, const Ledger::Entries& inEntries) {
    for (const auto& asked : inCrowd.All()) {
        const auto found = inEntries.find(asked->target);
        const Ledger::Entry entry = found == inEntries.end() ? Ledger::Entry() : found->second;
        const bool isCancel = asked->isCancelled && asked->status == Response::kStatusCancelled;
        EXPECT_EQ(asked->calls, 1) << asked->target;
        EXPECT_TRUE(isCancel || entry.Answers(asked->status) > 0)
            << asked->target << " ended with " << asked->status;
        EXPECT_LE(entry.Answers(200), 1) << asked->target << " was done twice";
        EXPECT_LE(entry.received, 1 + entry.Answers(401) + entry.Answers(503)) << asked->target;
    }
}

class Cancels : public TokenTest {
protected:
    /// Forty requests, cancelled as the seed will have it.
    static void RunSeed(unsigned inSeed, const InterfaceRef<IZOCDataServer>& inServer, TokenHub& ioHub,
                        Ledger& ioLedger) {
        const std::string root = std::string(kThing) + "/" + std::to_string(inSeed) + "/";
        ioLedger.Begin(root);
        std::mt19937 random(inSeed);
        const unsigned reads = random() % 11;
        Crowd crowd(inServer, ioHub, root);
        for (int i = 0; i < 40; ++i) {
            crowd.StartOne(random, reads);
            if (random() % 3 == 0) {
                crowd.CancelAny(random);
            }
            if (random() % 16 == 0) {
                ioHub.Expire();
            }
        }
        crowd.CancelIf([&](const Crowd::Asked&) { return random() % 2 == 0; });
        // The rest of what gets no answer is still out, and holds slots and connections.
        ASSERT_TRUE(crowd.WaitFor([](const Crowd::Asked& inAsked) { return inAsked.isCancelled; }))
            << "a cancel was lost";
        crowd.CancelIf([](const Crowd::Asked& inAsked) { return inAsked.isHold; });
        ASSERT_TRUE(crowd.WaitFor([](const Crowd::Asked&) { return true; })) << "requests do not end";
        ASSERT_TRUE(ioLedger.WaitUntilHeld(0, 0)) << "a cancelled request stays in flight";
        // Whatever still waited for a token would go out with the new one.
        ioHub.Expire();
        const std::string probe = kThing + std::string("/probe");
        ExpectHonestEnds(crowd, ioLedger.Begin(probe));
        Flight flight(inServer);
        flight.Start(ioHub.URL(probe));
        flight.WaitForAll();
        EXPECT_EQ(flight.Count(200), 1);
        EXPECT_EQ(ioLedger.Strays(), 0) << "a request was sent again after its end";
    }
};

TEST_F(Cancels, AtAnyMomentEndEachRequestOnceAndForGood) {
    const char* const wanted = std::getenv("ZOCLIENT_TEST_CANCEL_SEEDS");
    const char* const first = std::getenv("ZOCLIENT_TEST_CANCEL_FIRST");
    unsigned seed = first ? static_cast<unsigned>(std::atoi(first)) : 1;
    const unsigned end = seed + (wanted ? static_cast<unsigned>(std::atoi(wanted)) : 20);
    while (seed < end && !HasFailure()) {
        // A new hub now and then, as one keeps all that it was ever sent.
        const auto ledger = std::make_shared<Ledger>();
        TokenHub hub;
        ostcore::debug::DebugDatabase::SetOverride("ZOClient.DisableRetries", "false");
        const auto server = SignInKeeping(hub);
        ostcore::debug::DebugDatabase::SetOverride("ZOClient.DisableRetries", "true");
        ASSERT_TRUE(server);
        hub.ExpireEach(7);
        hub.Interfere(Step::kOther, [ledger, &hub](Connection& ioConnection, const ReceivedRequest& inRequest,
                                                   const HubAnswer&) {
            return AnswerByName(*ledger, hub, ioConnection, inRequest);
        });
        for (const unsigned stop = std::min(end, seed + 100); seed < stop && !HasFailure(); ++seed) {
            SCOPED_TRACE("seed " + std::to_string(seed));
            RunSeed(seed, server, hub, *ledger);
        }
        IZOCDataServer::Terminate(false);
    }
}

/// A hub that answers nothing, and how many requests are at it.
class SilentHub {
public:
    std::string URL() const { return mServer.URL("/hold"); }
    Ledger& TheLedger() { return *mLedger; }

private:
    const std::shared_ptr<Ledger> mLedger = std::make_shared<Ledger>();
    RawServer mServer{[ledger = mLedger](Connection& ioConnection) {
        if (ioConnection.ReadRequest()) {
            ledger->Hold(ioConnection);
        }
    }};
};

shared_ptr<NetworkProcessor> MakeNetwork() {
    return boost::make_shared<NetworkProcessor>(ostnet::NetworkSettings());
}

TEST_F(Cancels, ThatMeetTheStartOfTheirRequestLeaveNothingInFlight) {
    constexpr int kCount = 2000;
    SilentHub hub;
    const auto network = MakeNetwork();
    std::vector<Guid> ids;
    std::generate_n(std::back_inserter(ids), kCount, [] { return Guid::CreateUnique(); });
    std::atomic<int> current{0};
    std::atomic<int> ended{0};
    std::thread canceller([&] {
        for (int at = 0; at < kCount; at = current) {
            network->TryToCancelRequest(ids[static_cast<std::size_t>(at)]);
        }
    });
    std::map<int, int> statuses;  // guarded by the order of things: one request at a time
    for (const Guid& id : ids) {
        const auto status = std::make_shared<std::promise<int>>();
        EXPECT_TRUE(network->GET(id,
                                 [&ended, status](const Guid&, const shared_ptr<Response>& inResponse) {
                                     ++ended;
                                     status->set_value(inResponse ? inResponse->status : -2);
                                 },
                                 ImmutableString(hub.URL()), {}, {}));
        ++statuses[status->get_future().get()];
        ++current;
    }
    canceller.join();
    EXPECT_EQ(statuses[Response::kStatusCancelled], kCount);
    EXPECT_EQ(ended, kCount);
    EXPECT_TRUE(hub.TheLedger().WaitUntilHeld(0, 0)) << "a request that was cancelled is still out";
}

/// While it stands, this thread and those that it starts share one processor.
class OneProcessor {
public:
    OneProcessor() {
        EXPECT_EQ(sched_getaffinity(0, sizeof(mFormer), &mFormer), 0);
        cpu_set_t one;
        CPU_ZERO(&one);
        CPU_SET(sched_getcpu(), &one);
        EXPECT_EQ(sched_setaffinity(0, sizeof(one), &one), 0);
    }
    ~OneProcessor() { EXPECT_EQ(sched_setaffinity(0, sizeof(mFormer), &mFormer), 0); }

private:
    cpu_set_t mFormer;
};

// The canceller gives way to everybody, so that whatever its first cancel sets off, and that is the whole
// shutdown, happens before that cancel has returned. The others have not been cancelled then.
TEST_F(Cancels, ThatMeetTheShutdownEndEachRequestOnce) {
    constexpr int kCount = 4;
    const OneProcessor narrow;
    SilentHub hub;
    for (int round = 0; round < 5 && !HasFailure(); ++round) {
        const auto network = MakeNetwork();
        std::atomic<int> calls[kCount] = {};
        std::vector<Guid> ids;
        for (std::atomic<int>& count : calls) {
            ids.push_back(Guid::CreateUnique());
            ASSERT_TRUE(network->GET(ids.back(),
                                     [&count](const Guid&, const shared_ptr<Response>&) { ++count; },
                                     ImmutableString(hub.URL()), {}, {}));
        }
        EXPECT_TRUE(hub.TheLedger().WaitUntilHeld(kCount, kCount));
        std::thread canceller([&] {
            const sched_param none{};
            EXPECT_EQ(sched_setscheduler(0, SCHED_IDLE, &none), 0);
            for (const Guid& id : ids) {
                network->TryToCancelRequest(id);
            }
        });
        EXPECT_TRUE(hub.TheLedger().WaitUntilHeld(0, kCount - 1));
        network->Shutdown();
        canceller.join();
        for (const std::atomic<int>& count : calls) {
            EXPECT_EQ(count, 1) << "round " << round;
        }
        EXPECT_TRUE(hub.TheLedger().WaitUntilHeld(0, 0));
    }
}

}  // namespace
}  // namespace faults
