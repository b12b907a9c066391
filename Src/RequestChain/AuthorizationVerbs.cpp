// The verbs of the authorisation layer: each packs itself up, so that it can be sent again.
#include "ostcore/debug/DebugDatabase.h"
#include "ostnet/HeaderConstants.h"
#include "RequestChain/AuthorizationProcessor.h"

namespace ZOCL {

using Verb = PackedRequest::Verb;

namespace {

constexpr std::size_t kAddedHeaders = 2;

}

void AuthorizationProcessor::AddAuthorizationHeaders(const ImmutableString& inToken, Headers& ioHeaders) {
    if (!inToken.IsNull()) {
        ioHeaders.emplace(ostnet::kHEADER_COOKIE, inToken);
    }
    if (!ostcore::debug::DebugDatabase::GetBool("ZOClient.DisableExpectProcessingHeader", false)) {
        ioHeaders.emplace(ostnet::kHEADER_EXPECT, ostnet::kHEADERVALUE_102_PROCESSING);
    }
}

bool AuthorizationProcessor::GET(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                 const ImmutableString& inURL, Headers inHeaders,
                                 const RequestOptions& inOptions) {
    return MakeRequest(inRequestID, Pack(Verb::kGet, inURL, std::move(inHeaders), inOptions), inCompletion);
}

bool AuthorizationProcessor::HEAD(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                  const ImmutableString& inURL, Headers inHeaders,
                                  const RequestOptions& inOptions) {
    return MakeRequest(inRequestID, Pack(Verb::kHead, inURL, std::move(inHeaders), inOptions), inCompletion);
}

bool AuthorizationProcessor::PUT(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                 const ImmutableString& inURL, Headers inHeaders, const Payload& inPayload,
                                 const RequestOptions& inOptions) {
    return MakeRequest(inRequestID, Pack(Verb::kPut, inURL, std::move(inHeaders), inPayload, inOptions),
                       inCompletion);
}

bool AuthorizationProcessor::PUT(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                 const ImmutableString& inURL, Headers inHeaders, const Form& inForm,
                                 const RequestOptions& inOptions) {
    return MakeRequest(inRequestID, Pack(Verb::kPut, inURL, std::move(inHeaders), inForm, inOptions),
                       inCompletion);
}

bool AuthorizationProcessor::POST(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                  const ImmutableString& inURL, Headers inHeaders, const Payload& inPayload,
                                  const RequestOptions& inOptions) {
    return MakeRequest(inRequestID, Pack(Verb::kPost, inURL, std::move(inHeaders), inPayload, inOptions),
                       inCompletion);
}

bool AuthorizationProcessor::POST(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                  const ImmutableString& inURL, Headers inHeaders, const Form& inForm,
                                  const RequestOptions& inOptions) {
    return MakeRequest(inRequestID, Pack(Verb::kPost, inURL, std::move(inHeaders), inForm, inOptions),
                       inCompletion);
}

bool AuthorizationProcessor::DELETE(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                    const ImmutableString& inURL, Headers inHeaders,
                                    const RequestOptions& inOptions) {
    return MakeRequest(inRequestID, Pack(Verb::kDelete, inURL, std::move(inHeaders), inOptions),
                       inCompletion);
}

bool AuthorizationProcessor::SendPacked(const Request& inRequest, const ImmutableString& inToken,
                                        const CompletionFunction& inCompletion) {
    const PackedRequest& packed = inRequest.packed;
    const Guid& requestID = inRequest.requestID;
    Headers headers = ostnet::CopyWithRoom(packed.headers, kAddedHeaders);
    switch (packed.verb) {
        case Verb::kGet:
            return SendGET(inToken, requestID, inCompletion, packed.url, std::move(headers), packed.options);
        case Verb::kHead:
            return SendHEAD(inToken, requestID, inCompletion, packed.url, std::move(headers), packed.options);
        case Verb::kPut:
            return packed.form ? SendPUT(inToken, requestID, inCompletion, packed.url, std::move(headers),
                                         *packed.form, packed.options)
                               : SendPUT(inToken, requestID, inCompletion, packed.url, std::move(headers),
                                         packed.payload, packed.options);
        case Verb::kPost:
            return packed.form ? SendPOST(inToken, requestID, inCompletion, packed.url, std::move(headers),
                                          *packed.form, packed.options)
                               : SendPOST(inToken, requestID, inCompletion, packed.url, std::move(headers),
                                          packed.payload, packed.options);
        case Verb::kDelete:
            return SendDELETE(inToken, requestID, inCompletion, packed.url, std::move(headers),
                              packed.options);
    }
    return false;
}

bool AuthorizationProcessor::SendGET(const ImmutableString& inToken, const Guid& inRequestID,
                                     const CompletionFunction& inCompletion, const ImmutableString& inURL,
                                     Headers inHeaders, const RequestOptions& inOptions) {
    AddAuthorizationHeaders(inToken, inHeaders);
    return Next()->GET(inRequestID, inCompletion, inURL, std::move(inHeaders), inOptions);
}

bool AuthorizationProcessor::SendHEAD(const ImmutableString& inToken, const Guid& inRequestID,
                                      const CompletionFunction& inCompletion, const ImmutableString& inURL,
                                      Headers inHeaders, const RequestOptions& inOptions) {
    AddAuthorizationHeaders(inToken, inHeaders);
    return Next()->HEAD(inRequestID, inCompletion, inURL, std::move(inHeaders), inOptions);
}

bool AuthorizationProcessor::SendPUT(const ImmutableString& inToken, const Guid& inRequestID,
                                     const CompletionFunction& inCompletion, const ImmutableString& inURL,
                                     Headers inHeaders, const Payload& inPayload,
                                     const RequestOptions& inOptions) {
    AddAuthorizationHeaders(inToken, inHeaders);
    return Next()->PUT(inRequestID, inCompletion, inURL, std::move(inHeaders), inPayload, inOptions);
}

bool AuthorizationProcessor::SendPUT(const ImmutableString& inToken, const Guid& inRequestID,
                                     const CompletionFunction& inCompletion, const ImmutableString& inURL,
                                     Headers inHeaders, const Form& inForm, const RequestOptions& inOptions) {
    AddAuthorizationHeaders(inToken, inHeaders);
    return Next()->PUT(inRequestID, inCompletion, inURL, std::move(inHeaders), inForm, inOptions);
}

bool AuthorizationProcessor::SendPOST(const ImmutableString& inToken, const Guid& inRequestID,
                                      const CompletionFunction& inCompletion, const ImmutableString& inURL,
                                      Headers inHeaders, const Payload& inPayload,
                                      const RequestOptions& inOptions) {
    AddAuthorizationHeaders(inToken, inHeaders);
    return Next()->POST(inRequestID, inCompletion, inURL, std::move(inHeaders), inPayload, inOptions);
}

bool AuthorizationProcessor::SendPOST(const ImmutableString& inToken, const Guid& inRequestID,
                                      const CompletionFunction& inCompletion, const ImmutableString& inURL,
                                      Headers inHeaders, const Form& inForm,
                                      const RequestOptions& inOptions) {
    AddAuthorizationHeaders(inToken, inHeaders);
    return Next()->POST(inRequestID, inCompletion, inURL, std::move(inHeaders), inForm, inOptions);
}

bool AuthorizationProcessor::SendDELETE(const ImmutableString& inToken, const Guid& inRequestID,
                                        const CompletionFunction& inCompletion, const ImmutableString& inURL,
                                        Headers inHeaders, const RequestOptions& inOptions) {
    AddAuthorizationHeaders(inToken, inHeaders);
    return Next()->DELETE(inRequestID, inCompletion, inURL, std::move(inHeaders), inOptions);
}

}  // namespace ZOCL
