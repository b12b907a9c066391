// Cancel in every state, the workers, delayed functions, and the end of the processor.
#include <gtest/gtest.h>

#include <random>

#include "ostcore/threads/Scheduler.h"
#include "Requester.h"

namespace ostnet_test {
namespace {

using ostcore::threads::ScopedGlobalScheduler;
using ostcore::threads::VirtualScheduler;

void ExpectCancelled(Requester& ioRequester, const Guid& inID, const std::string& inWhat) {
    const auto response = ioRequester.Done().Wait(inID);
    ASSERT_TRUE(response) << inWhat;
    EXPECT_EQ(response->status, Response::kStatusCancelled) << inWhat;
    EXPECT_EQ(response->curlError, 0) << inWhat;
    EXPECT_TRUE(response->headers.empty()) << inWhat;
    EXPECT_FALSE(response->payload) << inWhat;
}

/// Two functions that hold both workers until they are let go.
class HeldWorkers {
public:
    explicit HeldWorkers(NetworkProcessor& ioProcessor) {
        for (Signal& held : mHeld) {
            ioProcessor.PostFunction(
                [this, &held] {
                    held.Set();
                    mRelease.Wait();
                },
                0);
        }
        for (Signal& held : mHeld) {
            EXPECT_TRUE(held.Wait());
        }
    }
    void Release() { mRelease.Set(); }

private:
    Signal mHeld[2];
    Signal mRelease;
};

TEST(Cancel, EndsARequestInEachOfItsStates) {
    Signal inBody;
    RawServer server([&](Connection& ioConnection) {
        const auto request = ioConnection.ReadHead();
        if (request && request->target == "/body") {
            ioConnection.Write("HTTP/1.1 200 OK\r\nContent-Length: 100\r\n\r\nabc");
            inBody.Set();
        }
        ioConnection.WaitForClose();
    });
    Requester requester;
    auto& processor = requester.Processor();

    const Guid connecting = requester.Start("https://127.0.0.1:" + std::to_string(server.Port()) + "/");
    ASSERT_TRUE(server.WaitForConnections(1));
    processor.TryToCancelRequest(connecting);
    ExpectCancelled(requester, connecting, "connecting");

    const Guid looking = requester.Start("http://no-such-host.invalid/");
    processor.TryToCancelRequest(looking);
    ExpectCancelled(requester, looking, "looking the name up");

    const Guid receiving = requester.Start(server.URL("/body"));
    ASSERT_TRUE(inBody.Wait());
    processor.TryToCancelRequest(receiving);
    ExpectCancelled(requester, receiving, "receiving");

    const Guid sending = requester.StartPost(server.URL("/slow"), std::string(32u << 20, 'b'));
    ASSERT_TRUE(server.WaitForConnections(3));
    processor.TryToCancelRequest(sending);
    ExpectCancelled(requester, sending, "sending");

    for (const Guid& id : {connecting, looking, receiving, sending}) {
        processor.TryToCancelRequest(id);
        EXPECT_EQ(requester.Done().Calls(id), 1);
        EXPECT_FALSE(processor.WaitingForRequest(id, 0));
    }
    processor.TryToCancelRequest(Guid::CreateUnique());
    EXPECT_EQ(requester.Done().Total(), 4u);
}

TEST(Cancel, EndsARequestThatWaitsForAConnection) {
    RawServer server([](Connection& ioConnection) { ioConnection.WaitForClose(); });
    NetworkSettings settings = Requester::DefaultSettings();
    settings.limits.maximumConnections = 1;
    Requester requester(settings);
    const Guid first = requester.Start(server.URL("/"));
    ASSERT_TRUE(server.WaitForConnections(1));
    const Guid queued = requester.Start(server.URL("/"));
    requester.Processor().TryToCancelRequest(queued);
    ExpectCancelled(requester, queued, "queued");
    EXPECT_EQ(requester.Done().Calls(first), 0);
    EXPECT_EQ(server.ConnectionCount(), 1u);
}

TEST(Cancel, WinsOverAnAnswerThatHasNotBeenHandedOver) {
    RawServer server(
        RawServer::Answering([](const ReceivedRequest&) { return RawServer::Answer(200, "late"); }));
    Requester requester;
    HeldWorkers workers(requester.Processor());
    const Guid id = requester.Start(server.URL("/"));
    ASSERT_TRUE(server.WaitForRequests(1));
    EXPECT_TRUE(requester.Processor().WaitingForRequest(id, 0));
    requester.Processor().TryToCancelRequest(id);
    EXPECT_FALSE(requester.Processor().WaitingForRequest(id, 0));
    workers.Release();
    ExpectCancelled(requester, id, "answered");
    // What follows on the same workers comes after whatever might have come a second time.
    ASSERT_EQ(requester.Get(server.URL("/"))->status, 200);
    EXPECT_EQ(requester.Done().Calls(id), 1);
}

TEST(Cancel, FreesTheIDForTheNextRequest) {
    RawServer server([](Connection& ioConnection) {
        if (ioConnection.Index() > 0 && ioConnection.ReadRequest()) {
            ioConnection.Write(RawServer::Answer(200, "second"));
        }
        ioConnection.WaitForClose();
    });
    Requester requester;
    auto& processor = requester.Processor();
    const Guid id = Guid::CreateUnique();
    const ImmutableString url(server.URL("/"));
    Completions first, second;
    ASSERT_TRUE(processor.GET(id, first.Function(), url, {}, {}));
    ASSERT_TRUE(server.WaitForConnections(1));
    EXPECT_FALSE(processor.GET(id, second.Function(), url, {}, {})) << "the ID is in use";
    processor.TryToCancelRequest(id);
    ASSERT_TRUE(processor.GET(id, second.Function(), url, {}, {}));
    EXPECT_EQ(first.Wait(id)->status, -1);
    EXPECT_EQ(Body(second.Wait(id)), "second");
    EXPECT_EQ(first.Total() + second.Total(), 2u);
}

TEST(Cancel, AtRandomTimesEndsEachRequestOnce) {
    // Servers of all tempers; each seed starts a few requests and cancels some of them at some time.
    RawServer server([](Connection& ioConnection) {
        while (const auto request = ioConnection.ReadRequest()) {
            const std::string temper = request->target.substr(1, 1);
            if (temper == "s") {
                ioConnection.WaitForClose();
                return;
            }
            if (temper == "h") {
                ioConnection.Write("HTTP/1.1 200 OK\r\nContent-Length: 9\r\n\r\nhalf");
                ioConnection.WaitForClose();
                return;
            }
            if (temper == "r") {
                ioConnection.Reset();
                return;
            }
            ioConnection.Write(RawServer::Answer(200, request->target));
        }
    });
    const std::string silent = "https://127.0.0.1:" + std::to_string(server.Port()) + "/";
    Requester requester;
    auto& processor = requester.Processor();
    std::map<Guid, std::string> started;
    std::size_t total = 0;
    constexpr unsigned kSeeds = 3000;
    for (unsigned seed = 0; seed < kSeeds; ++seed) {
        std::mt19937 random(seed);
        const auto upTo = [&random](unsigned inLimit) { return random() % inLimit; };
        std::vector<std::pair<Guid, std::string>> requests;
        for (unsigned i = 1 + upTo(4); i > 0; --i) {
            const std::string target = std::string("/") + "sahraaaa"[upTo(8)] + std::to_string(seed);
            const Guid id = upTo(2) ? requester.Start(server.URL(target))
                                    : requester.StartPost(server.URL(target), std::string(upTo(3000), 'b'));
            ASSERT_FALSE(id.IsNull());
            requests.emplace_back(id, target);
            if (upTo(4) == 0) {
                processor.TryToCancelRequest(requests[upTo(static_cast<unsigned>(requests.size()))].first);
            }
            if (upTo(4) == 0) {
                std::this_thread::yield();
            }
        }
        const bool oneEnds = std::any_of(requests.begin(), requests.end(),
                                         [](const auto& inRequest) { return inRequest.second[1] == 'a'; });
        if (oneEnds && upTo(2)) {
            ASSERT_TRUE(requester.Done().WaitForTotal(total + 1));
        }
        // What would never end by itself is cancelled from two sides.
        std::thread other;
        if (seed % 16 == 0) {
            other = std::thread([&] {
                for (const auto& [id, target] : requests) {
                    processor.TryToCancelRequest(id);
                }
            });
        }
        for (const auto& [id, target] : requests) {
            if (target[1] == 's' || target[1] == 'h' || upTo(3) == 0) {
                processor.TryToCancelRequest(id);
            }
        }
        if (other.joinable()) {
            other.join();
        }
        total += requests.size();
        if (seed % 8 == 7) {
            ASSERT_TRUE(requester.Done().WaitForTotal(total)) << "seed " << seed;
        }
        started.insert(requests.begin(), requests.end());
    }
    ASSERT_TRUE(requester.Done().WaitForTotal(total));
    processor.Shutdown();
    EXPECT_EQ(requester.Done().Total(), total);
    for (const auto& [id, target] : started) {
        ASSERT_EQ(requester.Done().Calls(id), 1) << target;
        const auto response = requester.Done().Wait(id);
        if (response->status == 200) {
            ASSERT_EQ(Body(response), target);
        } else {
            ASSERT_TRUE(response->status == -1 || response->status == 0) << response->status;
            ASSERT_FALSE(response->payload);
        }
    }
}

TEST(Workers, CompletionsRunNeitherOnTheCallersStackNorItsThread) {
    RawServer server(RawServer::Answering([](const ReceivedRequest&) { return RawServer::Answer(200, ""); }));
    Requester requester;
    for (const char* path : {"/a", "/b"}) {
        const Guid id = requester.Start(server.URL(path));
        requester.Processor().TryToCancelRequest(id);
        requester.Done().Wait(id);
        EXPECT_TRUE(requester.Done().Thread(id) != std::this_thread::get_id());
    }
}

TEST(Workers, BlockedOnesAreReplaced) {
    RawServer server(
        RawServer::Answering([](const ReceivedRequest&) { return RawServer::Answer(200, "inner"); }));
    Requester requester;
    auto& processor = requester.Processor();
    constexpr int kBlocked = 12;
    std::atomic<int> served{0};
    Signal allDone;
    for (int i = 0; i < kBlocked; ++i) {
        ASSERT_TRUE(processor.PostFunction(
            [&] {
                const Guid inner = requester.Start(server.URL("/"));
                if (processor.WaitingForRequest(inner, ostnet::http::kWaitForever)) {
                    EXPECT_EQ(Body(requester.Done().Wait(inner)), "inner");
                }
                if (++served == kBlocked) {
                    allDone.Set();
                }
            },
            0));
    }
    EXPECT_TRUE(allDone.Wait());
    EXPECT_EQ(requester.Done().Total(), static_cast<std::size_t>(kBlocked));
}

TEST(Workers, AreReplacedAlsoForARequestThatALayerAboveHolds) {
    Requester requester;
    auto& processor = requester.Processor();
    Signal goOn;
    std::atomic<int> wentOn{0};
    Signal held[2];
    for (Signal& signal : held) {
        processor.PostFunction(
            [&] {
                processor.WaitingForRequest(Guid::CreateUnique(), ostnet::http::kWaitForever);
                signal.Set();
                wentOn += goOn.Wait() ? 1 : 0;
            },
            0);
    }
    for (Signal& signal : held) {
        EXPECT_TRUE(signal.Wait());
    }
    processor.PostFunction([&] { goOn.Set(); }, 0);
    processor.Shutdown();
    EXPECT_EQ(wentOn, 2);
}

TEST(Workers, SurviveAThrowingCompletion) {
    RawServer server(
        RawServer::Answering([](const ReceivedRequest&) { return RawServer::Answer(200, "ok"); }));
    Requester requester;
    for (int i = 0; i < 4; ++i) {
        ASSERT_TRUE(requester.Processor().GET(
            Guid::CreateUnique(),
            [](const Guid&, const ResponseRef&) { throw std::runtime_error("a host's mistake"); },
            ImmutableString(server.URL("/")), {}, {}));
    }
    ASSERT_TRUE(server.WaitForRequests(4));
    EXPECT_EQ(Body(requester.Get(server.URL("/"))), "ok");
}

TEST(PostFunction, WaitsForItsTimeOnTheScheduler) {
    const auto scheduler = boost::make_shared<VirtualScheduler>();
    const ScopedGlobalScheduler scope(scheduler);
    Requester requester;
    Signal ran;
    std::atomic<bool> early{true};
    ASSERT_TRUE(requester.Processor().PostFunction(
        [&] {
            EXPECT_FALSE(early);
            ran.Set();
        },
        10000));
    scheduler->Advance(std::chrono::milliseconds(9999));
    Signal barrier;
    ASSERT_TRUE(requester.Processor().PostFunction([&] { barrier.Set(); }, 0));
    ASSERT_TRUE(barrier.Wait());
    early = false;
    scheduler->Advance(std::chrono::milliseconds(1));
    EXPECT_TRUE(ran.Wait());
}

TEST(Shutdown, EndsEverythingOnceAndStartsNothingMore) {
    const auto scheduler = boost::make_shared<VirtualScheduler>();
    const ScopedGlobalScheduler scope(scheduler);
    RawServer server([](Connection& ioConnection) { ioConnection.WaitForClose(); });
    Requester requester;
    auto& processor = requester.Processor();
    std::vector<Guid> ids;
    for (int i = 0; i < 50; ++i) {
        ids.push_back(requester.Start(server.URL("/" + std::to_string(i))));
    }
    int delayed = 0;
    ASSERT_TRUE(processor.PostFunction(
        [&] {
            ++delayed;
            EXPECT_TRUE(requester.Start(server.URL("/late")).IsNull());
            EXPECT_FALSE(processor.PostFunction([] {}, 0));
            EXPECT_FALSE(processor.PostFunction([] {}, 5));
        },
        60000));
    processor.Shutdown();
    EXPECT_EQ(delayed, 1) << "what waits for its time runs at the end";
    EXPECT_EQ(requester.Done().Total(), ids.size());
    for (const Guid& id : ids) {
        EXPECT_EQ(requester.Done().Calls(id), 1);
        EXPECT_EQ(requester.Done().Wait(id)->status, -1);
    }
    scheduler->Advance(std::chrono::minutes(2));
    processor.Shutdown();
    processor.TryToCancelRequest(ids[0]);
    EXPECT_TRUE(requester.Start(server.URL("/")).IsNull());
    EXPECT_FALSE(processor.PostFunction([] {}, 0));
    EXPECT_FALSE(processor.WaitingForRequest(ids[0], 0));
    EXPECT_EQ(delayed, 1);
}

TEST(Shutdown, RacesWithStartsAndLosesNone) {
    RawServer server(
        RawServer::Answering([](const ReceivedRequest&) { return RawServer::Answer(200, "x"); }));
    for (int round = 0; round < 8; ++round) {
        Requester requester;
        std::atomic<std::size_t> started{0};
        std::vector<std::thread> threads;
        for (int i = 0; i < 3; ++i) {
            threads.emplace_back([&] {
                while (!requester.Start(server.URL("/")).IsNull()) {
                    ++started;
                }
            });
        }
        requester.Done().WaitForTotal(static_cast<std::size_t>(round));
        requester.Processor().Shutdown();
        for (std::thread& thread : threads) {
            thread.join();
        }
        EXPECT_EQ(requester.Done().Total(), started);
    }
}

TEST(Shutdown, CanBeCalledFromACompletion) {
    RawServer server(
        RawServer::Answering([](const ReceivedRequest&) { return RawServer::Answer(200, "x"); }));
    Completions done;
    Signal ended;
    auto processor = boost::make_shared<NetworkProcessor>(Requester::DefaultSettings());
    ASSERT_TRUE(processor->GET(Guid::CreateUnique(),
                               [&](const Guid&, const ResponseRef&) {
                                   processor.reset();  // the last reference goes on its own worker
                                   ended.Set();
                               },
                               ImmutableString(server.URL("/")), {}, {}));
    EXPECT_TRUE(ended.Wait());
}

TEST(GlobalProcessor, IsSafeToUseAfterTheShutdownAndUsableAfterANewStart) {
    RawServer server(
        RawServer::Answering([](const ReceivedRequest&) { return RawServer::Answer(200, "x"); }));
    Completions done;
    const auto start = [&](const Guid& inID) {
        return ostnet::http::GetGlobalRequestProcessor()->GET(inID, done.Function(),
                                                              ImmutableString(server.URL("/")), {}, {});
    };
    const Guid before = Guid::CreateUnique(), after = Guid::CreateUnique(), again = Guid::CreateUnique();
    ASSERT_TRUE(start(before));
    EXPECT_EQ(Body(done.Wait(before)), "x");
    const auto former = ostnet::http::GetGlobalRequestProcessor();
    ostnet::Shutdown();
    ostnet::Shutdown();
    EXPECT_FALSE(start(after));
    ostnet::http::GetGlobalRequestProcessor()->TryToCancelRequest(before);
    ostnet::Startup();
    ASSERT_TRUE(start(again));
    EXPECT_EQ(Body(done.Wait(again)), "x");
    EXPECT_NE(ostnet::http::GetGlobalRequestProcessor(), former);

    const auto other = boost::make_shared<NetworkProcessor>(Requester::DefaultSettings());
    ostnet::http::SetGlobalRequestProcessor(other);
    EXPECT_EQ(ostnet::http::GetGlobalRequestProcessor(), other);
    EXPECT_EQ(ostnet::http::SetGlobalRequestProcessor({}), other);
    EXPECT_NE(ostnet::http::GetGlobalRequestProcessor(), other);
    // The threads of the global processor are left to the end of the process on purpose.
}

}  // namespace
}  // namespace ostnet_test
