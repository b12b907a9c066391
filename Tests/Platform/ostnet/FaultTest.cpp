// A server that breaks off, lies, floods or falls silent: each request ends once, with an honest error.
#include <curl/curl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <fstream>

#include "ostnet/http/Compression.h"
#include "Requester.h"

namespace ostnet_test {
namespace {

using testing::AnyOf;

constexpr const char* kSmallAnswer =
    "HTTP/1.1 200 OK\r\nContent-Type: text/plain\r\nX-A: b\r\nContent-Length: 12\r\n\r\nhello, world";

void ExpectFailure(const ResponseRef& inResponse, int inError, const std::string& inWhat = {}) {
    ASSERT_TRUE(inResponse) << inWhat;
    EXPECT_EQ(inResponse->status, 0) << inWhat;
    EXPECT_EQ(inResponse->curlError, inError) << inWhat;
    EXPECT_FALSE(inResponse->payload) << inWhat;
    EXPECT_TRUE(inResponse->headers.empty()) << inWhat;
}

/// Answers every connection with these bytes and then ends it.
RawServer::Handler SayAndEnd(std::string inBytes, bool inReset = false) {
    return [bytes = std::move(inBytes), inReset](Connection& ioConnection) {
        if (ioConnection.ReadRequest()) {
            ioConnection.Write(bytes);
            if (inReset) {
                ioConnection.Reset();
            }
        }
    };
}

class BrokenOff : public testing::TestWithParam<bool> {};

TEST_P(BrokenOff, AtEveryByteIsNeverASuccess) {
    const std::string answer = kSmallAnswer;
    RawServer server([&](Connection& ioConnection) {
        if (const auto request = ioConnection.ReadRequest()) {
            ioConnection.Write(answer.substr(0, std::stoul(request->target.substr(1))));
            if (GetParam()) {
                ioConnection.Reset();
            }
        }
    });
    Requester requester;
    std::vector<Guid> requests;
    for (std::size_t at = 0; at < answer.size(); ++at) {
        requests.push_back(requester.StartPost(server.URL("/" + std::to_string(at)), "x"));
    }
    for (std::size_t at = 0; at < answer.size(); ++at) {
        const auto response = requester.Done().Wait(requests[at]);
        ASSERT_TRUE(response) << at;
        EXPECT_EQ(response->status, 0) << at;
        EXPECT_FALSE(response->payload) << at;
        EXPECT_TRUE(Response::IsNetworkConnectivityError(response)) << at << " gave " << response->curlError;
        EXPECT_EQ(requester.Done().Calls(requests[at]), 1);
    }
    EXPECT_EQ(server.Requests().size(), answer.size()) << "a POST must not be sent twice";
}
INSTANTIATE_TEST_SUITE_P(Fault, BrokenOff, testing::Bool());

TEST(Fault, OnlyWhatIsSafeIsRepeatedOnADeadConnection) {
    // Each connection answers one request, then takes a second one and closes without a word.
    RawServer server([](Connection& ioConnection) {
        if (ioConnection.ReadRequest()) {
            ioConnection.Write(RawServer::Answer(200, "first"));
            ioConnection.ReadRequest();
        }
    });
    Requester requester;
    ASSERT_EQ(requester.Get(server.URL("/1"))->status, 200);
    ExpectFailure(requester.Post(server.URL("/post"), "once"), CURLE_GOT_NOTHING);
    ASSERT_EQ(requester.Get(server.URL("/2"))->status, 200);
    EXPECT_EQ(Body(requester.Get(server.URL("/get"))), "first");
    std::map<std::string, int> times;
    for (const auto& request : server.Requests()) {
        ++times[request.target];
    }
    EXPECT_EQ(times["/post"], 1);
    EXPECT_EQ(times["/get"], 2);
}

TEST(Fault, LengthInDoubtIsRefused) {
    const std::map<std::string, std::string> answers{
        {"/two", "HTTP/1.1 200 OK\r\nContent-Length: 5\r\nContent-Length: 3\r\n\r\nabcde"},
        {"/list", "HTTP/1.1 200 OK\r\nContent-Length: 5, 3\r\n\r\nabcde"},
        {"/negative", "HTTP/1.1 200 OK\r\nContent-Length: -5\r\n\r\nabcde"},
        {"/word", "HTTP/1.1 200 OK\r\nContent-Length: five\r\n\r\nabcde"},
        {"/huge", "HTTP/1.1 200 OK\r\nContent-Length: 99999999999999999999999\r\n\r\nabcde"},
        {"/both",
         "HTTP/1.1 200 OK\r\nContent-Length: 5\r\nTransfer-Encoding: chunked\r\n\r\n5\r\nabcde\r\n0\r\n\r\n"},
        {"/chunk", "HTTP/1.1 200 OK\r\nTransfer-Encoding: chunked\r\n\r\nzz\r\nabcde\r\n0\r\n\r\n"},
        {"/chunk-cut", "HTTP/1.1 200 OK\r\nTransfer-Encoding: chunked\r\n\r\n5\r\nabcde\r\n"},
        {"/garbage", "\x01\x02\x03\x04 this is no HTTP\r\n\r\n"},
    };
    RawServer server([&](Connection& ioConnection) {
        while (const auto request = ioConnection.ReadRequest()) {
            ioConnection.Write(request->target == "/good" ? RawServer::Answer(200, "good")
                                                          : answers.at(request->target));
            if (request->target == "/chunk-cut") {
                return;
            }
        }
    });
    Requester requester;
    for (const auto& [target, answer] : answers) {
        const auto response = requester.Get(server.URL(target));
        EXPECT_EQ(response->status, 0) << target;
        EXPECT_NE(response->curlError, 0) << target;
        EXPECT_FALSE(response->payload) << target;
        EXPECT_EQ(Body(requester.Get(server.URL("/good"))), "good") << "after " << target;
    }
    // The same length twice leaves no doubt.
    RawServer twice(SayAndEnd("HTTP/1.1 200 OK\r\nContent-Length: 2\r\nContent-Length: 2\r\n\r\nok"));
    EXPECT_EQ(Body(requester.Get(twice.URL("/"))), "ok");
}

TEST(Fault, BytesBeyondTheLengthReachNoOtherRequest) {
    RawServer server(RawServer::Answering([](const ReceivedRequest& inRequest) {
        return "HTTP/1.1 200 OK\r\nContent-Length: 4\r\n\r\n" + inRequest.target.substr(1, 4) +
               "HTTP/1.1 200 OK\r\nContent-Length: 4\r\n\r\nEVIL";
    }));
    Requester requester;
    for (int i = 1000; i < 1050; ++i) {
        const auto response = requester.Get(server.URL("/" + std::to_string(i)));
        if (response->status == 200) {
            EXPECT_EQ(Body(response), std::to_string(i));
        }
    }
}

TEST(Fault, BodyBeyondTheCapEndsAtTheCap) {
    NetworkSettings settings = Requester::DefaultSettings();
    settings.limits.maximumBodySize = 1 << 20;
    constexpr std::uint64_t kGiB = 1ull << 30;
    std::atomic<std::uint64_t> written{0};
    Signal chunkedEnded;
    RawServer server([&](Connection& ioConnection) {
        const auto request = ioConnection.ReadRequest();
        if (request->target == "/stated") {
            ioConnection.Write("HTTP/1.1 200 OK\r\nContent-Length: 1073741824\r\n\r\n");
            ioConnection.WaitForClose();
            return;
        }
        const std::string chunk = "10000\r\n" + std::string(0x10000, 'g') + "\r\n";
        ioConnection.Write("HTTP/1.1 200 OK\r\nTransfer-Encoding: chunked\r\n\r\n");
        while (written < kGiB && ioConnection.Write(chunk)) {
            written += chunk.size();
        }
        chunkedEnded.Set();
    });
    Requester requester(settings);
    ExpectFailure(requester.Get(server.URL("/stated")), CURLE_FILESIZE_EXCEEDED);
    ExpectFailure(requester.Get(server.URL("/chunked")), CURLE_FILESIZE_EXCEEDED);
    ASSERT_TRUE(chunkedEnded.Wait()) << "the connection must be dropped";
    EXPECT_LT(written, 64u << 20);
}

#if !defined(__SANITIZE_THREAD__) && !defined(__SANITIZE_ADDRESS__)
std::uint64_t PeakMemory() {
    std::ifstream status("/proc/self/status");
    for (std::string word; status >> word;) {
        if (word == "VmHWM:") {
            std::uint64_t kibibytes = 0;
            status >> kibibytes;
            return kibibytes << 10;
        }
    }
    return 0;
}
#endif

/// Runs and says by how much the peak of memory rose; sanitizers keep freed memory, so there it is not
/// judged.
template <typename Function>
void ExpectPeakBelow(std::uint64_t inBytes, Function inFunction) {
#if !defined(__SANITIZE_THREAD__) && !defined(__SANITIZE_ADDRESS__)
    std::ofstream("/proc/self/clear_refs") << "5";
    const std::uint64_t before = PeakMemory();
    inFunction();
    ASSERT_GT(before, 0u);
    EXPECT_LT(PeakMemory() - before, inBytes);
#else
    static_cast<void>(inBytes);
    inFunction();
#endif
}

std::string GzipOf(std::size_t inSize) {
    return std::string(
        ostnet::http::CompressPayload(RecycledMemory::CreateFromBytes(std::string(inSize, '\0')))->view());
}

TEST(Fault, GzipBombStopsAtTheCap) {
    constexpr std::uint64_t kCap = 32u << 20;
    NetworkSettings settings = Requester::DefaultSettings();
    settings.limits.inflate.maximumSize = kCap;
    settings.limits.inflate.maximumRatio = 2000;
    const std::string honest = GzipOf(256u << 20);
    ASSERT_GT((256u << 20) / honest.size(), 900u);
    std::string lying = honest;
    lying.replace(lying.size() - 4, 4, std::string("\x10\0\0\0", 4));
    std::string members;
    for (const std::string member = GzipOf(1 << 20); members.size() < 300 * member.size();) {
        members += member;
    }
    std::string damaged = GzipOf(1 << 20);
    damaged[damaged.size() / 2] = static_cast<char>(damaged[damaged.size() / 2] ^ 0x55);
    const std::map<std::string, std::pair<std::string, int>> bodies{
        {"/honest", {honest, CURLE_FILESIZE_EXCEEDED}},
        {"/lying", {lying, CURLE_FILESIZE_EXCEEDED}},
        {"/members", {members, CURLE_FILESIZE_EXCEEDED}},
        {"/damaged", {damaged, CURLE_BAD_CONTENT_ENCODING}},
        {"/cut", {honest.substr(0, honest.size() / 2), CURLE_BAD_CONTENT_ENCODING}},
        {"/short", {"\x1f\x8b", CURLE_BAD_CONTENT_ENCODING}},
    };
    RawServer server(RawServer::Answering([&](const ReceivedRequest& inRequest) {
        return RawServer::Answer(200, bodies.at(inRequest.target).first, "Content-Encoding: gzip\r\n");
    }));
    Requester requester(settings);
    ExpectPeakBelow(kCap + (16u << 20), [&] {
        for (const auto& [target, body] : bodies) {
            const auto response = requester.Get(server.URL(target));
            if (target == "/cut") {
                EXPECT_EQ(response->status,
                          0);  // what its last bytes seem to state decides between two errors
                EXPECT_THAT(response->curlError, AnyOf(CURLE_BAD_CONTENT_ENCODING, CURLE_FILESIZE_EXCEEDED));
            } else {
                ExpectFailure(response, body.second, target);
            }
        }
    });
    RawServer packedOtherwise(RawServer::Answering(
        [](const ReceivedRequest&) { return RawServer::Answer(200, "??", "Content-Encoding: br\r\n"); }));
    ExpectFailure(requester.Get(packedOtherwise.URL("/")), CURLE_BAD_CONTENT_ENCODING);
}

TEST(Fault, RatioIsBoundedBeforeTheSizeIs) {
    NetworkSettings settings = Requester::DefaultSettings();
    settings.limits.inflate.maximumRatio = 100;
    const std::string fine = GzipOf(4u << 20), tooDense = GzipOf(5u << 20);
    RawServer server(RawServer::Answering([&](const ReceivedRequest& inRequest) {
        return RawServer::Answer(200, inRequest.target == "/fine" ? fine : tooDense,
                                 "Content-Encoding: gzip\r\n");
    }));
    Requester requester(settings);
    EXPECT_EQ(requester.Get(server.URL("/fine"))->status, 200);
    ExpectFailure(requester.Get(server.URL("/dense")), CURLE_FILESIZE_EXCEEDED);
}

TEST(Fault, LongBodyOfUnknownLengthIsHeldOnce) {
    constexpr std::size_t kSize = 48u << 20;
    NetworkSettings settings = Requester::DefaultSettings();
    settings.limits.maximumBodySize = 64u << 20;
    const std::string piece(1 << 20, 'p');
    RawServer server([&](Connection& ioConnection) {
        ioConnection.ReadRequest();
        ioConnection.Write("HTTP/1.1 200 OK\r\nConnection: close\r\n\r\n");
        for (std::size_t sent = 0; sent < kSize; sent += piece.size()) {
            ioConnection.Write(piece);
        }
    });
    Requester requester(settings);
    ExpectPeakBelow(kSize + (16u << 20), [&] {
        const auto response = requester.Get(server.URL("/"));
        ASSERT_EQ(response->status, 200);
        EXPECT_EQ(response->payload->size(), kSize);
        EXPECT_EQ(response->payload->view().find_first_not_of('p'), std::string_view::npos);
    });
}

TEST(Fault, HeadIsBounded) {
    std::string lines = "HTTP/1.1 200 OK\r\n", large = lines, interim;
    for (int i = 0; i < 2000; ++i) {
        lines += "A: b\r\n";
        interim += "HTTP/1.1 102 Processing\r\n\r\n";
    }
    for (int i = 0; i < 10; ++i) {
        large += "Set-Cookie: c=" + std::string(50000, 'c') + "\r\n";
    }
    const std::map<std::string, std::string> heads{
        {"/lines", lines},
        {"/large", large},
        {"/interim", interim},
        {"/megabyte", "HTTP/1.1 200 OK\r\nSet-Cookie: c=" + std::string(1 << 20, 'c')}};
    RawServer server([&](Connection& ioConnection) {
        const auto request = ioConnection.ReadRequest();
        ioConnection.Write(heads.at(request->target));
        ioConnection.Write("\r\nContent-Length: 0\r\n\r\n");
        ioConnection.WaitForClose();
    });
    Requester requester;
    for (const auto& [target, head] : heads) {
        const auto response = requester.Get(server.URL(target));
        EXPECT_EQ(response->status, 0) << target;
        EXPECT_NE(response->curlError, 0) << target;
    }
}

class Silence : public testing::Test {
protected:
    static NetworkSettings Impatient() {
        NetworkSettings settings = Requester::DefaultSettings();
        settings.limits.connectTimeout = 300;
        settings.limits.responseTimeout = 300;
        settings.limits.lowSpeedTime = 200;
        settings.limits.lowSpeedBytes = 1000;
        return settings;
    }
    void ExpectTimeOut(const ResponseRef& inResponse) {
        ExpectFailure(inResponse, CURLE_OPERATION_TIMEDOUT);
        EXPECT_TRUE(Response::IsNetworkConnectivityError(inResponse));
    }
    Requester mRequester{Impatient()};
};

TEST_F(Silence, BeforeTheHeadIsCut) {
    RawServer server([](Connection& ioConnection) {
        ioConnection.ReadRequest();
        ioConnection.WaitForClose();
    });
    ExpectTimeOut(mRequester.Get(server.URL("/")));
}

TEST_F(Silence, InTheTLSHandshakeIsCut) {
    RawServer server([](Connection& ioConnection) { ioConnection.WaitForClose(); });
    ExpectTimeOut(mRequester.Get("https://127.0.0.1:" + std::to_string(server.Port()) + "/"));
}

TEST_F(Silence, InTheBodyIsCutAndSoIsATrickle) {
    Signal trickleEnded;
    RawServer server([&](Connection& ioConnection) {
        const auto request = ioConnection.ReadRequest();
        ioConnection.Write("HTTP/1.1 200 OK\r\nContent-Length: 1000000\r\n\r\nabc");
        if (request->target == "/trickle") {
            std::mutex mutex;
            std::condition_variable never;
            std::unique_lock<std::mutex> lock(mutex);
            while (ioConnection.Write("x")) {
                never.wait_for(lock, std::chrono::milliseconds(5));
            }
            trickleEnded.Set();
        }
        ioConnection.WaitForClose();
    });
    ExpectTimeOut(mRequester.Get(server.URL("/stall")));
    ExpectTimeOut(mRequester.Get(server.URL("/trickle")));
    EXPECT_TRUE(trickleEnded.Wait());
}

TEST_F(Silence, OfAServerThatDoesNotReadIsCut) {
    Signal ended;
    RawServer server([&](Connection& ioConnection) {
        ioConnection.ReadHead();
        ended.Wait();
    });
    ExpectTimeOut(mRequester.Post(server.URL("/"), std::string(64u << 20, 'u')));
    ended.Set();
}

TEST_F(Silence, IsBrokenByInterimAnswers) {
    RawServer server([](Connection& ioConnection) {
        ioConnection.ReadRequest();
        std::mutex mutex;
        std::condition_variable never;
        std::unique_lock<std::mutex> lock(mutex);
        for (int i = 0; i < 8; ++i) {
            never.wait_for(lock, std::chrono::milliseconds(100));
            ioConnection.Write("HTTP/1.1 102 Processing\r\n\r\n");
        }
        ioConnection.Write(RawServer::Answer(200, "late"));
        ioConnection.WaitForClose();
    });
    EXPECT_EQ(Body(mRequester.Get(server.URL("/"))), "late");
}

TEST(Fault, NoConnectionIsAConnectivityError) {
    Requester requester;
    std::uint16_t freePort = 0;
    {
        RawServer server([](Connection&) {});
        freePort = server.Port();
    }
    const auto refused = requester.Get("http://127.0.0.1:" + std::to_string(freePort) + "/");
    ExpectFailure(refused, CURLE_COULDNT_CONNECT);
    const auto unknown = requester.Get("http://no-such-host.invalid/");
    ExpectFailure(unknown, CURLE_COULDNT_RESOLVE_HOST);
    for (const auto& response : {refused, unknown}) {
        EXPECT_TRUE(Response::IsNetworkConnectivityError(response));
        EXPECT_FALSE(Response::IsBadSSLCACert(response));
    }
    const auto cancelled = boost::make_shared<Response>(Response::kStatusCancelled);
    const auto notFound = boost::make_shared<Response>(404);
    for (const auto& response : {ResponseRef(), cancelled, notFound}) {
        EXPECT_FALSE(Response::IsNetworkConnectivityError(response));
        EXPECT_FALSE(Response::IsBadSSLCACert(response));
    }
}

TEST(Fault, NoAnswerCrossesToAnotherRequest) {
    // The server answers on kept connections in its own time, with bodies of all sizes, and now and then it
    // breaks off; what a request gets is its own body, whole, or an error.
    RawServer server([](Connection& ioConnection) {
        while (const auto request = ioConnection.ReadRequest()) {
            const std::size_t number = std::stoul(request->target.substr(1));
            std::string body;
            while (body.size() < number % 5000) {
                body += request->target + ";";
            }
            const std::string answer = RawServer::Answer(200, body, "X-For: " + request->target + "\r\n");
            if (number % 17 == 0) {
                ioConnection.Write(answer.substr(0, answer.size() / 2));
                return;
            }
            ioConnection.Write(answer);
        }
    });
    Requester requester;
    std::mutex mutex;
    std::map<Guid, std::string> targets;
    std::vector<std::thread> threads;
    constexpr int kThreads = 4, kEach = 500;
    for (int thread = 0; thread < kThreads; ++thread) {
        threads.emplace_back([&, thread] {
            for (int i = 0; i < kEach; ++i) {
                const std::string target = "/" + std::to_string(1 + thread * 7919 + i * 31);
                const Guid id = requester.Start(server.URL(target));
                std::lock_guard<std::mutex> lock(mutex);
                targets[id] = target;
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    ASSERT_EQ(targets.size(), static_cast<std::size_t>(kThreads * kEach));
    std::size_t answered = 0;
    for (const auto& [id, target] : targets) {
        const auto response = requester.Done().Wait(id);
        ASSERT_TRUE(response);
        EXPECT_EQ(requester.Done().Calls(id), 1);
        const std::size_t number = std::stoul(target.substr(1));
        if (response->status == 0) {
            EXPECT_FALSE(response->payload);
            continue;
        }
        ++answered;
        EXPECT_NE(number % 17, 0u);
        EXPECT_EQ(GetHeader(response->headers, ImmutableString("X-For")).str(), target);
        const std::string body = Body(response);
        for (std::size_t at = 0; at < body.size(); at += target.size() + 1) {
            ASSERT_EQ(body.compare(at, target.size() + 1, target + ";"), 0);
        }
    }
    EXPECT_GT(answered, targets.size() / 2);
}

}  // namespace
}  // namespace ostnet_test
