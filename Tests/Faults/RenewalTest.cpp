// Tokens that die under the client's hands, over real sockets: one by one, by the hundred, in the middle of a
// large form, and a hub that goes away between its commit and its answer.
#include <atomic>
#include <future>
#include <random>

#include "ostnet/http/Compression.h"
#include "TokenHub.h"

namespace faults {
namespace {

class Renewal : public TokenTest {
protected:
    /// Waits until the host's server is this one.
    static bool BecomesLoggedIn(const InterfaceRef<IZOCDataServer>& inServer) {
        const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(60);
        while (IZOCDataServer::GetLoggedInServerRef() != inServer) {
            if (std::chrono::steady_clock::now() > end) {
                return false;
            }
            std::this_thread::yield();
        }
        return true;
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

TEST_F(Renewal, ALogoutEndsWhatWaitsForATokenAndIsAskedForNoNewOne) {
    TokenHub hub;
    const auto server = SignInKeeping(hub);
    ASSERT_TRUE(server);
    // The sign-in that renews hangs, so that all requests are parked when the session ends.
    std::atomic<int> hanging{0};
    std::promise<void> firstHangs;
    hub.Interfere(Step::kLogin, [&](Connection& ioConnection, const ReceivedRequest&, const HubAnswer&) {
        if (++hanging == 1) {
            firstHangs.set_value();
        }
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
    ASSERT_EQ(firstHangs.get_future().wait_for(std::chrono::seconds(60)), std::future_status::ready);
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
        // The answers come before the sign-in is through, which would undo the end of the session.
        EXPECT_TRUE(BecomesLoggedIn(server));
    }
    EXPECT_EQ(hub.Logins(), 5) << "each change of sides is one sign-in";
}

}  // namespace
}  // namespace faults
