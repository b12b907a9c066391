// Remote procedure calls as requests of a compound operation.
#include "ZOClient/CompoundAsyncOperation.h"

namespace ZOCL {

namespace {

using ostmarshal::RPCClient;

/// The number of a call is known only after it was sent, and a cancel can come before: whichever of the two
/// comes second does the cancelling, once.
class CancellableCall {
public:
    explicit CancellableCall(const shared_ptr<RPCClient>& inClient) : mClient(inClient) {}

    void SetNumber(RPCClient::RequestNumber inNumber) {
        mNumber.store(inNumber);
        if (mCancelled.load()) {
            CancelOnce();
        }
    }
    void Cancel() {
        mCancelled.store(true);
        CancelOnce();
    }

private:
    void CancelOnce() {
        const RPCClient::RequestNumber number = mNumber.exchange(RPCClient::kNoRequest);
        if (number != RPCClient::kNoRequest) {
            mClient->CancelRequest(number);
        }
    }
    const shared_ptr<RPCClient> mClient;
    std::atomic<RPCClient::RequestNumber> mNumber{RPCClient::kNoRequest};
    std::atomic<bool> mCancelled{false};
};

}  // namespace

void CompoundAsyncRPCOperation::SendRequest(const shared_ptr<CompoundAsyncOperation>& inOperation,
                                            const shared_ptr<RPCClient>& inClient,
                                            const shared_ptr<any>& inRequest,
                                            const RPCClient::SuccessFunction& inSuccess,
                                            const RPCClient::FailureFunction& inFailure) {
    const auto call = make_shared<CancellableCall>(inClient);
    const auto work = [call, inClient, inRequest, inSuccess, inFailure](
                          const Guid& inRequestID, const RequestCompletion& inCompletion) {
        const auto number = inClient->SendRequest(
            inRequest,
            [inRequestID, inCompletion, inSuccess](const shared_ptr<any>& inAnswer,
                                                   RPCClient::RequestNumber inNumber) {
                if (inSuccess) {
                    inSuccess(inAnswer, inNumber);
                }
                inCompletion(inRequestID, kResultSuccess, nullptr, nullptr);
            },
            [inRequestID, inCompletion, inFailure](long inError, const UString& inMessage,
                                                   RPCClient::RequestNumber inNumber) {
                if (inFailure) {
                    inFailure(inError, inMessage, inNumber);
                }
                const int result = static_cast<int>(inError);
                inCompletion(inRequestID, result < 0 ? result : kResultFailure, nullptr, nullptr);
            });
        if (number == RPCClient::kNoRequest) {
            return false;
        }
        call->SetNumber(number);
        return true;
    };
    inOperation->Initiate(work, nullptr, [call](const Guid&) { call->Cancel(); });
}

}  // namespace ZOCL
