// Keeps the answers to reads for a while, asks whether they still hold, and makes one request of many that
// ask for the same at once.
#pragma once

#include <atomic>
#include <map>

#include "ostcore/threads/RecursiveMutex.h"
#include "ostnet/http/ExpiringEntryMap.h"
#include "ostnet/http/RequestProcessor.h"

namespace ostnet {
namespace http {

/// The cache of one server's documents, by URL.
///
/// A GET of a URL whose answer is held and fresh is answered from memory. Any other becomes a fetch: one
/// request under an ID of this layer's own, which the GETs of the same URL join that come while it is out;
/// their headers and options do not count. It carries the ETag of the answer that is held, and not the
/// caller's. Each caller gets what it would have got alone: the held answer after a 304, or the 304 itself
/// (with the held headers and payload) when the tag that it sent is the one that the server confirmed.
///
/// Fresh is what came with a Cache-Control other than exactly "no-cache". A HEAD is a GET.
///
/// What is stricter or kinder than that:
///  - A read that wants its payload as it was sent (decompressPayload false) passes by: the cache holds
///    inflated payloads, and large immutable ones have a cache of their own.
///  - A read never joins a fetch that went out before a write of this server ended, so that whoever has been
///    told that a write succeeded does not read what was there before it.
///  - A 304 that confirms nothing that is held (another tag, or none was sent) is followed by one fetch
///    without a condition, for all who wait.
///
/// The race: a fetch is sent outside the lock, so it can be joined, cancelled by its last caller, or answered
/// before its start call returns. Whoever takes a caller out of mFetchByRequest, under the lock, completes
/// that caller; whoever finds the last one gone ends the fetch (Fetch::isOver). When the start fails, only
/// the caller on whose stack that happens is told so by false, if it still waits; all others are completed. A
/// cancel that came before the request was known below is repeated once the start has returned.
///
/// Threads: any. The mutex is held neither over the next layer nor over a completion; completions run through
/// PostFunction.
class ZOPLATFORM_EXPORT CachingProcessor : public ForwardingProcessor,
                                           public enable_shared_from_this<CachingProcessor> {
public:
    explicit CachingProcessor(shared_ptr<RequestProcessor> inNext);
    ~CachingProcessor() override;

    void TryToCancelRequest(const Guid& inRequestID) override;
    bool GET(const Guid&, const CompletionFunction&, const ImmutableString&, Headers,
             const RequestOptions&) override;
    bool HEAD(const Guid&, const CompletionFunction&, const ImmutableString&, Headers,
              const RequestOptions&) override;
    bool PUT(const Guid&, const CompletionFunction&, const ImmutableString&, Headers,
             const shared_ptr<RecycledMemory const>&, const RequestOptions&) override;
    bool PUT(const Guid&, const CompletionFunction&, const ImmutableString&, Headers, const Form&,
             const RequestOptions&) override;
    bool POST(const Guid&, const CompletionFunction&, const ImmutableString&, Headers,
              const shared_ptr<RecycledMemory const>&, const RequestOptions&) override;
    bool POST(const Guid&, const CompletionFunction&, const ImmutableString&, Headers, const Form&,
              const RequestOptions&) override;
    bool DELETE(const Guid&, const CompletionFunction&, const ImmutableString&, Headers,
                const RequestOptions&) override;
    bool WaitingForRequest(const Guid& inRequestID, std::uint32_t inTimeoutMilliseconds) override;

    /// True when a GET of the URL would be answered from memory.
    virtual bool IsFresh(const ImmutableString& inURL);
    /// Forgets all answers, those of fetches that are out included. They are released on another thread.
    virtual void Purge();

private:
    using ResponseRef = shared_ptr<Response>;
    struct CacheRecord {
        ResponseRef response;
        bool fresh = false;
    };
    using ResponseCache = ExpiringEntryMap<ImmutableString, CacheRecord>;
    /// One call of one completion.
    struct Delivery {
        CompletionFunction completion;
        Guid requestID;
        ResponseRef response;
    };
    struct Waiter {
        shared_ptr<Delivery> delivery;
        ImmutableString ifNoneMatch;
    };
    using Waiters = std::map<Guid, Waiter>;
    using Deliveries = std::vector<shared_ptr<Delivery>>;
    struct Fetch;
    using FetchRef = shared_ptr<Fetch>;

    static shared_ptr<ResponseCache> MakeCache();
    bool CacheLookup(const ImmutableString& inURL, ResponseRef& outResponse, bool& outFresh);
    bool Send(const FetchRef& inFetch, const Guid& inNetworkID, Headers inHeaders);
    bool OnStartFailed(const FetchRef& inFetch, const Guid& inCaller);
    void Completion(const FetchRef& inFetch, const ResponseRef& inResponse);
    void FetchAgain(const FetchRef& inFetch, const Guid& inNetworkID, const ResponseRef& inResponse);
    Waiters Close(Fetch& ioFetch) ZO_REQUIRES(mMutex);
    static Deliveries Answer(Waiters inWaiters, const ResponseRef& inResponse,
                             const ResponseRef& inConfirmed);
    void HandOut(const Deliveries& inDeliveries);
    void HandOutHere(Deliveries inDeliveries);
    bool Deliver(const shared_ptr<Delivery>& inDelivery);
    CompletionFunction EndOfWrite(const CompletionFunction& inCompletion);

    mutable ostcore::threads::RecursiveMutex mMutex;
    shared_ptr<ResponseCache> mResponses ZO_GUARDED_BY(mMutex);
    /// The fetch of each URL that can be joined, unless it is of a former generation.
    std::map<ImmutableString, FetchRef> mFetchByURL ZO_GUARDED_BY(mMutex);
    /// Whom each caller waits for. A caller stands here exactly as long as its completion is owed.
    std::map<Guid, FetchRef> mFetchByRequest ZO_GUARDED_BY(mMutex);
    /// Counts the writes that have ended, and the purges.
    std::atomic<std::uint64_t> mGeneration{0};
};

}  // namespace http
}  // namespace ostnet
