// Payloads by their content identifier: from the cache when it holds them, else from the server and into it.
#include <new>

#include "Connection/ContentCache.h"
#include "Connection/DataServer.h"
#include "Connection/SynchronousRequest.h"
#include "ostcore/debug/DebugDatabase.h"
#include "ostcore/debug/Trace.h"
#include "ostnet/http/Compression.h"
#include "ostnet/NetworkSettings.h"
#include "ZOClient/ResultCodes.h"

namespace ZOCL {

using ostcore::threads::ScopedLock;
using ostnet::http::RequestOptions;

namespace {

constexpr std::int32_t kStatusNotInflatable = 417;
constexpr ostnet::http::ExpiryLimits kSimpleContentCacheLimits{250, 1800, 300};

const ostcore::debug::TraceChannel& Channel() {
    static const ostcore::debug::TraceChannel sChannel("ZOCL.ContentCache");
    return sChannel;
}

void TraceContent(const char* inText, const ImmutableString& inContentID, const char* inEnd = "") {
    if (Channel().IsEnabled(ostcore::debug::kTraceLevel_LifetimeDetail)) {
        ostcore::debug::Trace(Channel(), ostcore::debug::kTraceLevel_LifetimeDetail,
                              inText + inContentID.str() + inEnd);
    }
}

shared_ptr<ostnet::Response> MakeContentResponse(const shared_ptr<RecycledMemory const>& inPayload) {
    const auto response = boost::make_shared<ostnet::Response>(200);
    response->payload = inPayload;
    return response;
}

/// Null when the bytes are no gzip stream, or one that is larger than this host allows.
shared_ptr<ostnet::Response> InflateStored(const shared_ptr<RecycledMemory const>& inStored) {
    try {
        const auto payload =
            ostnet::http::DecompressPayload(inStored, ostnet::GetNetworkSettings()->limits.inflate);
        return payload ? MakeContentResponse(payload) : nullptr;
    } catch (const std::bad_alloc&) {
        return nullptr;
    }
}

/// As InflateStored, for what came with these headers.
shared_ptr<ostnet::Response> InflateReceived(const ostnet::Response& inReceived) {
    try {
        shared_ptr<RecycledMemory const> payload;
        const bool isInflated = ostnet::http::DecompressPayload(
            inReceived.payload, inReceived.headers, payload, ostnet::GetNetworkSettings()->limits.inflate);
        return isInflated ? MakeContentResponse(payload) : nullptr;
    } catch (const std::bad_alloc&) {
        return nullptr;
    }
}

}  // namespace

DataServer::DataServer()
    : mUseSimpleContentCache(ostcore::debug::DebugDatabase::GetBool("ZOClient.UseSimpleContentCache", false)),
      mSimpleContentCache(mUseSimpleContentCache
                              ? boost::make_shared<ContentMap>(
                                    kSimpleContentCacheLimits,
                                    ostcore::threads::CreateCPUBoundExecutor("simple content cache"))
                              : nullptr) {}

/// The cache outlives sign-ins and is shared by all hubs, so one hub must not be able to answer for another.
ImmutableString DataServer::ContentKey(const ImmutableString& inContentID) const {
    return inContentID.empty() ? inContentID : ImmutableString(mBaseURL.str() + "\n" + inContentID.str());
}

int DataServer::GetCachedContent(const ImmutableString& inContentID, const ContentCompletion& inCompletion,
                                 ResponseRef& outResponse, bool inImmediately) {
    if (inContentID.empty()) {
        return kResultFailure;
    }
    return mUseSimpleContentCache ? GetSimplyCachedContent(inContentID, outResponse)
                                  : GetStoredContent(inContentID, inCompletion, outResponse, inImmediately);
}

int DataServer::GetSimplyCachedContent(const ImmutableString& inContentID, ResponseRef& outResponse) {
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::DataServer::GetCachedContent");
    const auto record = mSimpleContentCache->Lookup(inContentID);
    lock.Unlock();
    if (!record || !*record) {
        return kResultFailure;
    }
    TraceContent("GetCachedContent(): Found using simple content cache: ", inContentID);
    outResponse = *record;
    return kResultContentAvailable;
}

int DataServer::GetStoredContent(const ImmutableString& inContentID, const ContentCompletion& inCompletion,
                                 ResponseRef& outResponse, bool inImmediately) {
    const auto cache = GetContentCache();
    if (!cache) {
        return kResultFailure;
    }
    int result = kResultFailure;
    const InterfaceRef<DataServer> self(this);
    const ImmutableString key = ContentKey(inContentID);
    for (const ImmutableString& name : cache->ListNames(key)) {
        const StoredContent content{inContentID, name, cache, inCompletion};
        Payload stored;
        result = cache->Read(
            key, name,
            [self, content](int, const Payload& inStored) {
                const auto finish = [self, content, inStored] {
                    self->OnGetCachedContentComplete(content, inStored);
                };
                // Without workers it ends here, since it has to end.
                if (!self->PostFunction(finish, 0)) {
                    finish();
                }
            },
            stored);
        if (result == kResultContentAvailable) {
            result = inImmediately ? UseHeldContent(content, stored, outResponse)
                                   : UseHeldContentLater(content, stored);
        }
        if (result >= 0) {
            return result;
        }
    }
    return result;
}

int DataServer::UseHeldContent(const StoredContent& inContent, const Payload& inStored,
                               ResponseRef& outResponse) {
    const ResponseRef response = InflateStored(inStored);
    if (!response) {
        DropContent(inContent);
        return kResultFailure;
    }
    TraceContent("GetCachedContent(): Retrieved from cache immediately: ", inContent.contentID);
    outResponse = response;
    return kResultContentAvailable;
}

int DataServer::UseHeldContentLater(const StoredContent& inContent, const Payload& inStored) {
    TraceContent("GetCachedContent(): Retrieved from cache immediately: ", inContent.contentID,
                 ", but will decompress asynchronously.");
    const InterfaceRef<DataServer> self(this);
    const bool isStarted = PostFunction(
        [self, inContent, inStored] { self->OnGetCachedContentComplete(inContent, inStored); }, 0);
    return isStarted ? kResultContentPending : kResultFailure;
}

void DataServer::OnGetCachedContentComplete(const StoredContent& inContent, const Payload& inStored) {
    if (!inStored) {
        TraceContent("OnGetCachedContentComplete(): Failed to retrieve from cache asynchronously: ",
                     inContent.contentID);
        inContent.completion(nullptr);
        return;
    }
    TraceContent("OnGetCachedContentComplete(): Retrieved from cache asynchronously: ", inContent.contentID);
    const ResponseRef response = InflateStored(inStored);
    if (response) {
        TraceContent("OnGetCachedContentComplete(): Decompressed payload: ", inContent.contentID);
    } else {
        DropContent(inContent);
    }
    inContent.completion(response);
}

/// What cannot be inflated would stand in the way of its own payload in every run to come.
void DataServer::DropContent(const StoredContent& inContent) {
    ostcore::debug::Trace(
        Channel(), ostcore::debug::kTraceLevel_Error,
        "A payload of the content cache cannot be inflated and is dropped: " + inContent.contentID.str());
    inContent.cache->Remove(ContentKey(inContent.contentID), inContent.name);
}

DataServer::ResponseRef DataServer::GetCachedContentSynchronous(const ImmutableString& inContentID,
                                                                std::uint32_t inTimeoutMilliseconds) {
    const auto data = boost::make_shared<SynchronousCompletionData>();
    ResponseRef response;
    const int result = GetCachedContent(
        inContentID, [data](const ResponseRef& inResponse) { data->Complete(inResponse); }, response, true);
    if (result == kResultContentAvailable) {
        TraceContent("GetCachedContentSynchronous(): Retrieved from cache immediately: ", inContentID);
        return response;
    }
    if (result != kResultContentPending) {
        return nullptr;
    }
    TraceContent("GetCachedContentSynchronous(): Waiting for async response from cache: ", inContentID);
    if (!ostcore::threads::Gate::PassThrough(data->Gate(), inTimeoutMilliseconds)) {
        TraceContent("GetCachedContentSynchronous(): Async request from cache timed out: ", inContentID);
        return nullptr;
    }
    TraceContent("GetCachedContentSynchronous(): Async request from cache completed: ", inContentID);
    return data->Response();
}

DataServer::ResponseRef DataServer::CacheAndDecompressContent(const ImmutableString& inContentID,
                                                              const ResponseRef& inResponse) {
    if (!inResponse || !inResponse->IsSuccess()) {
        return inResponse;
    }
    if (mUseSimpleContentCache) {
        CacheSimply(inContentID, inResponse);
        return inResponse;
    }
    const ResponseRef inflated = InflateReceived(*inResponse);
    if (!inflated) {
        return boost::make_shared<ostnet::Response>(kStatusNotInflatable);
    }
    if (!ostnet::http::IsGzipEncoded(inResponse->headers)) {
        CacheContent(inContentID, inResponse->payload);
    } else if (!inContentID.empty()) {
        if (const auto cache = GetContentCache()) {
            cache->Write(ContentKey(inContentID), ContentName(), inResponse->payload);
        }
    }
    return inflated;
}

void DataServer::CacheSimply(const ImmutableString& inContentID, const ResponseRef& inResponse) {
    if (inContentID.empty()) {
        return;
    }
    TraceContent("CacheAndDecompressContent(): Caching with simple content cache: ", inContentID);
    optional<ResponseRef> replaced;
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::DataServer::CacheAndDecompressContent");
    replaced = mSimpleContentCache->Insert(inContentID, inResponse);
    lock.Unlock();
}

void DataServer::CacheContent(const ImmutableString& inContentID, const Payload& inPayload) {
    if (!mUseSimpleContentCache) {
        mContentPacking->Add(ContentKey(inContentID), inPayload);
    }
}

bool DataServer::RequestContent(const ImmutableString& inContentID, const Guid& inRequestID,
                                const Completion& inCompletion, const ImmutableString& inURL) {
    const ImmutableString url = MakeRequestURL(inURL);
    if (url.IsNull()) {
        return false;
    }
    RequestOptions options;
    options.decompressPayload = mUseSimpleContentCache;
    const InterfaceRef<DataServer> self(this);
    return mChain.common->GET(
        inRequestID,
        [self, inContentID, inCompletion](const Guid& inID, const ResponseRef& inResponse) {
            inCompletion(inID, self->CacheAndDecompressContent(inContentID, inResponse));
        },
        url, ostnet::Headers(), options);
}

bool DataServer::GETByContentID(const ImmutableString& inContentID, const Guid& inRequestID,
                                const Completion& inCompletion, const ImmutableString& inURL) {
    const InterfaceRef<DataServer> self(this);
    const ContentCompletion onCached = [self, inContentID, inRequestID, inCompletion,
                                        inURL](const ResponseRef& inResponse) {
        self->OnContentFromCache(inContentID, inRequestID, inCompletion, inURL, inResponse);
    };
    ResponseRef response;
    mContentReads.Begin(inRequestID);
    const int result = GetCachedContent(inContentID, onCached, response, false);
    if (result == kResultContentPending) {
        TraceContent("GETByContentID(): Will retrieve from cache asynchronously: ", inContentID);
        return true;
    }
    mContentReads.End(inRequestID);
    if (result == kResultContentAvailable) {
        return PostFunction([inCompletion, inRequestID, response] { inCompletion(inRequestID, response); },
                            0);
    }
    TraceContent("GETByContentID(): Content not found in cache, will request from server: ", inContentID);
    return RequestContent(inContentID, inRequestID, inCompletion, inURL);
}

/// The end of a look into the cache that took its time. What it could not give comes from the server.
void DataServer::OnContentFromCache(const ImmutableString& inContentID, const Guid& inRequestID,
                                    const Completion& inCompletion, const ImmutableString& inURL,
                                    const ResponseRef& inResponse) {
    if (mContentReads.End(inRequestID)) {
        inCompletion(inRequestID, boost::make_shared<ostnet::Response>(ostnet::Response::kStatusCancelled));
        return;
    }
    if (inResponse) {
        inCompletion(inRequestID, inResponse);
        return;
    }
    TraceContent("GETByContentID(): Content not found in cache, will request from server: ", inContentID);
    if (!RequestContent(inContentID, inRequestID, inCompletion, inURL)) {
        inCompletion(inRequestID, boost::make_shared<ostnet::Response>(ostnet::Response::kStatusNoResponse));
    }
}

DataServer::ResponseRef DataServer::BlockingGETByContentID(const ImmutableString& inContentID,
                                                           const ImmutableString& inURL,
                                                           std::uint32_t inTimeoutMilliseconds) {
    if (const ResponseRef cached = GetCachedContentSynchronous(inContentID, inTimeoutMilliseconds)) {
        return cached;
    }
    return WaitForResponse(inTimeoutMilliseconds,
                           [&](const Guid& inRequestID, const Completion& inCompletion) {
                               return RequestContent(inContentID, inRequestID, inCompletion, inURL);
                           });
}

}  // namespace ZOCL
