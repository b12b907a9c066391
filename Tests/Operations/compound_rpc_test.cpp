// Remote procedure calls as steps of a compound operation.
#include "Steps.h"

namespace ZOCL {
namespace {

class FakeClient final : public ostmarshal::RPCClient {
public:
    RequestNumber SendRequest(const shared_ptr<any>& inRequest, const SuccessFunction& inSuccess,
                              const FailureFunction& inFailure) override {
        request = inRequest;
        success = inSuccess;
        failure = inFailure;
        if (onSend) {
            onSend();
        }
        return number;
    }
    void CancelRequest(RequestNumber inNumber) override { cancelled.push_back(inNumber); }

    RequestNumber number = 42;
    function<void()> onSend;
    shared_ptr<any> request;
    SuccessFunction success;
    FailureFunction failure;
    std::vector<RequestNumber> cancelled;
};

class RPCTest : public ClientTest {
protected:
    RPCTest() : ClientTest(0) {}

    void Send() {
        CompoundAsyncRPCOperation::SendRequest(
            operation, client, make_shared<any>(1),
            [this](const shared_ptr<any>& inAnswer, std::uint64_t inNumber) {
                calls.push_back("success " + std::to_string(boost::any_cast<int>(*inAnswer)) + " " +
                                std::to_string(inNumber));
            },
            [this](long inError, const UString&, std::uint64_t inNumber) {
                calls.push_back("failure " + std::to_string(inError) + " " + std::to_string(inNumber));
            });
    }
    std::vector<int> Finals() {
        net->DeliverAll();
        return finish.Results();
    }

    Finish finish;
    shared_ptr<FakeClient> client = make_shared<FakeClient>();
    shared_ptr<CompoundAsyncOperation> operation =
        CompoundAsyncOperation::Create(finish.Function(), server, false);
    std::vector<std::string> calls;
};

TEST_F(RPCTest, AnswerReachesTheCallerBeforeTheEnd) {
    Send();
    client->success(make_shared<any>(7), 42);
    EXPECT_THAT(calls, testing::ElementsAre("success 7 42"));
    EXPECT_THAT(Finals(), testing::ElementsAre(kResultSuccess));
}

TEST_F(RPCTest, FailureFailsTheOperation) {
    Send();
    client->failure(5, UString(), 42);
    EXPECT_THAT(calls, testing::ElementsAre("failure 5 42"));
    EXPECT_THAT(Finals(), testing::ElementsAre(kResultFailure));
}

TEST_F(RPCTest, CallThatDoesNotStartFailsTheOperation) {
    client->number = ostmarshal::RPCClient::kNoRequest;
    Send();
    EXPECT_TRUE(calls.empty());
    EXPECT_THAT(Finals(), testing::ElementsAre(kResultNotStarted));
}

TEST_F(RPCTest, CancelReachesTheCallOnceAlsoWhileItIsBeingSent) {
    Send();
    operation->TryToCancel();
    EXPECT_THAT(client->cancelled, testing::ElementsAre(42u));
    client->failure(kResultCancelled, UString(), 42);
    EXPECT_THAT(Finals(), testing::ElementsAre(kResultCancelled));

    Finish second;
    operation = CompoundAsyncOperation::Create(second.Function(), server, false);
    client->cancelled.clear();
    client->onSend = [this] { operation->TryToCancel(); };
    Send();
    EXPECT_THAT(client->cancelled, testing::ElementsAre(42u));
    client->failure(kResultCancelled, UString(), 42);
    net->DeliverAll();
    EXPECT_THAT(second.Results(), testing::ElementsAre(kResultCancelled));
}

}  // namespace
}  // namespace ZOCL
