// The throttles: who waits, who follows, and what happens to those who cannot.
#include "ChainSupport.h"
#include "RequestChain/ThrottlingReadProcessor.h"
#include "RequestChain/ThrottlingWriteProcessor.h"

namespace ZOCL {
namespace {

using ostnet::Response;
using testing::Each;
using testing::ElementsAre;
using testing::IsEmpty;

class Throttles : public LayerTest {
protected:
    Throttles() {
        net->SetHandler([](const RecordedRequest&) { return ScriptedAnswer::Hold(); });
    }
    std::vector<std::string> Paths() const {
        std::vector<std::string> paths;
        for (const RecordedRequest& request : net->Requests()) {
            paths.push_back(request.Path());
        }
        return paths;
    }
    void Release(const Guid& inID) {
        EXPECT_TRUE(net->Release(inID, ScriptedAnswer::Status(200)));
        net->DeliverAll();
    }
    static void ExpectLoad(const ThrottlingProcessor& inLayer, int inInFlight, std::size_t inWaiting) {
        EXPECT_EQ(inLayer.GetLoad().inFlight, inInFlight);
        EXPECT_EQ(inLayer.GetLoad().waiting, inWaiting);
    }
    static constexpr int kMany = 100000;
};

TEST_F(Throttles, FiftyReadsAreInFlightAndTheOthersFollowInOrderOfArrival) {
    const auto reads = boost::make_shared<ThrottlingReadProcessor>(net);
    std::vector<Guid> ids;
    for (int i = 0; i < 53; ++i) {
        ids.push_back(Start(*reads, i % 2 == 0 ? Verb::kGet : Verb::kHead, "/" + std::to_string(i)));
    }
    EXPECT_EQ(net->RequestCount(), 50u);
    ExpectLoad(*reads, 50, 3);
    for (const Verb verb : {Verb::kPut, Verb::kPost, Verb::kDelete}) {
        Release(Start(*reads, verb));
    }
    net->ClearRequests();
    Release(ids[7]);
    EXPECT_THAT(Paths(), ElementsAre("/50"));
    ExpectLoad(*reads, 50, 2);
    Release(ids[50]);
    Release(ids[0]);
    EXPECT_THAT(Paths(), ElementsAre("/50", "/51", "/52"));
    Release(ids[1]);
    ExpectLoad(*reads, 49, 0);
}

TEST_F(Throttles, TenWritesOfAllKindsAreInFlightAndReadsPass) {
    const auto writes = boost::make_shared<ThrottlingWriteProcessor>(net);
    const ostnet::http::Form form{{ImmutableString("f"), "v"}};
    for (int i = 0; i < 4; ++i) {
        Start(*writes, Verb::kPut);
        Start(*writes, Verb::kDelete);
        EXPECT_TRUE(writes->POST(Guid::CreateUnique(), Note(), URLOf("/form"), {}, form, {}));
    }
    EXPECT_EQ(net->RequestCount(), 10u);
    ExpectLoad(*writes, 10, 2);
    Start(*writes, Verb::kGet);
    Start(*writes, Verb::kHead);
    EXPECT_EQ(net->RequestCount(), 12u);
    net->ReleaseHeld(ScriptedAnswer::Status(200));
    net->DeliverAll();
    EXPECT_EQ(net->RequestCount(), 14u);
    EXPECT_EQ(net->Requests().back().Field("f"), "v") << "what waited goes out as it came";
}

TEST_F(Throttles, AStartThatFailsGivesItsSlotToTheNext) {
    const auto reads = boost::make_shared<ThrottlingReadProcessor>(net, 1);
    net->Expect("GET", "", ScriptedAnswer::FailStart());
    EXPECT_FALSE(reads->GET(Guid::CreateUnique(), Note(), URLOf("/none"), {}, {}));
    ExpectLoad(*reads, 0, 0);
    const Guid first = Start(*reads, Verb::kGet, "/first");
    Start(*reads, Verb::kGet, "/second");
    Start(*reads, Verb::kGet, "/third");
    net->Expect("GET", "", ScriptedAnswer::FailStart());
    Release(first);
    EXPECT_THAT(Paths(), ElementsAre("/none", "/first", "/second", "/third"));
    EXPECT_THAT(statuses, ElementsAre(200, Response::kStatusCancelled));
    ExpectLoad(*reads, 1, 0);
}

TEST_F(Throttles, AHundredThousandFailedStartsNeitherGrowTheStackNorLoseASlot) {
    const auto reads = boost::make_shared<ThrottlingReadProcessor>(net, 1);
    const Guid first = Start(*reads);
    for (int i = 0; i < kMany; ++i) {
        Start(*reads);
    }
    net->SetHandler([](const RecordedRequest&) { return ScriptedAnswer::FailStart(); });
    statuses.reserve(kMany + 1);
    Release(first);
    ASSERT_EQ(statuses.size(), std::size_t(kMany) + 1);
    statuses.erase(statuses.begin());
    EXPECT_THAT(statuses, Each(Response::kStatusCancelled));
    ExpectLoad(*reads, 0, 0);
}

TEST_F(Throttles, ACancelInTheLineEndsThereAndTheOthersKeepTheirOrder) {
    const auto writes = boost::make_shared<ThrottlingWriteProcessor>(net, 1);
    const Guid first = Start(*writes, Verb::kPut, "/first");
    const Guid second = Start(*writes, Verb::kPut, "/second");
    Start(*writes, Verb::kPut, "/third");
    writes->TryToCancelRequest(second);
    EXPECT_THAT(statuses, IsEmpty()) << "completed on the stack of the cancel";
    writes->TryToCancelRequest(second);
    net->DeliverAll();
    EXPECT_THAT(statuses, ElementsAre(Response::kStatusCancelled));
    ExpectLoad(*writes, 1, 1);
    writes->TryToCancelRequest(first);
    net->DeliverAll();
    EXPECT_THAT(Paths(), ElementsAre("/first", "/third"));
    ExpectLoad(*writes, 1, 0);
}

TEST_F(Throttles, AHundredThousandWaitingRequestsAreCancelledFromTheEndOfTheLine) {
    const auto reads = boost::make_shared<ThrottlingReadProcessor>(net, 1);
    std::vector<Guid> ids;
    for (int i = 0; i <= kMany; ++i) {
        ids.push_back(Start(*reads));
    }
    for (int i = kMany; i > 0; --i) {
        reads->TryToCancelRequest(ids[static_cast<std::size_t>(i)]);
    }
    net->DeliverAll();
    EXPECT_EQ(statuses.size(), std::size_t(kMany));
    ExpectLoad(*reads, 1, 0);
    EXPECT_EQ(net->RequestCount(), 1u);
}

// The handler runs within the start call, when the request has left the line and the network does not know
// it.
TEST_F(Throttles, ACancelBetweenLineAndNetworkIsPassedOn) {
    const auto deaf = boost::make_shared<NotingProcessor>(net);
    const auto reads = boost::make_shared<ThrottlingReadProcessor>(deaf, 1);
    const Guid first = Start(*reads);
    const Guid second = Start(*reads);
    deaf->ignoresCancels = true;
    net->SetHandler([&](const RecordedRequest&) {
        reads->TryToCancelRequest(second);
        deaf->ignoresCancels = false;
        return ScriptedAnswer::Hold();
    });
    Release(first);
    EXPECT_THAT(statuses, ElementsAre(200, Response::kStatusCancelled));
    ExpectLoad(*reads, 0, 0);
}

}  // namespace
}  // namespace ZOCL
