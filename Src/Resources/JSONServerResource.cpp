// Parsing, links and installation of JSON resources.
#include "JSONServerResource.h"

#include "ostcore/debug/Trace.h"
#include "ostnet/HeaderConstants.h"
#include "Relations.h"

namespace ZOCL {

using ostcore::debug::kTraceLevel_Error;
using ostcore::threads::ScopedLock;

namespace {

ostcore::debug::TraceChannel& Channel() {
    static ostcore::debug::TraceChannel channel("ZOCL");
    return channel;
}

template <class... Pieces>
void TraceError(const Pieces&... inPieces) {
    if (Channel().IsEnabled(kTraceLevel_Error)) {
        ostcore::debug::Trace(Channel(), kTraceLevel_Error, JoinText(inPieces...));
    }
}

/// The parsed payload; an empty object for no payload, null for one that is not well-formed.
ostcore::serialization::JSONValue ParsePayload(const ostnet::Response& inResponse,
                                               const ImmutableString& inURL) {
    if (!inResponse.payload || inResponse.payload->empty()) {
        return ostcore::serialization::JSONValue::EmptyObject();
    }
    try {
        return ostcore::serialization::JSONParse(inResponse.payload);
    } catch (const std::exception& error) {
        TraceError("JSONServerResource::InternalInit(): the body of \"", inURL,
                   "\" is not well-formed JSON: ", std::string_view(error.what()));
    }
    return ostcore::serialization::JSONValue();
}

}  // namespace

bool JSONServerResourceBase::Guarded(const function<void()>& inBinding) {
    try {
        inBinding();
        return true;
    } catch (const boost::bad_any_cast& error) {
        TraceError("Bad any cast while parsing JSON, ex.what() == \"", std::string_view(error.what()), "\"");
    } catch (const std::exception& error) {
        TraceError("Std exception thrown while parsing JSON, ex.what() == \"", std::string_view(error.what()),
                   "\"");
    }
    return false;
}

bool JSONServerResourceBase::canLoadType(const ImmutableString& inContentType) {
    const std::string_view wanted = ostnet::kHEADER_CONTENT_TYPE_APPLICATION_JSON;
    return inContentType.view().substr(0, wanted.size()) == wanted;
}

bool JSONServerResourceBase::InternalInit(const ImmutableString& inURL,
                                          const InterfaceRef<IZOCDataServer>& inServer,
                                          const shared_ptr<ostnet::Response>& inResponse,
                                          ResourceWritability inWritability, bool inReportErrors) {
    const bool success = inResponse && inResponse->IsSuccess();
    if (inReportErrors && inResponse && !success && Channel().IsEnabled(kTraceLevel_Error)) {
        TraceError(
            "JSONServerResource::InternalInit(): cannot create object from unsuccessful server response. "
            "URL: \"",
            inURL, "\", HTTP status code: ", inResponse->status, ", CURL Error Code: ", inResponse->curlError,
            ", response data: \"", inResponse->GetShortenedPayloadAsUTF8String(), "\"");
    }
    if (success) {
        const ImmutableString type = ostnet::GetHeader(inResponse->headers, ostnet::kHEADER_CONTENT_TYPE);
        if (canLoadType(type)) {
            const ImmutableString location = ostnet::GetHeader(inResponse->headers, ostnet::kHEADER_LOCATION);
            const ImmutableString& url = location.empty() ? inURL : location;
            return InternalJSONInit(url, inServer, inResponse, ParsePayload(*inResponse, url), inWritability);
        }
        AssertLoadableType(JoinText("Failed to load content with type \"", type, "\" for resource \"", inURL,
                                    "\" PayLoad: ", inResponse->GetShortenedPayloadAsUTF8String(),
                                    ", Headers: ", inResponse->GetHeadersAsUTF8String()));
    }
    ScopedLock lock(IZOCDataServer::GetLock(), "JSONServerResource::InternalInit");
    ResetFieldsLocked(inURL, inServer, inResponse, inWritability);
    return false;
}

void JSONServerResourceBase::InstallLocked(const ImmutableString& inURL,
                                           const InterfaceRef<IZOCDataServer>& inServer,
                                           const shared_ptr<ostnet::Response>& inResponse, Links& ioLinks,
                                           const ImmutableString& inBodyETag, bool inLoaded,
                                           ResourceWritability inWritability) {
    ResetFieldsLocked(inURL, inServer, inResponse, inWritability);
    mLinks.swap(ioLinks);
    mLoaded = inLoaded;
    if (inResponse) {
        mETag = ostnet::GetHeader(inResponse->headers, ostnet::kHEADER_ETAG);
    }
    if (mETag.IsNull()) {
        mETag = inBodyETag;
    }
    const ImmutableString self = LinkHrefLocked(kRelation_Self);
    if (!self.empty()) {
        mURL = self;
    }
    if (mURL.empty()) {
        mURL = LinkHrefLocked(kRelation_Edit);
    }
    if (mURL.empty()) {
        mURL = LinkHrefLocked(kRelation_LatestVersion);
    }
}

ImmutableString JSONServerResourceBase::LinkHrefLocked(const ImmutableString& inRelation) const {
    return FindLink(mLinks, inRelation, ImmutableString()).href;
}

Link JSONServerResourceBase::GetLink(const ImmutableString& inRelation, const ImmutableString& inType) {
    ScopedLock lock(IZOCDataServer::GetLock(), "JSONServerResource::GetLink");
    return FindLink(mLinks, inRelation, inType);
}

ImmutableString JSONServerResourceBase::GetLinkHref(const ImmutableString& inRelation) {
    return GetLink(inRelation).href;
}

ImmutableString JSONServerResourceBase::GetLatestVersionLink() {
    const ImmutableString link = GetLinkHref(kRelation_LatestVersion);
    return link.empty() ? ServerResource::GetLatestVersionLink() : link;
}

ImmutableString JSONServerResourceBase::GetEditLink() {
    const ImmutableString link = GetLinkHref(kRelation_Edit);
    return link.empty() ? ServerResource::GetEditLink() : link;
}

ImmutableString JSONServerResourceBase::GetDeleteLink() {
    const ImmutableString link = GetLinkHref(kRelation_Delete);
    return link.empty() ? ServerResource::GetDeleteLink() : link;
}

ImmutableString JSONServerResourceBase::GetParentLink() {
    const ImmutableString link = GetLinkHref(kRelation_Up);
    return link.empty() ? ServerResource::GetParentLink() : link;
}

}  // namespace ZOCL
