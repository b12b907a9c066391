// The verbs: where each enters the chain, and their blocking forms.
#include "Connection/DataServer.h"
#include "Connection/SynchronousRequest.h"
#include "ostnet/HeaderConstants.h"

namespace ZOCL {

using ostnet::Headers;
using ostnet::http::Form;
using ostnet::http::RequestOptions;

namespace {

/// By its identifier the server knows a change that is sent again, since its answer was lost or its token
/// refused, and does not do it twice. A key of the caller's own goes first.
Headers WithIdempotencyKey(Headers inHeaders, const Guid& inRequestID) {
    if (inHeaders.find(ostnet::kHEADER_IDEMPOTENCY_KEY) == inHeaders.end()) {
        inHeaders.emplace(ostnet::kHEADER_IDEMPOTENCY_KEY, ImmutableString(inRequestID.ToString()));
    }
    return inHeaders;
}

}  // namespace

void DataServer::TryToCancelRequest(const Guid& inRequestID) {
    if (mContentReads.Cancel(inRequestID)) {
        return;
    }
    mChain.upload->TryToCancelRequest(inRequestID);
}

bool DataServer::GET(const Guid& inRequestID, const Completion& inCompletion, const ImmutableString& inURL,
                     Headers inHeaders) {
    const ImmutableString url = MakeRequestURL(inURL);
    return !url.IsNull() &&
           mChain.common->GET(inRequestID, inCompletion, url, std::move(inHeaders), RequestOptions());
}

bool DataServer::HEAD(const Guid& inRequestID, const Completion& inCompletion, const ImmutableString& inURL,
                      Headers inHeaders) {
    const ImmutableString url = MakeRequestURL(inURL);
    return !url.IsNull() &&
           mChain.common->HEAD(inRequestID, inCompletion, url, std::move(inHeaders), RequestOptions());
}

bool DataServer::DELETE(const Guid& inRequestID, const Completion& inCompletion, const ImmutableString& inURL,
                        Headers inHeaders) {
    const ImmutableString url = MakeRequestURL(inURL);
    return !url.IsNull() &&
           mChain.common->DELETE(inRequestID, inCompletion, url,
                                 WithIdempotencyKey(std::move(inHeaders), inRequestID), RequestOptions());
}

bool DataServer::POST(const Guid& inRequestID, const Completion& inCompletion, const ImmutableString& inURL,
                      Headers inHeaders, const Payload& inPayload) {
    const ImmutableString url = MakeRequestURL(inURL);
    const auto& entry = SupportsUploadCompression() ? mChain.upload : mChain.common;
    return !url.IsNull() &&
           entry->POST(inRequestID, inCompletion, url, WithIdempotencyKey(std::move(inHeaders), inRequestID),
                       inPayload, RequestOptions());
}

bool DataServer::POST(const Guid& inRequestID, const Completion& inCompletion, const ImmutableString& inURL,
                      Headers inHeaders, const Form& inForm) {
    const ImmutableString url = MakeRequestURL(inURL);
    const auto& entry = SupportsUploadCompression() ? mChain.upload : mChain.common;
    return !url.IsNull() &&
           entry->POST(inRequestID, inCompletion, url, WithIdempotencyKey(std::move(inHeaders), inRequestID),
                       inForm, RequestOptions());
}

bool DataServer::PUT(const Guid& inRequestID, const Completion& inCompletion, const ImmutableString& inURL,
                     Headers inHeaders, const Payload& inPayload) {
    const ImmutableString url = MakeRequestURL(inURL);
    const auto& entry = SupportsUploadCompression() ? mChain.upload : mChain.common;
    return !url.IsNull() &&
           entry->PUT(inRequestID, inCompletion, url, WithIdempotencyKey(std::move(inHeaders), inRequestID),
                      inPayload, RequestOptions());
}

bool DataServer::PUT(const Guid& inRequestID, const Completion& inCompletion, const ImmutableString& inURL,
                     Headers inHeaders, const Form& inForm) {
    const ImmutableString url = MakeRequestURL(inURL);
    const auto& entry = SupportsUploadCompression() ? mChain.upload : mChain.common;
    return !url.IsNull() &&
           entry->PUT(inRequestID, inCompletion, url, WithIdempotencyKey(std::move(inHeaders), inRequestID),
                      inForm, RequestOptions());
}

DataServer::ResponseRef DataServer::WaitForResponse(
    std::uint32_t inTimeoutMilliseconds, const function<bool(const Guid&, const Completion&)>& inStart) {
    const Guid requestID = Guid::CreateUnique();
    const auto data = boost::make_shared<SynchronousCompletionData>();
    const bool started = inStart(
        requestID, [data](const Guid&, const ResponseRef& inResponse) { data->Complete(inResponse); });
    if (!started) {
        return nullptr;
    }
    WaitForRequest(data->Gate(), requestID, inTimeoutMilliseconds, *mChain.upload,
                   [this] { ShowWarningsIfNeeded(); });
    return data->Response();
}

DataServer::ResponseRef DataServer::BlockingGET(const ImmutableString& inURL, Headers inHeaders,
                                                std::uint32_t inTimeoutMilliseconds) {
    return WaitForResponse(inTimeoutMilliseconds,
                           [&](const Guid& inRequestID, const Completion& inCompletion) {
                               return GET(inRequestID, inCompletion, inURL, inHeaders);
                           });
}

DataServer::ResponseRef DataServer::BlockingHEAD(const ImmutableString& inURL, Headers inHeaders,
                                                 std::uint32_t inTimeoutMilliseconds) {
    return WaitForResponse(inTimeoutMilliseconds,
                           [&](const Guid& inRequestID, const Completion& inCompletion) {
                               return HEAD(inRequestID, inCompletion, inURL, inHeaders);
                           });
}

DataServer::ResponseRef DataServer::BlockingDELETE(const ImmutableString& inURL, Headers inHeaders,
                                                   std::uint32_t inTimeoutMilliseconds) {
    return WaitForResponse(inTimeoutMilliseconds,
                           [&](const Guid& inRequestID, const Completion& inCompletion) {
                               return DELETE(inRequestID, inCompletion, inURL, inHeaders);
                           });
}

DataServer::ResponseRef DataServer::BlockingPOST(const ImmutableString& inURL, Headers inHeaders,
                                                 const Payload& inPayload,
                                                 std::uint32_t inTimeoutMilliseconds) {
    return WaitForResponse(inTimeoutMilliseconds,
                           [&](const Guid& inRequestID, const Completion& inCompletion) {
                               return POST(inRequestID, inCompletion, inURL, inHeaders, inPayload);
                           });
}

DataServer::ResponseRef DataServer::BlockingPOST(const ImmutableString& inURL, Headers inHeaders,
                                                 const Form& inForm, std::uint32_t inTimeoutMilliseconds) {
    return WaitForResponse(inTimeoutMilliseconds,
                           [&](const Guid& inRequestID, const Completion& inCompletion) {
                               return POST(inRequestID, inCompletion, inURL, inHeaders, inForm);
                           });
}

DataServer::ResponseRef DataServer::BlockingPUT(const ImmutableString& inURL, Headers inHeaders,
                                                const Payload& inPayload,
                                                std::uint32_t inTimeoutMilliseconds) {
    return WaitForResponse(inTimeoutMilliseconds,
                           [&](const Guid& inRequestID, const Completion& inCompletion) {
                               return PUT(inRequestID, inCompletion, inURL, inHeaders, inPayload);
                           });
}

DataServer::ResponseRef DataServer::BlockingPUT(const ImmutableString& inURL, Headers inHeaders,
                                                const Form& inForm, std::uint32_t inTimeoutMilliseconds) {
    return WaitForResponse(inTimeoutMilliseconds,
                           [&](const Guid& inRequestID, const Completion& inCompletion) {
                               return PUT(inRequestID, inCompletion, inURL, inHeaders, inForm);
                           });
}

}  // namespace ZOCL
