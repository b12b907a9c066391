// A hub whose tokens die, and requests in flight at it.
#pragma once

#include <atomic>
#include <future>
#include <map>
#include <set>

#include "Client.h"

namespace faults {

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
    /// Whether the request bears the newest token.
    bool Accepts(const ReceivedRequest& inRequest) {
        const auto cookie = inRequest.Header("Cookie");
        if (!cookie || cookie->substr(0, cookie->find(';')) != Token(mGeneration)) {
            ++mRefused;
            return false;
        }
        const int accepted = ++mAccepted;
        if (mExpireEach > 0 && accepted % mExpireEach == 0) {
            ++mGeneration;
        }
        return true;
    }

private:
    static std::string Token(int inGeneration) {
        return "login-token=" + std::string(kTokenValue) + "-" + std::to_string(inGeneration);
    }
    bool Answer(Connection& ioConnection, const ReceivedRequest& inRequest) {
        return ioConnection.Write(
            (Accepts(inRequest) ? HubAnswer{200, "", inRequest.target} : HubAnswer{401, "", ""}).Bytes());
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

/// Signs in at such a hub so that the client renews its token by itself.
class TokenTest : public FaultTest {
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

}  // namespace faults
