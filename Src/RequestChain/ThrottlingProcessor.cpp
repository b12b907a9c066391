// Slots and the line in front of them.
#include "RequestChain/ThrottlingProcessor.h"

namespace ZOCL {

using ostcore::threads::ScopedLock;
using ostnet::Response;

ThrottlingProcessor::ThrottlingProcessor(shared_ptr<ostnet::http::RequestProcessor> inNext,
                                         std::int32_t inLimit, const Labels& inLabels)
    : ForwardingProcessor(std::move(inNext)), mLimit(inLimit), mLabels(inLabels) {}

ThrottlingProcessor::~ThrottlingProcessor() = default;

struct ThrottlingProcessor::Slot {
    shared_ptr<ThrottlingProcessor> layer;
    CompletionFunction completion;
};

bool ThrottlingProcessor::MakeRequest(const Guid& inRequestID, const CompletionFunction& inCompletion,
                                      PackedRequest&& inPacked) {
    {
        ScopedLock lock(mMutex, mLabels.makeRequest);
        if (mInFlight >= mLimit) {
            mWaiting.push_back({inRequestID, std::move(inPacked), inCompletion});
            mPlaces.emplace(inRequestID, std::prev(mWaiting.end()));
            return true;
        }
        ++mInFlight;
    }
    if (Send(inRequestID, inCompletion, inPacked)) {
        return true;
    }
    HandSlotOn();
    return false;
}

bool ThrottlingProcessor::Send(const Guid& inRequestID, const CompletionFunction& inCompletion,
                               PackedRequest& ioPacked) {
    // In one block, since the function is copied from layer to layer.
    const auto slot = boost::make_shared<Slot>(Slot{shared_from_this(), inCompletion});
    return ioPacked.SendOnce(*Next(), inRequestID,
                             [slot](const Guid& inID, const shared_ptr<Response>& inResponse) {
                                 slot->layer->HandSlotOn();
                                 slot->completion(inID, inResponse);
                             });
}

void ThrottlingProcessor::HandSlotOn() {
    Line failed;
    for (Line taken = TakeFirst(); !taken.empty() && !StartTaken(taken.front()); taken = TakeFirst()) {
        failed.splice(failed.begin(), taken);
    }
    EndLater(std::move(failed));
}

ThrottlingProcessor::Line ThrottlingProcessor::TakeFirst() {
    Line taken;
    ScopedLock lock(mMutex, mLabels.completed);
    if (mWaiting.empty()) {
        --mInFlight;
        return taken;
    }
    const auto first = mWaiting.begin();
    const auto place = mPlaces.find(first->requestID);
    if (place != mPlaces.end() && place->second == first) {
        mPlaces.erase(place);
    }
    mStarting.emplace(first->requestID, false);
    taken.splice(taken.begin(), mWaiting, first);
    return taken;
}

bool ThrottlingProcessor::StartTaken(QueuedRequest& ioRequest) {
    const bool started = Send(ioRequest.requestID, ioRequest.completion, ioRequest.packed);
    bool wasCancelled = false;
    {
        ScopedLock lock(mMutex, mLabels.makeRequest);
        const auto found = mStarting.find(ioRequest.requestID);
        if (found != mStarting.end()) {
            wasCancelled = found->second;
            mStarting.erase(found);
        }
    }
    if (started && wasCancelled) {
        Next()->TryToCancelRequest(ioRequest.requestID);
    }
    return started;
}

void ThrottlingProcessor::TryToCancelRequest(const Guid& inRequestID) {
    Line cancelled;
    {
        ScopedLock lock(mMutex, mLabels.tryToCancel);
        const auto place = mPlaces.find(inRequestID);
        if (place != mPlaces.end()) {
            cancelled.splice(cancelled.begin(), mWaiting, place->second);
            mPlaces.erase(place);
        } else if (const auto starting = mStarting.find(inRequestID); starting != mStarting.end()) {
            starting->second = true;
        }
    }
    if (cancelled.empty()) {
        Next()->TryToCancelRequest(inRequestID);
    } else {
        EndLater(std::move(cancelled));
    }
}

ThrottlingProcessor::Load ThrottlingProcessor::GetLoad() const {
    ScopedLock lock(mMutex, mLabels.makeRequest);
    return {mInFlight, mWaiting.size()};
}

void ThrottlingProcessor::EndLater(Line&& inEnded) {
    if (inEnded.empty()) {
        return;
    }
    const auto ended = boost::make_shared<Line>(std::move(inEnded));
    const auto endAll = [ended] {
        for (const QueuedRequest& request : *ended) {
            request.completion(request.requestID, boost::make_shared<Response>(Response::kStatusCancelled));
        }
    };
    if (!PostFunction(endAll, 0)) {
        endAll();
    }
}

}  // namespace ZOCL
