// POST, PUT and DELETE of a resource.
#include "ostcore/debug/Assert.h"
#include "ostcore/debug/Trace.h"
#include "ostcore/filesupport/File.h"
#include "ostnet/HeaderConstants.h"
#include "Resources/JoinText.h"
#include "Resources/ServerResource.h"

namespace ZOCL {

namespace {

constexpr std::uint32_t kWait = ostnet::http::kWaitForever;

/// Traces what went wrong with a write; no response at all counts as status 0.
void TraceFailedWrite(std::string_view inOperation, std::string_view inDoing, const ImmutableString& inURL,
                      const shared_ptr<ostnet::Response>& inResponse) {
    static ostcore::debug::TraceChannel channel("ZOCL.ServerResource");
    if (!channel.IsEnabled(ostcore::debug::kTraceLevel_Error)) {
        return;
    }
    ostcore::debug::Trace(
        channel, ostcore::debug::kTraceLevel_Error,
        JoinText(inOperation, "(): Error ", inResponse ? inResponse->status : 0, " ", inDoing, " asset \"",
                 inURL, "\": (", inResponse ? inResponse->GetShortenedPayloadAsUTF8String() : std::string(),
                 ")"));
}

bool HasStatus(const shared_ptr<ostnet::Response>& inResponse, int inFirst, int inLast) {
    return inResponse && inResponse->status >= inFirst && inResponse->status <= inLast;
}

}  // namespace

shared_ptr<ostnet::Response> ServerResource::Post(const shared_ptr<RecycledMemory const>& inBody,
                                                  const ImmutableString& inContentType) {
    const ImmutableString url = GetHTTPURL();
    const auto response =
        GetServer()->BlockingPOST(url, MakeContentTypeHeaders(inContentType), inBody, kWait);
    if (!HasStatus(response, 200, 399)) {
        TraceFailedWrite("Post", "posting", url, response);
    }
    return response;
}

shared_ptr<ostnet::Response> ServerResource::PostFile(const std::string& inPath,
                                                      const ImmutableString& inContentType) {
    const shared_ptr<RecycledMemory const> bytes = ostcore::filesupport::File::Read(inPath);
    return bytes ? Post(bytes, inContentType) : nullptr;
}

bool ServerResource::Post(const shared_ptr<RecycledMemory const>& inBody, const ostnet::Headers& inHeaders,
                          const Guid& inRequestID, const RequestCompletion& inCompletion) {
    return GetServer()->POST(inRequestID, MakeCompletionFunction(inCompletion, true, true), GetHTTPURL(),
                             inHeaders, inBody);
}

shared_ptr<ostnet::Response> ServerResource::PostMultiPart(const ostnet::http::Form& inForm) {
    const ImmutableString url = GetHTTPURL();
    const auto response = GetServer()->BlockingPOST(url, ostnet::Headers(), inForm, kWait);
    if (!HasStatus(response, 200, 299)) {
        TraceFailedWrite("PostMultiPart", "posting", url, response);
    }
    return response;
}

bool ServerResource::PostMultiPart(const ostnet::http::Form& inForm, const Guid& inRequestID,
                                   const RequestCompletion& inCompletion) {
    return GetServer()->POST(inRequestID, MakeCompletionFunction(inCompletion, true, true), GetHTTPURL(),
                             ostnet::Headers(), inForm);
}

shared_ptr<ostnet::Response> ServerResource::Put(const shared_ptr<RecycledMemory const>& inBody,
                                                 const ImmutableString& inContentType, bool inIgnoreETag) {
    return PutIfMatch(inBody, inContentType, inIgnoreETag ? ImmutableString() : GetETag(false));
}

shared_ptr<ostnet::Response> ServerResource::PutIfMatch(const shared_ptr<RecycledMemory const>& inBody,
                                                        const ImmutableString& inContentType,
                                                        const ImmutableString& inETag) {
    ostnet::Headers headers = MakeContentTypeHeaders(inContentType);
    if (!inETag.IsNull()) {
        headers.emplace(ostnet::kHEADER_IF_MATCH, inETag);
    }
    const ImmutableString url = GetHTTPURL();
    const auto response = GetServer()->BlockingPUT(url, std::move(headers), inBody, kWait);
    ZO_ASSERT_ONCE(response, "response", JoinText("Failed to PUT with URL: ", url));
    if (HasStatus(response, 200, 299)) {
        SetETag(GetETagFromResponse(response));
    }
    return response;
}

shared_ptr<ostnet::Response> ServerResource::PutFile(const std::string& inPath,
                                                     const ImmutableString& inContentType) {
    const shared_ptr<RecycledMemory const> bytes = ostcore::filesupport::File::Read(inPath);
    return bytes ? Put(bytes, inContentType, false) : nullptr;
}

bool ServerResource::Put(const shared_ptr<RecycledMemory const>& inBody, const ImmutableString& inContentType,
                         const Guid& inRequestID, const RequestCompletion& inCompletion, bool inIgnoreETag) {
    ostnet::Headers headers = MakeContentTypeHeaders(inContentType);
    const ImmutableString tag = inIgnoreETag ? ImmutableString() : GetETag(false);
    if (!tag.IsNull()) {
        headers.emplace(ostnet::kHEADER_IF_MATCH, tag);
    }
    return Put(inBody, headers, inRequestID, inCompletion);
}

bool ServerResource::Put(const shared_ptr<RecycledMemory const>& inBody, const ostnet::Headers& inHeaders,
                         const Guid& inRequestID, const RequestCompletion& inCompletion) {
    return GetServer()->PUT(inRequestID, MakeCompletionFunction(inCompletion, false, true), GetHTTPURL(),
                            inHeaders, inBody);
}

shared_ptr<ostnet::Response> ServerResource::PutMultiPart(const ostnet::http::Form& inForm) {
    const ImmutableString url = GetHTTPURL();
    const auto response = GetServer()->BlockingPUT(url, ostnet::Headers(), inForm, kWait);
    if (HasStatus(response, 200, 299)) {
        SetETag(GetETagFromResponse(response));
    } else {
        TraceFailedWrite("PutMultiPart", "putting", url, response);
    }
    return response;
}

bool ServerResource::PutMultiPart(const ostnet::http::Form& inForm, const Guid& inRequestID,
                                  const RequestCompletion& inCompletion) {
    return GetServer()->PUT(inRequestID, MakeCompletionFunction(inCompletion, false, true), GetHTTPURL(),
                            ostnet::Headers(), inForm);
}

bool ServerResource::Delete() {
    const ImmutableString url = GetDeleteLink();
    const auto response = GetServer()->BlockingDELETE(url, ostnet::Headers(), kWait);
    ZO_ASSERT_ONCE(response, "response", JoinText("Failed to DELETE at URL: ", url));
    return HasStatus(response, 200, 299);
}

bool ServerResource::Delete(const Guid& inRequestID, const RequestCompletion& inCompletion) {
    return GetServer()->DELETE(inRequestID,
                               MakeCompletionFunction(TreatMissingAsGone(inCompletion), false, true),
                               GetDeleteLink(), ostnet::Headers());
}

}  // namespace ZOCL
