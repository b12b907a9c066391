// What goes over the wire, byte for byte as the server sees it, and what comes back.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "ostnet/http/Compression.h"
#include "Requester.h"

namespace ostnet_test {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;

std::string Echo(const ReceivedRequest& inRequest) {
    return RawServer::Answer(200, inRequest.Raw());
}

TEST(Wire, GetHasExactlyTheseBytes) {
    RawServer server(RawServer::Answering(Echo));
    Requester requester;
    const auto response = requester.Get(
        server.URL("/a/../b?q=1%202#part"),
        {{ImmutableString("Cookie"), ImmutableString("login-token=t;")}, {ImmutableString("X-Empty"), {}}});
    EXPECT_EQ(Body(response),
              "GET /a/../b?q=1%202 HTTP/1.1\r\nHost: 127.0.0.1:" + std::to_string(server.Port()) +
                  "\r\nUser-Agent: ZOTest/1\r\nAccept: */*\r\nCookie: login-token=t;\r\nX-Empty:\r\n"
                  "Accept-Encoding: gzip\r\n\r\n");
}

TEST(Wire, BodiesGoOutAsTheyAreAndWithoutWait) {
    RawServer server(RawServer::Answering(Echo));
    Requester requester;
    std::string body(3 << 20, 'x');
    body[1] = '\0';
    const auto processing = std::pair(ostnet::kHEADER_EXPECT, ostnet::kHEADERVALUE_102_PROCESSING);
    requester.Post(server.URL("/post"), body, {processing});
    requester.Post(server.URL("/empty"), "");
    const Guid put = Guid::CreateUnique();
    ASSERT_TRUE(requester.Processor().PUT(
        put, requester.Done().Function(), ImmutableString(server.URL("/put")),
        {{ostnet::kHEADER_CONTENT_TYPE, ostnet::kHEADER_CONTENT_TYPE_APPLICATION_JSON_UTF_8},
         {ImmutableString("Content-Length"), ImmutableString("7")}},
        RecycledMemory::CreateFromBytes("{}"), {}));
    ASSERT_TRUE(requester.Done().Wait(put));

    const auto requests = server.Requests();
    ASSERT_EQ(requests.size(), 3u);
    EXPECT_EQ(requests[0].method, "POST");
    EXPECT_EQ(requests[0].body, body);
    EXPECT_EQ(requests[0].Header("Expect"), "102-processing");
    EXPECT_EQ(requests[0].Header("Content-Type"), std::nullopt);
    EXPECT_EQ(requests[1].Header("Content-Length"), "0");
    EXPECT_EQ(requests[1].Header("Expect"), std::nullopt);
    EXPECT_EQ(requests[2].method, "PUT");
    EXPECT_EQ(requests[2].body, "{}");
    EXPECT_EQ(requests[2].Header("Content-Type"), "application/json;charset=utf-8");
    EXPECT_EQ(requests[2].Header("Content-Length"), "2");
    EXPECT_EQ(requests[2].CountHeaders("Content-Length"), 1u);
    EXPECT_EQ(server.ConnectionCount(), 1u) << "all verbs share one kept connection";
}

TEST(Wire, VerbsDoNotLeakIntoTheNextRequestOfAHandle) {
    RawServer server(RawServer::Answering([](const ReceivedRequest& inRequest) {
        return inRequest.method == "HEAD" ? "HTTP/1.1 200 OK\r\nContent-Length: 99\r\nETag: \"h\"\r\n\r\n"
                                          : RawServer::Answer(200, inRequest.method + inRequest.body);
    }));
    Requester requester;
    auto& processor = requester.Processor();
    const ImmutableString url(server.URL("/"));
    for (int round = 0; round < 3; ++round) {
        EXPECT_EQ(Body(requester.Get(server.URL("/"))), "GET");
        const Guid head = Guid::CreateUnique(), remove = Guid::CreateUnique(), put = Guid::CreateUnique();
        ASSERT_TRUE(processor.HEAD(head, requester.Done().Function(), url, {}, {}));
        const auto answer = requester.Done().Wait(head);
        EXPECT_EQ(answer->status, 200);
        EXPECT_FALSE(answer->payload);
        EXPECT_EQ(GetHeader(answer->headers, ostnet::kHEADER_ETAG), ImmutableString("\"h\""));
        ASSERT_TRUE(processor.DELETE(remove, requester.Done().Function(), url, {}, {}));
        EXPECT_EQ(Body(requester.Done().Wait(remove)), "DELETE");
        ASSERT_TRUE(processor.PUT(put, requester.Done().Function(), url, {},
                                  RecycledMemory::CreateFromBytes("p"), {}));
        EXPECT_EQ(Body(requester.Done().Wait(put)), "PUTp");
        EXPECT_EQ(Body(requester.Post(server.URL("/"), "q")), "POSTq");
    }
    EXPECT_EQ(server.ConnectionCount(), 1u);
}

TEST(Wire, FormIsMultipartInOrder) {
    RawServer server(RawServer::Answering(Echo));
    Requester requester;
    const Guid id = Guid::CreateUnique();
    const ostnet::http::Form form{{ImmutableString("j_username"), "Zo\xC3\xAB"},
                                  {ImmutableString(":commitMessage"), std::string("a\0b\r\n--", 7)},
                                  {ImmutableString("empty"), ""}};
    ASSERT_TRUE(requester.Processor().POST(id, requester.Done().Function(), ImmutableString(server.URL("/f")),
                                           {}, form, {}));
    ASSERT_EQ(requester.Done().Wait(id)->status, 200);
    const auto request = server.Requests().at(0);
    const std::string type = request.Header("Content-Type").value_or("");
    ASSERT_THAT(type, StartsWith("multipart/form-data; boundary="));
    const std::string line = "--" + type.substr(type.find('=') + 1);
    const std::string part = "\r\nContent-Disposition: form-data; name=\"";
    EXPECT_EQ(request.body, line + part + "j_username\"\r\n\r\nZo\xC3\xAB\r\n" + line + part +
                                ":commitMessage\"\r\n\r\n" + std::string("a\0b\r\n--", 7) + "\r\n" + line +
                                part + "empty\"\r\n\r\n\r\n" + line + "--\r\n");
}

TEST(Wire, PartsCarryTheirContentType) {
    ostnet::http::FormBuilder form;
    ASSERT_TRUE(AppendFormPart(form, ImmutableString(":enclosure"),
                               ostnet::kHEADER_CONTENT_TYPE_APPLICATION_JSON_UTF_8, "{}"));
    for (const char* bad : {"a\rb", "a\nb", "a\"b", ""}) {
        EXPECT_FALSE(AppendFormPart(form, ImmutableString(bad), {}, "x")) << bad;
    }
    EXPECT_FALSE(AppendFormPart(form, ImmutableString("n", 1), ImmutableString("t\r\nX: y"), "x"));
    EXPECT_FALSE(AppendFormPart(form, ImmutableString("a\0b", 3), {}, "x"));
    Headers headers{{ostnet::kHEADER_CONTENT_TYPE, ImmutableString("text/plain")}};
    SetFormContentTypeHeader(form, headers);
    EXPECT_EQ(headers.size(), 1u);
    const std::string line = "--" + form.Boundary();
    EXPECT_EQ(CompleteForm(form)->view(),
              line + "\r\nContent-Disposition: form-data; name=\":enclosure\"\r\nContent-Type: " +
                  "application/json;charset=utf-8\r\n\r\n{}\r\n" + line + "--\r\n");
}

TEST(Wire, WhatCouldBreakOutOfItsPlaceIsNeverSent) {
    RawServer server(RawServer::Answering(Echo));
    Requester requester;
    const auto name = [](std::string_view inName) {
        return Headers{{ImmutableString(inName), ImmutableString("v")}};
    };
    const auto value = [](std::string_view inValue) {
        return Headers{{ImmutableString("X"), ImmutableString(inValue)}};
    };
    for (const std::string_view bad :
         {std::string_view("a\rb"), std::string_view("a\nb"), std::string_view("a\0b", 3),
          std::string_view("a\x7F"), std::string_view("v\r\nX-Evil: 1")}) {
        EXPECT_TRUE(requester.Start(server.URL("/"), name(bad)).IsNull());
        EXPECT_TRUE(requester.Start(server.URL("/"), value(bad)).IsNull());
        EXPECT_TRUE(requester.Start(server.URL("/" + std::string(bad))).IsNull());
    }
    for (const std::string_view bad : {"", "a b", "a:", "a;", "(x)"}) {
        EXPECT_TRUE(requester.Start(server.URL("/"), name(bad)).IsNull()) << bad;
    }
    EXPECT_TRUE(requester.Start(server.URL("/"), value(std::string(1 << 20, 'c'))).IsNull());
    const std::string port = std::to_string(server.Port());
    for (const std::string& bad : {std::string(), std::string("/x"), "ftp://127.0.0.1:" + port + "/",
                                   "http://u:p@127.0.0.1:" + port + "/", std::string("file:///etc/passwd"),
                                   "http://127.0.0.1:" + port + "/a b", std::string("http://:80/")}) {
        EXPECT_TRUE(requester.Start(bad).IsNull()) << bad;
    }
    const ostnet::http::Form form{{ImmutableString("a\r\nb"), "x"}};
    EXPECT_FALSE(requester.Processor().POST(Guid::CreateUnique(), requester.Done().Function(),
                                            ImmutableString(server.URL("/")), {}, form, {}));
    EXPECT_FALSE(
        requester.Processor().GET(Guid::CreateUnique(), {}, ImmutableString(server.URL("/")), {}, {}));

    EXPECT_EQ(requester.Get(server.URL("/good"))->status, 200);
    ASSERT_EQ(server.Requests().size(), 1u);
    EXPECT_EQ(server.ConnectionCount(), 1u);
    EXPECT_EQ(requester.Done().Total(), 1u);
}

TEST(Wire, HeadersAreReadAsTheyCome) {
    RawServer server(RawServer::Answering([](const ReceivedRequest&) {
        return RawServer::Answer(
            201, "b",
            "Set-Cookie: a=1; Path=/\r\nset-cookie: b=2\r\nX-Folded: one\r\n  two\r\n\tthree\r\n"
            "X-Blank: \r\nX-Blanks:   v w  \r\nbad name: x\r\n");
    }));
    Requester requester;
    const auto response = requester.Get(server.URL("/"));
    EXPECT_EQ(response->status, 201);
    std::vector<std::string> cookies;
    const auto range = response->headers.equal_range(ostnet::kHEADER_SET_COOKIE);
    for (auto it = range.first; it != range.second; ++it) {
        cookies.push_back(it->second.str());
    }
    EXPECT_THAT(cookies, ElementsAre("a=1; Path=/", "b=2"));
    EXPECT_EQ(GetHeader(response->headers, ImmutableString("x-folded")).view(), "one two three");
    EXPECT_EQ(GetHeader(response->headers, ImmutableString("X-BLANKS")).view(), "v w");
    EXPECT_EQ(response->headers.count(ImmutableString("X-Blank")), 1u);
    EXPECT_THAT(response->GetHeadersAsUTF8String(), HasSubstr("Set-Cookie: <hidden>\n"));
    EXPECT_THAT(response->GetHeadersAsUTF8String(), Not(HasSubstr("a=1")));
}

TEST(Wire, InterimAnswersAndTrailersAreNotTheAnswer) {
    RawServer server([](Connection& ioConnection) {
        while (ioConnection.ReadRequest()) {
            ioConnection.Write(
                "HTTP/1.1 102 Processing\r\nX-Interim: 1\r\n\r\nHTTP/1.1 102 Processing\r\n\r\n");
            ioConnection.Write(
                "HTTP/1.1 200 OK\r\nTransfer-Encoding: chunked\r\nX-Final: "
                "1\r\n\r\n3\r\nabc\r\n2;ext=1\r\nde\r\n"
                "0\r\nX-Trailer: 1\r\n\r\n");
        }
    });
    Requester requester;
    for (int i = 0; i < 2; ++i) {
        const auto response =
            requester.Get(server.URL("/"), {{ostnet::kHEADER_EXPECT, ostnet::kHEADERVALUE_102_PROCESSING}});
        EXPECT_EQ(response->status, 200);
        EXPECT_EQ(Body(response), "abcde");
        EXPECT_EQ(response->headers.count(ImmutableString("X-Final")), 1u);
        EXPECT_EQ(response->headers.count(ImmutableString("X-Interim")), 0u);
    }
    EXPECT_EQ(server.ConnectionCount(), 1u);
}

TEST(Wire, RedirectsAreHandedOverAndCookiesForgotten) {
    RawServer elsewhere(RawServer::Answering(Echo));
    RawServer server(RawServer::Answering([&](const ReceivedRequest&) {
        return RawServer::Answer(302, "",
                                 "Location: " + elsewhere.URL("/stolen") +
                                     "\r\nSet-Cookie: foreign=1; Domain=example.com\r\nSet-Cookie: own=" +
                                     std::string(60000, 'c') + "\r\n");
    }));
    Requester requester;
    const Headers token{{ostnet::kHEADER_COOKIE, ImmutableString("login-token=secret;")}};
    const auto response = requester.Get(server.URL("/"), token);
    EXPECT_EQ(response->status, 302);
    EXPECT_EQ(GetHeader(response->headers, ostnet::kHEADER_LOCATION).str(), elsewhere.URL("/stolen"));
    EXPECT_EQ(elsewhere.ConnectionCount(), 0u);
    requester.Get(server.URL("/again"));
    requester.Get(elsewhere.URL("/"));
    EXPECT_EQ(server.Requests().at(1).Header("Cookie"), std::nullopt);
    EXPECT_EQ(elsewhere.Requests().at(0).Header("Cookie"), std::nullopt);
}

TEST(Wire, PackedBodyIsInflatedWhenAsked) {
    const std::string text(100000, 'z');
    const auto packed = ostnet::http::CompressPayload(RecycledMemory::CreateFromBytes(text));
    RawServer server(RawServer::Answering([&](const ReceivedRequest& inRequest) {
        const bool empty = inRequest.target == "/empty";
        return RawServer::Answer(empty ? 304 : 200, empty ? std::string_view() : packed->view(),
                                 "Content-Encoding: gzip\r\nETag: \"x\"\r\n");
    }));
    Requester requester;
    RequestOptions raw;
    raw.decompressPayload = false;
    const auto inflated = requester.Get(server.URL("/"));
    EXPECT_EQ(Body(inflated), text);
    EXPECT_EQ(inflated->headers.count(ostnet::kHEADER_CONTENT_ENCODING), 0u);
    EXPECT_EQ(inflated->headers.count(ImmutableString("Content-Length")), 0u);
    const auto asSent = requester.Get(server.URL("/"), {}, raw);
    EXPECT_EQ(Body(asSent), std::string(packed->view()));
    EXPECT_EQ(GetHeader(asSent->headers, ostnet::kHEADER_CONTENT_ENCODING).view(), "gzip");
    EXPECT_EQ(requester.Get(server.URL("/empty"))->status, 304);
}

struct Reports : ostnet::http::RequestObserver {
    void OnProgress(std::uint64_t inSent, std::uint64_t inSendTotal, std::uint64_t inReceived,
                    std::uint64_t) override {
        std::lock_guard<std::mutex> lock(mutex);
        EXPECT_LE(inSent, inSendTotal);
        EXPECT_GE(inReceived, received);
        received = inReceived;
        seen.Set();
    }
    std::mutex mutex;
    std::uint64_t received = 0;
    Signal seen;
};

TEST(Wire, ObserverHearsOfProgressAndStatisticsCount) {
    auto reports = boost::make_shared<Reports>();
    RawServer server([&](Connection& ioConnection) {
        ioConnection.ReadRequest();
        ioConnection.Write("HTTP/1.1 200 OK\r\nContent-Length: 20000\r\n\r\n" + std::string(10000, 'a'));
        EXPECT_TRUE(reports->seen.Wait());
        ioConnection.Write(std::string(10000, 'b'));
        ioConnection.WaitForClose();
    });
    Requester requester;
    RequestOptions options;
    options.observer = reports;
    EXPECT_EQ(Body(requester.Get(server.URL("/"), {}, options)).size(), 20000u);
    ostnet::http::RequestProcessor::Statistics statistics;
    ASSERT_TRUE(requester.Processor().GetStatistics(statistics));
    EXPECT_EQ(statistics.started, 1u);
    EXPECT_EQ(statistics.completed, 1u);
    EXPECT_EQ(statistics.connectionsOpened, 1u);
    EXPECT_EQ(statistics.bytesReceived, 20000u);
}

}  // namespace
}  // namespace ostnet_test
