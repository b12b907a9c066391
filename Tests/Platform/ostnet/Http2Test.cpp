// HTTP/2 against a server that speaks nothing else: what was agreed on in the handshake is really used.
#include <arpa/inet.h>
#include <fcntl.h>
#include <gtest/gtest.h>
#include <netinet/in.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <csignal>
#include <filesystem>
#include <fstream>

#include "net/Certificates.h"
#include "Requester.h"

namespace ostnet_test {
namespace {

/// A port that was free a moment ago.
int PickPort() {
    const int probe = socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    socklen_t size = sizeof address;
    void* const place = &address;
    bind(probe, static_cast<sockaddr*>(place), size);
    getsockname(probe, static_cast<sockaddr*>(place), &size);
    close(probe);
    return ntohs(address.sin_port);
}

/// nghttpd, which serves a folder by HTTP/2 over TLS and refuses every older protocol.
class Http2Server {
public:
    Http2Server(const zotest::net::ServerIdentity& inIdentity, const std::filesystem::path& inFolder) {
        const auto key = inFolder / "key.pem", certificate = inFolder / "certificate.pem";
        std::ofstream(key) << inIdentity.key;
        std::ofstream(certificate) << inIdentity.certificate;
        // Somebody else may take the port before the server does.
        for (int attempt = 0; attempt < 5 && !mIsListening; ++attempt) {
            Stop();
            mPort = PickPort();
            Start({"/usr/sbin/nghttpd", "-v", "-a", "127.0.0.1", "-d", inFolder.string(),
                   std::to_string(mPort), key.string(), certificate.string()});
        }
    }
    ~Http2Server() { Stop(); }
    Http2Server(const Http2Server&) = delete;
    Http2Server& operator=(const Http2Server&) = delete;

    bool IsListening() const { return mIsListening; }
    std::string URL(const std::string& inPath) const {
        return "https://127.0.0.1:" + std::to_string(mPort) + inPath;
    }

private:
    void Start(std::vector<std::string> inWords) {
        std::array<int, 2> pipe{};
        ASSERT_EQ(pipe2(pipe.data(), O_CLOEXEC), 0);
        posix_spawn_file_actions_t actions;
        posix_spawn_file_actions_init(&actions);
        posix_spawn_file_actions_adddup2(&actions, pipe[1], STDOUT_FILENO);
        posix_spawn_file_actions_adddup2(&actions, pipe[1], STDERR_FILENO);
        std::vector<char*> arguments;
        for (std::string& word : inWords) {
            arguments.push_back(word.data());
        }
        arguments.push_back(nullptr);
        if (posix_spawn(&mProcess, arguments[0], &actions, nullptr, arguments.data(), environ) != 0) {
            mProcess = -1;
        }
        posix_spawn_file_actions_destroy(&actions);
        close(pipe[1]);
        mOutput = pipe[0];
        std::string said;
        std::array<char, 256> bytes;
        for (ssize_t size = 0; !mIsListening && (size = read(mOutput, bytes.data(), bytes.size())) > 0;) {
            said.append(bytes.data(), static_cast<std::size_t>(size));
            mIsListening = said.find("listen 127.0.0.1") != std::string::npos;
        }
        if (mIsListening) {
            // Nobody reads on; the server must not block on what it says.
            mReader = std::thread([this] {
                std::array<char, 4096> rest;
                while (read(mOutput, rest.data(), rest.size()) > 0) {
                }
            });
        }
    }
    void Stop() {
        if (mProcess > 0) {
            kill(mProcess, SIGKILL);
            waitpid(mProcess, nullptr, 0);
            mProcess = -1;
        }
        if (mReader.joinable()) {
            mReader.join();
        }
        if (mOutput >= 0) {
            close(mOutput);
            mOutput = -1;
        }
    }

    pid_t mProcess = -1;
    int mOutput = -1;
    int mPort = 0;
    bool mIsListening = false;
    std::thread mReader;
};

TEST(Http2, ManyRequestsShareOneConnection) {
    const std::filesystem::path folder =
        std::filesystem::temp_directory_path() / ("zo-http2-" + Guid::CreateUnique().ToString());
    std::filesystem::create_directory(folder);
    constexpr std::size_t kFiles = 40;
    const auto content = [](std::size_t inNumber) {
        return std::string(20000 + inNumber, static_cast<char>('a' + inNumber % 26));
    };
    for (std::size_t i = 0; i < kFiles; ++i) {
        std::ofstream(folder / std::to_string(i)) << content(i);
    }
    const zotest::net::CertificateAuthority authority;
    {
        const Http2Server server(authority.Issue("127.0.0.1"), folder);
        ASSERT_TRUE(server.IsListening()) << "nghttpd (package nghttp2-server) did not start";
        NetworkSettings settings = Requester::DefaultSettings();
        settings.certificateAuthorityFile = authority.File();
        Requester requester(settings);
        std::vector<Guid> requests;
        for (std::size_t i = 0; i < kFiles; ++i) {
            requests.push_back(requester.Start(server.URL("/" + std::to_string(i))));
        }
        for (std::size_t i = 0; i < kFiles; ++i) {
            const auto response = requester.Done().Wait(requests[i]);
            ASSERT_TRUE(response);
            EXPECT_EQ(response->status, 200) << response->curlError;
            EXPECT_EQ(Body(response), content(i));
        }
        EXPECT_EQ(requester.Get(server.URL("/missing"))->status, 404);
        ostnet::http::RequestProcessor::Statistics statistics;
        ASSERT_TRUE(requester.Processor().GetStatistics(statistics));
        EXPECT_EQ(statistics.connectionsOpened, 1u);
        EXPECT_EQ(requester.Done().Total(), kFiles + 1);
    }
    std::filesystem::remove_all(folder);
}

}  // namespace
}  // namespace ostnet_test
