#include "ostnet/http/RequestProcessor.h"

namespace ostnet {
namespace http {

RequestProcessor::~RequestProcessor() = default;

void RequestProcessor::CancelAllRequests() {}

ForwardingProcessor::ForwardingProcessor(shared_ptr<RequestProcessor> inNext) : mNext(std::move(inNext)) {}

void ForwardingProcessor::TryToCancelRequest(const Guid& inRequestID) {
    mNext->TryToCancelRequest(inRequestID);
}

bool ForwardingProcessor::GET(const Guid& inRequestID, const CompletionFunction& inCompletion,
                              const ImmutableString& inURL, Headers inHeaders,
                              const RequestOptions& inOptions) {
    return mNext->GET(inRequestID, inCompletion, inURL, std::move(inHeaders), inOptions);
}

bool ForwardingProcessor::HEAD(const Guid& inRequestID, const CompletionFunction& inCompletion,
                               const ImmutableString& inURL, Headers inHeaders,
                               const RequestOptions& inOptions) {
    return mNext->HEAD(inRequestID, inCompletion, inURL, std::move(inHeaders), inOptions);
}

bool ForwardingProcessor::PUT(const Guid& inRequestID, const CompletionFunction& inCompletion,
                              const ImmutableString& inURL, Headers inHeaders,
                              const shared_ptr<RecycledMemory const>& inPayload,
                              const RequestOptions& inOptions) {
    return mNext->PUT(inRequestID, inCompletion, inURL, std::move(inHeaders), inPayload, inOptions);
}

bool ForwardingProcessor::PUT(const Guid& inRequestID, const CompletionFunction& inCompletion,
                              const ImmutableString& inURL, Headers inHeaders, const Form& inForm,
                              const RequestOptions& inOptions) {
    return mNext->PUT(inRequestID, inCompletion, inURL, std::move(inHeaders), inForm, inOptions);
}

bool ForwardingProcessor::POST(const Guid& inRequestID, const CompletionFunction& inCompletion,
                               const ImmutableString& inURL, Headers inHeaders,
                               const shared_ptr<RecycledMemory const>& inPayload,
                               const RequestOptions& inOptions) {
    return mNext->POST(inRequestID, inCompletion, inURL, std::move(inHeaders), inPayload, inOptions);
}

bool ForwardingProcessor::POST(const Guid& inRequestID, const CompletionFunction& inCompletion,
                               const ImmutableString& inURL, Headers inHeaders, const Form& inForm,
                               const RequestOptions& inOptions) {
    return mNext->POST(inRequestID, inCompletion, inURL, std::move(inHeaders), inForm, inOptions);
}

bool ForwardingProcessor::DELETE(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                 const ImmutableString& inURL, Headers inHeaders,
                                 const RequestOptions& inOptions) {
    return mNext->DELETE(inRequestID, inCompletion, inURL, std::move(inHeaders), inOptions);
}

bool ForwardingProcessor::PostFunction(const function<void()>& inFunction,
                                       std::uint32_t inDelayMilliseconds) {
    return mNext->PostFunction(inFunction, inDelayMilliseconds);
}

bool ForwardingProcessor::WaitingForRequest(const Guid& inRequestID, std::uint32_t inTimeoutMilliseconds) {
    return mNext->WaitingForRequest(inRequestID, inTimeoutMilliseconds);
}

bool ForwardingProcessor::GetStatistics(Statistics& outStatistics) {
    return mNext->GetStatistics(outStatistics);
}

}  // namespace http
}  // namespace ostnet
