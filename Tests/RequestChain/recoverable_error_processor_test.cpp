// Retries on virtual time: their delays, their counts, who is told, and how they end.
#include "ChainSupport.h"
#include "RequestChain/RecoverableErrorProcessor.h"
#include "RequestChain/RepeatMark.h"

namespace ZOCL {
namespace {

using ostnet::Response;
using testing::Each;
using testing::ElementsAre;
using testing::IsEmpty;

class RecoverableErrors : public LayerTest {
protected:
    RecoverableErrors() { layer->SetRetriesEnabled(true); }

    Guid Start(const std::string& inPath = "/a", Verb inVerb = Verb::kGet) {
        return LayerTest::Start(*layer, inVerb, inPath);
    }
    void AnswerWith(const ScriptedAnswer& inAnswer) {
        net->SetHandler([inAnswer](const RecordedRequest&) { return inAnswer; });
    }
    std::vector<bool> Reports() {
        const std::lock_guard<std::mutex> lock(mMutex);
        return mReports;
    }

    shared_ptr<NotingProcessor> bottom = boost::make_shared<NotingProcessor>(net);
    shared_ptr<RecoverableErrorProcessor> layer =
        boost::make_shared<RecoverableErrorProcessor>(bottom, [this](bool inLooksDown) {
            const std::lock_guard<std::mutex> lock(mMutex);
            mReports.push_back(inLooksDown);
        });

private:
    std::mutex mMutex;
    std::vector<bool> mReports;
};

const std::vector<std::uint32_t> kFourteenDelays{4,   8,    16,   32,   64,   128,   256,
                                                 512, 1024, 2048, 4096, 8192, 16384, 32768};

TEST_F(RecoverableErrors, ALoneRequestDoublesItsDelayAndNeverGivesUp) {
    AnswerWith(ScriptedAnswer::NoResponse());
    Start();
    Pass(milliseconds(65532));
    EXPECT_EQ(net->RequestCount(), 15u) << "fourteen retries take 65532 milliseconds";
    EXPECT_EQ(std::vector<std::uint32_t>(bottom->delays.begin(), bottom->delays.begin() + 14),
              kFourteenDelays);
    Pass(milliseconds(512 * 20));
    EXPECT_EQ(net->RequestCount(), 35u);
    EXPECT_THAT(std::vector<std::uint32_t>(bottom->delays.begin() + 14, bottom->delays.end()), Each(512u));
    EXPECT_THAT(statuses, IsEmpty());
    AnswerWith(ScriptedAnswer::Status(200));
    Pass(milliseconds(512));
    EXPECT_THAT(statuses, ElementsAre(200));
}

TEST_F(RecoverableErrors, ARequestGivesUpWhenOthersSucceedWhileItUsesUpItsRetries) {
    net->SetHandler([](const RecordedRequest& inRequest) {
        return ScriptedAnswer::Status(inRequest.Path() == "/good" ? 200 : 503);
    });
    Start("/bad");
    for (int failure = 0; failure < 14; ++failure) {
        net->DeliverAll();
        Start("/good");
        Pass(milliseconds(bottom->delays.back()));
    }
    EXPECT_EQ(bottom->delays, kFourteenDelays);
    EXPECT_EQ(statuses.size(), 15u);
    EXPECT_EQ(statuses.back(), 503);
}

TEST_F(RecoverableErrors, InAnOutageAFreshRequestSettlesAt512Milliseconds) {
    AnswerWith(ScriptedAnswer::Status(500));
    for (int i = 0; i < 15; ++i) {
        Start();
    }
    net->DeliverAll();
    bottom->delays.clear();
    const std::size_t before = net->RequestCount();
    Pass(milliseconds(4 + 8 + 16 + 32 + 64 + 128 + 256));
    EXPECT_EQ(net->RequestCount(), before + 15 * 7);
    bottom->delays.clear();
    Pass(milliseconds(512 * 3));
    EXPECT_THAT(bottom->delays, Each(512u));
}

TEST_F(RecoverableErrors, WhatCannotPassEndsAtOnceAndClearsTheCountOfAll) {
    const std::vector<ScriptedAnswer> answers{ScriptedAnswer::Status(200),    ScriptedAnswer::Status(304),
                                              ScriptedAnswer::Status(404),    ScriptedAnswer::Status(600),
                                              ScriptedAnswer::NullResponse(), ScriptedAnswer::NoResponse(60)};
    for (const ScriptedAnswer& answer : answers) {
        AnswerWith(ScriptedAnswer::Status(503));
        for (int i = 0; i < 3; ++i) {
            Start();
        }
        net->DeliverAll();
        bottom->delays.clear();
        AnswerWith(answer);
        Start();
        net->DeliverAll();
        EXPECT_THAT(bottom->delays, IsEmpty());
        Pass(milliseconds(500));
    }
    EXPECT_EQ(statuses.size(), 4 * answers.size());
    EXPECT_THAT(Reports(), Each(false)) << "a report tells the state of its own moment";
}

TEST_F(RecoverableErrors, TheThirdFailureInARowIsReportedAndItsEndIs) {
    AnswerWith(ScriptedAnswer::Status(503));
    Start();
    Pass(milliseconds(4));
    AnswerWith(ScriptedAnswer::Status(200));
    Pass(milliseconds(600));
    EXPECT_THAT(Reports(), ElementsAre(false)) << "two failures";
    AnswerWith(ScriptedAnswer::Status(503));
    Start();
    Pass(milliseconds(499));
    EXPECT_EQ(Reports().size(), 1u);
    Pass(milliseconds(1));
    EXPECT_THAT(Reports(), ElementsAre(false, true));
    AnswerWith(ScriptedAnswer::Status(404));
    Pass(milliseconds(2000));
    EXPECT_EQ(Reports().back(), false);
    const std::size_t reports = Reports().size();
    Pass(milliseconds(5000));
    EXPECT_EQ(Reports().size(), reports) << "nothing happened";
}

TEST_F(RecoverableErrors, ABurstOfFailuresCostsOneReport) {
    AnswerWith(ScriptedAnswer::Status(503));
    for (int i = 0; i < 1000; ++i) {
        Start();
    }
    Pass(milliseconds(500));
    EXPECT_THAT(Reports(), ElementsAre(true));
    Pass(milliseconds(10000));
    EXPECT_LE(Reports().size(), 21u);
    EXPECT_THAT(Reports(), Each(true));
}

TEST_F(RecoverableErrors, WithRetriesOffEachRequestEndsWithItsNextFailure) {
    AnswerWith(ScriptedAnswer::Status(503));
    Start();
    Pass(milliseconds(3));
    layer->SetRetriesEnabled(false);
    EXPECT_THAT(statuses, IsEmpty()) << "it ends with its next failure, not now";
    Start("/b");
    net->DeliverAll();
    EXPECT_THAT(statuses, ElementsAre(503));
    Pass(milliseconds(1));
    EXPECT_THAT(statuses, ElementsAre(503, 503));
    Pass(milliseconds(500));
    EXPECT_THAT(Reports(), ElementsAre(false)) << "turning them off forgets the failures";
    layer->SetRetriesEnabled(true);
    Start("/c");
    Pass(milliseconds(4));
    EXPECT_EQ(net->RequestCount(), 5u);
}

TEST_F(RecoverableErrors, ACancelDuringTheDelayEndsTheRequestThere) {
    AnswerWith(ScriptedAnswer::Status(503));
    const Guid id = Start();
    net->DeliverAll();
    layer->TryToCancelRequest(id);
    EXPECT_THAT(statuses, IsEmpty()) << "completed on the stack of the cancel";
    layer->TryToCancelRequest(id);
    Pass(milliseconds(40000));
    EXPECT_THAT(statuses, ElementsAre(Response::kStatusCancelled));
    EXPECT_EQ(net->RequestCount(), 1u);
}

TEST_F(RecoverableErrors, ACancelAtTheNetworkIsNoFailureToRepeat) {
    AnswerWith(ScriptedAnswer::Hold());
    layer->TryToCancelRequest(Start());
    Pass(milliseconds(40000));
    EXPECT_THAT(statuses, ElementsAre(Response::kStatusCancelled));
    EXPECT_EQ(net->RequestCount(), 1u);
}

// The failure was on its way up when the cancel went down past it.
TEST_F(RecoverableErrors, ACancelThatTheNetworkMissedIsNotLost) {
    bottom->ignoresCancels = true;
    AnswerWith(ScriptedAnswer::Status(503));
    layer->TryToCancelRequest(Start());
    Pass(milliseconds(40000));
    EXPECT_THAT(statuses, ElementsAre(Response::kStatusCancelled));
    EXPECT_EQ(net->RequestCount(), 1u);
}

// The handler runs within the start call, before the network knows the request.
TEST_F(RecoverableErrors, ACancelWithinTheStartOfARetryIsPassedOn) {
    Guid id;
    bottom->ignoresCancels = true;
    net->SetHandler([&](const RecordedRequest&) {
        if (net->RequestCount() == 1) {
            return ScriptedAnswer::Status(503);
        }
        layer->TryToCancelRequest(id);
        bottom->ignoresCancels = false;
        return ScriptedAnswer::Hold();
    });
    id = Start();
    Pass(milliseconds(4));
    EXPECT_THAT(statuses, ElementsAre(Response::kStatusCancelled));
    EXPECT_EQ(bottom->cancels, 2);
}

TEST_F(RecoverableErrors, WhatCannotBeSentAgainEndsWithItsFailure) {
    net->Expect("GET", "", ScriptedAnswer::FailStart());
    EXPECT_FALSE(layer->GET(Guid::CreateUnique(), Note(), URLOf("/a"), {}, {}));
    net->Expect("GET", "", ScriptedAnswer::Status(502));
    net->Expect("GET", "", ScriptedAnswer::FailStart());
    Start();
    Pass(milliseconds(4));
    EXPECT_THAT(statuses, ElementsAre(502));
    bottom->refusesDelays = true;
    net->Expect("GET", "", ScriptedAnswer::Status(504));
    Start();
    net->DeliverAll();
    EXPECT_THAT(statuses, ElementsAre(502, 504));
}

TEST_F(RecoverableErrors, EveryVerbIsSentAgainAsItWas) {
    const auto payload = RecycledMemory::CreateFromBytes("body");
    const ostnet::http::Form form{{ImmutableString("f"), "v"}};
    const ostnet::Headers headers{{ImmutableString("X-Mark"), ImmutableString("1")}};
    std::vector<PackedRequest> all;
    for (const Verb verb : {Verb::kGet, Verb::kHead, Verb::kPut, Verb::kPost, Verb::kDelete}) {
        all.push_back(Pack(verb, URLOf("/a"), ostnet::Headers(headers), {}));
    }
    for (const Verb verb : {Verb::kPut, Verb::kPost}) {
        all.push_back(Pack(verb, URLOf("/a"), ostnet::Headers(headers), payload, {}));
        all.push_back(Pack(verb, URLOf("/a"), ostnet::Headers(headers), form, {}));
    }
    for (const PackedRequest& packed : all) {
        net->ClearRequests();
        net->SetHandler([&](const RecordedRequest&) {
            return ScriptedAnswer::Status(net->RequestCount() == 1 ? 503 : 200);
        });
        EXPECT_TRUE(packed.Send(*layer, Guid::CreateUnique(), Note()));
        Pass(milliseconds(4));
        const auto sent = net->Requests();
        ASSERT_EQ(sent.size(), 2u);
        EXPECT_EQ(sent[0].Line(), sent[1].Line());
        EXPECT_EQ(sent[0].requestID, sent[1].requestID);
        EXPECT_EQ(sent[0].headers, sent[1].headers);
        EXPECT_EQ(sent[0].body, sent[1].body);
        EXPECT_EQ(sent[0].form, sent[1].form);
        EXPECT_EQ(sent[1].Header("X-Mark"), "1");
    }
    EXPECT_THAT(statuses, Each(200));
}

TEST_F(RecoverableErrors, ARefusalOfARepetitionIsMarkedAsOne) {
    AnswerWith(ScriptedAnswer::Status(409));
    Start("/a", Verb::kPost);
    net->DeliverAll();
    EXPECT_FALSE(IsRefusedRepetition(last));
    AnswerWith(ScriptedAnswer::NoResponse());
    Start("/a", Verb::kPost);
    net->DeliverAll();
    AnswerWith(ScriptedAnswer::Status(409));
    Pass(milliseconds(4));
    EXPECT_TRUE(IsRefusedRepetition(last));
    EXPECT_THAT(statuses, ElementsAre(409, 409));
}

TEST_F(RecoverableErrors, RetryAfterIsNotRead) {
    for (const char* const value : {"-5", "0", "315360000", "Wed, 21 Oct 2099 07:28:00 GMT", "\x7f"}) {
        net->Expect("GET", "", ScriptedAnswer::Status(503).With("Retry-After", value));
        net->Expect("GET", "", ScriptedAnswer::Status(200));
        Start();
        Pass(milliseconds(3));
        EXPECT_EQ(net->PendingCount(), 0u);
        Pass(milliseconds(1));
    }
    EXPECT_THAT(bottom->delays, Each(4u));
    EXPECT_THAT(statuses, ElementsAre(200, 200, 200, 200, 200));
}

}  // namespace
}  // namespace ZOCL
