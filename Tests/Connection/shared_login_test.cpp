// Two hosts as processes of their own that share a registry: each follows the other's login.
//
// A host is this program once more, with one test that is no test: it takes commands from its standard input
// and tells of what happens on its standard output, a line each.
#include <poll.h>

#include <future>
#include <iostream>
#include <thread>

#include <gtest/gtest.h>

#include "HubProcess.h"
#include "ostcore/threads/MainThread.h"
#include "Relations.h"
#include "RFL/Registry.h"
#include "ZOClient/Authentication.h"
#include "ZOClient/IZOCDataServer.h"
#include "ZOClient/Library.h"
#include "ZOClient/Messages.h"
#include "ZOClient/Registry.h"

namespace ZOCL {
namespace {

constexpr const char* kHubVariable = "ZOCLIENT_TEST_HUB";
constexpr int kPatienceMilliseconds = 60000;

std::string Fingerprint(const ImmutableString& inToken) {
    return inToken.IsNull() ? "none" : std::to_string(std::hash<std::string_view>()(inToken.view()));
}

/// The side of the child.
class Host {
public:
    void Run() {
        const ImmutableString hub(getenv(kHubVariable));
        Initialize();
        {
            RFL::Listener listener(GetStationID());
            listener.AddHandler<ZOInitializeConnectionMessage>(
                [](const ZOInitializeConnectionMessage&) { Say("initialized " + Fingerprint(Token())); });
            listener.AddHandler<ZOTerminateConnectionMessage>(
                [](const ZOTerminateConnectionMessage&) { Say("terminated"); });
            HandleFirstAutoAuthentication();
            std::thread reader([&] { ReadCommands(hub); });
            Say("ready");
            while (!mIsOver) {
                ostcore::threads::WaitAndPumpMainThread(0xFFFFFFFFu);
            }
            reader.join();
        }
        IZOCDataServer::Terminate(false);
        ostcore::threads::PumpMainThread();
        Shutdown();
    }

private:
    static void Say(const std::string& inLine) { std::cout << inLine << std::endl; }
    static ImmutableString Token() {
        const auto server = IZOCDataServer::GetLoggedInServerRef();
        return server ? server->GetCredentials().token : ImmutableString();
    }
    void ReadCommands(const ImmutableString& inHub) {
        std::string line;
        while (std::getline(std::cin, line)) {
            ostcore::threads::AsyncCallFromMainThread([this, line, inHub] { Do(line, inHub); });
        }
        ostcore::threads::AsyncCallFromMainThread([this] { mIsOver = true; });
    }
    void Do(const std::string& inCommand, const ImmutableString& inHub) {
        if (inCommand.substr(0, 6) == "login ") {
            Login(inCommand.substr(6), inHub);
        } else if (inCommand == "get") {
            Get();
        } else if (inCommand == "forget") {
            Forget();
        }
    }
    /// As the sign-in window of a host does: signs in with the password and stores the login for all.
    static void Login(const std::string& inUser, const ImmutableString& inHub) {
        ZOSCredentials credentials;
        credentials.username = ImmutableString(inUser);
        credentials.password = inUser + "s-secret";
        std::promise<InterfaceRef<IZOCDataServer>> ended;
        Guid id;
        IZOCDataServer::ConnectToServer(
            inHub, credentials, id, false,
            [&ended](const Guid&, const InterfaceRef<IZOCDataServer>& inServer, int,
                     const shared_ptr<ostnet::Response>&) { ended.set_value(inServer); },
            true, true);
        const InterfaceRef<IZOCDataServer> server = ended.get_future().get();
        const bool stored = server && Registry::StoreLoginData(server->GetLoginData(), UString());
        Say(stored ? "login " + Fingerprint(Token()) : "login failed");
    }
    /// Has the hub forget the token, of which this process takes no note.
    static void Forget() {
        const auto server = IZOCDataServer::GetLoggedInServerRef();
        const auto response = server->BlockingPOST(server->GetLink(kRelation_System_Logout), {},
                                                   shared_ptr<RecycledMemory const>(), 30000);
        Say("forgotten " + std::to_string(response ? response->status : -2));
    }
    static void Get() {
        const auto server = IZOCDataServer::GetLoggedInServerRef();
        const auto response =
            server ? server->BlockingGET(server->GetLink(kRelation_Productions), {}, 30000) : nullptr;
        Say("status " + std::to_string(response ? response->status : -2) + " " + Fingerprint(Token()));
    }

    bool mIsOver = false;
};

TEST(HostProcess, DISABLED_Run) {
    Host().Run();
}

/// The side of the test.
class Child {
public:
    Child() {
        int commands[2];
        int lines[2];
        EXPECT_EQ(pipe2(commands, O_CLOEXEC), 0);
        EXPECT_EQ(pipe2(lines, O_CLOEXEC), 0);
        mProcess = fork();
        if (mProcess == 0) {
            dup2(commands[0], STDIN_FILENO);
            dup2(lines[1], STDOUT_FILENO);
            execl("/proc/self/exe", "host", "--gtest_filter=HostProcess.DISABLED_Run",
                  "--gtest_also_run_disabled_tests", static_cast<char*>(nullptr));
            _exit(127);
        }
        close(commands[0]);
        close(lines[1]);
        mCommands = commands[1];
        mLines = lines[0];
        WaitFor("ready");
    }
    ~Child() {
        close(mCommands);
        int status = -1;
        waitpid(mProcess, &status, 0);
        EXPECT_EQ(status, 0) << "the host did not end well";
        close(mLines);
    }
    Child(const Child&) = delete;
    Child& operator=(const Child&) = delete;

    void Tell(const std::string& inCommand) {
        const std::string line = inCommand + "\n";
        EXPECT_EQ(write(mCommands, line.data(), line.size()), static_cast<ssize_t>(line.size()));
    }
    /// Reads on until a line begins so, and gives what follows; fails the test when none comes.
    std::string WaitFor(const std::string& inBeginning) {
        std::string line;
        while (ReadLine(line)) {
            if (line.substr(0, inBeginning.size()) == inBeginning) {
                return line.substr(std::min(line.size(), inBeginning.size() + 1));
            }
        }
        ADD_FAILURE() << "no line \"" << inBeginning << "\" came";
        return {};
    }
    std::string Ask(const std::string& inCommand, const std::string& inBeginning) {
        Tell(inCommand);
        return WaitFor(inBeginning);
    }

private:
    bool ReadLine(std::string& outLine) {
        outLine.clear();
        pollfd watched{mLines, POLLIN, 0};
        char character = 0;
        while (poll(&watched, 1, kPatienceMilliseconds) > 0 && read(mLines, &character, 1) == 1) {
            if (character == '\n') {
                return true;
            }
            outLine += character;
        }
        return false;
    }

    pid_t mProcess = -1;
    int mCommands = -1;
    int mLines = -1;
};

TEST(SharedLogin, ProcessesFollowEachOther) {
    RunningHub hub;
    hub.AddUser("berta");
    setenv("ZOCLIENT_CONFIG_HOME", (hub.Directory() + "/config").c_str(), 1);
    setenv(kHubVariable, hub.URL().c_str(), 1);
    Child first;
    Child second;

    // A login of the one is a login of the other, with the same token and no password.
    const std::string token = first.Ask("login anna", "login");
    EXPECT_EQ(second.WaitFor("initialized"), token);
    EXPECT_EQ(second.Ask("get", "status"), "200 " + token);

    // The hub forgets the token; the first has kept the password and renews, the second takes what it stores.
    EXPECT_EQ(first.Ask("forget", "forgotten"), "204");
    const std::string answer = first.Ask("get", "status");
    EXPECT_EQ(answer.substr(0, 4), "200 ");
    const std::string renewed = answer.substr(4);
    EXPECT_NE(renewed, token);
    EXPECT_EQ(second.WaitFor("initialized"), renewed);
    EXPECT_EQ(second.Ask("get", "status"), "200 " + renewed);

    // Somebody else signs in: with nobody to ask for a password, the second gives its login up.
    first.Ask("login berta", "login");
    second.WaitFor("terminated");
}

}  // namespace
}  // namespace ZOCL
