// A hub that dies between its commit and its answer, or before both: the client rides it out or says so, and
// what was committed is there once. Also with a hub that does not know the key of a request, where the client
// has to find out by itself what became of it.
#include <arpa/inet.h>
#include <sys/socket.h>

#include <future>
#include <mutex>

#include <gtest/gtest.h>

#include "ClientTest.h"
#include "HubProcess.h"
#include "net/RawServer.h"
#include "ostcore/debug/DebugDatabase.h"
#include "ostcore/threads/MainThread.h"
#include "ostcore/utility/StringConversion.h"
#include "RFL/Registry.h"
#include "ZOClient/IZOCEditingSession.h"
#include "ZOClient/Library.h"

namespace ZOCL {
namespace {

using zotest::net::Connection;
using zotest::net::RawServer;
using zotest::net::ReceivedRequest;

constexpr const char* kSwitch = "ZOClient.DisableRetries";

/// A head as it goes to a hub that knows no keys.
std::string WithoutKey(std::string inHead) {
    const std::size_t start = inHead.find("\r\nIdempotency-Key:");
    return start == std::string::npos ? inHead : inHead.erase(start, inHead.find("\r\n", start + 2) - start);
}

/// Sends a request to the hub over a connection of its own and reads until that is closed.
std::string Forward(const ImmutableString& inHub, const ReceivedRequest& inRequest, bool inWithKey) {
    const std::string url = inHub.str();
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_port = htons(static_cast<std::uint16_t>(std::stoi(url.substr(url.rfind(':') + 1))));
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    const int hub = socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
    std::string answer;
    if (connect(hub, reinterpret_cast<const sockaddr*>(&address), sizeof address) == 0) {
        // The head with its last line end, and before the empty line the wish that the hub closes.
        const std::string lines = inRequest.head.substr(0, inRequest.head.find("\r\n\r\n"));
        const std::string head = (inWithKey ? lines : WithoutKey(lines)) + "\r\nConnection: close\r\n\r\n";
        for (const std::string& part : {head, inRequest.body}) {
            for (std::size_t sent = 0; sent < part.size();) {
                const ssize_t count = send(hub, part.data() + sent, part.size() - sent, MSG_NOSIGNAL);
                if (count <= 0) {
                    break;
                }
                sent += static_cast<std::size_t>(count);
            }
        }
        char buffer[4096];
        ssize_t count = 0;
        while ((count = read(hub, buffer, sizeof buffer)) > 0) {
            answer.append(buffer, static_cast<std::size_t>(count));
        }
    }
    close(hub);
    return answer;
}

struct Crime {
    /// The end of the path of the POST that meets it; once.
    std::string pathEnd;
    /// Whether the hub gets the request and dies with its answer, or the request is lost alone.
    bool reachesHub = true;
    /// Whether the hub ever sees the keys of requests.
    bool passesKeys = true;
    /// What happens elsewhere between the loss and the next sending.
    std::function<void()> meanwhile = [] {};
};

/// Stands before the hub.
class Assassin {
public:
    Assassin(RunningHub& inHub, Crime inCrime)
        : mHub(inHub), mCrime(std::move(inCrime)), mServer([this](Connection& ioConnection) {
              while (const auto request = ioConnection.ReadRequest()) {
                  if (!Serve(ioConnection, *request)) {
                      return;
                  }
              }
          }) {}

    ImmutableString URL() const { return ImmutableString(mServer.URL("")); }
    /// What the hub had answered when it was killed; empty when it was not.
    std::string LastAnswer() const {
        const std::lock_guard<std::mutex> lock(mMutex);
        return mLastAnswer;
    }
    void WaitForDeed() { mDone.get_future().get(); }
    void ReviveHub() {
        const std::lock_guard<std::mutex> lock(mMutex);
        mHub.Start();
    }

private:
    bool Serve(Connection& ioConnection, const ReceivedRequest& inRequest) {
        const std::lock_guard<std::mutex> lock(mMutex);
        const std::string& target = inRequest.target;
        const std::string& end = mCrime.pathEnd;
        const bool isTheOne = !mIsDone && inRequest.method == "POST" && target.size() >= end.size() &&
                              target.substr(target.size() - end.size()) == end;
        if (!isTheOne) {
            return ioConnection.Write(Forward(mHub.URL(), inRequest, mCrime.passesKeys)) && false;
        }
        mIsDone = true;
        if (mCrime.reachesHub) {
            mLastAnswer = Forward(mHub.URL(), inRequest, mCrime.passesKeys);
            mHub.End(SIGKILL);
        }
        mCrime.meanwhile();
        ioConnection.Reset();
        mDone.set_value();
        return false;
    }

    RunningHub& mHub;
    const Crime mCrime;
    mutable std::mutex mMutex;
    bool mIsDone = false;
    std::promise<void> mDone;
    std::string mLastAnswer;
    RawServer mServer;
};

template <class To, class From>
InterfaceRef<To> As(const InterfaceRef<From>& inObject) {
    return RFL::QueryInterface<To>(inObject);
}

using Start = std::function<bool(const Guid&, const RequestCompletion&)>;

/// Started and waited for.
Outcome Perform(const Start& inStart) {
    Outcome outcome;
    EXPECT_TRUE(inStart(Guid::CreateUnique(), outcome.Function()));
    outcome.Wait();
    return outcome;
}

Start Committing(const InterfaceRef<IZOCTransaction>& inTransaction) {
    return [inTransaction](const Guid& inID, const RequestCompletion& inDone) {
        return inTransaction->Commit(inID, inDone, u"The change");
    };
}

class HubDeath : public testing::Test {
protected:
    HubDeath() {
        setenv("ZOCLIENT_CONFIG_HOME", (hub.Directory() + "/config").c_str(), 1);
        RFL::CloseRegistry();
        Initialize();
    }
    ~HubDeath() override {
        IZOCDataServer::Terminate(false);
        ostcore::threads::PumpMainThread();
        Shutdown();
        RFL::CloseRegistry();
        ostcore::debug::DebugDatabase::ClearOverrides();
    }
    static InterfaceRef<IZOCDataServer> SignIn(const ImmutableString& inURL) {
        ZOSCredentials credentials;
        credentials.username = ImmutableString("anna");
        credentials.password = "annas-secret";
        std::promise<InterfaceRef<IZOCDataServer>> ended;
        Guid id;
        EXPECT_TRUE(IZOCDataServer::ConnectToServer(
            inURL, credentials, id, false,
            [&ended](const Guid&, const InterfaceRef<IZOCDataServer>& inServer, int,
                     const shared_ptr<ostnet::Response>&) { ended.set_value(inServer); },
            true, true));
        return ended.get_future().get();
    }
    /// A server that another has taken the place of is let go of by nobody else.
    static void LetGoOf(const InterfaceRef<IZOCDataServer>& inServer) {
        RFL::QueryInterface<DataServer>(inServer)->ReleaseCaches();
    }
    /// Anna's session on the one production that there is, made when there is none.
    static InterfaceRef<IZOCEditingSession> OpenSession(const InterfaceRef<IZOCDataServer>& inServer) {
        const auto list = inServer->GetProductionList(true);
        const auto all = list->GetAllItems();
        const auto production = all.empty() ? inServer->CreateProduction(u"Harbour Film", u"", false)
                                            : inServer->GetWritableProductionFromURL(all.front().url);
        InterfaceRef<IZOCEditingSession> session;
        EXPECT_TRUE(production && production->CreateEditingSession(session, u"Mine", u"", false));
        return session;
    }
    /// A transaction with something in it.
    static InterfaceRef<IZOCTransaction> Change(const InterfaceRef<IZOCEditingSession>& inSession,
                                                const std::string& inText) {
        const auto transaction =
            As<IZOCTransaction>(Perform([&](const Guid& inID, const RequestCompletion& inDone) {
                                    return inSession->CreateTransaction(inID, inDone, kTransactionType_Edit);
                                }).Resource());
        EXPECT_TRUE(transaction);
        EXPECT_EQ(Perform([&](const Guid& inID, const RequestCompletion& inDone) {
                      return transaction->WriteEnclosure("notes", inText, inID, inDone, "text/plain");
                  }).Wait(),
                  kResultSuccess);
        return transaction;
    }
    static Start Sharing(const InterfaceRef<IZOCEditingSession>& inSession) {
        const UString commit =
            ostcore::utility::ToUTF16(As<IZOCProduction>(inSession)->GetLoadedRevision().view());
        return [inSession, commit](const Guid& inID, const RequestCompletion& inDone) {
            return inSession->Push(inID, inDone, u"The change", kResolveStrategy_None, commit);
        };
    }
    /// How often the change stands in a history.
    static int CountChanges(const InterfaceRef<IZOCProduction>& inProduction) {
        const auto history = inProduction->GetProductionHistory();
        EXPECT_TRUE(As<IZOCServerResource>(history)->Load(true));
        int count = 0;
        for (int i = 0; i < history->GetHistoryVersionCount(); ++i) {
            UString date, user, title, message, revision;
            history->GetHistoryVersion(i)->GetInfo(date, user, title, message, revision);
            count += message == u"The change" ? 1 : 0;
        }
        return count;
    }
    /// The same as a new login at the hub itself sees it: in the session, or shared.
    int CountChangesAtHub(bool inShared) {
        IZOCDataServer::Terminate(false);
        const auto session = OpenSession(SignIn(hub.URL()));
        if (!inShared) {
            return CountChanges(As<IZOCProduction>(session));
        }
        const auto parent = session->GetParentProduction();
        EXPECT_TRUE(As<IZOCServerResource>(parent)->Load(true));
        return CountChanges(parent);
    }

    RunningHub hub;
};

TEST_F(HubDeath, WithoutRetriesIsANetworkFailureAndTheCommitIsThereOnce) {
    ostcore::debug::DebugDatabase::SetOverride(kSwitch, "true");
    {
        Assassin assassin(hub, {"/p"});
        const auto server = SignIn(assassin.URL());
        ASSERT_TRUE(server);
        const Outcome ended = Perform([&](const Guid& inID, const RequestCompletion& inDone) {
            return server->CreateProduction(inID, u"Harbour Film", u"", false, inDone);
        });
        EXPECT_EQ(Outcome(ended).Wait(), kResultNoHTTPResponse);
        EXPECT_NE(assassin.LastAnswer().find(" 201 "), std::string::npos) << assassin.LastAnswer();
        IZOCDataServer::Terminate(false);
    }
    hub.Start();
    const auto server = SignIn(hub.URL());
    ASSERT_TRUE(server);
    const auto list = server->GetProductionList(true);
    ASSERT_TRUE(list);
    EXPECT_EQ(list->GetAllItems().size(), 1u);
}

/// A commit or a share, with a hub that knows keys or does not, with retries or without.
struct Loss {
    bool isShare;
    bool passesKeys;
    bool retries;
};

class LostAnswer : public HubDeath, public testing::WithParamInterface<Loss> {};

TEST_P(LostAnswer, TheChangeIsThereOnceAndTheHostIsToldTheTruth) {
    const Loss loss = GetParam();
    ostcore::debug::DebugDatabase::SetOverride(kSwitch, loss.retries ? "false" : "true");
    {
        Assassin assassin(hub, {loss.isShare ? "/push" : "/commit", true, loss.passesKeys});
        auto server = SignIn(loss.isShare ? hub.URL() : assassin.URL());
        ASSERT_TRUE(server);
        auto session = OpenSession(server);
        Start change = Committing(Change(session, "text"));
        if (loss.isShare) {
            ASSERT_EQ(Perform(change).Wait(), kResultSuccess);
            IZOCDataServer::Terminate(false);
            server = SignIn(assassin.URL());
            session = OpenSession(server);
            change = Sharing(session);
        }
        Outcome outcome;
        ASSERT_TRUE(change(Guid::CreateUnique(), outcome.Function()));
        assassin.WaitForDeed();
        EXPECT_NE(assassin.LastAnswer().find(" 200 "), std::string::npos) << assassin.LastAnswer();
        assassin.ReviveHub();
        EXPECT_EQ(outcome.Wait(), loss.retries ? kResultSuccess : kResultNoHTTPResponse);
        if (loss.retries) {
            const std::string answer = outcome.Response()->GetPayloadAsUTF8String();
            const ImmutableString commit = As<IZOCProduction>(outcome.Resource())
                                               ? As<IZOCProduction>(outcome.Resource())->GetLoadedRevision()
                                               : ImmutableString();
            EXPECT_NE(answer.find("zo:commitId"), std::string::npos) << answer;
            EXPECT_TRUE(loss.isShare || answer.find(commit.str()) != std::string::npos) << answer;
        }
        EXPECT_EQ(outcome.Calls(), 1);
        IZOCDataServer::Terminate(false);
    }
    EXPECT_EQ(CountChangesAtHub(loss.isShare), 1);
}

INSTANTIATE_TEST_SUITE_P(All, LostAnswer,
                         testing::Values(Loss{false, true, true}, Loss{false, false, true},
                                         Loss{false, true, false}, Loss{true, true, true},
                                         Loss{true, false, true}, Loss{true, true, false}));

// The first sending is lost on its way; before the second one another host of the same user, on the same
// machine, does the same with the same message. That is a conflict, and not our own change.
TEST_F(HubDeath, ACommitOfTheSameUserIsNotTakenForOnesOwn) {
    InterfaceRef<IZOCTransaction> others;
    const auto elsewhere = SignIn(hub.URL());
    Crime crime{"/commit", false, false};
    crime.meanwhile = [&others] { EXPECT_EQ(Perform(Committing(others)).Wait(), kResultSuccess); };
    Assassin assassin(hub, crime);
    const auto session = OpenSession(SignIn(assassin.URL()));
    const auto transaction = Change(session, "text");
    others = Change(OpenSession(elsewhere), "other text");
    EXPECT_EQ(Perform(Committing(transaction)).Wait(), kResultHTTPPreconditionFailed);
    EXPECT_EQ(CountChangesAtHub(false), 1);
    LetGoOf(elsewhere);
}

TEST_F(HubDeath, AShareOfTheSameUserIsNotTakenForOnesOwn) {
    const auto elsewhere = SignIn(hub.URL());
    const auto others = OpenSession(elsewhere);
    Crime crime{"/push", false, false};
    crime.meanwhile = [&others] {
        ASSERT_EQ(Perform(Committing(Change(others, "more"))).Wait(), kResultSuccess);
        EXPECT_EQ(Perform(Sharing(others)).Wait(), kResultSuccess);
    };
    Assassin assassin(hub, crime);
    const auto session = OpenSession(SignIn(assassin.URL()));
    ASSERT_EQ(Perform(Committing(Change(session, "text"))).Wait(), kResultSuccess);
    ASSERT_EQ(Perform([&](const Guid& inID, const RequestCompletion& inDone) {
                  return others->Refresh(inID, inDone);
              }).Wait(),
              kResultSuccess);
    EXPECT_EQ(Perform(Sharing(session)).Wait(), kResultHTTPPreconditionFailed);
    EXPECT_EQ(CountChangesAtHub(true), 1);
    LetGoOf(elsewhere);
}

}  // namespace
}  // namespace ZOCL
