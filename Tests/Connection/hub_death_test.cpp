// A hub that dies between its commit and its answer: the client says so, and what was committed is there
// once.
#include <arpa/inet.h>
#include <sys/socket.h>

#include <future>
#include <mutex>

#include <gtest/gtest.h>

#include "HubProcess.h"
#include "net/RawServer.h"
#include "ostcore/threads/MainThread.h"
#include "RFL/Registry.h"
#include "ZOClient/IZOCDataServer.h"
#include "ZOClient/IZOCProduction.h"
#include "ZOClient/Library.h"

namespace ZOCL {
namespace {

using zotest::net::Connection;
using zotest::net::RawServer;
using zotest::net::ReceivedRequest;

/// Sends a request to the hub over a connection of its own and reads until that is closed.
std::string Forward(const ImmutableString& inHub, const ReceivedRequest& inRequest) {
    const std::string url = inHub.str();
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_port = htons(static_cast<std::uint16_t>(std::stoi(url.substr(url.rfind(':') + 1))));
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    const int hub = socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
    std::string answer;
    if (connect(hub, reinterpret_cast<const sockaddr*>(&address), sizeof address) == 0) {
        // The head with its last line end, and before the empty line the wish that the hub closes.
        const std::size_t headEnd = inRequest.head.find("\r\n\r\n");
        const std::string head = inRequest.head.substr(0, headEnd) + "\r\nConnection: close\r\n\r\n";
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

/// Stands before the hub and kills it when it has answered a POST of this path, so that the client never sees
/// that answer.
class Assassin {
public:
    Assassin(RunningHub& inHub, const std::string& inPathEnd)
        : mHub(inHub), mPathEnd(inPathEnd), mServer([this](Connection& ioConnection) {
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

private:
    bool Serve(Connection& ioConnection, const ReceivedRequest& inRequest) {
        const std::lock_guard<std::mutex> lock(mMutex);
        const std::string answer = Forward(mHub.URL(), inRequest);
        const std::string& target = inRequest.target;
        const bool isTheOne = inRequest.method == "POST" && target.size() >= mPathEnd.size() &&
                              target.substr(target.size() - mPathEnd.size()) == mPathEnd;
        if (isTheOne) {
            mLastAnswer = answer;
            mHub.End(SIGKILL);
            ioConnection.Reset();
            return false;
        }
        return ioConnection.Write(answer) && false;
    }

    RunningHub& mHub;
    const std::string mPathEnd;
    mutable std::mutex mMutex;
    std::string mLastAnswer;
    RawServer mServer;
};

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
    }
    InterfaceRef<IZOCDataServer> SignIn(const ImmutableString& inURL) {
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
    RunningHub hub;
};

TEST_F(HubDeath, AfterACommitIsANetworkFailureAndTheCommitIsThereOnce) {
    {
        Assassin assassin(hub, "/p");
        const auto server = SignIn(assassin.URL());
        ASSERT_TRUE(server);
        std::promise<int> ended;
        ASSERT_TRUE(server->CreateProduction(
            Guid::CreateUnique(), u"Harbour Film", u"", false,
            [&ended](const Guid&, int inResult, const InterfaceRef<IZOCServerResource>&,
                     const shared_ptr<ostnet::Response>&) { ended.set_value(inResult); }));
        EXPECT_EQ(ended.get_future().get(), kResultNoHTTPResponse);
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

}  // namespace
}  // namespace ZOCL
