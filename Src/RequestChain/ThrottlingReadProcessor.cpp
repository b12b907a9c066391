// The verbs that the read throttle counts.
#include "RequestChain/ThrottlingReadProcessor.h"

namespace ZOCL {

using Verb = PackedRequest::Verb;

ThrottlingReadProcessor::ThrottlingReadProcessor(shared_ptr<ostnet::http::RequestProcessor> inNext,
                                                 std::int32_t inLimit)
    : ThrottlingProcessor(
          std::move(inNext), inLimit,
          {"ThrottlingReadProcessor::MakeRequest", "ThrottlingReadProcessor::AsyncReadCompleted",
           "ThrottlingReadProcessor::TryToCancelRequest"}) {}

bool ThrottlingReadProcessor::GET(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                  const ImmutableString& inURL, Headers inHeaders,
                                  const RequestOptions& inOptions) {
    return MakeRequest(inRequestID, inCompletion, Pack(Verb::kGet, inURL, std::move(inHeaders), inOptions));
}

bool ThrottlingReadProcessor::HEAD(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                   const ImmutableString& inURL, Headers inHeaders,
                                   const RequestOptions& inOptions) {
    return MakeRequest(inRequestID, inCompletion, Pack(Verb::kHead, inURL, std::move(inHeaders), inOptions));
}

}  // namespace ZOCL
