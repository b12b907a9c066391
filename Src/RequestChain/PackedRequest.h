// A request as a thing that can be kept, and sent when its time comes.
#pragma once

#include "ostnet/http/RequestProcessor.h"
#include "ZOClient/Types.h"

namespace ZOCL {

/// All arguments of a verb but the request's ID and its completion. A value; the body is shared.
struct PackedRequest {
    enum class Verb { kGet, kHead, kPut, kPost, kDelete };

    Verb verb = Verb::kGet;
    ImmutableString url;
    ostnet::Headers headers;
    ostnet::http::RequestOptions options;
    shared_ptr<RecycledMemory const> payload;
    /// Set when the variant of the verb that takes a form was called.
    shared_ptr<ostnet::http::Form const> form;

    /// Sends a copy, so that it can be done again.
    bool Send(ostnet::http::RequestProcessor& ioTo, const Guid& inRequestID,
              const ostnet::http::CompletionFunction& inCompletion) const;
    /// Sends what it holds, once.
    bool SendOnce(ostnet::http::RequestProcessor& ioTo, const Guid& inRequestID,
                  const ostnet::http::CompletionFunction& inCompletion);

private:
    bool SendWith(ostnet::Headers&& inHeaders, ostnet::http::RequestProcessor& ioTo, const Guid& inRequestID,
                  const ostnet::http::CompletionFunction& inCompletion) const;
};

PackedRequest Pack(PackedRequest::Verb inVerb, const ImmutableString& inURL, ostnet::Headers&& inHeaders,
                   const ostnet::http::RequestOptions& inOptions);
PackedRequest Pack(PackedRequest::Verb inVerb, const ImmutableString& inURL, ostnet::Headers&& inHeaders,
                   const shared_ptr<RecycledMemory const>& inPayload,
                   const ostnet::http::RequestOptions& inOptions);
PackedRequest Pack(PackedRequest::Verb inVerb, const ImmutableString& inURL, ostnet::Headers&& inHeaders,
                   const ostnet::http::Form& inForm, const ostnet::http::RequestOptions& inOptions);

}  // namespace ZOCL
