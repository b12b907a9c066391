// Puts the login token on every request, and sees a request through the expiry of its token.
#pragma once

#include <unordered_map>
#include <vector>

#include "ostcore/threads/RecursiveMutex.h"
#include "ostnet/http/RequestProcessor.h"
#include "RequestChain/PackedRequest.h"
#include "ZOClient/Types.h"

namespace ZOCL {

/// A request that comes back with status 401 is parked, a new token is asked for once, and when it comes all
/// parked requests are sent again with it.
///
/// The race: many requests are refused with the same token at once, and while a new token is fetched more
/// are refused, some with the old token, some were sent already with the new one. The lock alone does not
/// decide what a late 401 means; so each request remembers the token that it carried. A refused token that
/// is not the current one means that the request merely left too early: it is sent again at once. Only the
/// first refusal of the current token moves the state from kTokenHeld to kTokenAskedFor and asks; all
/// others find the state moved. Hence one question for any number of refusals.
///
/// A cancel can come when a refusal is on its way up from the next layer, or the request on its way down to
/// it, so that nobody below knows the request. So each request stands in mRequests from its start to its end,
/// and a cancel leaves its mark there: a refusal of a marked request ends it, and what was sent again is
/// cancelled below once its start has returned. An ID that is in use is refused: a cancel could reach only
/// one of the two.
///
/// Invariants: a request is in the hands of the next layer, parked, or taken out to be sent again, and in one
/// of these only, so it completes once. The mutex is never held over the next layer, a completion or the
/// notification.
///
/// Threads: any. Completions that this layer itself makes (a cancel, a refusal at the end) run on the workers
/// of the base processor, never on the stack of the operation that caused them.
class AuthorizationProcessor : public ostnet::http::ForwardingProcessor,
                               public boost::enable_shared_from_this<AuthorizationProcessor> {
public:
    using CompletionFunction = ostnet::http::CompletionFunction;
    using RequestOptions = ostnet::http::RequestOptions;
    using Headers = ostnet::Headers;
    using Form = ostnet::http::Form;
    using Payload = shared_ptr<RecycledMemory const>;

    /// How often one request waits for a new token before its 401 goes to the caller: a server that accepts
    /// each login and refuses each token does not keep it for ever.
    static constexpr int kMaximumRenewals = 4;

    AuthorizationProcessor(shared_ptr<ostnet::http::RequestProcessor> inNext,
                           function<void()> inTokenNotification);

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

    virtual void AddAuthorizationHeaders(const ImmutableString& inToken, Headers& ioHeaders);
    virtual bool SendGET(const ImmutableString& inToken, const Guid&, const CompletionFunction&,
                         const ImmutableString&, Headers, const RequestOptions&);
    virtual bool SendHEAD(const ImmutableString& inToken, const Guid&, const CompletionFunction&,
                          const ImmutableString&, Headers, const RequestOptions&);
    virtual bool SendPUT(const ImmutableString& inToken, const Guid&, const CompletionFunction&,
                         const ImmutableString&, Headers, const Payload&, const RequestOptions&);
    virtual bool SendPUT(const ImmutableString& inToken, const Guid&, const CompletionFunction&,
                         const ImmutableString&, Headers, const Form&, const RequestOptions&);
    virtual bool SendPOST(const ImmutableString& inToken, const Guid&, const CompletionFunction&,
                          const ImmutableString&, Headers, const Payload&, const RequestOptions&);
    virtual bool SendPOST(const ImmutableString& inToken, const Guid&, const CompletionFunction&,
                          const ImmutableString&, Headers, const Form&, const RequestOptions&);
    virtual bool SendDELETE(const ImmutableString& inToken, const Guid&, const CompletionFunction&,
                            const ImmutableString&, Headers, const RequestOptions&);

    /// A token sends the parked requests again; the null token, or the one that they were refused with, ends
    /// them with their 401.
    void SetAuthToken(const ImmutableString& inToken);
    void SetAuthTokenNotificationFunction(const function<void()>& inFunction);
    /// From now on nobody is asked for a token; if somebody was, the parked requests end with their 401.
    void ClearAuthTokenNotificationFunction();

private:
    enum class State { kNoToken, kTokenHeld, kTokenAskedFor };
    /// Sent with a token as often as needed, once at a time.
    struct Request {
        PackedRequest packed;
        CompletionFunction completion;
        Guid requestID;
        int renewals = 0;  // guarded by the mutex of the layer
    };
    using RequestRef = shared_ptr<Request>;
    struct Flight;
    struct ParkedRequest {
        RequestRef request;
        ImmutableString token;
        shared_ptr<ostnet::Response> response;
    };
    struct Ending {
        CompletionFunction completion;
        Guid requestID;
        shared_ptr<ostnet::Response> response;
    };

    bool MakeRequest(const Guid& inRequestID, PackedRequest&& inPacked,
                     const CompletionFunction& inCompletion);
    bool SendWithToken(const RequestRef& inRequest, const ImmutableString& inToken);
    bool SendPacked(const Request& inRequest, const ImmutableString& inToken,
                    const CompletionFunction& inCompletion);
    void OnCompleted(const RequestRef& inRequest, const ImmutableString& inUsedToken, const Guid& inRequestID,
                     const shared_ptr<ostnet::Response>& inResponse);
    /// Sends a request that was taken out again; cancels that came meanwhile are honoured.
    void SendAgain(const ParkedRequest& inParked, const ImmutableString& inToken);
    bool IsCancelled(const Guid& inRequestID) const;
    void Forget(const Guid& inRequestID);
    void EndLater(std::vector<Ending> inEndings);
    void EndWithRefusal(const ParkedRequest& inParked);
    void EndCancelled(const Request& inRequest);

    mutable ostcore::threads::RecursiveMutex mMutex;
    State mState ZO_GUARDED_BY(mMutex) = State::kNoToken;
    std::vector<ParkedRequest> mParked ZO_GUARDED_BY(mMutex);
    /// From the start of each request to its end, with whether it was cancelled.
    std::unordered_map<Guid, bool> mRequests ZO_GUARDED_BY(mMutex);
    ImmutableString mToken ZO_GUARDED_BY(mMutex);
    function<void()> mTokenNotification ZO_GUARDED_BY(mMutex);
};

}  // namespace ZOCL
