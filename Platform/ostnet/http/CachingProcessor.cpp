// Looking up, joining, fetching and handing out.
#include "ostnet/http/CachingProcessor.h"

#include "ostnet/HeaderConstants.h"

namespace ostnet {
namespace http {

using ostcore::threads::ScopedLock;

namespace {

constexpr ExpiryLimits kLimits{100, 900, 60};
constexpr std::int32_t kStatusNotModified = 304;

/// The tag without the mark of a weak one: a 304 confirms by weak comparison (RFC 9110, section 13.1.2).
std::string_view OpaqueTag(std::string_view inTag) {
    return inTag.substr(0, 2) == "W/" ? inTag.substr(2) : inTag;
}

bool IsNotModified(const shared_ptr<Response>& inResponse) {
    return inResponse && inResponse->status == kStatusNotModified;
}

/// Whether a 304 speaks of this answer. One that names no tag speaks of what it was asked about.
bool Confirms(const Response& inNotModified, const shared_ptr<Response>& inHeld) {
    if (!inHeld) {
        return false;
    }
    const ImmutableString named = GetHeader(inNotModified.headers, kHEADER_ETAG);
    const ImmutableString held = GetHeader(inHeld->headers, kHEADER_ETAG);
    return named.empty() || OpaqueTag(named.view()) == OpaqueTag(held.view());
}

bool IsFreshAnswer(const Response& inResponse) {
    const ImmutableString control = GetHeader(inResponse.headers, kHEADER_CACHECONTROL);
    return !control.empty() && control != kHEADERVALUE_NOCACHE;
}

shared_ptr<Response> MakeNotModified(const Response& inHeld) {
    const auto response = boost::make_shared<Response>(kStatusNotModified);
    response->headers = inHeld.headers;
    response->payload = inHeld.payload;
    return response;
}

}  // namespace

/// One request on the network, and who waits for it. What is not const is guarded by the layer's mutex.
struct CachingProcessor::Fetch {
    Fetch(shared_ptr<CachingProcessor> inLayer, const ImmutableString& inURL, Headers inHeaders,
          const RequestOptions& inOptions)
        : layer(std::move(inLayer)), url(inURL), headers(std::move(inHeaders)), options(inOptions) {}

    const shared_ptr<CachingProcessor> layer;
    const ImmutableString url;
    const Headers headers;  // without a condition
    const RequestOptions options;

    Guid networkID = Guid::CreateUnique();
    ResponseRef held;
    shared_ptr<ResponseCache> responses;
    std::uint64_t generation = 0;
    Waiters waiters;
    bool isRepeated = false;
    /// Answered, not started, or abandoned by its last caller: nobody waits and nobody can join.
    bool isOver = false;
};

CachingProcessor::CachingProcessor(shared_ptr<RequestProcessor> inNext)
    : ForwardingProcessor(std::move(inNext)), mResponses(MakeCache()) {}

CachingProcessor::~CachingProcessor() = default;

shared_ptr<CachingProcessor::ResponseCache> CachingProcessor::MakeCache() {
    return boost::make_shared<ResponseCache>(kLimits,
                                             ostcore::threads::CreateCPUBoundExecutor("cache sweep"));
}

bool CachingProcessor::GET(const Guid& inRequestID, const CompletionFunction& inCompletion,
                           const ImmutableString& inURL, Headers inHeaders, const RequestOptions& inOptions) {
    if (!inOptions.decompressPayload || !inCompletion) {
        return Next()->GET(inRequestID, inCompletion, inURL, std::move(inHeaders), inOptions);
    }
    const auto delivery = boost::make_shared<Delivery>(Delivery{inCompletion, inRequestID, nullptr});
    const auto condition = inHeaders.find(kHEADER_IF_NONE_MATCH);
    const bool isConditional = condition != inHeaders.end();
    const ImmutableString callerTag = isConditional ? condition->second : ImmutableString();
    ImmutableString heldTag;
    FetchRef fetch;
    {
        ScopedLock lock(mMutex, "CachingProcessor::GET");
        const optional<CacheRecord> record = mResponses->Lookup(inURL);
        if (record && record->fresh) {
            lock.Unlock();
            delivery->response = record->response;
            return Deliver(delivery);
        }
        if (mFetchByRequest.count(inRequestID) > 0) {
            return false;
        }
        FetchRef& present = mFetchByURL[inURL];
        const bool joins = present && present->generation == mGeneration;
        if (!joins) {
            if (isConditional) {
                inHeaders.erase(kHEADER_IF_NONE_MATCH);
            }
            present = boost::make_shared<Fetch>(shared_from_this(), inURL, std::move(inHeaders), inOptions);
            present->responses = mResponses;
            present->generation = mGeneration;
            heldTag = record ? GetHeader(record->response->headers, kHEADER_ETAG) : ImmutableString();
            if (!heldTag.empty()) {
                present->held = record->response;
            }
        }
        present->waiters.emplace(inRequestID, Waiter{delivery, callerTag});
        mFetchByRequest.emplace(inRequestID, present);
        if (joins) {
            return true;
        }
        fetch = present;
    }
    Headers headers = CopyWithRoom(fetch->headers, 1);
    if (!heldTag.empty()) {
        headers.emplace(kHEADER_IF_NONE_MATCH, heldTag);
    }
    return Send(fetch, fetch->networkID, std::move(headers)) || OnStartFailed(fetch, inRequestID);
}

bool CachingProcessor::HEAD(const Guid& inRequestID, const CompletionFunction& inCompletion,
                            const ImmutableString& inURL, Headers inHeaders,
                            const RequestOptions& inOptions) {
    return GET(inRequestID, inCompletion, inURL, std::move(inHeaders), inOptions);
}

bool CachingProcessor::Send(const FetchRef& inFetch, const Guid& inNetworkID, Headers inHeaders) {
    // The fetch holds the layer: so the function stays small enough to be handed on without an allocation.
    const bool isStarted = Next()->GET(
        inNetworkID,
        [inFetch](const Guid&, const ResponseRef& inResponse) {
            inFetch->layer->Completion(inFetch, inResponse);
        },
        inFetch->url, std::move(inHeaders), inFetch->options);
    if (!isStarted) {
        return false;
    }
    bool isOver = false;
    {
        ScopedLock lock(mMutex, "CachingProcessor::Send");
        isOver = inFetch->isOver;
    }
    if (isOver) {
        Next()->TryToCancelRequest(inNetworkID);  // no effect when it is over because it was answered
    }
    return true;
}

/// False for the caller on whose stack the start failed. True when it has been cancelled meanwhile: then it
/// has its completion already.
bool CachingProcessor::OnStartFailed(const FetchRef& inFetch, const Guid& inCaller) {
    Waiters others;
    bool wasWaiting = false;
    {
        ScopedLock lock(mMutex, "CachingProcessor::OnStartFailed");
        others = Close(*inFetch);
        wasWaiting = others.erase(inCaller) > 0;
    }
    HandOut(Answer(std::move(others), boost::make_shared<Response>(Response::kStatusNoResponse), nullptr));
    return !wasWaiting;
}

void CachingProcessor::Completion(const FetchRef& inFetch, const ResponseRef& inResponse) {
    optional<CacheRecord> formerAtURL, formerElsewhere;
    Waiters waiters;
    ResponseRef confirmed;
    Guid networkID;
    bool isRepeated = false;
    {
        ScopedLock lock(mMutex, "CachingProcessor::Completion");
        if (inFetch->isOver) {
            return;
        }
        if (IsNotModified(inResponse) && Confirms(*inResponse, inFetch->held)) {
            confirmed = inFetch->held;
        } else if (IsNotModified(inResponse) && !inFetch->isRepeated) {
            inFetch->isRepeated = isRepeated = true;
            inFetch->held.reset();
            inFetch->networkID = networkID = Guid::CreateUnique();
        } else if (inResponse && inResponse->IsSuccess() && inFetch->responses == mResponses) {
            const bool isFresh = IsFreshAnswer(*inResponse);
            const ImmutableString location = GetHeader(inResponse->headers, kHEADER_LOCATION);
            const bool isElsewhere = !location.empty() && location != inFetch->url;
            if (isElsewhere) {
                formerElsewhere = mResponses->Insert(location, {inResponse, isFresh});
            }
            formerAtURL = mResponses->Insert(inFetch->url, {inResponse, isFresh && !isElsewhere});
        }
        if (!isRepeated) {
            waiters = Close(*inFetch);
        }
    }
    if (isRepeated) {
        FetchAgain(inFetch, networkID, inResponse);
    } else {
        HandOutHere(Answer(std::move(waiters), inResponse, confirmed));
    }
}

void CachingProcessor::FetchAgain(const FetchRef& inFetch, const Guid& inNetworkID,
                                  const ResponseRef& inResponse) {
    if (Send(inFetch, inNetworkID, inFetch->headers)) {
        return;
    }
    Waiters waiters;
    {
        ScopedLock lock(mMutex, "CachingProcessor::FetchAgain");
        waiters = Close(*inFetch);
    }
    HandOutHere(Answer(std::move(waiters), inResponse, nullptr));
}

CachingProcessor::Waiters CachingProcessor::Close(Fetch& ioFetch) {
    ioFetch.isOver = true;
    const auto atURL = mFetchByURL.find(ioFetch.url);
    if (atURL != mFetchByURL.end() && atURL->second.get() == &ioFetch) {
        mFetchByURL.erase(atURL);
    }
    for (const auto& [requestID, waiter] : ioFetch.waiters) {
        mFetchByRequest.erase(requestID);
    }
    return std::exchange(ioFetch.waiters, {});
}

/// inConfirmed is the held answer that a 304 spoke of, null for any other response.
CachingProcessor::Deliveries CachingProcessor::Answer(Waiters inWaiters, const ResponseRef& inResponse,
                                                      const ResponseRef& inConfirmed) {
    const ImmutableString tag =
        inConfirmed ? GetHeader(inConfirmed->headers, kHEADER_ETAG) : ImmutableString();
    ResponseRef notModified;
    Deliveries deliveries;
    for (auto& [requestID, waiter] : inWaiters) {
        waiter.delivery->response = inConfirmed ? inConfirmed : inResponse;
        if (inConfirmed && waiter.ifNoneMatch == tag) {
            if (!notModified) {
                notModified = MakeNotModified(*inConfirmed);
            }
            waiter.delivery->response = notModified;
        }
        deliveries.push_back(std::move(waiter.delivery));
    }
    return deliveries;
}

/// On workers, each on its own turn.
void CachingProcessor::HandOut(const Deliveries& inDeliveries) {
    for (const shared_ptr<Delivery>& delivery : inDeliveries) {
        if (!Deliver(delivery)) {
            delivery->completion(delivery->requestID, delivery->response);
        }
    }
}

/// On a worker: one of them needs no other.
void CachingProcessor::HandOutHere(Deliveries inDeliveries) {
    if (inDeliveries.empty()) {
        return;
    }
    const shared_ptr<Delivery> last = std::move(inDeliveries.back());
    inDeliveries.pop_back();
    HandOut(inDeliveries);
    last->completion(last->requestID, last->response);
}

bool CachingProcessor::Deliver(const shared_ptr<Delivery>& inDelivery) {
    return PostFunction([inDelivery] { inDelivery->completion(inDelivery->requestID, inDelivery->response); },
                        0);
}

void CachingProcessor::TryToCancelRequest(const Guid& inRequestID) {
    shared_ptr<Delivery> cancelled;
    optional<Guid> below = inRequestID;
    FetchRef fetch;
    {
        ScopedLock lock(mMutex, "CachingProcessor::TryToCancelRequest");
        const auto found = mFetchByRequest.find(inRequestID);
        if (found != mFetchByRequest.end()) {
            fetch = std::move(found->second);
            mFetchByRequest.erase(found);
            const auto waiter = fetch->waiters.find(inRequestID);
            cancelled = std::move(waiter->second.delivery);
            fetch->waiters.erase(waiter);
            below.reset();
            if (fetch->waiters.empty()) {
                Close(*fetch);
                below = fetch->networkID;
            }
        }
    }
    if (cancelled) {
        cancelled->response = boost::make_shared<Response>(Response::kStatusCancelled);
        if (!Deliver(cancelled)) {
            cancelled->completion(inRequestID, cancelled->response);
        }
    }
    if (below) {
        Next()->TryToCancelRequest(*below);
    }
}

bool CachingProcessor::WaitingForRequest(const Guid& inRequestID, std::uint32_t inTimeoutMilliseconds) {
    Guid below = inRequestID;
    {
        ScopedLock lock(mMutex, "CachingProcessor::WaitingForRequest");
        const auto found = mFetchByRequest.find(inRequestID);
        if (found != mFetchByRequest.end()) {
            below = found->second->networkID;
        }
    }
    return Next()->WaitingForRequest(below, inTimeoutMilliseconds);
}

bool CachingProcessor::CacheLookup(const ImmutableString& inURL, ResponseRef& outResponse, bool& outFresh) {
    shared_ptr<ResponseCache> responses;
    {
        ScopedLock lock(mMutex, "CachingProcessor::CacheLookup");
        responses = mResponses;
    }
    const optional<CacheRecord> record = responses->Lookup(inURL);
    if (record) {
        outResponse = record->response;
        outFresh = record->fresh;
    }
    return record.has_value();
}

bool CachingProcessor::IsFresh(const ImmutableString& inURL) {
    ResponseRef response;
    bool isFresh = false;
    return CacheLookup(inURL, response, isFresh) && isFresh;
}

void CachingProcessor::Purge() {
    shared_ptr<ResponseCache> former = MakeCache();
    {
        ScopedLock lock(mMutex, "CachingProcessor::Purge");
        former.swap(mResponses);
        ++mGeneration;
    }
    if (!ostcore::threads::CreateCPUBoundExecutor("cache purge")->Post([former] { former->Clear(); })) {
        former->Clear();
    }
}

CompletionFunction CachingProcessor::EndOfWrite(const CompletionFunction& inCompletion) {
    if (!inCompletion) {
        return inCompletion;
    }
    return [self = shared_from_this(), inCompletion](const Guid& inRequestID, const ResponseRef& inResponse) {
        ++self->mGeneration;
        inCompletion(inRequestID, inResponse);
    };
}

bool CachingProcessor::PUT(const Guid& inRequestID, const CompletionFunction& inCompletion,
                           const ImmutableString& inURL, Headers inHeaders,
                           const shared_ptr<RecycledMemory const>& inPayload,
                           const RequestOptions& inOptions) {
    return Next()->PUT(inRequestID, EndOfWrite(inCompletion), inURL, std::move(inHeaders), inPayload,
                       inOptions);
}

bool CachingProcessor::PUT(const Guid& inRequestID, const CompletionFunction& inCompletion,
                           const ImmutableString& inURL, Headers inHeaders, const Form& inForm,
                           const RequestOptions& inOptions) {
    return Next()->PUT(inRequestID, EndOfWrite(inCompletion), inURL, std::move(inHeaders), inForm, inOptions);
}

bool CachingProcessor::POST(const Guid& inRequestID, const CompletionFunction& inCompletion,
                            const ImmutableString& inURL, Headers inHeaders,
                            const shared_ptr<RecycledMemory const>& inPayload,
                            const RequestOptions& inOptions) {
    return Next()->POST(inRequestID, EndOfWrite(inCompletion), inURL, std::move(inHeaders), inPayload,
                        inOptions);
}

bool CachingProcessor::POST(const Guid& inRequestID, const CompletionFunction& inCompletion,
                            const ImmutableString& inURL, Headers inHeaders, const Form& inForm,
                            const RequestOptions& inOptions) {
    return Next()->POST(inRequestID, EndOfWrite(inCompletion), inURL, std::move(inHeaders), inForm,
                        inOptions);
}

bool CachingProcessor::DELETE(const Guid& inRequestID, const CompletionFunction& inCompletion,
                              const ImmutableString& inURL, Headers inHeaders,
                              const RequestOptions& inOptions) {
    return Next()->DELETE(inRequestID, EndOfWrite(inCompletion), inURL, std::move(inHeaders), inOptions);
}

}  // namespace http
}  // namespace ostnet
