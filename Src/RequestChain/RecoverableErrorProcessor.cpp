// Counting, waiting and sending again.
#include "RequestChain/RecoverableErrorProcessor.h"

#include <algorithm>
#include <utility>

#include "ostcore/debug/Trace.h"
#include "ostcore/threads/DelayedCall.h"
#include "RequestChain/PackedRequest.h"
#include "RequestChain/RepeatMark.h"

namespace ZOCL {

using ostcore::threads::RecursiveMutex;
using ostcore::threads::ScopedLock;
using ostnet::Response;
using Verb = PackedRequest::Verb;

namespace {

/// From so many failures in a row on, requests wait for the network and not for a count.
constexpr std::int32_t kFailuresOfOutage = 15;
constexpr std::int32_t kRetriesInOutage = 7;
/// More failures in a row than these look like a network that is down.
constexpr std::int32_t kFailuresUnnoticed = 2;
constexpr std::uint32_t kReportDelayMilliseconds = 500;

const ostcore::debug::TraceChannel kTrace("ZOCL");

std::uint32_t DelayBeforeRetry(std::int32_t inRetriesLeft) {
    return 2u << (RecoverableErrorProcessor::kRetries - inRetriesLeft);
}

void TraceRetry(const ImmutableString& inURL, const Response& inFailure, std::uint32_t inDelay) {
    if (kTrace.IsEnabled(ostcore::debug::kTraceLevel_LifetimeDetail)) {
        ostcore::debug::Trace(kTrace.Name(), ostcore::debug::kTraceLevel_LifetimeDetail,
                              ostcore::debug::StructuredText("The request failed and will be sent again")
                                  .Add("uri", inURL.view())
                                  .Add("httpStatusCode", std::to_string(inFailure.status))
                                  .Add("CURL Error Code", std::to_string(inFailure.curlError))
                                  .Add("delay", std::to_string(inDelay)));
    }
}

}  // namespace

struct RecoverableErrorProcessor::Request {
    shared_ptr<RecoverableErrorProcessor> layer;
    Guid requestID;
    PackedRequest packed;
    CompletionFunction completion;
    std::int32_t retriesLeft = kRetries;
    /// What it ends with, unless it is sent again.
    shared_ptr<Response> response;
    std::atomic<bool> isCancelled{false};
    bool isWaiting = false;  // guarded by the mutex of the layer
};

/// The count of failures and who hears of it. Its own object, as a report can outlive the layer.
class RecoverableErrorProcessor::NetworkState {
public:
    explicit NetworkState(const function<void(bool)>& inStatusFunction) : mStatusFunction(inStatusFunction) {}

    std::int32_t AddError() {
        ScopedLock lock(mMutex, "RecoverableErrorProcessor::ReportError");
        return ++mConsecutiveErrors;
    }
    /// True when there was an error to forget.
    bool ForgetErrors(const char* inLabel) {
        ScopedLock lock(mMutex, inLabel);
        return std::exchange(mConsecutiveErrors, 0) != 0;
    }
    static void MakeReporter(const shared_ptr<NetworkState>& inState) {
        const boost::weak_ptr<NetworkState> weak = inState;
        inState->mReporter = boost::make_shared<ostcore::threads::DeferredCaller>(
            ostcore::threads::CreateCPUBoundExecutor("ZOCL::RecoverableErrorProcessor"), [weak] {
                if (const auto state = weak.lock()) {
                    state->ReportStatus();
                }
            });
    }
    void QueueReport() { mReporter->QueueOnlyOnce(kReportDelayMilliseconds); }

private:
    void ReportStatus() {
        bool looksDown = false;
        {
            ScopedLock lock(mMutex, "RecoverableErrorProcessor::ReportStatus");
            looksDown = mConsecutiveErrors > kFailuresUnnoticed;
        }
        if (mStatusFunction) {
            mStatusFunction(looksDown);
        }
    }

    const function<void(bool)> mStatusFunction;
    shared_ptr<ostcore::threads::DeferredCaller> mReporter;
    RecursiveMutex mMutex;
    std::int32_t mConsecutiveErrors ZO_GUARDED_BY(mMutex) = 0;
};

RecoverableErrorProcessor::RecoverableErrorProcessor(shared_ptr<ostnet::http::RequestProcessor> inNext,
                                                     const function<void(bool)>& inStatusFunction)
    : ForwardingProcessor(std::move(inNext)), mState(boost::make_shared<NetworkState>(inStatusFunction)) {
    NetworkState::MakeReporter(mState);
}

RecoverableErrorProcessor::~RecoverableErrorProcessor() = default;

void RecoverableErrorProcessor::SetRetriesEnabled(bool inEnabled) {
    mRetriesDisabled = inEnabled ? 0 : 1;
    if (!inEnabled) {
        mState->ForgetErrors("RecoverableErrorProcessor::SetRetriesEnabled");
    }
}

bool RecoverableErrorProcessor::IsRecoverableError(const shared_ptr<Response>& inResponse) const {
    if (!inResponse || (inResponse->status >= 200 && inResponse->status <= 499)) {
        return false;
    }
    if (mRetriesDisabled != 0) {
        return false;
    }
    if (inResponse->status >= 500 && inResponse->status <= 599) {
        return true;
    }
    return Response::IsNetworkConnectivityError(inResponse);
}

bool RecoverableErrorProcessor::MakeRequest(const Guid& inRequestID, PackedRequest&& inPacked,
                                            const CompletionFunction& inCompletion) {
    const auto request = boost::make_shared<Request>();
    request->layer = shared_from_this();
    request->requestID = inRequestID;
    request->packed = std::move(inPacked);
    request->completion = inCompletion;
    {
        ScopedLock lock(mMutex, "RecoverableErrorProcessor::MakeRequest");
        if (!mRequests.emplace(inRequestID, request).second) {
            return false;  // the ID is in use, if only by a request that waits for its retry
        }
    }
    if (Send(request)) {
        return true;
    }
    Forget(*request);
    return false;
}

bool RecoverableErrorProcessor::Send(const shared_ptr<Request>& inRequest) {
    const auto onCompleted = [inRequest](const Guid&, const shared_ptr<Response>& inResponse) {
        inRequest->layer->OnCompleted(inRequest, inResponse);
    };
    if (!inRequest->packed.Send(*Next(), inRequest->requestID, onCompleted)) {
        return false;
    }
    // A cancel that came while the network did not know the request has found nothing there.
    if (inRequest->isCancelled) {
        Next()->TryToCancelRequest(inRequest->requestID);
    }
    return true;
}

void RecoverableErrorProcessor::OnCompleted(const shared_ptr<Request>& inRequest,
                                            const shared_ptr<Response>& inResponse) {
    const bool isRepetition = inRequest->retriesLeft != kRetries;
    inRequest->response = isRepetition ? MarkAsRepetition(inResponse) : inResponse;
    if (!IsRecoverableError(inResponse)) {
        ReportSuccess();
        Forget(*inRequest);
        // On a worker already, so that it needs no other one: that would cost more than all of this layer.
        Complete(*inRequest);
        return;
    }
    if (ReportError(inRequest->retriesLeft)) {
        End(inRequest);
        return;
    }
    --inRequest->retriesLeft;
    WaitAndRetry(inRequest);
}

void RecoverableErrorProcessor::WaitAndRetry(const shared_ptr<Request>& inRequest) {
    const std::uint32_t delay = DelayBeforeRetry(inRequest->retriesLeft);
    TraceRetry(inRequest->packed.url, *inRequest->response, delay);
    bool isCancelled = false;
    {
        ScopedLock lock(mMutex, "RecoverableErrorProcessor::Completion");
        isCancelled = inRequest->isCancelled;
        inRequest->isWaiting = !isCancelled;
    }
    if (isCancelled) {
        inRequest->response = boost::make_shared<Response>(Response::kStatusCancelled);
        End(inRequest);
        return;
    }
    const auto retry = [inRequest] { inRequest->layer->Retry(inRequest); };
    if (!PostFunction(retry, delay) && TakeWaiting(*inRequest)) {
        End(inRequest);
    }
}

void RecoverableErrorProcessor::Retry(const shared_ptr<Request>& inRequest) {
    if (!TakeWaiting(*inRequest) || Send(inRequest)) {
        return;
    }
    if (inRequest->isCancelled) {
        inRequest->response = boost::make_shared<Response>(Response::kStatusCancelled);
    }
    End(inRequest);
}

bool RecoverableErrorProcessor::TakeWaiting(Request& ioRequest) {
    ScopedLock lock(mMutex, "RecoverableErrorProcessor::Retry");
    return std::exchange(ioRequest.isWaiting, false);
}

void RecoverableErrorProcessor::TryToCancelRequest(const Guid& inRequestID) {
    shared_ptr<Request> request;
    bool wasWaiting = false;
    {
        ScopedLock lock(mMutex, "RecoverableErrorProcessor::TryToCancelRequest");
        const auto found = mRequests.find(inRequestID);
        if (found != mRequests.end()) {
            request = found->second.lock();
        }
        if (request) {
            request->isCancelled = true;
            wasWaiting = std::exchange(request->isWaiting, false);
        }
    }
    if (!wasWaiting) {
        Next()->TryToCancelRequest(inRequestID);
        return;
    }
    request->packed = PackedRequest();  // the posted retry holds the request itself until its time
    request->response = boost::make_shared<Response>(Response::kStatusCancelled);
    End(request);
}

bool RecoverableErrorProcessor::ReportError(std::int32_t& ioRetriesLeft) {
    bool givesUp = false;
    if (mState->AddError() >= kFailuresOfOutage) {
        ioRetriesLeft = std::max(ioRetriesLeft, kRetriesInOutage);
    } else {
        givesUp = ioRetriesLeft == 0;
    }
    mState->QueueReport();
    return givesUp;
}

void RecoverableErrorProcessor::ReportSuccess() {
    if (mState->ForgetErrors("RecoverableErrorProcessor::ReportSuccess")) {
        mState->QueueReport();
    }
}

void RecoverableErrorProcessor::End(const shared_ptr<Request>& inRequest) {
    Forget(*inRequest);
    const auto complete = [inRequest] { Complete(*inRequest); };
    if (!PostFunction(complete, 0)) {
        complete();
    }
}

void RecoverableErrorProcessor::Complete(Request& ioRequest) {
    CompletionFunction completion;
    completion.swap(ioRequest.completion);
    const shared_ptr<Response> response = std::move(ioRequest.response);
    completion(ioRequest.requestID, response);
}

void RecoverableErrorProcessor::Forget(const Request& inRequest) {
    boost::weak_ptr<Request> forgotten;
    ScopedLock lock(mMutex, "RecoverableErrorProcessor::Forget");
    const auto found = mRequests.find(inRequest.requestID);
    if (found != mRequests.end() && found->second.lock().get() == &inRequest) {
        forgotten.swap(found->second);
        mRequests.erase(found);
    }
}

bool RecoverableErrorProcessor::GET(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                    const ImmutableString& inURL, Headers inHeaders,
                                    const RequestOptions& inOptions) {
    return MakeRequest(inRequestID, Pack(Verb::kGet, inURL, std::move(inHeaders), inOptions), inCompletion);
}

bool RecoverableErrorProcessor::HEAD(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                     const ImmutableString& inURL, Headers inHeaders,
                                     const RequestOptions& inOptions) {
    return MakeRequest(inRequestID, Pack(Verb::kHead, inURL, std::move(inHeaders), inOptions), inCompletion);
}

bool RecoverableErrorProcessor::PUT(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                    const ImmutableString& inURL, Headers inHeaders, const Payload& inPayload,
                                    const RequestOptions& inOptions) {
    return MakeRequest(inRequestID, Pack(Verb::kPut, inURL, std::move(inHeaders), inPayload, inOptions),
                       inCompletion);
}

bool RecoverableErrorProcessor::PUT(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                    const ImmutableString& inURL, Headers inHeaders, const Form& inForm,
                                    const RequestOptions& inOptions) {
    return MakeRequest(inRequestID, Pack(Verb::kPut, inURL, std::move(inHeaders), inForm, inOptions),
                       inCompletion);
}

bool RecoverableErrorProcessor::POST(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                     const ImmutableString& inURL, Headers inHeaders,
                                     const Payload& inPayload, const RequestOptions& inOptions) {
    return MakeRequest(inRequestID, Pack(Verb::kPost, inURL, std::move(inHeaders), inPayload, inOptions),
                       inCompletion);
}

bool RecoverableErrorProcessor::POST(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                     const ImmutableString& inURL, Headers inHeaders, const Form& inForm,
                                     const RequestOptions& inOptions) {
    return MakeRequest(inRequestID, Pack(Verb::kPost, inURL, std::move(inHeaders), inForm, inOptions),
                       inCompletion);
}

bool RecoverableErrorProcessor::DELETE(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                       const ImmutableString& inURL, Headers inHeaders,
                                       const RequestOptions& inOptions) {
    return MakeRequest(inRequestID, Pack(Verb::kDelete, inURL, std::move(inHeaders), inOptions),
                       inCompletion);
}

}  // namespace ZOCL
