// Connecting over real sockets to a hub that runs as a process of its own.
#include <fcntl.h>
#include <signal.h>
#include <stdlib.h>
#include <sys/wait.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <future>

#include <gtest/gtest.h>

#include "Connection/DataServer.h"
#include "ostcore/threads/MainThread.h"
#include "Relations.h"
#include "RFL/Registry.h"
#include "ZOClient/Library.h"

namespace ZOCL {
namespace {

using ostnet::http::kWaitForever;

pid_t Spawn(const std::vector<std::string>& inArguments, int inOutput) {
    std::vector<char*> words;
    for (const std::string& argument : inArguments) {
        words.push_back(const_cast<char*>(argument.c_str()));
    }
    words.push_back(nullptr);
    const pid_t child = fork();
    if (child == 0) {
        dup2(inOutput, STDOUT_FILENO);
        execv(words[0], words.data());
        _exit(127);
    }
    return child;
}

/// A hub with the user anna on a free port, in a directory that goes with it.
class RunningHub {
public:
    RunningHub() {
        std::string pattern = (std::filesystem::temp_directory_path() / "zoclient-hub-XXXXXX").string();
        mDirectory = mkdtemp(pattern.data());
        std::ofstream(mDirectory + "/password") << "annas-secret\n";
        int ends[2] = {-1, -1};
        EXPECT_EQ(pipe2(ends, O_CLOEXEC), 0);
        const pid_t adding = Spawn({ZO_HUB_PROGRAM, "user", "add", "anna", "--data", mDirectory + "/data",
                                    "--password-file", mDirectory + "/password"},
                                   STDERR_FILENO);
        int status = -1;
        waitpid(adding, &status, 0);
        EXPECT_EQ(status, 0) << "the user could not be added";
        mProcess = Spawn({ZO_HUB_PROGRAM, "serve", "--data", mDirectory + "/data", "--port", "0", "--no-tls"},
                         ends[1]);
        close(ends[1]);
        mURL = ReadURL(ends[0]);
        close(ends[0]);
    }
    ~RunningHub() {
        kill(mProcess, SIGTERM);
        waitpid(mProcess, nullptr, 0);
        std::error_code ignored;
        std::filesystem::remove_all(mDirectory, ignored);
    }
    RunningHub(const RunningHub&) = delete;
    RunningHub& operator=(const RunningHub&) = delete;

    ImmutableString URL() const { return ImmutableString(mURL); }
    const std::string& Directory() const { return mDirectory; }

private:
    /// Waits for the line that tells the URL, or for the end of the process.
    static std::string ReadURL(int inPipe) {
        std::string text;
        char character = 0;
        while (read(inPipe, &character, 1) == 1 && character != '\n') {
            text += character;
        }
        const std::size_t start = text.find("http://");
        EXPECT_NE(start, std::string::npos) << text;
        return start == std::string::npos ? std::string() : text.substr(start);
    }
    std::string mDirectory;
    std::string mURL;
    pid_t mProcess = -1;
};

struct Connected {
    int result = 1;
    InterfaceRef<IZOCDataServer> server;
};

class HubConnectTest : public testing::Test {
protected:
    HubConnectTest() {
        setenv("ZOCLIENT_CONFIG_HOME", (hub.Directory() + "/config").c_str(), 1);
        RFL::CloseRegistry();
        Initialize();
    }
    ~HubConnectTest() override {
        IZOCDataServer::Terminate(false);
        ostcore::threads::PumpMainThread();
        Shutdown();
        RFL::CloseRegistry();
    }
    Connected Connect(const char* inPassword, const ImmutableString& inToken = {}, bool inKeep = false) {
        ZOSCredentials credentials;
        credentials.username = ImmutableString("anna");
        credentials.password = inPassword;
        credentials.token = inToken;
        std::promise<Connected> ended;
        Guid id;
        EXPECT_TRUE(IZOCDataServer::ConnectToServer(
            hub.URL(), credentials, id, false,
            [&ended](const Guid&, const InterfaceRef<IZOCDataServer>& inServer, int inResult,
                     const shared_ptr<ostnet::Response>&) {
                ended.set_value({inResult, inServer});
            },
            inKeep, true));
        return ended.get_future().get();
    }
    RunningHub hub;
};

TEST_F(HubConnectTest, SignsInAndOut) {
    const Connected connected = Connect("annas-secret");
    ASSERT_EQ(connected.result, kResultSuccess);
    ASSERT_TRUE(connected.server);
    EXPECT_TRUE(IsLoggedIn());
    EXPECT_TRUE(ServerIsCompatible(connected.server));
    const ImmutableString productions = connected.server->GetLink(kRelation_Productions);
    ASSERT_FALSE(productions.IsNull());
    EXPECT_EQ(connected.server->BlockingGET(productions, {}, kWaitForever)->status, 200);
    const ImmutableString token = connected.server->GetCredentials().token;
    IZOCDataServer::Terminate(true);
    EXPECT_FALSE(IsLoggedIn());
    EXPECT_EQ(connected.server->BlockingGET(productions, {}, kWaitForever)->status, 401);
    EXPECT_EQ(Connect("not-the-secret", token).result, kResultHTTPUnauthorized)
        << "the token outlived the logout";
}

TEST_F(HubConnectTest, AWrongPasswordIsRefused) {
    const Connected connected = Connect("wrong");
    EXPECT_EQ(connected.result, kResultHTTPUnauthorized);
    EXPECT_FALSE(connected.server);
    EXPECT_FALSE(IsLoggedIn());
}

TEST_F(HubConnectTest, ATokenThatTheHubHasForgottenIsRenewed) {
    const Connected first = Connect("annas-secret", {}, true);
    ASSERT_TRUE(first.server);
    const ImmutableString token = first.server->GetCredentials().token;
    const ImmutableString productions = first.server->GetLink(kRelation_Productions);
    // Another process that shares the token signs out with it.
    const Connected second = Connect("", token);
    ASSERT_TRUE(second.server);
    EXPECT_EQ(second.server->GetCredentials().token, token);
    RFL::QueryInterface<DataServer>(second.server)->SendLogout();
    EXPECT_EQ(first.server->BlockingGET(productions, {}, kWaitForever)->status, 200);
    EXPECT_NE(first.server->GetCredentials().token, token);
}

}  // namespace
}  // namespace ZOCL
