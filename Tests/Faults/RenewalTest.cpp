// Tokens that die under the client's hands, over real sockets: one by one, by the hundred, in the middle of a
// large form, and a hub that goes away between its commit and its answer.
#include <atomic>
#include <cstdlib>
#include <future>
#include <map>
#include <random>
#include <set>

#include "Client.h"
#include "ostnet/http/Compression.h"

namespace faults {
namespace {

constexpr const char* kThing = "/thing";

/// A hub whose tokens the test takes back. Everything below /thing wants the newest token.
class TokenHub : public BadHub {
public:
    TokenHub() {
        Interfere(Step::kLogin, [this](Connection& ioConnection, const ReceivedRequest&, const HubAnswer&) {
            if (mRefusesLogins) {
                return ioConnection.Write(HubAnswer{401, "", ""}.Bytes());
            }
            ++mLogins;
            return ioConnection.Write(
                HubAnswer{200, "Set-Cookie: " + Token(++mGeneration) + "; Path=/\r\n", ""}.Bytes());
        });
        Interfere(Step::kLogout, [this](Connection& ioConnection, const ReceivedRequest&, const HubAnswer&) {
            ++mLogouts;
            ++mGeneration;
            return ioConnection.Write(HubAnswer{204, "", ""}.Bytes());
        });
        Interfere(Step::kOther, [this](Connection& ioConnection, const ReceivedRequest& inRequest,
                                       const HubAnswer&) { return Answer(ioConnection, inRequest); });
    }

    /// The token that was given last is not good any more.
    void Expire() { ++mGeneration; }
    /// After so many answers the token expires; 0 is never.
    void ExpireEach(int inAnswers) { mExpireEach = inAnswers; }
    void RefuseLogins() { mRefusesLogins = true; }
    int Logins() const { return mLogins; }
    int Logouts() const { return mLogouts; }
    int Accepted() const { return mAccepted; }
    int Refused() const { return mRefused; }

private:
    static std::string Token(int inGeneration) {
        return "login-token=" + std::string(kTokenValue) + "-" + std::to_string(inGeneration);
    }
    bool Answer(Connection& ioConnection, const ReceivedRequest& inRequest) {
        const auto cookie = inRequest.Header("Cookie");
        const bool isGood = cookie && cookie->substr(0, cookie->find(';')) == Token(mGeneration);
        if (!isGood) {
            ++mRefused;
            return ioConnection.Write(HubAnswer{401, "", ""}.Bytes());
        }
        const int accepted = ++mAccepted;
        if (mExpireEach > 0 && accepted % mExpireEach == 0) {
            ++mGeneration;
        }
        return ioConnection.Write(HubAnswer{200, "", inRequest.target}.Bytes());
    }

    std::atomic<int> mGeneration{0};
    std::atomic<int> mExpireEach{0};
    std::atomic<bool> mRefusesLogins{false};
    std::atomic<int> mLogins{0};
    std::atomic<int> mLogouts{0};
    std::atomic<int> mAccepted{0};
    std::atomic<int> mRefused{0};
};

/// Requests in flight and how each ended.
class Flight {
public:
    explicit Flight(const InterfaceRef<IZOCDataServer>& inServer) : mServer(inServer) {}
    ~Flight() { WaitForAll(); }

    Guid Start(const std::string& inURL) {
        const Guid id = Guid::CreateUnique();
        {
            const std::lock_guard<std::mutex> lock(mState->mutex);
            ++mState->started;
        }
        EXPECT_TRUE(mServer->GET(id, CompletionOf(inURL), ImmutableString(inURL), {}));
        return id;
    }
    ostnet::http::CompletionFunction CompletionOf(const std::string& inURL) {
        return [state = mState, inURL](const Guid& inID, const shared_ptr<Response>& inResponse) {
            const std::lock_guard<std::mutex> lock(state->mutex);
            state->repeated += state->ended.insert(inID).second ? 0 : 1;
            const int status = inResponse ? inResponse->status : -2;
            ++state->statuses[status];
            // The answer of another request would be another path.
            if (status == 200 && (!inResponse->payload ||
                                  inURL.find(inResponse->GetPayloadAsUTF8String()) == std::string::npos)) {
                ++state->crossed;
            }
            state->changed.notify_all();
        };
    }
    void WaitForAll() {
        std::unique_lock<std::mutex> lock(mState->mutex);
        EXPECT_TRUE(mState->changed.wait_for(
            lock, std::chrono::seconds(120),
            [&] { return mState->ended.size() >= static_cast<std::size_t>(mState->started); }))
            << mState->started - static_cast<int>(mState->ended.size()) << " requests did not end";
        EXPECT_EQ(mState->repeated, 0);
        EXPECT_EQ(mState->crossed, 0);
    }
    int Count(int inStatus) const {
        const std::lock_guard<std::mutex> lock(mState->mutex);
        const auto found = mState->statuses.find(inStatus);
        return found == mState->statuses.end() ? 0 : found->second;
    }
    std::size_t Ended() const {
        const std::lock_guard<std::mutex> lock(mState->mutex);
        return mState->ended.size();
    }

private:
    struct State {
        std::mutex mutex;
        std::condition_variable changed;
        std::set<Guid> ended;
        std::map<int, int> statuses;
        int started = 0;
        int repeated = 0;
        int crossed = 0;
    };
    const InterfaceRef<IZOCDataServer> mServer;
    const std::shared_ptr<State> mState = std::make_shared<State>();
};

class Renewal : public FaultTest {
protected:
    InterfaceRef<IZOCDataServer> SignInKeeping(const TokenHub& inHub) {
        std::promise<InterfaceRef<IZOCDataServer>> ended;
        Guid id;
        EXPECT_TRUE(IZOCDataServer::ConnectToServer(
            ImmutableString(inHub.URL("")), Client::Credentials(), id, false,
            [&ended](const Guid&, const InterfaceRef<IZOCDataServer>& inServer, int,
                     const shared_ptr<Response>&) { ended.set_value(inServer); },
            true, true));
        InterfaceRef<IZOCDataServer> server = ended.get_future().get();
        EXPECT_TRUE(server);
        return server;
    }
    static std::string URL(const TokenHub& inHub, int inNumber) {
        return inHub.URL(kThing) + "/" + std::to_string(inNumber);
    }
};

TEST_F(Renewal, TwoHundredRefusalsAreOneSignInAndTwoHundredAnswers) {
    TokenHub hub;
    const auto server = SignInKeeping(hub);
    ASSERT_TRUE(server);
    hub.Expire();
    Flight flight(server);
    for (int i = 0; i < 200; ++i) {
        flight.Start(URL(hub, i));
    }
    flight.WaitForAll();
    EXPECT_EQ(flight.Count(200), 200);
    EXPECT_EQ(hub.Logins(), 2);
    EXPECT_EQ(hub.Accepted(), 200);
}

TEST_F(Renewal, TwoHundredRefusalsAndNoSignInAreTwoHundredRefusals) {
    TokenHub hub;
    const auto server = SignInKeeping(hub);
    ASSERT_TRUE(server);
    hub.RefuseLogins();
    hub.Expire();
    Flight flight(server);
    for (int i = 0; i < 200; ++i) {
        flight.Start(URL(hub, i));
    }
    flight.WaitForAll();
    EXPECT_EQ(flight.Count(401), 200);
    EXPECT_EQ(hub.CountRequests("POST", "/login"), 2u) << "one failed sign-in is enough";
    EXPECT_EQ(hub.Accepted(), 0);
}

TEST_F(Renewal, AThousandRequestsOutliveTokensThatDieAgainAndAgain) {
    constexpr int kCount = 1000;
    TokenHub hub;
    const auto server = SignInKeeping(hub);
    ASSERT_TRUE(server);
    hub.ExpireEach(250);
    {
        Flight flight(server);
        for (int i = 0; i < kCount; ++i) {
            flight.Start(URL(hub, i));
        }
        flight.WaitForAll();
        EXPECT_EQ(flight.Count(200), kCount);
        EXPECT_EQ(hub.Accepted(), kCount) << "something was done twice";
        EXPECT_LE(hub.Logins(), 5) << "a token was renewed more than once";
        EXPECT_GE(hub.Logins(), 4);
    }
    // A token that lives for twenty answers: who has waited for four of them is told so.
    hub.ExpireEach(20);
    const int before = hub.Accepted();
    Flight flight(server);
    for (int i = 0; i < kCount; ++i) {
        flight.Start(URL(hub, i));
    }
    flight.WaitForAll();
    EXPECT_EQ(flight.Count(200) + flight.Count(401), kCount);
    EXPECT_EQ(hub.Accepted() - before, flight.Count(200));
    EXPECT_GE(flight.Count(200), 4 * 20) << "a renewal that ended late took what waited for the next one";
}

TEST_F(Renewal, CancelsAtAnyMomentEndEachRequestOnce) {
    TokenHub hub;
    const auto server = SignInKeeping(hub);
    ASSERT_TRUE(server);
    hub.ExpireEach(7);
    const char* const wanted = std::getenv("ZOCLIENT_TEST_CANCEL_SEEDS");
    const unsigned seeds = wanted ? static_cast<unsigned>(std::atoi(wanted)) : 20;
    for (unsigned seed = 1; seed <= seeds; ++seed) {
        std::mt19937 random(seed);
        Flight flight(server);
        std::vector<Guid> ids;
        for (int i = 0; i < 40; ++i) {
            ids.push_back(flight.Start(URL(hub, i)));
            if (random() % 3 == 0) {
                server->TryToCancelRequest(ids[random() % ids.size()]);
            }
            if (random() % 16 == 0) {
                hub.Expire();
            }
        }
        for (const Guid& id : ids) {
            if (random() % 2 == 0) {
                server->TryToCancelRequest(id);
            }
        }
        flight.WaitForAll();
        ASSERT_EQ(flight.Count(200) + flight.Count(401) + flight.Count(-1), 40) << "seed " << seed;
    }
}

TEST_F(Renewal, ALogoutEndsWhatWaitsForATokenAndIsAskedForNoNewOne) {
    TokenHub hub;
    const auto server = SignInKeeping(hub);
    ASSERT_TRUE(server);
    // The sign-in that renews hangs, so that all requests are parked when the session ends.
    std::atomic<int> hanging{0};
    hub.Interfere(Step::kLogin, [&](Connection& ioConnection, const ReceivedRequest&, const HubAnswer&) {
        ++hanging;
        ioConnection.WaitForClose();
        return false;
    });
    hub.Expire();
    Flight flight(server);
    for (int i = 0; i < 50; ++i) {
        flight.Start(URL(hub, i));
    }
    // Four to sign in, the fifty, and the sign-in that hangs.
    ASSERT_TRUE(hub.Server().WaitForRequests(4 + 50 + 1));
    IZOCDataServer::Terminate(true);
    flight.WaitForAll();
    EXPECT_EQ(flight.Count(401), 50);
    EXPECT_EQ(hanging, 1);
}

TEST_F(Renewal, ALargeFormWhoseTokenExpiresOnTheWayArrivesOnceAndWhole) {
    TokenHub hub;
    const auto server = SignInKeeping(hub);
    ASSERT_TRUE(server);
    std::string large(32u << 20, '\0');
    std::minstd_rand random(28);
    for (std::size_t i = 0; i < large.size(); i += 64) {
        large[i] = static_cast<char>(random());
    }
    std::vector<std::size_t> sizes;
    std::vector<std::size_t> hashes;
    hub.Interfere(Step::kOther,
                  [&](Connection& ioConnection, const ReceivedRequest& inRequest, const HubAnswer&) {
                      // One connection after the other, as the second form follows the answer to the first.
                      EXPECT_EQ(inRequest.Header("Content-Encoding"), "gzip");
                      const auto form = ostnet::http::DecompressPayload(
                          ostcore::utility::RecycledMemory::CreateFromBytes(inRequest.body));
                      const std::string_view body = form ? form->view() : std::string_view();
                      const std::size_t begin = body.find(large.substr(0, 64));
                      sizes.push_back(inRequest.body.size());
                      hashes.push_back(begin == std::string_view::npos
                                           ? 0
                                           : std::hash<std::string_view>()(body.substr(begin, large.size())));
                      return ioConnection.Write(HubAnswer{sizes.size() == 1 ? 401 : 201, "", ""}.Bytes());
                  });
    std::promise<int> status;
    const ostnet::http::Form form{{ImmutableString("name"), "film"}, {ImmutableString("data"), large}};
    ASSERT_TRUE(server->POST(
        Guid::CreateUnique(),
        [&status](const Guid&, const shared_ptr<Response>& inResponse) {
            status.set_value(inResponse ? inResponse->status : -2);
        },
        ImmutableString(hub.URL(kThing)), {}, form));
    EXPECT_EQ(status.get_future().get(), 201);
    ASSERT_EQ(sizes.size(), 2u) << "refused once, sent again once";
    EXPECT_EQ(sizes[0], sizes[1]);
    EXPECT_EQ(hashes[0], std::hash<std::string_view>()(large));
    EXPECT_EQ(hashes[1], hashes[0]);
    EXPECT_EQ(hub.Logins(), 2);
}

TEST_F(Renewal, ASecondSignInElsewhereAndItsLogoutDisturbNobodyForLong) {
    TokenHub hub;
    const auto first = SignInKeeping(hub);
    ASSERT_TRUE(first);
    // The hub of this test lets one token live: whoever signs in last.
    const auto second = SignInKeeping(hub);
    ASSERT_TRUE(second);
    for (const auto& server : {first, second, first}) {
        Flight flight(server);
        for (int i = 0; i < 10; ++i) {
            flight.Start(URL(hub, i));
        }
        flight.WaitForAll();
        EXPECT_EQ(flight.Count(200), 10);
    }
    EXPECT_EQ(hub.Logins(), 5) << "each change of sides is one sign-in";
}

}  // namespace
}  // namespace faults
