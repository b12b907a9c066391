// The verbs of the authorisation layer: each packs itself up, so that it can be sent again.
#include "ostcore/debug/DebugDatabase.h"
#include "ostnet/HeaderConstants.h"
#include "RequestChain/AuthorizationProcessor.h"

namespace ZOCL {

namespace {

/// One copy for all sendings: a packed request is copied from hand to hand, and a form can be large.
shared_ptr<ostnet::http::Form const> Keep(const ostnet::http::Form& inForm) {
    return boost::make_shared<ostnet::http::Form>(inForm);
}

}  // namespace

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
    PackedRequest packed = [this, inRequestID, inURL, headers = std::move(inHeaders), inOptions](
                               const ImmutableString& inToken, const CompletionFunction& inDone) {
        return SendGET(inToken, inRequestID, inDone, inURL, headers, inOptions);
    };
    return MakeRequest(inRequestID, std::move(packed), inCompletion);
}

bool AuthorizationProcessor::HEAD(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                  const ImmutableString& inURL, Headers inHeaders,
                                  const RequestOptions& inOptions) {
    PackedRequest packed = [this, inRequestID, inURL, headers = std::move(inHeaders), inOptions](
                               const ImmutableString& inToken, const CompletionFunction& inDone) {
        return SendHEAD(inToken, inRequestID, inDone, inURL, headers, inOptions);
    };
    return MakeRequest(inRequestID, std::move(packed), inCompletion);
}

bool AuthorizationProcessor::PUT(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                 const ImmutableString& inURL, Headers inHeaders, const Payload& inPayload,
                                 const RequestOptions& inOptions) {
    PackedRequest packed = [this, inRequestID, inURL, headers = std::move(inHeaders), inPayload, inOptions](
                               const ImmutableString& inToken, const CompletionFunction& inDone) {
        return SendPUT(inToken, inRequestID, inDone, inURL, headers, inPayload, inOptions);
    };
    return MakeRequest(inRequestID, std::move(packed), inCompletion);
}

bool AuthorizationProcessor::PUT(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                 const ImmutableString& inURL, Headers inHeaders, const Form& inForm,
                                 const RequestOptions& inOptions) {
    PackedRequest packed = [this, inRequestID, inURL, headers = std::move(inHeaders), form = Keep(inForm),
                            inOptions](const ImmutableString& inToken, const CompletionFunction& inDone) {
        return SendPUT(inToken, inRequestID, inDone, inURL, headers, *form, inOptions);
    };
    return MakeRequest(inRequestID, std::move(packed), inCompletion);
}

bool AuthorizationProcessor::POST(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                  const ImmutableString& inURL, Headers inHeaders, const Payload& inPayload,
                                  const RequestOptions& inOptions) {
    PackedRequest packed = [this, inRequestID, inURL, headers = std::move(inHeaders), inPayload, inOptions](
                               const ImmutableString& inToken, const CompletionFunction& inDone) {
        return SendPOST(inToken, inRequestID, inDone, inURL, headers, inPayload, inOptions);
    };
    return MakeRequest(inRequestID, std::move(packed), inCompletion);
}

bool AuthorizationProcessor::POST(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                  const ImmutableString& inURL, Headers inHeaders, const Form& inForm,
                                  const RequestOptions& inOptions) {
    PackedRequest packed = [this, inRequestID, inURL, headers = std::move(inHeaders), form = Keep(inForm),
                            inOptions](const ImmutableString& inToken, const CompletionFunction& inDone) {
        return SendPOST(inToken, inRequestID, inDone, inURL, headers, *form, inOptions);
    };
    return MakeRequest(inRequestID, std::move(packed), inCompletion);
}

bool AuthorizationProcessor::DELETE(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                    const ImmutableString& inURL, Headers inHeaders,
                                    const RequestOptions& inOptions) {
    PackedRequest packed = [this, inRequestID, inURL, headers = std::move(inHeaders), inOptions](
                               const ImmutableString& inToken, const CompletionFunction& inDone) {
        return SendDELETE(inToken, inRequestID, inDone, inURL, headers, inOptions);
    };
    return MakeRequest(inRequestID, std::move(packed), inCompletion);
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
