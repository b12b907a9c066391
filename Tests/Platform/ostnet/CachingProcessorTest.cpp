// The caching layer over a scripted network: what it answers itself, what it asks, who is joined to whom, and
// how each caller ends.
#include <gmock/gmock.h>

#include <random>
#include <thread>

#include "LayerTest.h"
#include "ostcore/threads/Executor.h"
#include "ostnet/HeaderConstants.h"
#include "ostnet/http/CachingProcessor.h"

namespace {

using namespace ostnet_test;
using ostnet::http::CachingProcessor;

const ImmutableString kURL("http://hub.test/a");

ScriptedAnswer Document(const std::string& inBody, const std::string& inTag) {
    ScriptedAnswer answer = ScriptedAnswer::JSON(inBody);
    return inTag.empty() ? answer : std::move(answer).With("ETag", inTag);
}

class CachingTest : public testing::Test {
protected:
    explicit CachingTest(std::size_t inWorkers = 0)
        : net(ScriptedProcessor::Create(inWorkers)), layer(boost::make_shared<CachingProcessor>(net)) {}
    ~CachingTest() override { net->Shutdown(); }

    Guid Get(const ImmutableString& inURL = kURL, const std::string& inTag = {}) {
        const Guid id = Guid::CreateUnique();
        Headers headers;
        if (!inTag.empty()) {
            headers.emplace(ostnet::kHEADER_IF_NONE_MATCH, ImmutableString(inTag));
        }
        EXPECT_TRUE(layer->GET(id, told.Function(), inURL, headers, {}));
        return id;
    }
    /// Asks, and lets the answer of the script come.
    Guid GetAnswered(ScriptedAnswer inAnswer, const std::string& inTag = {}) {
        net->Expect("GET", "", std::move(inAnswer));
        const Guid id = Get(kURL, inTag);
        net->DeliverAll();
        return id;
    }
    std::string LastTag() const { return net->Requests().back().Header("If-None-Match"); }
    Guid LastNetworkID() const { return net->Requests().back().requestID; }

    boost::shared_ptr<ScriptedProcessor> net;
    Told told;
    boost::shared_ptr<CachingProcessor> layer;
};

TEST_F(CachingTest, AsksEachTimeUnlessTheServerSaidOtherwise) {
    GetAnswered(Document("one", "\"1\""));
    EXPECT_EQ(net->Requests().back().CountHeader("If-None-Match"), 0u);
    EXPECT_FALSE(layer->IsFresh(kURL));
    EXPECT_EQ(told.Body(GetAnswered(Document("two", "\"2\"").With("Cache-Control", "no-cache"))), "two");
    EXPECT_EQ(LastTag(), "\"1\"");
    EXPECT_FALSE(layer->IsFresh(kURL));
    GetAnswered(Document("three", "\"3\"").With("Cache-Control", "private, max-age=31536000, immutable"));
    EXPECT_EQ(LastTag(), "\"2\"");
    EXPECT_TRUE(layer->IsFresh(kURL));

    const Guid plain = Get(), tagged = Get(kURL, "\"3\"");
    EXPECT_EQ(told.Calls(plain), 0u) << "completed on the stack of GET";
    net->DeliverAll();
    EXPECT_EQ(net->RequestCount(), 3u);
    for (const Guid& id : {plain, tagged}) {
        EXPECT_EQ(told.Status(id), 200);
        EXPECT_EQ(told.Body(id), "three");
    }
}

TEST_F(CachingTest, AnAnswerWithoutTagIsNotAskedAbout) {
    GetAnswered(Document("one", ""), "\"mine\"");
    GetAnswered(Document("two", ""), "\"mine\"");
    EXPECT_EQ(net->Requests()[0].CountHeader("If-None-Match"), 0u) << "nothing is held that a 304 could mean";
    EXPECT_EQ(net->Requests()[1].CountHeader("If-None-Match"), 0u);
    EXPECT_EQ(told.Status(GetAnswered(ScriptedAnswer::Status(500))), 500);
    EXPECT_EQ(told.Body(GetAnswered(Document("three", "\"3\""))), "three") << "a failure is not kept";
}

TEST_F(CachingTest, GivesEachCallerWhatA304MeansToIt) {
    GetAnswered(Document("one", "\"1\"").With("X-Mark", "kept"));
    net->Expect("GET", kURL.str(), ScriptedAnswer::Hold());
    const Guid without = Get(), same = Get(kURL, "\"1\""), other = Get(kURL, "\"0\"");
    EXPECT_EQ(net->RequestCount(), 2u);
    EXPECT_EQ(LastTag(), "\"1\"");
    EXPECT_EQ(net->Requests().back().CountHeader("If-None-Match"), 1u);
    net->ReleaseHeld(ScriptedAnswer::Status(304));
    net->DeliverAll();
    EXPECT_EQ(told.Status(without), 200);
    EXPECT_EQ(told.Status(other), 200);
    EXPECT_EQ(told.Status(same), 304);
    for (const Guid& id : {without, same, other}) {
        EXPECT_EQ(told.Body(id), "one");
        EXPECT_EQ(ostnet::GetHeader(told.Only(id)->headers, "X-Mark").view(), "kept");
    }
}

TEST_F(CachingTest, KeepsAnAnswerUnderItsLocationToo) {
    const ImmutableString elsewhere("http://hub.test/b");
    GetAnswered(
        Document("one", "\"1\"").With("Cache-Control", "max-age=9").With("Location", elsewhere.str()));
    EXPECT_TRUE(layer->IsFresh(elsewhere));
    EXPECT_FALSE(layer->IsFresh(kURL));
    const Guid id = Get(elsewhere);
    net->DeliverAll();
    EXPECT_EQ(told.Body(id), "one");
    EXPECT_EQ(net->RequestCount(), 1u);
    GetAnswered(ScriptedAnswer::Status(304));
    EXPECT_EQ(LastTag(), "\"1\"");
}

TEST_F(CachingTest, OneOfManyCanLeaveAndTheLastEndsTheRequest) {
    net->SetHandler([](const RecordedRequest&) { return ScriptedAnswer::Hold(); });
    const Guid first = Get(), second = Get();
    EXPECT_EQ(net->RequestCount(), 1u);
    EXPECT_NE(LastNetworkID(), first);
    layer->TryToCancelRequest(first);
    EXPECT_EQ(told.Calls(first), 0u) << "completed on the stack of the cancel";
    net->DeliverAll();
    EXPECT_EQ(told.Status(first), -1);
    EXPECT_EQ(net->PendingCount(), 1u);
    net->ReleaseHeld(Document("one", "\"1\""));
    net->DeliverAll();
    EXPECT_EQ(told.Body(second), "one");

    const Guid third = Get(), fourth = Get();
    layer->TryToCancelRequest(third);
    layer->TryToCancelRequest(fourth);
    layer->TryToCancelRequest(fourth);
    net->DeliverAll();
    EXPECT_EQ(net->PendingCount(), 0u);
    const Guid fifth = Get();
    EXPECT_EQ(net->RequestCount(), 3u) << "nobody joins what was given up";
    EXPECT_EQ(told.Status(third), -1);
    EXPECT_EQ(told.Status(fourth), -1);
    net->ReleaseHeld(ScriptedAnswer::Status(304));
    net->DeliverAll();
    EXPECT_EQ(told.Body(fifth), "one");
    EXPECT_FALSE(layer->GET(Get(kURL), told.Function(), kURL, {}, {})) << "the ID is in use";
}

TEST_F(CachingTest, AHundredFollowersOfALeaderThatFailsOrLeavesAllEndWithoutAnotherRequest) {
    net->SetHandler([](const RecordedRequest&) { return ScriptedAnswer::Hold(); });
    const auto hundred = [this] {
        std::vector<Guid> ids;
        for (int i = 0; i < 101; ++i) {
            ids.push_back(Get());
        }
        return ids;
    };
    for (const ScriptedAnswer& failure :
         {ScriptedAnswer::NoResponse(), ScriptedAnswer::NullResponse(), ScriptedAnswer::Status(503)}) {
        net->ClearRequests();
        const std::vector<Guid> ids = hundred();
        net->ReleaseHeld(failure);
        net->DeliverAll();
        EXPECT_EQ(net->RequestCount(), 1u);
        for (const Guid& id : ids) {
            EXPECT_EQ(told.Calls(id), 1u);
            EXPECT_NE(told.Status(id), 200);
        }
    }
    net->ClearRequests();
    const std::vector<Guid> ids = hundred();
    layer->TryToCancelRequest(ids[0]);
    net->ReleaseHeld(Document("one", ""));
    net->DeliverAll();
    EXPECT_EQ(net->RequestCount(), 1u);
    EXPECT_EQ(told.Status(ids[0]), -1);
    for (std::size_t i = 1; i < ids.size(); ++i) {
        EXPECT_EQ(told.Status(ids[i]), 200);
    }
}

TEST_F(CachingTest, AStartThatFailsIsToldToItsCallerByFalseAndToTheOthersByTheirCompletion) {
    const Guid caller = Guid::CreateUnique();
    Guid joined, left;
    net->SetHandler([&](const RecordedRequest&) {
        joined = Get();
        left = Get();
        layer->TryToCancelRequest(left);
        return ScriptedAnswer::FailStart();
    });
    EXPECT_FALSE(layer->GET(caller, told.Function(), kURL, {}, {}));
    net->DeliverAll();
    EXPECT_EQ(told.Calls(caller), 0u);
    EXPECT_EQ(told.Status(joined), 0);
    EXPECT_EQ(told.Status(left), -1);

    net->SetHandler([&](const RecordedRequest&) {
        layer->TryToCancelRequest(caller);
        return ScriptedAnswer::FailStart();
    });
    EXPECT_TRUE(layer->GET(caller, told.Function(), kURL, {}, {})) << "it has its completion already";
    net->DeliverAll();
    EXPECT_EQ(told.Status(caller), -1);
    net->SetHandler([](const RecordedRequest&) { return ScriptedAnswer::Status(200); });
    const Guid next = Get();
    net->DeliverAll();
    EXPECT_EQ(told.Status(next), 200);
}

/// A network to which a request is known only when its start has returned, as it is to a layer that queues.
class LateNetwork : public ostnet::http::ForwardingProcessor {
public:
    using ForwardingProcessor::ForwardingProcessor;
    boost::function<void()> beforeStart;
    bool GET(const Guid& inID, const CompletionFunction& inCompletion, const ImmutableString& inURL,
             Headers inHeaders, const RequestOptions& inOptions) override {
        beforeStart();
        return ForwardingProcessor::GET(inID, inCompletion, inURL, std::move(inHeaders), inOptions);
    }
};

TEST_F(CachingTest, ACancelBeforeTheRequestIsKnownBelowIsNotLost) {
    const auto late = boost::make_shared<LateNetwork>(net);
    layer = boost::make_shared<CachingProcessor>(late);
    const Guid caller = Guid::CreateUnique();
    late->beforeStart = [&] { layer->TryToCancelRequest(caller); };
    net->SetHandler([](const RecordedRequest&) { return ScriptedAnswer::Hold(); });
    EXPECT_TRUE(layer->GET(caller, told.Function(), kURL, {}, {}));
    net->DeliverAll();
    EXPECT_EQ(told.Status(caller), -1);
    EXPECT_EQ(net->RequestCount(), 1u);
    EXPECT_EQ(net->PendingCount(), 0u);
}

TEST_F(CachingTest, A304ThatConfirmsNothingIsFollowedByOneFetchWithoutACondition) {
    // Nothing was asked, and yet nothing is said to have changed.
    net->Expect("GET", kURL.str(), ScriptedAnswer::Status(304));
    std::vector<Guid> ids;
    for (int i = 0; i < 100; ++i) {
        ids.push_back(Get());
    }
    net->Expect("GET", kURL.str(), Document("one", "\"1\""));
    net->DeliverAll();
    EXPECT_EQ(net->RequestCount(), 2u);
    for (const Guid& id : ids) {
        EXPECT_EQ(told.Body(id), "one");
    }
    // The answer speaks of another state than the one that is held.
    net->Expect("GET", kURL.str(), ScriptedAnswer::Status(304).With("ETag", "\"2\""));
    net->Expect("GET", kURL.str(), Document("two", "\"2\""));
    const Guid other = Get(kURL, "\"2\"");
    net->DeliverAll();
    EXPECT_EQ(told.Body(other), "two");
    EXPECT_EQ(net->Requests()[2].Header("If-None-Match"), "\"1\"");
    EXPECT_EQ(net->Requests()[3].CountHeader("If-None-Match"), 0u);
    EXPECT_EQ(told.Status(GetAnswered(ScriptedAnswer::Status(304).With("ETag", "W/\"2\""))), 200);
    // A server that insists is believed.
    layer->Purge();
    net->Expect("GET", kURL.str(), ScriptedAnswer::Status(304));
    EXPECT_EQ(told.Status(GetAnswered(ScriptedAnswer::Status(304))), 304);
    EXPECT_EQ(net->RequestCount(), 7u);
    // The second request cannot be started, or is given up.
    net->Expect("GET", kURL.str(), ScriptedAnswer::Status(304));
    EXPECT_EQ(told.Status(GetAnswered(ScriptedAnswer::FailStart())), 304);
    net->Expect("GET", kURL.str(), ScriptedAnswer::Status(304));
    const Guid cancelled = GetAnswered(ScriptedAnswer::Hold());
    layer->TryToCancelRequest(cancelled);
    net->DeliverAll();
    EXPECT_EQ(told.Status(cancelled), -1);
    EXPECT_EQ(net->PendingCount(), 0u);
    EXPECT_THAT(net->Mismatches(), testing::IsEmpty());
}

TEST_F(CachingTest, ReadsOfPackedBytesPassByAndWritesLeaveEntriesAlone) {
    GetAnswered(Document("inflated", "\"1\"").With("Cache-Control", "max-age=9"));
    RequestOptions asSent;
    asSent.decompressPayload = false;
    const Guid packed = Guid::CreateUnique();
    net->Expect("GET", kURL.str(), Document("packed", "\"1\""));
    Headers headers{{ostnet::kHEADER_IF_NONE_MATCH, ImmutableString("\"mine\"")}};
    EXPECT_TRUE(layer->GET(packed, told.Function(), kURL, headers, asSent));
    EXPECT_EQ(LastNetworkID(), packed);
    EXPECT_EQ(LastTag(), "\"mine\"");
    net->Expect("DELETE", kURL.str(), ScriptedAnswer::Status(204));
    EXPECT_TRUE(layer->DELETE(Guid::CreateUnique(), told.Function(), kURL, {}, {}));
    const Guid head = Guid::CreateUnique();
    EXPECT_TRUE(layer->HEAD(head, told.Function(), kURL, {}, {}));
    net->DeliverAll();
    EXPECT_EQ(told.Body(packed), "packed");
    EXPECT_EQ(told.Body(head), "inflated");
    EXPECT_THAT(net->Mismatches(), testing::IsEmpty());
}

TEST_F(CachingTest, WhoeverKnowsThatAWriteEndedDoesNotReadWhatWasBefore) {
    const auto payload = RecycledMemory::CreateFromBytes("new");
    const ostnet::http::Form form{{ImmutableString("f"), "v"}};
    const auto id = [] { return Guid::CreateUnique(); };
    const boost::function<void()> writes[] = {
        [&] { layer->PUT(id(), told.Function(), kURL, {}, payload, {}); },
        [&] { layer->PUT(id(), told.Function(), kURL, {}, form, {}); },
        [&] { layer->POST(id(), told.Function(), kURL, {}, payload, {}); },
        [&] { layer->POST(id(), told.Function(), kURL, {}, form, {}); },
        [&] { layer->DELETE(id(), told.Function(), kURL, {}, {}); }};
    net->SetHandler([](const RecordedRequest& inRequest) {
        return inRequest.verb == "GET" ? ScriptedAnswer::Hold() : ScriptedAnswer::Status(200);
    });
    for (const auto& write : writes) {
        net->ClearRequests();
        const Guid before = Get();
        write();
        const Guid during = Get();
        EXPECT_EQ(net->RequestCount(), 2u) << "the write is on its way: what is read may be either";
        net->DeliverAll();
        const Guid after = Get(), alike = Get();
        ASSERT_EQ(net->RequestCount(), 3u);
        EXPECT_TRUE(net->Release(net->Requests()[0].requestID, Document("old", "")));
        net->DeliverAll();
        EXPECT_EQ(told.Calls(after), 0u);
        net->ReleaseHeld(Document("new", ""));
        net->DeliverAll();
        EXPECT_EQ(told.Body(before) + told.Body(during), "oldold");
        EXPECT_EQ(told.Body(after) + told.Body(alike), "newnew");
    }
}

TEST_F(CachingTest, APurgeForgetsAlsoWhatIsOnItsWay) {
    const auto fresh = [] { return Document("one", "\"1\"").With("Cache-Control", "max-age=9"); };
    const ImmutableString late("http://hub.test/late");
    GetAnswered(fresh());
    boost::weak_ptr<ostnet::Response> held;
    {
        const Guid id = Get();
        net->DeliverAll();
        held = told.Only(id);
    }
    told.Forget();
    net->Expect("GET", late.str(), ScriptedAnswer::Hold());
    const Guid onItsWay = Get(late);
    layer->Purge();
    ASSERT_TRUE(ostcore::threads::WaitForExecutors(20000));
    EXPECT_TRUE(held.expired());
    net->ReleaseHeld(fresh());
    net->DeliverAll();
    EXPECT_EQ(told.Body(onItsWay), "one");
    EXPECT_FALSE(layer->IsFresh(late) || layer->IsFresh(kURL));
}

class CachingThreadsTest : public CachingTest {
protected:
    static constexpr int kThreads = 8;
    CachingThreadsTest() : CachingTest(2) {}

    template <typename Function>
    static void OnThreads(Function inFunction) {
        std::vector<std::thread> threads;
        for (int i = 0; i < kThreads; ++i) {
            threads.emplace_back([=] { inFunction(i); });
        }
        for (std::thread& thread : threads) {
            thread.join();
        }
    }
};

TEST_F(CachingThreadsTest, AThousandReadsAtOnceAreOneRequest) {
    constexpr int kReads = 1000 / kThreads;
    net->SetHandler([](const RecordedRequest&) { return ScriptedAnswer::Hold(); });
    OnThreads([this](int) {
        for (int i = 0; i < kReads; ++i) {
            Get();
        }
    });
    EXPECT_EQ(net->RequestCount(), 1u);
    net->ReleaseHeld(Document("one", "\"1\""));
    ASSERT_TRUE(net->WaitUntilIdle());
    EXPECT_EQ(told.Total(), 1000u);
}

TEST_F(CachingThreadsTest, JoinsAndCancelsInAnyOrderEndEachCallerOnce) {
    const char* const answers[] = {"200", "304", "503", "fail", "other"};
    std::atomic<unsigned> count{0};
    net->SetHandler([&](const RecordedRequest& inRequest) {
        const std::string kind = answers[count++ * 7 % 5];
        if (kind == "fail") {
            return ScriptedAnswer::FailStart();
        }
        if (kind == "other") {
            return ScriptedAnswer::Status(304).With("ETag", "\"x\"");
        }
        return kind == "200" ? Document(inRequest.url, "\"1\"") : ScriptedAnswer::Status(std::stoi(kind));
    });
    Mutex mutex;
    std::vector<Guid> started, refused;
    OnThreads([&](int inThread) {
        std::mt19937 random(static_cast<unsigned>(inThread));
        std::vector<Guid> mine, mineRefused;
        for (int i = 0; i < 1500; ++i) {
            const unsigned choice = random();
            const ImmutableString url("http://hub.test/" + std::to_string(choice % 3));
            const Guid id = Guid::CreateUnique();
            const bool isStarted = layer->GET(id, told.Function(), url, {}, {});
            (isStarted ? mine : mineRefused).push_back(id);
            if (choice % 4 == 0 && !mine.empty()) {
                layer->TryToCancelRequest(mine[random() % mine.size()]);
            }
            if (choice % 64 == 0) {
                layer->Purge();
            } else if (choice % 16 == 0) {
                layer->DELETE(Guid::CreateUnique(), [](const Guid&, const ResponseRef&) {}, url, {}, {});
            }
        }
        MutexLock lock(mutex);
        started.insert(started.end(), mine.begin(), mine.end());
        refused.insert(refused.end(), mineRefused.begin(), mineRefused.end());
    });
    ASSERT_TRUE(net->WaitUntilIdle());
    for (const Guid& id : started) {
        ASSERT_EQ(told.Calls(id), 1u);
    }
    for (const Guid& id : refused) {
        ASSERT_EQ(told.Calls(id), 0u);
    }
    EXPECT_EQ(net->PendingCount(), 0u);
    boost::weak_ptr<CachingProcessor> gone = layer;
    layer.reset();
    EXPECT_TRUE(gone.expired()) << "nothing in flight holds the layer any more";
}

}  // namespace
