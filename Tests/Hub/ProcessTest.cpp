// The program itself: its commands, its TLS, and that kill -9 loses nothing that was answered.
#include <fcntl.h>
#include <openssl/err.h>
#include <openssl/ssl.h>
#include <signal.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <condition_variable>
#include <mutex>
#include <thread>

#include "Base/Digest.h"
#include "HubFixture.h"

extern char** environ;

namespace zohub::test {

namespace fs = std::filesystem;

namespace {

// A child with its standard streams in our hands.
class Process {
public:
    Process(std::vector<std::string> inArguments, std::string const& inInput = {}) {
        int input[2];
        int output[2];
        if (pipe2(input, O_CLOEXEC) != 0 || pipe2(output, O_CLOEXEC) != 0)
            throw std::runtime_error("no pipes");
        posix_spawn_file_actions_t actions;
        posix_spawn_file_actions_init(&actions);
        posix_spawn_file_actions_adddup2(&actions, input[0], STDIN_FILENO);
        posix_spawn_file_actions_adddup2(&actions, output[1], STDOUT_FILENO);
        posix_spawn_file_actions_adddup2(&actions, output[1], STDERR_FILENO);
        std::vector<char*> arguments{const_cast<char*>(ZOHUB_BINARY)};
        for (auto& argument : inArguments)
            arguments.push_back(argument.data());
        arguments.push_back(nullptr);
        int const failed = posix_spawn(&mId, ZOHUB_BINARY, &actions, nullptr, arguments.data(), environ);
        posix_spawn_file_actions_destroy(&actions);
        close(input[0]);
        close(output[1]);
        mOutput = output[0];
        bool const written =
            write(input[1], inInput.data(), inInput.size()) == static_cast<ssize_t>(inInput.size());
        close(input[1]);
        if (failed || !written)
            throw std::runtime_error("cannot start zohub");
    }

    ~Process() {
        if (mId > 0) {
            kill(mId, SIGKILL);
            waitpid(mId, nullptr, 0);
        }
        close(mOutput);
    }
    Process(Process const&) = delete;
    Process& operator=(Process const&) = delete;

    void Signal(int inSignal) { kill(mId, inSignal); }

    /// The exit code, or 128 and the signal.
    int Wait() {
        int status = 0;
        waitpid(mId, &status, 0);
        mId = -1;
        return WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
    }

    std::string ReadUntil(std::string const& inText) {
        char c = 0;
        while (mText.find(inText) == std::string::npos && read(mOutput, &c, 1) == 1)
            mText += c;
        return mText;
    }

    std::string ReadAll() { return ReadUntil("\x01 never"); }

private:
    pid_t mId = -1;
    int mOutput = -1;
    std::string mText;
};

struct Result {
    int code = 0;
    std::string output;
};

Result RunZohub(std::vector<std::string> inArguments, std::string const& inInput = {}) {
    Process process(std::move(inArguments), inInput);
    std::string output = process.ReadAll();
    int const code = process.Wait();
    return {code, output};
}

bool CanSpeakTls(
    std::uint16_t inPort, std::string const& inCaFile, std::string const& inHost, std::string& outAnswer,
    std::string const& inRequest = "GET /health HTTP/1.1\r\nHost: localhost\r\nConnection: close\r\n\r\n") {
    using Context = std::unique_ptr<SSL_CTX, decltype(&SSL_CTX_free)>;
    Context const context(SSL_CTX_new(TLS_client_method()), SSL_CTX_free);
    SSL_CTX_set_verify(context.get(), SSL_VERIFY_PEER, nullptr);
    if (!inCaFile.empty())
        SSL_CTX_load_verify_locations(context.get(), inCaFile.c_str(), nullptr);
    std::unique_ptr<BIO, decltype(&BIO_free_all)> const bio(BIO_new_ssl_connect(context.get()), BIO_free_all);
    SSL* ssl = nullptr;
    BIO_get_ssl(bio.get(), &ssl);
    X509_VERIFY_PARAM* const rules = SSL_get0_param(ssl);
    if (inHost.find_first_not_of("0123456789.:") == std::string::npos)
        X509_VERIFY_PARAM_set1_ip_asc(rules, inHost.c_str());
    else
        SSL_set1_host(ssl, inHost.c_str());
    BIO_set_conn_hostname(bio.get(), ("127.0.0.1:" + std::to_string(inPort)).c_str());
    if (BIO_do_connect(bio.get()) != 1)
        return false;
    BIO_write(bio.get(), inRequest.data(), static_cast<int>(inRequest.size()));
    char bytes[4096];
    for (int count; (count = BIO_read(bio.get(), bytes, sizeof bytes)) > 0;)
        outAnswer.append(bytes, static_cast<std::size_t>(count));
    return true;
}

std::uint16_t PortOf(std::string const& inUrl) {
    return static_cast<std::uint16_t>(std::stoul(inUrl.substr(inUrl.rfind(':') + 1)));
}

}  // namespace

class ProcessTest : public ::testing::Test {
protected:
    std::string Data() const { return (mDirectory.Path() / "data").string(); }
    fs::path ReadyFile() const { return mDirectory.Path() / "ready.json"; }

    Result AddUser(std::string const& inName) {
        return RunZohub({"user", "add", inName, "--password-stdin", "--data", Data()}, inName + "-secret\n");
    }

    std::unique_ptr<Process> Serve() {
        auto process = std::make_unique<Process>(
            std::vector<std::string>{"serve", "--data", Data(), "--port", "0", "--tls-port", "0",
                                     "--ready-file", ReadyFile().string()});
        process->ReadUntil("certificate authority");
        mReady = Json::parse(ReadFile(ReadyFile()));
        return process;
    }

    std::uint16_t Port() const { return PortOf(mReady["httpUrl"].get<std::string>()); }

    TemporaryDirectory mDirectory;
    Json mReady;
};

TEST_F(ProcessTest, WhatWasAnsweredSurvivesKillMinusNine) {
    ASSERT_EQ(AddUser("anna").code, 0);
    std::vector<std::string> answered;
    std::string production;
    for (int round = 0; round < 4; ++round) {
        auto const hub = Serve();
        Client anna(Port());
        ASSERT_EQ(anna.SignIn("anna", "anna-secret").status, 200);
        if (production.empty())
            production = Json::parse(anna.PostJson("/zo/1/p", R"({"name":"Film"})").body)["zo:productionId"];
        std::mutex mutex;
        std::condition_variable enough;
        std::size_t const goal = answered.size() + 10u + static_cast<std::size_t>(round) * 7u;
        auto const write = [&](int inThread) {
            for (int i = 0;; ++i) {
                std::string const id =
                    "a" + std::to_string(round) + "-" + std::to_string(inThread) + "-" + std::to_string(i);
                try {
                    Answer const answer = anna.PostJson(
                        "/zo/1/p/" + production + "/a",
                        R"({"zo:assetId":")" + id +
                            R"(","properties":{"name":"x","description":"","cdzo:assetType":"bin"}})");
                    if (answer.status != 201)
                        return;
                } catch (std::runtime_error const&) {
                    return;
                }
                std::lock_guard const lock(mutex);
                answered.push_back(id);
                enough.notify_all();
            }
        };
        std::thread first(write, 1);
        std::thread second(write, 2);
        {
            std::unique_lock lock(mutex);
            enough.wait_for(lock, std::chrono::seconds(60), [&] { return answered.size() >= goal; });
        }
        hub->Signal(SIGKILL);
        EXPECT_EQ(hub->Wait(), 128 + SIGKILL);
        first.join();
        second.join();
        ASSERT_GE(answered.size(), goal);
    }
    auto const hub = Serve();
    Client anna(Port());
    ASSERT_EQ(anna.SignIn("anna", "anna-secret").status, 200);
    std::set<std::string> present;
    Json const list = Json::parse(anna.Get("/zo/1/p/" + production + "/a").body);
    for (auto const& asset : list["assets"])
        present.insert(asset["zo:assetId"].get<std::string>());
    for (auto const& id : answered)
        EXPECT_TRUE(present.count(id)) << id;
    Result const check = RunZohub({"check", "--data", Data()});
    EXPECT_EQ(check.code, 0) << check.output;
}

TEST_F(ProcessTest, CommandsWorkBesideARunningServerAndItStopsWhenTold) {
    auto const hub = Serve();
    ASSERT_EQ(AddUser("anna").code, 0);
    Client anna(Port());
    ASSERT_EQ(anna.SignIn("anna", "anna-secret").status, 200);
    Result const imported = RunZohub(
        {"import", ZOHUB_SAMPLE_MEDIA, "--production", "Harbour", "--owner", "anna", "--data", Data()});
    EXPECT_EQ(imported.code, 0) << imported.output;
    Json const list = Json::parse(anna.Get("/zo/1/p").body);
    ASSERT_EQ(list["productions"].size(), 1u);

    fs::path const target = mDirectory.Path() / "out";
    Result const exported =
        RunZohub({"export", target.string(), "--production", "Harbour", "--data", Data()});
    EXPECT_EQ(exported.code, 0) << exported.output;
    fs::path const sample = ZOHUB_SAMPLE_MEDIA;
    EXPECT_EQ(ReadFile(target / "broll" / "lighthouse.jpg"), ReadFile(sample / "broll" / "lighthouse.jpg"));
    EXPECT_EQ(ReadFile(target / "broll" / "lighthouse.jpg.xmp"),
              ReadFile(sample / "broll" / "lighthouse.xmp"));
    EXPECT_EQ(RunZohub({"export", target.string(), "--production", "Harbour", "--data", Data()}).code, 1);

    hub->Signal(SIGTERM);
    EXPECT_NE(hub->ReadAll().find("zohub: stopping"), std::string::npos);
    EXPECT_EQ(hub->Wait(), 0);
}

TEST_F(ProcessTest, ExportsOfHostileNamesStayInTheirFolder) {
    ASSERT_EQ(AddUser("anna").code, 0);
    auto const hub = Serve();
    Client anna(Port());
    ASSERT_EQ(anna.SignIn("anna", "anna-secret").status, 200);
    Json const production = Json::parse(anna.PostJson("/zo/1/p", R"({"name":"Film"})").body);
    for (char const* name :
         {"../../escape.jpg", "/tmp/absolute.jpg", "..", ".hidden", "a\\b", "x.jpg", "x.jpg"}) {
        Json const properties = {{"name", name}, {"description", ""}, {"cdzo:assetType", "masterclip"}};
        Json const asset = Json::parse(
            anna.PostJson(LinkOf(production, "/assets/asset#create"), Json{{"properties", properties}}.dump())
                .body);
        anna.Request("POST", LinkOf(asset, "/renditions"), name, {{"Content-Type", "image/jpeg"}});
    }
    // A parent of itself must not send the export round in circles.
    Json const loop = {
        {"name", "loop"}, {"description", ""}, {"zo:parent", "loop"}, {"cdzo:assetType", "bin"}};
    anna.PostJson(LinkOf(production, "/assets/asset#create"),
                  Json{{"zo:assetId", "loop"}, {"properties", loop}}.dump());
    fs::path const target = mDirectory.Path() / "deep" / "er" / "out";
    Result const exported = RunZohub({"export", target.string(), "--production", "Film", "--data", Data()});
    EXPECT_EQ(exported.code, 0) << exported.output;
    std::size_t files = 0;
    for (auto const& entry : fs::recursive_directory_iterator(mDirectory.Path()))
        files += entry.path().extension() == ".jpg" ? 1 : 0;
    std::size_t inside = 0;
    for (auto const& entry : fs::recursive_directory_iterator(target))
        inside += entry.path().extension() == ".jpg" ? 1 : 0;
    EXPECT_EQ(inside, 7u);
    EXPECT_EQ(files, inside);
    EXPECT_FALSE(fs::exists("/tmp/absolute.jpg"));
}

TEST_F(ProcessTest, TlsIsTrustedThroughItsOwnAuthorityOnly) {
    auto hub = Serve();
    std::uint16_t const port = PortOf(mReady["tlsUrl"].get<std::string>());
    std::string const ca = mReady["caFile"].get<std::string>();
    for (char const* host : {"localhost", "127.0.0.1", "::1"}) {
        std::string answer;
        EXPECT_TRUE(CanSpeakTls(port, ca, host, answer)) << host;
        EXPECT_EQ(answer.rfind("HTTP/1.1 200", 0), 0u) << answer;
    }
    std::string nothing;
    EXPECT_FALSE(CanSpeakTls(port, "", "localhost", nothing));
    EXPECT_FALSE(CanSpeakTls(port, ca, "other.example", nothing));
    ERR_clear_error();
    auto const rights = fs::status(fs::path(Data()) / "tls" / "server.key").permissions();
    EXPECT_EQ(rights & (fs::perms::group_all | fs::perms::others_all), fs::perms::none);

    std::string const before = ReadFile(ca);
    hub->Signal(SIGTERM);
    EXPECT_EQ(hub->Wait(), 0);
    hub = Serve();
    EXPECT_EQ(ReadFile(mReady["caFile"].get<std::string>()), before) << "clients keep the file they have";
}

TEST_F(ProcessTest, LongAnswersLeaveWholeOverTls) {
    ASSERT_EQ(AddUser("anna").code, 0);
    auto const hub = Serve();
    Client anna(Port());
    ASSERT_EQ(anna.SignIn("anna", "anna-secret").status, 200);
    Json const production = Json::parse(anna.PostJson("/zo/1/p", R"({"name":"Film"})").body);
    for (std::size_t const size : {100u, 8000u, 9000u, 16384u, 100000u, 1500000u}) {
        std::string bytes;
        while (bytes.size() < size)
            bytes += std::to_string(bytes.size()) + ",";
        Answer const made = anna.SendForm(
            "POST", LinkOf(production, "/enclosures"),
            Form().Add(":name", std::to_string(size)).Add(":enclosure", bytes, "text/x-numbers"));
        ASSERT_EQ(made.status, 201);
        std::string const href = LinkOf(Json::parse(made.body), "/enclosures/enclosure");
        std::string answer;
        ASSERT_TRUE(CanSpeakTls(
            PortOf(mReady["tlsUrl"].get<std::string>()), mReady["caFile"].get<std::string>(), "localhost",
            answer,
            "GET " + href.substr(href.find("/zo/")) +
                " HTTP/1.1\r\nHost: localhost\r\nConnection: close\r\nCookie: " + anna.Token() + "\r\n\r\n"));
        std::size_t const head = answer.find("\r\n\r\n");
        ASSERT_NE(head, std::string::npos);
        EXPECT_EQ(answer.size() - head - 4, bytes.size());
        EXPECT_TRUE(answer.compare(head + 4, std::string::npos, bytes) == 0) << size;
    }
}

TEST_F(ProcessTest, CommandLinesThatMakeNoSenseAreRefusedWithoutAPasswordInSight) {
    for (std::vector<std::string> const& words :
         {std::vector<std::string>{},
          {"fly"},
          {"serve", "--port"},
          {"serve", "--port", "70000"},
          {"serve", "--port", "x"},
          {"serve", "--colour"},
          {"user", "add", "anna", "--password", "pw"},
          {"user", "add", "anna"},
          {"import", "x"},
          {"import", "x", "y", "--production", "p", "--owner", "o"}}) {
        auto arguments = words;
        if (!arguments.empty())
            arguments.insert(arguments.end(), {"--data", Data()});
        EXPECT_EQ(RunZohub(arguments).code, 2) << (words.empty() ? "" : words[0]);
    }
    EXPECT_EQ(RunZohub({"--help"}).code, 0);
    EXPECT_EQ(RunZohub({"user", "add", "anna", "--password-stdin", "--data", Data()}, "\n").code, 1);
    for (char const* cost : {"9", "17", "ten"})
        EXPECT_EQ(RunZohub({"user", "add", "anna", "--password-file", "unread", "--password-cost", cost,
                            "--data", Data()})
                      .code,
                  2)
            << cost;
    EXPECT_EQ(AddUser("anna").code, 0);
    Result const twice = AddUser("anna");
    EXPECT_EQ(twice.code, 1);
    EXPECT_EQ(twice.output.find("anna-secret"), std::string::npos);
    EXPECT_EQ(
        RunZohub({"user", "add", "anna", "--replace", "--password-stdin", "--data", Data()}, "new\n").code,
        0);
}

}  // namespace zohub::test
