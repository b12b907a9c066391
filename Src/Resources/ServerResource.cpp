// Loading, refreshing and the state of a resource; its writes stand in ServerResourceWrites.cpp.
#include "Resources/ServerResource.h"

#include "ostcore/debug/Assert.h"
#include "ostcore/debug/Trace.h"
#include "ostnet/HeaderConstants.h"
#include "Resources/JoinText.h"
#include "Resources/PollingResourceMonitor.h"

namespace ZOCL {

using ostcore::debug::kTraceLevel_Error;
using ostcore::debug::kTraceLevel_Progress;
using ostcore::threads::ScopedLock;

namespace {

ostcore::debug::TraceChannel& GeneralChannel() {
    static ostcore::debug::TraceChannel channel("ZOCL");
    return channel;
}
ostcore::debug::TraceChannel& ResourceChannel() {
    static ostcore::debug::TraceChannel channel("ZOCL.ServerResource");
    return channel;
}

template <class... Pieces>
void TraceOn(const ostcore::debug::TraceChannel& inChannel, int inLevel, const Pieces&... inPieces) {
    if (inChannel.IsEnabled(inLevel)) {
        ostcore::debug::Trace(inChannel, inLevel, JoinText(inPieces...));
    }
}

}  // namespace

RequestCompletion TreatMissingAsGone(const RequestCompletion& inCompletion) {
    if (!inCompletion) {
        return inCompletion;
    }
    return [inCompletion](const Guid& inRequestID, int inResult,
                          const InterfaceRef<IZOCServerResource>& inResource,
                          const shared_ptr<ostnet::Response>& inResponse) {
        inCompletion(inRequestID, inResult == kResultHTTPNotFound ? kResultGone : inResult, inResource,
                     inResponse);
    };
}

ostnet::Headers MakeContentTypeHeaders(const ImmutableString& inContentType) {
    ostnet::Headers headers;
    if (!inContentType.empty()) {
        headers.emplace(ostnet::kHEADER_CONTENT_TYPE, inContentType);
    }
    return headers;
}

InterfaceRef<IZOCServerResource> IZOCServerResource::Create(const ImmutableString& inURL,
                                                            const InterfaceRef<IZOCDataServer>& inServer,
                                                            ResourceWritability inWritability) {
    return ServerResource::MakePlain(inURL, inServer, inWritability);
}

InterfaceRef<ServerResource> ServerResource::MakePlain(const ImmutableString& inURL,
                                                       const InterfaceRef<IZOCDataServer>& inServer,
                                                       ResourceWritability inWritability) {
    InterfaceRef<ServerResource> resource(new ServerResource);
    resource->InternalInit(inURL, inServer, nullptr, inWritability, true);
    return resource;
}

ServerResource::~ServerResource() = default;

std::uint32_t ServerResource::AddRef() noexcept {
    return mReferences.Add();
}

std::uint32_t ServerResource::Release() noexcept {
    const std::uint32_t left = mReferences.Drop();
    if (left == 0) {
        delete this;
    }
    return left;
}

int ServerResource::QueryInterface(const RFL::InterfaceID& inID, void** outInterface) noexcept {
    const int result = QueryInterfaceNoAddRef(inID, outInterface);
    if (result >= 0) {
        AddRef();
    }
    return result;
}

int ServerResource::QueryInterfaceNoAddRef(const RFL::InterfaceID& inID, void** outInterface) noexcept {
    if (inID == IZOCServerResource::kInterfaceID) {
        *outInterface = static_cast<IZOCServerResource*>(this);
    } else if (inID == RFL::RFLUnknown::kInterfaceID) {
        *outInterface = static_cast<RFL::RFLUnknown*>(static_cast<IZOCServerResource*>(this));
    } else if (inID == ServerResource::kInterfaceID) {
        *outInterface = static_cast<ServerResource*>(this);
    } else if (inID == IZOCWritableServerResource::kInterfaceID && IsWritable()) {
        *outInterface = static_cast<IZOCWritableServerResource*>(this);
    } else {
        *outInterface = nullptr;
        return kResultInterfaceNotSupported;
    }
    return kResultSuccess;
}

bool ServerResource::Load(const Guid& inRequestID, const RequestCompletion& inCompletion,
                          bool inReportErrors) {
    if (IsLoaded()) {
        if (inCompletion) {
            inCompletion(inRequestID, kResultSuccess, GetSelf(), nullptr);
        }
        return true;
    }
    const Target target = GetTarget("ServerResource::Load");
    TraceOn(GeneralChannel(), kTraceLevel_Progress,
            "ServerResource::Load(): Beginning async load of server resource ", target.url,
            ", inRequestID == ", inRequestID);
    return target.server->GET(inRequestID, MakeCompletionFunction(inCompletion, true, inReportErrors),
                              target.url, ostnet::Headers());
}

bool ServerResource::Load(bool inReportErrors) {
    Target target;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ServerResource::Load");
        if (mLoaded) {
            return true;
        }
        target = {mURL, mServer};
    }
    shared_ptr<ostnet::Response> response;
    if (!target.url.empty() && target.server) {
        response = target.server->BlockingGET(target.url, ostnet::Headers(), ostnet::http::kWaitForever);
        if (!response) {
            TraceOn(GeneralChannel(), kTraceLevel_Error,
                    "ServerResource::Load(): Failed to load resource (No response from server) at url: ",
                    target.url);
        }
    }
    AsyncOperationHelper(Guid(), response, RequestCompletion(), target.url, target.server, true,
                         inReportErrors);
    return IsLoaded();
}

bool ServerResource::LoadTreatingMissingAsEmpty(const Guid& inRequestID,
                                                const RequestCompletion& inCompletion, bool inReportErrors) {
    return Load(inRequestID, TreatMissingAsGone(inCompletion), inReportErrors);
}

bool ServerResource::LoadBlocking(bool inReportErrors) {
    return Load(inReportErrors);
}

void ServerResource::LoadInBackground(bool inReportErrors) {
    Load(Guid::CreateUnique(), RequestCompletion(), inReportErrors);
}

bool ServerResource::IsValid() {
    ScopedLock lock(IZOCDataServer::GetLock(), "ServerResource::IsValid");
    return !mURL.empty() && mServer;
}

bool ServerResource::IsLoaded() {
    ScopedLock lock(IZOCDataServer::GetLock(), "ServerResource::IsLoaded");
    return mLoaded;
}

bool ServerResource::Refresh(const Guid& inRequestID, const RequestCompletion& inCompletion) {
    ostnet::Headers headers;
    const ImmutableString tag = GetETag(true);
    if (!tag.IsNull()) {
        headers.emplace(ostnet::kHEADER_IF_NONE_MATCH, tag);
    }
    const Target target = GetTarget("ServerResource::Refresh");
    TraceOn(GeneralChannel(), kTraceLevel_Progress,
            "ServerResource::Refresh(): Beginning async load of server resource ", target.url,
            ", inRequestID == ", inRequestID);
    if (!target.server) {
        RFL::ThrowNullInterface();
    }
    const auto completion = MakeCompletionFunction(inCompletion, true, true);
    return target.server->GET(inRequestID, completion, GetLatestVersionLink(), std::move(headers));
}

bool ServerResource::Refresh(bool& outChanged, bool /*inReserved*/) {
    outChanged = false;
    const ImmutableString tag = GetETag(true);
    const InterfaceRef<IZOCDataServer> server = GetServer();
    if (!server) {
        RFL::ThrowNullInterface();
    }
    const auto response =
        server->BlockingGET(GetLatestVersionLink(), ostnet::Headers(), ostnet::http::kWaitForever);
    if (!tag.IsNull() && tag == GetETagFromResponse(response)) {
        return true;
    }
    if (!response) {
        return false;
    }
    if (response->status == 204) {
        return true;
    }
    outChanged = true;
    return InitFromResponse(response, ResourceWritability::kKeep);
}

bool ServerResource::RefreshTreatingMissingAsEmpty(const Guid& inRequestID,
                                                   const RequestCompletion& inCompletion) {
    return Refresh(inRequestID, TreatMissingAsGone(inCompletion));
}

ImmutableString ServerResource::GetHTTPURL() {
    ScopedLock lock(IZOCDataServer::GetLock(), "ServerResource::GetHTTPURL");
    return mURL;
}

ImmutableString ServerResource::GetLatestVersionLink() {
    return GetEditLink();
}

ImmutableString ServerResource::GetETag(bool inNoFetch) {
    Target target;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ServerResource::GetETag");
        if (mLoaded) {
            return mETag;
        }
        target = {mURL, mServer};
    }
    if (inNoFetch) {
        return ImmutableString();
    }
    return GetETagFromResponse(
        target.server->BlockingHEAD(target.url, ostnet::Headers(), ostnet::http::kWaitForever));
}

shared_ptr<RecycledMemory const> ServerResource::GetResponseData() {
    ScopedLock lock(IZOCDataServer::GetLock(), "ServerResource::GetResponseData");
    return mResponse ? mResponse->payload : nullptr;
}

bool ServerResource::TryToCancelRequest(const Guid& inRequestID) {
    GetServer()->TryToCancelRequest(inRequestID);
    return true;
}

shared_ptr<ServerResourceChangeNotifier> ServerResource::SubscribeToChanges(
    const ServerResourceChangeNotifier::Function& inFunction, bool inNotifyWhenUnloaded,
    std::uint32_t inIntervalMilliseconds) {
    return PollingResourceMonitor::Get().SubscribeToChanges(GetSelf(), inFunction, inIntervalMilliseconds,
                                                            inNotifyWhenUnloaded);
}

InterfaceRef<ServerResource> ServerResource::GetSelf() {
    return InterfaceRef<ServerResource>(this);
}

ImmutableString ServerResource::GetEditLink() {
    return GetHTTPURL();
}

ImmutableString ServerResource::GetDeleteLink() {
    return GetLatestVersionLink();
}

ImmutableString ServerResource::GetParentLink() {
    return ImmutableString();
}

bool ServerResource::canLoadType(const ImmutableString& /*inContentType*/) {
    return true;
}

InterfaceRef<IZOCDataServer> ServerResource::GetServer() {
    ScopedLock lock(IZOCDataServer::GetLock(), "ServerResource::GetServer");
    return mServer;
}

ServerResource::Target ServerResource::GetTarget(const char* inLabel) {
    ScopedLock lock(IZOCDataServer::GetLock(), inLabel);
    return {mURL, mServer};
}

std::string ServerResource::GetTraceName() {
    return GetHTTPURL().str();
}

void ServerResource::SetETag(const ImmutableString& inETag) {
    const std::string name = GetTraceName();
    ImmutableString present;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ServerResource::SetETag");
        present = mETag;
        mETag = inETag;
    }
    if (inETag.IsNull()) {
        TraceOn(ResourceChannel(), kTraceLevel_Error, "SetETag(): empty eTag for asset \"", name, "\"");
    }
    TraceOn(ResourceChannel(), kTraceLevel_Progress, "SetETag(): setting ETag for asset \"", name, "\" to \"",
            present, "\"");
}

bool ServerResource::InitFromResponse(const shared_ptr<ostnet::Response>& inResponse,
                                      ResourceWritability inWritability) {
    const Target target = GetTarget("ServerResource::InitFromResponse");
    return InternalInit(target.url, target.server, inResponse, inWritability, true);
}

void ServerResource::ResetFieldsLocked(const ImmutableString& inURL,
                                       const InterfaceRef<IZOCDataServer>& inServer,
                                       const shared_ptr<ostnet::Response>& inResponse,
                                       ResourceWritability inWritability) {
    if (!mServer) {
        mServer = inServer ? inServer : IZOCDataServer::GetLoggedInServerRef();
    }
    mURL = inURL;
    mResponse = inResponse;
    mLoaded = false;
    mETag = ImmutableString();
    if (inWritability != ResourceWritability::kKeep) {
        std::int32_t present = mWritable.load(std::memory_order_relaxed);
        const std::int32_t wanted = inWritability == ResourceWritability::kWritable ? 1 : 0;
        while (!mWritable.compare_exchange_weak(present, wanted, std::memory_order_acq_rel)) {
        }
    }
}

bool ServerResource::InternalInit(const ImmutableString& inURL, const InterfaceRef<IZOCDataServer>& inServer,
                                  const shared_ptr<ostnet::Response>& inResponse,
                                  ResourceWritability inWritability, bool inReportErrors) {
    const bool success = inResponse && inResponse->IsSuccess();
    if (inReportErrors && inResponse && !success && GeneralChannel().IsEnabled(kTraceLevel_Error)) {
        TraceOn(
            GeneralChannel(), kTraceLevel_Error,
            "ServerResource::InternalInit(): cannot create object from unsuccessful server response. URL: \"",
            inURL, "\", HTTP status code: ", inResponse->status, ", response data: \"",
            inResponse->GetShortenedPayloadAsUTF8String(), "\"");
    }
    const ImmutableString type =
        success ? ostnet::GetHeader(inResponse->headers, ostnet::kHEADER_CONTENT_TYPE) : ImmutableString();
    const bool accepted = success && canLoadType(type);
    bool loaded = false;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ServerResource::InternalInit");
        ResetFieldsLocked(inURL, inServer, inResponse, inWritability);
        if (accepted) {
            mLoaded = true;
            mETag = GetETagFromResponse(inResponse);
            const ImmutableString location = ostnet::GetHeader(inResponse->headers, ostnet::kHEADER_LOCATION);
            if (!location.empty()) {
                mURL = location;
            }
        }
        loaded = mLoaded;
    }
    ZO_ASSERT_ONCE(accepted || !success, "canLoadType",
                   JoinText("Failed to load content with type \"", type, "\" for resource \"", inURL, "\""));
    return loaded;
}

ostnet::http::CompletionFunction ServerResource::MakeCompletionFunction(const RequestCompletion& inCompletion,
                                                                        bool inInitOnCompletion,
                                                                        bool inReportErrors) {
    const Target target = GetTarget("ServerResource::MakeCompletionFunction");
    const InterfaceRef<ServerResource> self = GetSelf();
    return [self, target, inCompletion, inInitOnCompletion, inReportErrors](
               const Guid& inRequestID, const shared_ptr<ostnet::Response>& inResponse) {
        self->AsyncOperationHelper(inRequestID, inResponse, inCompletion, target.url, target.server,
                                   inInitOnCompletion, inReportErrors);
    };
}

void ServerResource::AsyncOperationHelper(const Guid& inRequestID,
                                          const shared_ptr<ostnet::Response>& inResponse,
                                          const RequestCompletion& inCompletion, const ImmutableString& inURL,
                                          const InterfaceRef<IZOCDataServer>& inServer,
                                          bool inInitOnCompletion, bool inReportErrors) {
    bool ok = true;
    if (inInitOnCompletion && !(inResponse && inResponse->status == 304)) {
        const ImmutableString tag = GetETag(true);
        if (tag.IsNull() || tag != GetETagFromResponse(inResponse)) {
            ok = InternalInit(inURL, inServer, inResponse, ResourceWritability::kKeep, inReportErrors);
        }
    }
    if (!ok && inReportErrors) {
        TraceOn(GeneralChannel(), kTraceLevel_Error, "Internal initialization failed for resource \"", inURL,
                "\", requestID == ", inRequestID);
    }
    const int responseResult = GetResultFromResponse(inResponse, kResultNoResponseObject);
    TraceOn(GeneralChannel(), kTraceLevel_Progress, "ServerResource::AsyncOperationHelper(): request ",
            inRequestID, " completed with result ", responseResult);
    if (!inCompletion) {
        return;
    }
    const bool success = inResponse && inResponse->IsSuccess() && ok;
    inCompletion(inRequestID, success ? kResultSuccess : responseResult, GetSelf(), inResponse);
}

}  // namespace ZOCL
