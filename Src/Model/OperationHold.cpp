// Holds on compound operations.
#include "Model/OperationHold.h"

#include "ostcore/threads/Mutex.h"

namespace ZOCL {

using ostcore::threads::Mutex;
using ostcore::threads::MutexLock;

/// The request's completion, taken by whoever ends it first. The cancel may come before the request has
/// started, so the ticket remembers that it has ended.
struct OperationHold::Ticket {
    Mutex mutex;
    bool hasEnded ZO_GUARDED_BY(mutex) = false;
    int endResult ZO_GUARDED_BY(mutex) = kResultSuccess;
    Guid requestID ZO_GUARDED_BY(mutex);
    RequestCompletion completion ZO_GUARDED_BY(mutex);

    void Start(const Guid& inRequestID, const RequestCompletion& inCompletion) {
        int result = kResultSuccess;
        {
            MutexLock lock(mutex);
            if (!hasEnded) {
                requestID = inRequestID;
                completion = inCompletion;
                return;
            }
            result = endResult;
        }
        inCompletion(inRequestID, result, nullptr, nullptr);
    }

    void End(int inResult) {
        RequestCompletion taken;
        Guid id;
        {
            MutexLock lock(mutex);
            if (hasEnded) {
                return;
            }
            hasEnded = true;
            endResult = inResult;
            taken.swap(completion);
            id = requestID;
        }
        if (taken) {
            taken(id, inResult, nullptr, nullptr);
        }
    }
};

shared_ptr<OperationHold> OperationHold::Take(const shared_ptr<CompoundAsyncOperation>& inOperation) {
    const auto hold = make_shared<OperationHold>();
    const auto ticket = make_shared<Ticket>();
    hold->mTicket = ticket;
    inOperation->Initiate(
        [ticket](const Guid& inRequestID, const RequestCompletion& inCompletion) {
            ticket->Start(inRequestID, inCompletion);
            return true;
        },
        nullptr, [ticket](const Guid&) { ticket->End(kResultCancelled); });
    return hold;
}

OperationHold::~OperationHold() {
    Release(kResultSuccess);
}

void OperationHold::Release(int inResult) {
    if (mTicket) {
        mTicket->End(inResult);
    }
}

}  // namespace ZOCL
