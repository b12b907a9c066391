// The verbs that the write throttle counts.
#include "RequestChain/ThrottlingWriteProcessor.h"

namespace ZOCL {

using Verb = PackedRequest::Verb;

ThrottlingWriteProcessor::ThrottlingWriteProcessor(shared_ptr<ostnet::http::RequestProcessor> inNext,
                                                   std::int32_t inLimit)
    : ThrottlingProcessor(
          std::move(inNext), inLimit,
          {"ThrottlingWriteProcessor::MakeRequest", "ThrottlingWriteProcessor::AsyncWriteCompleted",
           "ThrottlingWriteProcessor::TryToCancelRequest"}) {}

bool ThrottlingWriteProcessor::PUT(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                   const ImmutableString& inURL, Headers inHeaders, const Payload& inPayload,
                                   const RequestOptions& inOptions) {
    return MakeRequest(inRequestID, inCompletion,
                       Pack(Verb::kPut, inURL, std::move(inHeaders), inPayload, inOptions));
}

bool ThrottlingWriteProcessor::PUT(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                   const ImmutableString& inURL, Headers inHeaders, const Form& inForm,
                                   const RequestOptions& inOptions) {
    return MakeRequest(inRequestID, inCompletion,
                       Pack(Verb::kPut, inURL, std::move(inHeaders), inForm, inOptions));
}

bool ThrottlingWriteProcessor::POST(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                    const ImmutableString& inURL, Headers inHeaders, const Payload& inPayload,
                                    const RequestOptions& inOptions) {
    return MakeRequest(inRequestID, inCompletion,
                       Pack(Verb::kPost, inURL, std::move(inHeaders), inPayload, inOptions));
}

bool ThrottlingWriteProcessor::POST(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                    const ImmutableString& inURL, Headers inHeaders, const Form& inForm,
                                    const RequestOptions& inOptions) {
    return MakeRequest(inRequestID, inCompletion,
                       Pack(Verb::kPost, inURL, std::move(inHeaders), inForm, inOptions));
}

bool ThrottlingWriteProcessor::DELETE(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                      const ImmutableString& inURL, Headers inHeaders,
                                      const RequestOptions& inOptions) {
    return MakeRequest(inRequestID, inCompletion,
                       Pack(Verb::kDelete, inURL, std::move(inHeaders), inOptions));
}

}  // namespace ZOCL
