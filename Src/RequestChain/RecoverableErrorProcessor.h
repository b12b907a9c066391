// The layer next to the network: sends again what failed for a reason that may pass, and tells when the
// network looks down.
#pragma once

#include <atomic>
#include <unordered_map>

#include "ostcore/threads/RecursiveMutex.h"
#include "ostnet/http/RequestProcessor.h"
#include "ZOClient/Types.h"

namespace ZOCL {

struct PackedRequest;

/// A request that fails with a 5xx or for want of a connection is sent again after 4 milliseconds, and after
/// twice as long each time that it fails again. From the 15th failure in a row of all requests on, none gives
/// up: they are sent again every 512 milliseconds until the network is back or retries are turned off. The
/// caller sees no failure.
///
/// What a server says in `Retry-After` is not read: the delays are bounded, and so is, by the throttles
/// above, the number of requests that wait for them. No server can make the client wait for years or hurry.
///
/// The race: a cancel finds its request at the network, waiting for its delay, or between the two, where
/// neither the network nor a table of the waiting knows it. So each request is in the table from its first
/// start to its end, with two marks. Under the mutex, whoever takes away "waiting" (its time has come, or the
/// cancel) owns the request; and "cancelled", once set, is looked at after each start and before each wait.
/// Hence a cancel is never lost, a cancelled request is never sent again after a failure, and it completes
/// once.
///
/// A retry is posted, so the stack does not grow with the number of retries.
///
/// Threads: any. Completions run on the workers of the base processor; the mutex is never held over the next
/// layer, a completion or the status function.
class RecoverableErrorProcessor : public ostnet::http::ForwardingProcessor,
                                  public boost::enable_shared_from_this<RecoverableErrorProcessor> {
public:
    using CompletionFunction = ostnet::http::CompletionFunction;
    using RequestOptions = ostnet::http::RequestOptions;
    using Headers = ostnet::Headers;
    using Form = ostnet::http::Form;
    using Payload = shared_ptr<RecycledMemory const>;

    /// The retries that a new request may use.
    static constexpr std::int32_t kRetries = 14;

    /// The function is told true when the network looks down and false when it is back, on a CPU-bound
    /// executor, at most every 500 milliseconds. It can be empty.
    RecoverableErrorProcessor(shared_ptr<ostnet::http::RequestProcessor> inNext,
                              const function<void(bool)>& inStatusFunction);
    ~RecoverableErrorProcessor() override;

    void TryToCancelRequest(const Guid& inRequestID) override;
    bool GET(const Guid&, const CompletionFunction&, const ImmutableString&, Headers,
             const RequestOptions&) override;
    bool HEAD(const Guid&, const CompletionFunction&, const ImmutableString&, Headers,
              const RequestOptions&) override;
    bool PUT(const Guid&, const CompletionFunction&, const ImmutableString&, Headers, const Payload&,
             const RequestOptions&) override;
    bool PUT(const Guid&, const CompletionFunction&, const ImmutableString&, Headers, const Form&,
             const RequestOptions&) override;
    bool POST(const Guid&, const CompletionFunction&, const ImmutableString&, Headers, const Payload&,
              const RequestOptions&) override;
    bool POST(const Guid&, const CompletionFunction&, const ImmutableString&, Headers, const Form&,
              const RequestOptions&) override;
    bool DELETE(const Guid&, const CompletionFunction&, const ImmutableString&, Headers,
                const RequestOptions&) override;

    /// Off from the start; a login that was accepted turns it on. Off: each request ends with its next
    /// failure, also those that wait for their delay now, and the count of failures begins anew.
    virtual void SetRetriesEnabled(bool inEnabled);
    virtual bool IsRecoverableError(const shared_ptr<ostnet::Response>& inResponse) const;

private:
    struct Request;
    class NetworkState;

    bool MakeRequest(const Guid& inRequestID, PackedRequest&& inPacked,
                     const CompletionFunction& inCompletion);
    bool Send(const shared_ptr<Request>& inRequest);
    void OnCompleted(const shared_ptr<Request>& inRequest, const shared_ptr<ostnet::Response>& inResponse);
    void WaitAndRetry(const shared_ptr<Request>& inRequest);
    void Retry(const shared_ptr<Request>& inRequest);
    /// True for the one who may go on with a request that waits.
    bool TakeWaiting(Request& ioRequest);
    /// Whether the request gives up; raises its retries when it must not.
    bool ReportError(std::int32_t& ioRetriesLeft);
    void ReportSuccess();
    /// Completes the request on another worker.
    void End(const shared_ptr<Request>& inRequest);
    static void Complete(Request& ioRequest);
    void Forget(const Request& inRequest);

    const shared_ptr<NetworkState> mState;
    std::atomic<std::int32_t> mRetriesDisabled{1};
    mutable ostcore::threads::RecursiveMutex mMutex;
    /// From the first start to the end. Weak: a base processor that drops a posted function at its shutdown
    /// must not leave a circle behind.
    std::unordered_map<Guid, boost::weak_ptr<Request>> mRequests ZO_GUARDED_BY(mMutex);
};

}  // namespace ZOCL
