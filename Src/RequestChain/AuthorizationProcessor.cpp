// Parking, renewal and replay; the verbs stand in AuthorizationVerbs.cpp.
#include "RequestChain/AuthorizationProcessor.h"

namespace ZOCL {

using ostcore::threads::ScopedLock;
using ostnet::Response;

namespace {

constexpr std::int32_t kStatusUnauthorized = 401;

}  // namespace

AuthorizationProcessor::AuthorizationProcessor(shared_ptr<ostnet::http::RequestProcessor> inNext,
                                               function<void()> inTokenNotification)
    : ForwardingProcessor(std::move(inNext)), mTokenNotification(std::move(inTokenNotification)) {}

/// What a completion needs, in one block: the function that holds it is copied from layer to layer.
struct AuthorizationProcessor::Flight {
    shared_ptr<AuthorizationProcessor> layer;
    RequestRef request;
    ImmutableString token;
};

bool AuthorizationProcessor::MakeRequest(const Guid& inRequestID, PackedRequest&& inPacked,
                                         const CompletionFunction& inCompletion) {
    ImmutableString token;
    {
        ScopedLock lock(mMutex, "AuthorizationProcessor::MakeRequest");
        token = mToken;
        if (!mRequests.emplace(inRequestID, false).second) {
            return false;  // the ID is in use, if only by a request that waits for a token
        }
    }
    const auto request = boost::make_shared<Request>(Request{std::move(inPacked), inCompletion, inRequestID});
    if (!SendWithToken(request, token)) {
        Forget(inRequestID);
        return false;
    }
    // A cancel that came while the next layer did not know the request has found nothing there.
    if (IsCancelled(inRequestID)) {
        Next()->TryToCancelRequest(inRequestID);
    }
    return true;
}

bool AuthorizationProcessor::SendWithToken(const RequestRef& inRequest, const ImmutableString& inToken) {
    const auto flight = boost::make_shared<Flight>(Flight{shared_from_this(), inRequest, inToken});
    return SendPacked(*inRequest, inToken,
                      [flight](const Guid& inID, const shared_ptr<Response>& inResponse) {
                          flight->layer->OnCompleted(flight->request, flight->token, inID, inResponse);
                      });
}

void AuthorizationProcessor::OnCompleted(const RequestRef& inRequest, const ImmutableString& inUsedToken,
                                         const Guid& inRequestID, const shared_ptr<Response>& inResponse) {
    if (!inResponse || inResponse->status != kStatusUnauthorized) {
        Forget(inRequest->requestID);
        inRequest->completion(inRequestID, inResponse);
        return;
    }
    enum class Verdict { kGiveBack, kCancelled, kSendAgain, kParked } verdict = Verdict::kParked;
    ImmutableString current;
    function<void()> notification;
    {
        ScopedLock lock(mMutex, "AuthorizationProcessor::CompletionFunction");
        current = mToken;
        const auto found = mRequests.find(inRequest->requestID);
        if (found != mRequests.end() && found->second) {
            verdict = Verdict::kCancelled;
        } else if (mToken.IsNull() || !mTokenNotification || inRequest->renewals >= kMaximumRenewals) {
            verdict = Verdict::kGiveBack;
        } else if (inUsedToken != mToken) {
            verdict = Verdict::kSendAgain;
        } else {
            if (mState == State::kTokenHeld) {
                notification = mTokenNotification;
            }
            mState = State::kTokenAskedFor;
            mParked.push_back({inRequest, inUsedToken, inResponse});
            ++inRequest->renewals;
        }
    }
    switch (verdict) {
        case Verdict::kGiveBack:
            Forget(inRequest->requestID);
            inRequest->completion(inRequestID, inResponse);
            break;
        case Verdict::kCancelled:
            EndCancelled(*inRequest);
            break;
        case Verdict::kSendAgain:
            SendAgain({inRequest, inUsedToken, inResponse}, current);
            break;
        case Verdict::kParked:
            if (notification) {
                notification();
            }
            break;
    }
}

void AuthorizationProcessor::SetAuthToken(const ImmutableString& inToken) {
    std::vector<ParkedRequest> parked;
    {
        ScopedLock lock(mMutex, "AuthorizationProcessor::SetAuthTokenNotificationFunction");
        parked.swap(mParked);
        mState = inToken.IsNull() ? State::kNoToken : State::kTokenHeld;
        mToken = inToken;
    }
    std::vector<Ending> endings;
    for (const ParkedRequest& entry : parked) {
        if (!inToken.IsNull() && inToken != entry.token) {
            SendAgain(entry, inToken);
        } else if (IsCancelled(entry.request->requestID)) {
            EndCancelled(*entry.request);
        } else {
            Forget(entry.request->requestID);
            endings.push_back({entry.request->completion, entry.request->requestID, entry.response});
        }
    }
    EndLater(std::move(endings));
}

void AuthorizationProcessor::SetAuthTokenNotificationFunction(const function<void()>& inFunction) {
    function<void()> former = inFunction;
    ScopedLock lock(mMutex, "AuthorizationProcessor::SetAuthTokenNotificationFunction");
    former.swap(mTokenNotification);
    lock.Unlock();
}

void AuthorizationProcessor::ClearAuthTokenNotificationFunction() {
    function<void()> former;
    bool wasAskedFor = false;
    {
        ScopedLock lock(mMutex, "AuthorizationProcessor::ClearAuthTokenNotificationFunction");
        former.swap(mTokenNotification);
        wasAskedFor = mState == State::kTokenAskedFor;
    }
    if (wasAskedFor) {
        SetAuthToken(ImmutableString());
    }
}

void AuthorizationProcessor::TryToCancelRequest(const Guid& inRequestID) {
    optional<ParkedRequest> parked;
    {
        ScopedLock lock(mMutex, "AuthorizationProcessor::TryToCancelRequest");
        const auto request = mRequests.find(inRequestID);
        if (request != mRequests.end()) {
            request->second = true;
        }
        const auto found = std::find_if(mParked.begin(), mParked.end(), [&](const ParkedRequest& inParked) {
            return inParked.request->requestID == inRequestID;
        });
        if (found != mParked.end()) {
            parked = std::move(*found);
            mParked.erase(found);
        }
    }
    if (parked) {
        EndCancelled(*parked->request);
    } else {
        Next()->TryToCancelRequest(inRequestID);
    }
}

void AuthorizationProcessor::SendAgain(const ParkedRequest& inParked, const ImmutableString& inToken) {
    const Guid& requestID = inParked.request->requestID;
    if (IsCancelled(requestID)) {
        EndCancelled(*inParked.request);
    } else if (!SendWithToken(inParked.request, inToken)) {
        if (IsCancelled(requestID)) {
            EndCancelled(*inParked.request);
        } else {
            EndWithRefusal(inParked);
        }
    } else if (IsCancelled(requestID)) {
        Next()->TryToCancelRequest(requestID);
    }
}

bool AuthorizationProcessor::IsCancelled(const Guid& inRequestID) const {
    ScopedLock lock(mMutex, "AuthorizationProcessor::IsCancelled");
    const auto found = mRequests.find(inRequestID);
    return found != mRequests.end() && found->second;
}

void AuthorizationProcessor::Forget(const Guid& inRequestID) {
    ScopedLock lock(mMutex, "AuthorizationProcessor::Forget");
    mRequests.erase(inRequestID);
}

void AuthorizationProcessor::EndLater(std::vector<Ending> inEndings) {
    if (inEndings.empty()) {
        return;
    }
    const auto endAll = [endings = std::move(inEndings)] {
        for (const Ending& ending : endings) {
            ending.completion(ending.requestID, ending.response);
        }
    };
    if (!PostFunction(endAll, 0)) {
        endAll();
    }
}

void AuthorizationProcessor::EndWithRefusal(const ParkedRequest& inParked) {
    Forget(inParked.request->requestID);
    EndLater({Ending{inParked.request->completion, inParked.request->requestID, inParked.response}});
}

void AuthorizationProcessor::EndCancelled(const Request& inRequest) {
    Forget(inRequest.requestID);
    EndLater({Ending{inRequest.completion, inRequest.requestID,
                     boost::make_shared<Response>(Response::kStatusCancelled)}});
}

}  // namespace ZOCL
