// The authorisation layer over a scripted network: what it adds, what it parks, and what it sends again.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "ostcore/debug/DebugDatabase.h"
#include "ostcore/threads/Mutex.h"
#include "RequestChain/AuthorizationProcessor.h"
#include "ZOClientTesting/ScriptedProcessor.h"

namespace ZOCL {
namespace {

using testing::ElementsAre;
using ZOClientTesting::RecordedRequest;
using ZOClientTesting::ScriptedAnswer;
using ZOClientTesting::ScriptedProcessor;

const ImmutableString kOld("login-token=old;");
const ImmutableString kNew("login-token=new;");

class AuthorizationTest : public testing::Test {
protected:
    explicit AuthorizationTest(std::size_t inWorkers = 0)
        : net(ScriptedProcessor::Create(inWorkers)),
          layer(boost::make_shared<AuthorizationProcessor>(net, [this] { ++notifications; })) {
        layer->SetAuthToken(kOld);
        net->SetHandler([](const RecordedRequest& inRequest) {
            return ScriptedAnswer::Status(inRequest.Header("Cookie") == kNew.view() ? 200 : 401);
        });
    }
    ~AuthorizationTest() override { net->Shutdown(); }

    Guid Get() {
        const Guid id = Guid::CreateUnique();
        EXPECT_TRUE(layer->GET(id,
                               [this, id](const Guid& inID, const shared_ptr<ostnet::Response>& inResponse) {
                                   EXPECT_EQ(inID, id);
                                   statuses.push_back(inResponse ? inResponse->status : -100);
                               },
                               ImmutableString("http://hub.test/a"), {}, {}));
        return id;
    }

    shared_ptr<ScriptedProcessor> net;
    std::atomic<int> notifications{0};
    std::vector<int> statuses;
    shared_ptr<AuthorizationProcessor> layer;
};

TEST_F(AuthorizationTest, PutsTokenAndExpectOnEveryVerb) {
    const auto done = [](const Guid&, const shared_ptr<ostnet::Response>&) {};
    const ImmutableString url("http://hub.test/a");
    const auto payload = RecycledMemory::CreateFromBytes("body");
    const ostnet::http::Form form{{ImmutableString("f"), "v"}};
    layer->SetAuthToken(kNew);
    layer->GET(Guid::CreateUnique(), done, url, {}, {});
    layer->HEAD(Guid::CreateUnique(), done, url, {}, {});
    layer->PUT(Guid::CreateUnique(), done, url, {}, payload, {});
    layer->PUT(Guid::CreateUnique(), done, url, {}, form, {});
    layer->POST(Guid::CreateUnique(), done, url, {}, payload, {});
    layer->POST(Guid::CreateUnique(), done, url, {}, form, {});
    layer->DELETE(Guid::CreateUnique(), done, url, {}, {});
    std::vector<std::string> verbs;
    for (const RecordedRequest& request : net->Requests()) {
        verbs.push_back(request.verb + (request.isForm ? " form" : "") +
                        (request.body.empty() ? "" : " body"));
        EXPECT_EQ(request.CountHeader("Cookie"), 1u);
        EXPECT_EQ(request.Header("Cookie"), kNew.view());
        EXPECT_EQ(request.Header("Expect"), "102-processing");
    }
    EXPECT_THAT(verbs,
                ElementsAre("GET", "HEAD", "PUT body", "PUT form", "POST body", "POST form", "DELETE"));
    net->ClearRequests();
    layer->SetAuthToken(ImmutableString());
    ostcore::debug::DebugDatabase::SetOverride("ZOClient.DisableExpectProcessingHeader", "true");
    layer->GET(Guid::CreateUnique(), done, url, {}, {});
    ostcore::debug::DebugDatabase::ClearOverrides();
    EXPECT_TRUE(net->Requests()[0].headers.empty());
}

TEST_F(AuthorizationTest, TwoRefusalsAskOnceAndAreEachSentAgainOnce) {
    Get();
    Get();
    net->DeliverAll();
    EXPECT_EQ(notifications, 1);
    EXPECT_TRUE(statuses.empty());
    layer->SetAuthToken(kNew);
    net->DeliverAll();
    EXPECT_EQ(net->RequestCount(), 4u);
    EXPECT_THAT(statuses, ElementsAre(200, 200));
    EXPECT_EQ(net->Requests()[2].CountHeader("Cookie"), 1u);
}

TEST_F(AuthorizationTest, ALateRefusalOfAnOlderTokenIsSentAgainAtOnce) {
    Get();
    layer->SetAuthToken(kNew);
    net->DeliverAll();
    EXPECT_EQ(notifications, 0);
    EXPECT_THAT(statuses, ElementsAre(200));
}

TEST_F(AuthorizationTest, WithoutTokenOrNotificationTheRefusalGoesToTheCaller) {
    layer->SetAuthToken(ImmutableString());
    Get();
    net->DeliverAll();
    EXPECT_THAT(statuses, ElementsAre(401));
    layer->SetAuthToken(kOld);
    layer->ClearAuthTokenNotificationFunction();
    Get();
    net->DeliverAll();
    EXPECT_THAT(statuses, ElementsAre(401, 401));
    EXPECT_EQ(notifications, 0);
}

TEST_F(AuthorizationTest, TheSameOrNoTokenEndsWhatIsParked) {
    Get();
    net->DeliverAll();
    layer->SetAuthToken(kOld);
    EXPECT_TRUE(statuses.empty()) << "completed on the stack of SetAuthToken";
    net->DeliverAll();
    EXPECT_THAT(statuses, ElementsAre(401));
    Get();
    net->DeliverAll();
    layer->SetAuthToken(ImmutableString());
    net->DeliverAll();
    EXPECT_THAT(statuses, ElementsAre(401, 401));
    EXPECT_EQ(net->RequestCount(), 2u);
    EXPECT_EQ(notifications, 2);
}

TEST_F(AuthorizationTest, ClearingTheNotificationEndsWhatWaitsForIt) {
    Get();
    net->DeliverAll();
    layer->ClearAuthTokenNotificationFunction();
    net->DeliverAll();
    EXPECT_THAT(statuses, ElementsAre(401));
}

TEST_F(AuthorizationTest, AParkedRequestCanBeCancelledAndTheRenewalGoesOn) {
    const Guid first = Get();
    Get();
    net->DeliverAll();
    layer->TryToCancelRequest(first);
    layer->TryToCancelRequest(first);
    net->DeliverAll();
    EXPECT_THAT(statuses, ElementsAre(-1));
    layer->SetAuthToken(kNew);
    net->DeliverAll();
    EXPECT_THAT(statuses, ElementsAre(-1, 200));
}

TEST_F(AuthorizationTest, ACancelThatMeetsTheReplayIsNotLost) {
    Guid id;
    net->SetHandler([&](const RecordedRequest& inRequest) {
        if (inRequest.Header("Cookie") == kNew.view()) {
            layer->TryToCancelRequest(id);
            return ScriptedAnswer::Hold();
        }
        return ScriptedAnswer::Status(401);
    });
    id = Get();
    net->DeliverAll();
    layer->SetAuthToken(kNew);
    net->DeliverAll();
    EXPECT_THAT(statuses, ElementsAre(-1));
}

TEST_F(AuthorizationTest, AReplayThatDoesNotStartEndsWithTheRefusal) {
    net->SetHandler([&](const RecordedRequest& inRequest) {
        return inRequest.Header("Cookie") == kNew.view() ? ScriptedAnswer::FailStart()
                                                         : ScriptedAnswer::Status(401);
    });
    Get();
    net->DeliverAll();
    layer->SetAuthToken(kNew);
    net->DeliverAll();
    EXPECT_THAT(statuses, ElementsAre(401));
}

TEST_F(AuthorizationTest, ARequestIsNotSentAgainForEver) {
    net->SetHandler([](const RecordedRequest&) { return ScriptedAnswer::Status(401); });
    int tokens = 0;
    layer->SetAuthTokenNotificationFunction(
        [&] { layer->SetAuthToken(ImmutableString("login-token=" + std::to_string(++tokens))); });
    Get();
    net->DeliverAll();
    EXPECT_THAT(statuses, ElementsAre(401));
    EXPECT_EQ(net->RequestCount(), 1u + AuthorizationProcessor::kMaximumRenewals);
}

TEST_F(AuthorizationTest, ANullResponseIsPassedOn) {
    net->SetHandler([](const RecordedRequest&) { return ScriptedAnswer::NullResponse(); });
    Get();
    net->DeliverAll();
    EXPECT_THAT(statuses, ElementsAre(-100));
}

TEST(AuthorizationStorm, AThousandRefusalsFromManyThreadsAskOnce) {
    const auto net = ScriptedProcessor::Create(4);
    net->SetHandler([](const RecordedRequest& inRequest) {
        return ScriptedAnswer::Status(inRequest.Header("Cookie") == kNew.view() ? 200 : 401);
    });
    constexpr int kThreads = 4;
    constexpr int kEach = 250;
    std::atomic<int> notifications{0};
    std::atomic<int> succeeded{0};
    std::atomic<int> completed{0};
    ostcore::threads::Mutex mutex;
    ostcore::threads::ConditionVariable changed;
    auto layer = boost::make_shared<AuthorizationProcessor>(net, [&] { ++notifications; });
    layer->SetAuthToken(kOld);
    std::vector<std::thread> threads;
    for (int i = 0; i < kThreads; ++i) {
        threads.emplace_back([&] {
            for (int k = 0; k < kEach; ++k) {
                layer->GET(Guid::CreateUnique(),
                           [&](const Guid&, const shared_ptr<ostnet::Response>& inResponse) {
                               succeeded += inResponse->status == 200 ? 1 : 0;
                               ostcore::threads::MutexLock lock(mutex);
                               ++completed;
                               changed.NotifyAll();
                           },
                           ImmutableString("http://hub.test/a"), {}, {});
            }
        });
    }
    ASSERT_TRUE(net->WaitForRequests(kThreads * kEach / 2));
    while (notifications == 0) {
        std::this_thread::yield();
    }
    layer->SetAuthToken(kNew);
    for (std::thread& thread : threads) {
        thread.join();
    }
    {
        const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(60);
        ostcore::threads::MutexLock lock(mutex);
        while (completed < kThreads * kEach) {
            ASSERT_TRUE(changed.WaitUntil(lock, deadline) || completed == kThreads * kEach);
        }
    }
    net->WaitUntilIdle();
    EXPECT_EQ(notifications, 1);
    EXPECT_EQ(succeeded, kThreads * kEach);
    EXPECT_EQ(completed, kThreads * kEach);
    EXPECT_LE(net->RequestCount(), 2u * kThreads * kEach);
    net->Shutdown();
}

}  // namespace
}  // namespace ZOCL
