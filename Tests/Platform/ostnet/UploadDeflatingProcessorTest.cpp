// The packing layer over a scripted network: what is packed, when, and how each upload ends.
#include <gmock/gmock.h>

#include <random>
#include <thread>

#include "LayerTest.h"
#include "ostcore/debug/DebugDatabase.h"
#include "ostnet/HeaderConstants.h"
#include "ostnet/http/Compression.h"
#include "ostnet/http/UploadDeflatingProcessor.h"

namespace {

using namespace ostnet_test;
using ostnet::http::UploadDeflatingProcessor;
using Payload = boost::shared_ptr<RecycledMemory const>;

const ImmutableString kURL("http://hub.test/a");
constexpr std::size_t kThreshold = 65536;

std::string Unpacked(const std::string& inBody) {
    const Payload plain = ostnet::http::DecompressPayload(RecycledMemory::CreateFromBytes(inBody));
    return plain ? std::string(plain->view()) : "(not packed)";
}

class DeflatingTest : public testing::Test {
protected:
    explicit DeflatingTest(std::size_t inWorkers = 0)
        : net(ScriptedProcessor::Create(inWorkers)),
          layer(boost::make_shared<UploadDeflatingProcessor>(net)) {
        net->SetHandler([](const RecordedRequest&) { return ScriptedAnswer::Status(200); });
    }
    ~DeflatingTest() override {
        net->Shutdown();
        ostcore::debug::DebugDatabase::ClearOverrides();
    }

    Guid Put(const Payload& inPayload, const Headers& inHeaders = {}) {
        const Guid id = Guid::CreateUnique();
        EXPECT_TRUE(layer->PUT(id, told.Function(), kURL, inHeaders, inPayload, {}));
        return id;
    }
    static Payload BodyOf(std::size_t inSize) {
        return RecycledMemory::CreateFromBytes(std::string(inSize, 'a'));
    }
    void UseThreshold(const char* inSize) {
        ostcore::debug::DebugDatabase::SetOverride("ostnet.UploadCompressionMinimumSize", inSize);
        layer = boost::make_shared<UploadDeflatingProcessor>(net);
    }

    boost::shared_ptr<ScriptedProcessor> net;
    Told told;
    boost::shared_ptr<UploadDeflatingProcessor> layer;
};

TEST_F(DeflatingTest, PacksWhatIsLargerThanTheThresholdAndNothingElse) {
    const Guid small = Put(BodyOf(kThreshold));
    ASSERT_EQ(net->RequestCount(), 1u) << "goes on at once";
    EXPECT_EQ(net->Requests()[0].body.size(), kThreshold);
    EXPECT_EQ(net->Requests()[0].CountHeader("Content-Encoding"), 0u);

    const Guid large = Guid::CreateUnique();
    EXPECT_TRUE(layer->POST(large, told.Function(), kURL,
                            {{ostnet::kHEADER_CONTENT_TYPE, ImmutableString("text/x")}},
                            BodyOf(kThreshold + 1), {}));
    EXPECT_EQ(net->RequestCount(), 1u) << "packed on the caller's thread";
    net->DeliverAll();
    const RecordedRequest packed = net->Requests().back();
    EXPECT_EQ(packed.Line(), "POST " + kURL.str());
    EXPECT_EQ(packed.requestID, large);
    EXPECT_EQ(packed.Header("Content-Encoding"), "gzip");
    EXPECT_EQ(packed.Header("Content-Type"), "text/x");
    EXPECT_LT(packed.body.size(), kThreshold / 100);
    EXPECT_EQ(Unpacked(packed.body), BodyOf(kThreshold + 1)->view());

    const Guid encoded = Put(BodyOf(kThreshold + 1), {{ostnet::kHEADER_CONTENT_ENCODING, "br"}});
    EXPECT_EQ(net->Requests().back().Header("Content-Encoding"), "br");
    EXPECT_EQ(net->Requests().back().body.size(), kThreshold + 1);
    const Guid none = Put(nullptr);
    layer->GET(Guid::CreateUnique(), told.Function(), kURL, {}, {});
    layer->DELETE(Guid::CreateUnique(), told.Function(), kURL, {}, {});
    EXPECT_EQ(net->RequestCount(), 6u);
    net->DeliverAll();
    for (const Guid& id : {small, large, encoded, none}) {
        EXPECT_EQ(told.Status(id), 200);
    }
}

TEST_F(DeflatingTest, AThresholdOfZeroPacksEveryBodyThatIsNotEmpty) {
    UseThreshold("0");
    Put(BodyOf(0));
    Put(BodyOf(1));
    net->DeliverAll();
    EXPECT_EQ(net->Requests()[0].CountHeader("Content-Encoding"), 0u);
    EXPECT_EQ(Unpacked(net->Requests()[1].body), "a");
}

TEST_F(DeflatingTest, FormsBecomePayloadsAndArePackedAlike) {
    const ostnet::http::Form smallForm{{ImmutableString("f"), "v"}};
    const ostnet::http::Form largeForm{{ImmutableString("f"), std::string(kThreshold, 'v')}};
    const ostnet::http::Form badForm{{ImmutableString("a\"b"), "v"}};
    EXPECT_TRUE(layer->PUT(Guid::CreateUnique(), told.Function(), kURL, {}, smallForm, {}));
    EXPECT_TRUE(layer->POST(Guid::CreateUnique(), told.Function(), kURL, {}, largeForm, {}));
    EXPECT_FALSE(layer->POST(Guid::CreateUnique(), told.Function(), kURL, {}, badForm, {}));
    net->DeliverAll();
    ASSERT_EQ(net->RequestCount(), 2u);
    for (const RecordedRequest& request : net->Requests()) {
        EXPECT_FALSE(request.isForm);
        const std::string type = request.Header("Content-Type");
        ASSERT_EQ(type.rfind("multipart/form-data; boundary=", 0), 0u);
        const std::string boundary = type.substr(type.find('=') + 1);
        const bool isPacked = request.CountHeader("Content-Encoding") > 0;
        const std::string body = isPacked ? Unpacked(request.body) : request.body;
        EXPECT_EQ(body.rfind("--" + boundary + "\r\n", 0), 0u);
        EXPECT_EQ(isPacked, body.size() > kThreshold);
    }
    EXPECT_EQ(told.Total(), 2u);
}

TEST_F(DeflatingTest, ACancelEndsAnUploadOnceInEachOfItsStates) {
    const Guid waiting = Put(BodyOf(kThreshold + 1));
    layer->TryToCancelRequest(waiting);
    layer->TryToCancelRequest(waiting);
    EXPECT_EQ(told.Calls(waiting), 0u) << "completed on the stack of the cancel";
    net->DeliverAll();
    EXPECT_EQ(told.Status(waiting), -1);
    EXPECT_EQ(net->RequestCount(), 0u);

    // While it is being started: below, it is known only afterwards.
    Guid starting;
    net->SetHandler([&](const RecordedRequest&) {
        layer->TryToCancelRequest(starting);
        return ScriptedAnswer::Hold();
    });
    starting = Put(BodyOf(kThreshold + 1));
    net->DeliverAll();
    EXPECT_EQ(told.Status(starting), -1);
    EXPECT_EQ(net->PendingCount(), 0u);

    net->SetHandler([](const RecordedRequest&) { return ScriptedAnswer::Hold(); });
    const Guid out = Put(BodyOf(kThreshold + 1));
    net->DeliverAll();
    EXPECT_EQ(net->PendingCount(), 1u);
    layer->TryToCancelRequest(out);
    net->DeliverAll();
    EXPECT_EQ(told.Status(out), -1);
    EXPECT_EQ(net->RequestCount(), 2u);
}

TEST_F(DeflatingTest, AStartThatFailsEndsAsACancelAndARefusedFunctionAsFalse) {
    net->SetHandler([](const RecordedRequest&) { return ScriptedAnswer::FailStart(); });
    const Guid packed = Put(BodyOf(kThreshold + 1));
    net->DeliverAll();
    EXPECT_EQ(told.Status(packed), -1);
    net->Shutdown();
    EXPECT_FALSE(layer->PUT(Guid::CreateUnique(), told.Function(), kURL, {}, BodyOf(kThreshold + 1), {}));
    EXPECT_EQ(told.Total(), 1u);
}

TEST_F(DeflatingTest, TheBodyGoesWhenItIsPacked) {
    boost::weak_ptr<RecycledMemory const> plain;
    net->SetHandler([&](const RecordedRequest&) {
        EXPECT_TRUE(plain.expired());
        return ScriptedAnswer::Hold();
    });
    {
        const Payload body = BodyOf(kThreshold + 1);
        plain = body;
        Put(body);
    }
    EXPECT_FALSE(plain.expired());
    net->DeliverAll();
    EXPECT_EQ(net->RequestCount(), 1u);
}

class DeflatingThreadsTest : public DeflatingTest {
protected:
    DeflatingThreadsTest() : DeflatingTest(2) {}
};

TEST_F(DeflatingThreadsTest, CancelsAtAnyMomentEndEachUploadOnce) {
    UseThreshold("1000");
    std::atomic<unsigned> count{0};
    net->SetHandler([&](const RecordedRequest&) {
        return ++count % 5 == 0 ? ScriptedAnswer::FailStart() : ScriptedAnswer::Status(200);
    });
    std::vector<std::thread> threads;
    Mutex mutex;
    std::vector<Guid> all;
    for (unsigned seed = 0; seed < 4; ++seed) {
        threads.emplace_back([&, seed] {
            std::mt19937 random(seed);
            std::vector<Guid> mine;
            for (int i = 0; i < 500; ++i) {
                mine.push_back(Put(BodyOf(1001 + random() % 20000)));
                if (random() % 2 == 0) {
                    layer->TryToCancelRequest(
                        mine[mine.size() - 1 - random() % std::min<std::size_t>(3, mine.size())]);
                }
            }
            MutexLock lock(mutex);
            all.insert(all.end(), mine.begin(), mine.end());
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    ASSERT_TRUE(net->WaitUntilIdle());
    for (const Guid& id : all) {
        ASSERT_EQ(told.Calls(id), 1u);
    }
    EXPECT_EQ(net->PendingCount(), 0u);
}

}  // namespace
