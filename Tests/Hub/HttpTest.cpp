// The wire itself: compression, malformed and hostile requests, slow clients, limits.
#include <zlib.h>

#include <thread>

#include "Base/Gzip.h"
#include "HubFixture.h"

namespace zohub::test {

namespace {

using std::chrono::milliseconds;

std::string RequestText(std::string const& inLine, std::string const& inHeaders = {}) {
    return inLine + " HTTP/1.1\r\nHost: localhost\r\n" + inHeaders + "\r\n";
}

int StatusOf(std::uint16_t inPort, std::string const& inBytes) {
    RawConnection connection(inPort);
    connection.TrySend(inBytes);
    return connection.Receive().status;
}

std::string Inflate(std::string const& inPacked) {
    UnpackLimits limits;
    limits.maxSize = 64 << 20;
    limits.maxRatio = 100000;
    return Unpack(inPacked, limits);
}

}  // namespace

class HttpTest : public HubTest {};

TEST_F(HttpTest, AnswersArePackedForThoseWhoAskAndTheSameWhenUnpacked) {
    Json const production = MakeProduction(mAnna, "Film");
    for (int i = 0; i < 3; ++i)
        MakeAsset(mAnna, production, kClip);
    std::string const href = LinkOf(production, "/assets#full");
    Answer const plain = mAnna.Get(href);
    for (char const* asked : {"gzip", "br;q=1.0, gzip;q=0.5", "*"}) {
        Answer const packed = mAnna.Get(href, {{"Accept-Encoding", asked}});
        EXPECT_EQ(packed.Header("content-encoding"), "gzip") << asked;
        EXPECT_LT(packed.body.size(), plain.body.size());
        EXPECT_EQ(Inflate(packed.body), plain.body);
        EXPECT_EQ(packed.Header("etag"), plain.Header("etag"));
        EXPECT_NE(packed.Header("vary").find("Accept-Encoding"), std::string::npos);
    }
    for (char const* asked : {"br", "gzip;q=0", "identity"})
        EXPECT_EQ(mAnna.Get(href, {{"Accept-Encoding", asked}}).Header("content-encoding"), "") << asked;
}

TEST_F(HttpTest, PackedBodiesAreTakenAndBombsAreNot) {
    std::string const body = R"({"name":"Packed","description":""})";
    Client::Headers const packedJson = {{"Content-Encoding", "gzip"}, {"Content-Type", "application/json"}};
    EXPECT_EQ(mAnna.Request("POST", "/zo/1/p", GzipPack(body), packedJson).status, 201);
    EXPECT_EQ(mAnna.Request("POST", "/zo/1/p", GzipPack(body).substr(0, 20), packedJson).status, 400);
    EXPECT_EQ(mAnna.Request("POST", "/zo/1/p", GzipPack(body) + "tail", packedJson).status, 400);
    EXPECT_EQ(mAnna.Request("POST", "/zo/1/p", "no gzip at all", packedJson).status, 400);
    EXPECT_EQ(mAnna.Request("POST", "/zo/1/p", body, {{"Content-Encoding", "br"}}).status, 415);
    std::string const bomb = GzipPack(std::string(64 << 20, ' '));
    ASSERT_LT(bomb.size(), 400000u);
    Answer const refused = mAnna.Request("POST", "/zo/1/p", bomb, packedJson);
    EXPECT_EQ(refused.status, 413);
    EXPECT_EQ(Json::parse(refused.body)["error"]["code"], "unpacked-too-large");
}

TEST_F(HttpTest, MalformedRequestsAreRefusedAndTheConnectionEnds) {
    std::uint16_t const port = mHub.Port();
    std::string const get = "GET /health";
    EXPECT_EQ(StatusOf(port, RequestText(get)), 200);
    struct Case {
        char const* what;
        std::string bytes;
        int status;
    };
    std::vector<Case> const cases = {
        {"two lengths", RequestText("POST /zo/1/p", "Content-Length: 2\r\nContent-Length: 3\r\n") + "{}",
         400},
        {"two equal lengths",
         RequestText("POST /zo/1/p", "Content-Length: 2\r\nContent-Length: 2\r\n") + "{}", 400},
        {"length list", RequestText("POST /zo/1/p", "Content-Length: 2, 2\r\n") + "{}", 400},
        {"length and chunks",
         RequestText("POST /zo/1/p", "Content-Length: 2\r\nTransfer-Encoding: chunked\r\n") + "0\r\n\r\n",
         400},
        {"negative length", RequestText("POST /zo/1/p", "Content-Length: -2\r\n"), 400},
        {"bad chunk size",
         RequestText("POST /zo/1/p", "Transfer-Encoding: chunked\r\n") + "zz\r\n{}\r\n0\r\n\r\n", 400},
        {"chunk without end",
         RequestText("POST /zo/1/p", "Transfer-Encoding: chunked\r\n") + "2\r\n{}xx0\r\n\r\n", 400},
        {"no host", "GET /health HTTP/1.1\r\n\r\n", 400},
        {"two hosts", RequestText(get, "Host: b\r\n"), 400},
        {"host with path", "GET /health HTTP/1.1\r\nHost: a/b\r\n\r\n", 400},
        {"host with quote", "GET /health HTTP/1.1\r\nHost: a\"b\r\n\r\n", 400},
        {"host with user", "GET /health HTTP/1.1\r\nHost: u@h\r\n\r\n", 400},
        {"folded header", RequestText(get, "X: a\r\n b\r\n"), 200},
        {"bare line feed", RequestText(get, "X: a\nY: b\r\n"), 400},
        {"nul in header", RequestText(get, std::string("X: a\0b\r\n", 8)), 400},
        {"header without colon", RequestText(get, "nonsense\r\n"), 400},
        {"space before colon", RequestText(get, "X : a\r\n"), 400},
        {"old version", "GET /health HTTP/0.9\r\n\r\n", 400},
        {"dots", RequestText("GET /zo/1/p/../links"), 400},
        {"coded dots", RequestText("GET /zo/1/p/%2e%2e/links"), 400},
        {"coded slash", RequestText("GET /zo/1/p%2flinks"), 400},
        {"coded nul", RequestText("GET /zo/1/p/a%00"), 400},
        {"bad coding", RequestText("GET /zo/1/p/%zz"), 400},
        {"bad utf-8", RequestText("GET /zo/1/p/%ff"), 400},
        {"no slash", RequestText("GET health"), 400},
        {"unknown address", RequestText("GET /nothing"), 404},
        {"unknown method", RequestText("PATCH /health"), 405},
        {"large header", RequestText(get, "X: " + std::string(40000, 'x') + "\r\n"), 431},
        {"many headers",
         RequestText(get,
                     [] {
                         std::string all;
                         for (int i = 0; i < 120; ++i)
                             all += "X: y\r\n";
                         return all;
                     }()),
         431},
        {"large body without token", RequestText("POST /zo/1/p", "Content-Length: 100000\r\n"), 413},
    };
    for (auto const& c : cases) {
        RawConnection connection(port);
        connection.TrySend(c.bytes);
        Answer const answer = connection.Receive();
        EXPECT_EQ(answer.status, c.status) << c.what;
        if (answer.status == 400 && answer.Header("connection") == "close") {
            EXPECT_TRUE(connection.IsClosedWithin(milliseconds(5000))) << c.what;
        }
    }
    EXPECT_EQ(StatusOf(port, RequestText(get)), 200);
}

TEST_F(HttpTest, DeepJsonIsRefusedAtItsDepth) {
    auto const nested = [](std::size_t inDepth) {
        return "{\"name\":\"x\",\"a\":" + std::string(inDepth - 1, '[') + std::string(inDepth - 1, ']') + "}";
    };
    EXPECT_EQ(mAnna.PostJson("/zo/1/p", nested(64)).status, 201);
    EXPECT_EQ(mAnna.PostJson("/zo/1/p", nested(65)).status, 400);
    EXPECT_EQ(mAnna.PostJson("/zo/1/p", std::string(100000, '[')).status, 400);
    EXPECT_EQ(mAnna.PostJson("/zo/1/p", std::string(100000, '{')).status, 400);
}

TEST_F(HttpTest, DamagedFormsAreRefused) {
    Client::Headers const type = {{"Content-Type", "multipart/form-data; boundary=b"}};
    for (std::string const& body :
         {std::string(), std::string("--b"), std::string("--b\r\n"), std::string("--b\r\n\r\nx\r\n--b--"),
          std::string("--b\r\nContent-Disposition: form-data; name=\"j_username\"\r\n\r\nx"),
          std::string("--b\r\nContent-Disposition: form-data; name=\"j_username\r\n\r\nx\r\n--b--"),
          std::string("--bx\r\n\r\n--b--"), "--b\r\n" + std::string(20000, 'h') + "\r\n\r\nx\r\n--b--"})
        EXPECT_EQ(mAnna.Request("POST", "/zo/1/system/login", body, type).status, 400) << body.substr(0, 80);
    EXPECT_EQ(
        mAnna.Request("POST", "/zo/1/system/login", "x", {{"Content-Type", "multipart/form-data"}}).status,
        400);
}

TEST_F(HttpTest, OneConnectionCarriesManyRequestsAlsoWhenTheyComeTogether) {
    RawConnection connection(mHub.Port());
    connection.Send(RequestText("GET /health") + RequestText("HEAD /health") + RequestText("GET /nothing") +
                    RequestText("POST /zo/1/p", "Transfer-Encoding: chunked\r\n") +
                    "1\r\n{\r\n1\r\n}\r\n0\r\n\r\n" + RequestText("GET /health"));
    EXPECT_EQ(connection.Receive().status, 200);
    EXPECT_EQ(connection.Receive(true).status, 200);
    EXPECT_EQ(connection.Receive().status, 404);
    EXPECT_EQ(connection.Receive().status, 401);
    EXPECT_EQ(connection.Receive().body, "{\"status\":\"ok\"}");
}

TEST_F(HttpTest, ExpectationsAreMetOrOverlooked) {
    RawConnection connection(mHub.Port());
    connection.Send(RequestText("POST /zo/1/p", "Content-Length: 2\r\nExpect: 100-continue\r\n"));
    EXPECT_EQ(connection.Receive().status, 100);
    connection.Send("{}");
    EXPECT_EQ(connection.Receive().status, 401);
    connection.Send(RequestText("GET /health", "Expect: 102-processing\r\n"));
    EXPECT_EQ(connection.Receive().status, 200);
}

TEST_F(HttpTest, StoppingEndsIdleConnectionsAndComesBack) {
    RawConnection idle(mHub.Port());
    idle.Send(RequestText("GET /health"));
    EXPECT_EQ(idle.Receive().status, 200);
    mHub.Stop();
    EXPECT_TRUE(idle.IsClosedWithin(milliseconds(5000)));
    EXPECT_THROW(RawConnection{mHub.Port()}, std::runtime_error);
}

TEST(SlowClients, AreCutWhileOthersAreServedAtOnce) {
    ServerLimits limits;
    limits.header = milliseconds(300);
    limits.bodyGrace = milliseconds(300);
    limits.readThreads = 2;
    RunningHub hub(limits);
    std::vector<std::unique_ptr<RawConnection>> slow;
    for (int i = 0; i < 150; ++i) {
        slow.push_back(std::make_unique<RawConnection>(hub.Port()));
        // Half of them stop inside the head, half inside the body.
        slow.back()->Send(i % 2 ? "GET /health HT"
                                : RequestText("POST /zo/1/p", "Content-Length: 50\r\n") + "{");
    }
    std::vector<milliseconds> waits;
    for (int i = 0; i < 100; ++i) {
        auto const begin = std::chrono::steady_clock::now();
        EXPECT_EQ(StatusOf(hub.Port(), RequestText("GET /health", "Connection: close\r\n")), 200);
        waits.push_back(std::chrono::duration_cast<milliseconds>(std::chrono::steady_clock::now() - begin));
    }
    std::sort(waits.begin(), waits.end());
    EXPECT_LT(waits[98], milliseconds(100));
    for (auto const& connection : slow)
        EXPECT_TRUE(connection->IsClosedWithin(milliseconds(10000)));
}

TEST(SlowClients, TricklingDoesNotBuyTime) {
    ServerLimits limits;
    limits.header = milliseconds(400);
    RunningHub hub(limits);
    RawConnection connection(hub.Port());
    auto const begin = std::chrono::steady_clock::now();
    connection.Send("GET /health HTTP/1.1\r\nHost: localhost\r\n");
    // Waiting for the end in small steps is what paces the bytes.
    while (!connection.IsClosedWithin(milliseconds(50)) && connection.TrySend("X: y\r\n"))
        ASSERT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds(10));
    EXPECT_GE(std::chrono::steady_clock::now() - begin, milliseconds(350));
}

TEST(Limits, ConnectionsBeyondTheCapAreToldToComeBack) {
    ServerLimits limits;
    limits.maxConnections = 3;
    RunningHub hub(limits);
    std::vector<std::unique_ptr<RawConnection>> held;
    for (int i = 0; i < 3; ++i) {
        held.push_back(std::make_unique<RawConnection>(hub.Port()));
        held.back()->Send(RequestText("GET /health"));
        EXPECT_EQ(held.back()->Receive().status, 200);
    }
    RawConnection extra(hub.Port());
    Answer const refused = extra.Receive();
    EXPECT_EQ(refused.status, 503);
    EXPECT_EQ(refused.Header("retry-after"), "1");
    held[0]->Send(RequestText("GET /health"));
    EXPECT_EQ(held[0]->Receive().status, 200);
}

TEST(Limits, BodiesBeyondTheLimitAreRefusedAnnouncedOrNot) {
    ServerLimits limits;
    limits.maxBody = 1000;
    RunningHub hub(limits);
    std::string const cookie = "Cookie: login-token=x;\r\n";
    EXPECT_EQ(StatusOf(hub.Port(), RequestText("POST /zo/1/p", cookie + "Content-Length: 1001\r\n")), 413);
    EXPECT_EQ(StatusOf(hub.Port(), RequestText("POST /zo/1/p", cookie + "Transfer-Encoding: chunked\r\n") +
                                       "3e9\r\n" + std::string(1001, 'x') + "\r\n0\r\n\r\n"),
              413);
    EXPECT_EQ(StatusOf(hub.Port(), RequestText("POST /zo/1/p", cookie + "Content-Length: 1000\r\n") +
                                       std::string(1000, 'x')),
              401);
}

TEST(Limits, AllBodiesTogetherStayBelowTheirSum) {
    ServerLimits limits;
    limits.maxBodiesInFlight = 100000;
    RunningHub hub(limits);
    std::string const head =
        RequestText("POST /zo/1/p", "Cookie: login-token=x;\r\nContent-Length: 90000\r\n");
    RawConnection first(hub.Port());
    first.Send(head + std::string(80000, 'x'));
    RawConnection second(hub.Port());
    second.TrySend(head + std::string(80000, 'x'));
    // Which of the two goes over the sum depends on the order of arrival; one of them must.
    RawConnection third(hub.Port());
    third.TrySend(head + std::string(80000, 'x'));
    int refused = 0;
    for (auto* connection : {&second, &third}) {
        connection->TrySend(std::string(10000, 'x'));
        refused += connection->Receive().status == 503 ? 1 : 0;
    }
    EXPECT_GE(refused, 1);
}

}  // namespace zohub::test
