// From the arguments of a verb to the record, and back.
#include "RequestChain/PackedRequest.h"

namespace ZOCL {

using ostnet::Headers;
using ostnet::http::CompletionFunction;
using ostnet::http::Form;
using ostnet::http::RequestOptions;
using ostnet::http::RequestProcessor;

bool PackedRequest::Send(RequestProcessor& ioTo, const Guid& inRequestID,
                         const CompletionFunction& inCompletion) const {
    return SendWith(Headers(headers), ioTo, inRequestID, inCompletion);
}

bool PackedRequest::SendOnce(RequestProcessor& ioTo, const Guid& inRequestID,
                             const CompletionFunction& inCompletion) {
    return SendWith(std::move(headers), ioTo, inRequestID, inCompletion);
}

bool PackedRequest::SendWith(Headers&& inHeaders, RequestProcessor& ioTo, const Guid& inRequestID,
                             const CompletionFunction& inCompletion) const {
    switch (verb) {
        case Verb::kGet:
            return ioTo.GET(inRequestID, inCompletion, url, std::move(inHeaders), options);
        case Verb::kHead:
            return ioTo.HEAD(inRequestID, inCompletion, url, std::move(inHeaders), options);
        case Verb::kPut:
            return form ? ioTo.PUT(inRequestID, inCompletion, url, std::move(inHeaders), *form, options)
                        : ioTo.PUT(inRequestID, inCompletion, url, std::move(inHeaders), payload, options);
        case Verb::kPost:
            return form ? ioTo.POST(inRequestID, inCompletion, url, std::move(inHeaders), *form, options)
                        : ioTo.POST(inRequestID, inCompletion, url, std::move(inHeaders), payload, options);
        case Verb::kDelete:
            return ioTo.DELETE(inRequestID, inCompletion, url, std::move(inHeaders), options);
    }
    return false;
}

PackedRequest Pack(PackedRequest::Verb inVerb, const ImmutableString& inURL, Headers&& inHeaders,
                   const RequestOptions& inOptions) {
    PackedRequest packed;
    packed.verb = inVerb;
    packed.url = inURL;
    packed.headers = std::move(inHeaders);
    packed.options = inOptions;
    return packed;
}

PackedRequest Pack(PackedRequest::Verb inVerb, const ImmutableString& inURL, Headers&& inHeaders,
                   const shared_ptr<RecycledMemory const>& inPayload, const RequestOptions& inOptions) {
    PackedRequest packed = Pack(inVerb, inURL, std::move(inHeaders), inOptions);
    packed.payload = inPayload;
    return packed;
}

PackedRequest Pack(PackedRequest::Verb inVerb, const ImmutableString& inURL, Headers&& inHeaders,
                   const Form& inForm, const RequestOptions& inOptions) {
    PackedRequest packed = Pack(inVerb, inURL, std::move(inHeaders), inOptions);
    packed.form = boost::make_shared<Form>(inForm);
    return packed;
}

}  // namespace ZOCL
