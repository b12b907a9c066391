// What the two throttles share: slots, and the line of requests that wait for one.
#pragma once

#include <list>
#include <unordered_map>

#include "ostcore/threads/RecursiveMutex.h"
#include "RequestChain/PackedRequest.h"

namespace ZOCL {

/// Bounds the requests in flight below it. A request that finds no slot free waits in order of arrival; a
/// slot is handed from a request that ends straight to the first that waits, on the thread of the ending.
///
/// Invariants: mInFlight is at most mLimit; nobody waits unless mInFlight equals mLimit. A request is in
/// mWaiting, or in mStarting (taken out of the line, its start not yet returned), or with the next layer, and
/// in one of these only.
///
/// The race: a cancel can find its request taken out of the line, when the next layer does not know it yet.
/// It leaves a mark in mStarting, and whoever starts the request passes the cancel on afterwards.
///
/// Starts that fail hand the slot on in a loop, so a line of any length can fail without growing the stack. A
/// cancel in the line takes constant time.
///
/// Threads: any. What this layer itself completes (a cancel in the line, a failed start) completes on the
/// workers of the base processor. The mutex is never held over the next layer or a completion.
class ThrottlingProcessor : public ostnet::http::ForwardingProcessor,
                            public boost::enable_shared_from_this<ThrottlingProcessor> {
public:
    using CompletionFunction = ostnet::http::CompletionFunction;
    using RequestOptions = ostnet::http::RequestOptions;
    using Headers = ostnet::Headers;

    void TryToCancelRequest(const Guid& inRequestID) override;

    struct Load {
        std::int32_t inFlight = 0;
        std::size_t waiting = 0;
    };
    /// Both numbers of one moment.
    Load GetLoad() const;
    std::int32_t Limit() const noexcept { return mLimit; }

protected:
    /// How the operations name themselves to the mutex; literals.
    struct Labels {
        const char* makeRequest;
        const char* completed;
        const char* tryToCancel;
    };
    ThrottlingProcessor(shared_ptr<ostnet::http::RequestProcessor> inNext, std::int32_t inLimit,
                        const Labels& inLabels);
    ~ThrottlingProcessor() override;

    bool MakeRequest(const Guid& inRequestID, const CompletionFunction& inCompletion,
                     PackedRequest&& inPacked);

private:
    struct Slot;
    struct QueuedRequest {
        Guid requestID;
        PackedRequest packed;
        CompletionFunction completion;
    };
    using Line = std::list<QueuedRequest>;

    bool Send(const Guid& inRequestID, const CompletionFunction& inCompletion, PackedRequest& ioPacked);
    /// Gives the slot of a request that has ended to the first in the line that can be started.
    void HandSlotOn();
    /// The first in the line, which has the slot from now on; nothing when the slot becomes free instead.
    Line TakeFirst();
    bool StartTaken(QueuedRequest& ioRequest);
    void EndLater(Line&& inEnded);

    const std::int32_t mLimit;
    const Labels mLabels;
    mutable ostcore::threads::RecursiveMutex mMutex;
    std::int32_t mInFlight ZO_GUARDED_BY(mMutex) = 0;
    Line mWaiting ZO_GUARDED_BY(mMutex);
    std::unordered_map<Guid, Line::iterator> mPlaces ZO_GUARDED_BY(mMutex);
    /// Each with whether it was cancelled meanwhile.
    std::unordered_map<Guid, bool> mStarting ZO_GUARDED_BY(mMutex);
};

}  // namespace ZOCL
