// The bookkeeping of compound operations. All of it is under the lock of the connection layer; every function
// of the user is called after that lock was let go.
#include "ZOClient/CompoundAsyncOperation.h"

#include "ostcore/debug/Assert.h"
#include "ostcore/debug/Trace.h"
#include "Resources/JoinText.h"

namespace ZOCL {

using ostcore::debug::kTraceLevel_Lifetime;
using ostcore::debug::kTraceLevel_LifetimeDetail;
using ostcore::threads::ScopedLock;

namespace {

template <class... Pieces>
void TraceOperation(int inLevel, const Pieces&... inPieces) {
    static ostcore::debug::TraceChannel channel("ZO.CompoundAsyncOperation");
    if (channel.IsEnabled(inLevel)) {
        ostcore::debug::Trace(channel, inLevel, JoinText(inPieces...));
    }
}

void AssertKnown(bool inKnown) {
    ZO_ASSERT_ONCE(inKnown, "it != mRequestIDs.end() || inRequestID == mRequestID",
                   "A request ended that the operation does not know.");
}

}  // namespace

CompoundAsyncOperation::CompoundAsyncOperation(const FinalCompletion& inFinalCompletion,
                                               const InterfaceRef<IZOCDataServer>& inServer, bool inSerial)
    : mFinalCompletion(inFinalCompletion),
      mRequestID(Guid::CreateUnique()),
      mServer(inServer ? inServer : IZOCDataServer::GetLoggedInServerRef()),
      mSerial(inSerial) {}

CompoundAsyncOperation::~CompoundAsyncOperation() = default;

shared_ptr<CompoundAsyncOperation> CompoundAsyncOperation::Create(
    const FinalCompletion& inFinalCompletion, const InterfaceRef<IZOCDataServer>& inServer, bool inSerial) {
    return shared_ptr<CompoundAsyncOperation>(
        new CompoundAsyncOperation(inFinalCompletion, inServer, inSerial));
}

RequestCompletion CompoundAsyncOperation::MakeRequestCompletion(bool inForgiveNotModified) {
    const shared_ptr<CompoundAsyncOperation> self = shared_from_this();
    return [self, inForgiveNotModified](const Guid& inRequestID, int inResult,
                                        const InterfaceRef<IZOCServerResource>& inResource,
                                        const shared_ptr<ostnet::Response>& inResponse) {
        self->Completion(inRequestID, inResult, inResource, inResponse, inForgiveNotModified);
    };
}

void CompoundAsyncOperation::InitiateUniform(const WorkFunction& inWork,
                                             const IntermediateCompletion& inIntermediate,
                                             const TryToCancelFunction& inTryToCancel,
                                             bool inForgiveNotModified) {
    const RequestCompletion completion = MakeRequestCompletion(inForgiveNotModified);
    Registered registered;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "CompoundAsyncOperation::Initiate");
        registered = RegisterLocked(inWork, completion, Request(inTryToCancel, inIntermediate));
    }
    Start(registered, inWork, completion);
}

CompoundAsyncOperation::Registered CompoundAsyncOperation::RegisterLocked(
    const WorkFunction& inWork, const RequestCompletion& inCompletion, const Request& inRequest) {
    Registered registered;
    registered.requestID = Guid::CreateUnique();
    registered.result = mResult;
    mRequestIDs.emplace(registered.requestID, inRequest);
    if (mResult < 0 || !mSerial) {
        return registered;
    }
    if (mCurrentSerialRequest.IsNull()) {
        mCurrentSerialRequest = registered.requestID;
        return registered;
    }
    const Guid requestID = registered.requestID;
    mQueuedWork.emplace_back([inWork, requestID, inCompletion] { return inWork(requestID, inCompletion); },
                             requestID);
    registered.queued = true;
    return registered;
}

void CompoundAsyncOperation::Start(const Registered& inRegistered, const WorkFunction& inWork,
                                   const RequestCompletion& inCompletion) {
    if (inRegistered.queued) {
        return;
    }
    TraceOperation(kTraceLevel_Lifetime, "Initiate(): requestID == ", inRegistered.requestID,
                   ", mRequestID == ", mRequestID, ", currentResult == ", inRegistered.result);
    int result = inRegistered.result;
    if (result >= 0 && !inWork(inRegistered.requestID, inCompletion)) {
        result = kResultNotStarted;
    }
    if (result < 0) {
        Completion(inRegistered.requestID, result, nullptr, nullptr, false);
    }
}

bool CompoundAsyncOperation::TakeNextSerialLocked(const Guid& inRequestID, QueuedWork& outNext) {
    if (!mSerial || inRequestID != mCurrentSerialRequest) {
        return false;
    }
    mCurrentSerialRequest = Guid();
    if (mQueuedWork.empty()) {
        return false;
    }
    outNext = std::move(mQueuedWork.front());
    mQueuedWork.pop_front();
    mCurrentSerialRequest = outNext.second;
    return true;
}

bool CompoundAsyncOperation::IsKnownLocked(const Guid& inRequestID) const {
    return inRequestID == mRequestID || mRequestIDs.count(inRequestID) != 0;
}

void CompoundAsyncOperation::Completion(const Guid& inRequestID, int inResult,
                                        const InterfaceRef<IZOCServerResource>& inResource,
                                        const shared_ptr<ostnet::Response>& inResponse,
                                        bool inForgiveNotModified) {
    int result = inForgiveNotModified && inResult == kResultHTTPNotModified ? kResultSuccess : inResult;
    IntermediateCompletion intermediate;
    QueuedWork next;
    bool hasNext = false;
    bool known = false;
    int operationResult = kResultSuccess;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "CompoundAsyncOperation::Completion");
        hasNext = TakeNextSerialLocked(inRequestID, next);
        known = IsKnownLocked(inRequestID);
        operationResult = mResult;
        const auto found = mRequestIDs.find(inRequestID);
        if (found != mRequestIDs.end()) {
            intermediate = found->second.second;
        }
    }
    AssertKnown(known);
    const bool nextRefused = hasNext && !next.first();
    TraceOperation(kTraceLevel_Lifetime, "Completion(): inRequestID == ", inRequestID,
                   ", mRequestID == ", mRequestID, ", inResult == ", result,
                   ", mResult == ", operationResult);
    if (intermediate) {
        TraceOperation(kTraceLevel_LifetimeDetail, "Completion(): inRequestID == ", inRequestID,
                       ", mRequestID == ", mRequestID, ", calling intermediate completion function");
        result = intermediate(result, inResource, inResponse);
    }
    SetResult(result);
    Retire(inRequestID);
    if (nextRefused) {
        Completion(next.second, kResultNotStarted, nullptr, nullptr, false);
    }
}

void CompoundAsyncOperation::Retire(const Guid& inRequestID) {
    FinalCompletion final;
    Request retired;
    bool known = false;
    bool ended = false;
    std::size_t pending = 0;
    Guid firstPending;
    int result = kResultSuccess;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "CompoundAsyncOperation::Completion");
        known = IsKnownLocked(inRequestID);
        const auto found = mRequestIDs.find(inRequestID);
        const bool erased = found != mRequestIDs.end();
        if (erased) {
            // Destroyed after the lock is gone: what a user function holds may run code of its own.
            retired = std::move(found->second);
            mRequestIDs.erase(found);
        }
        pending = mRequestIDs.size();
        ended = erased && pending == 0;
        if (ended) {
            final.swap(mFinalCompletion);
            mEndedUnseen = !final;
        } else if (pending != 0) {
            firstPending = mRequestIDs.begin()->first;
        }
        result = mResult;
    }
    AssertKnown(known);
    if (pending != 0) {
        TraceOperation(kTraceLevel_LifetimeDetail, "Completion(): ", pending,
                       " requests still pending for request mRequest == ", mRequestID, ", including ",
                       firstPending);
    }
    if (ended) {
        TraceOperation(kTraceLevel_Lifetime, "Completion(): inRequestID == ", inRequestID,
                       ", mRequestID == ", mRequestID,
                       final ? ", calling final completion function"
                             : ", operation complete with no completion function");
        if (final) {
            DeliverFinal(final, result);
        }
    }
}

void CompoundAsyncOperation::DeliverFinal(const FinalCompletion& inFinal, int inResult) {
    InterfaceRef<IZOCDataServer> server;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "CompoundAsyncOperation::Completion");
        server = mServer;
    }
    const bool posted = server && server->PostFunction([inFinal, inResult] { inFinal(inResult); }, 0);
    ZO_ASSERT_ONCE(posted, "posted", "Failed to call completion asynchronously.");
    if (!posted) {
        inFinal(inResult);
    }
}

void CompoundAsyncOperation::SetResult(int inResult) {
    std::map<Guid, Request> requests;
    std::deque<QueuedWork> queued;
    InterfaceRef<IZOCDataServer> server;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "CompoundAsyncOperation::SetResult");
        if (mResult < 0 || inResult >= 0) {
            return;
        }
        mResult = inResult;
        requests = mRequestIDs;
        server = mServer;
        queued.swap(mQueuedWork);
    }
    Completion(mRequestID, inResult, nullptr, nullptr, false);
    CancelRequests(requests, server, inResult);
    for (const QueuedWork& waiting : queued) {
        Completion(waiting.second, inResult, nullptr, nullptr, false);
    }
}

void CompoundAsyncOperation::CancelRequests(const std::map<Guid, Request>& inRequests,
                                            const InterfaceRef<IZOCDataServer>& inServer, int inResult) {
    for (const auto& [requestID, request] : inRequests) {
        if (request.first) {
            TraceOperation(kTraceLevel_LifetimeDetail, "SetResult(): mRequestID == ", mRequestID,
                           ", calling custom cancel for request ", requestID, ", inResult == ", inResult);
            request.first(requestID);
        } else if (inServer) {
            TraceOperation(kTraceLevel_LifetimeDetail, "SetResult(): mRequestID == ", mRequestID,
                           ", asking dataserver to cancel request ", requestID, ", inResult == ", inResult);
            inServer->TryToCancelRequest(requestID);
        }
    }
}

void CompoundAsyncOperation::TryToCancel() {
    TraceOperation(kTraceLevel_Lifetime, "TryToCancel(): mRequestID == ", mRequestID);
    SetResult(kResultCancelled);
}

void CompoundAsyncOperation::SetTryToCancelFunction(const Guid& inRequestID,
                                                    const TryToCancelFunction& inFunction) {
    TryToCancelFunction replaced = inFunction;
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::CompoundAsyncOperation::SetTryToCancelFunction");
    const auto found = mRequestIDs.find(inRequestID);
    if (found != mRequestIDs.end()) {
        found->second.first.swap(replaced);
    }
}

function<int()> CompoundAsyncOperation::RetrieveWorkFunction(const Guid& inRequestID) {
    function<int()> work;
    ScopedLock lock(IZOCDataServer::GetLock(), "CompoundAsyncOperation::RetrieveWorkFunction");
    const auto found = mWorkFunctions.find(inRequestID);
    if (found != mWorkFunctions.end()) {
        work.swap(found->second);
        mWorkFunctions.erase(found);
    }
    return work;
}

bool CompoundAsyncOperation::CallAsynchronously(const shared_ptr<ostcore::threads::Executor>& inExecutor,
                                                const function<int()>& inWork, bool inCancelable) {
    const shared_ptr<CompoundAsyncOperation> self = shared_from_this();
    const Guid requestID = Guid::CreateUnique();
    const auto runner = [self, requestID] {
        if (const function<int()> work = self->RetrieveWorkFunction(requestID)) {
            self->Completion(requestID, work(), nullptr, nullptr, false);
        }
    };
    TryToCancelFunction tryToCancel;
    if (inCancelable) {
        tryToCancel = [self](const Guid& inCancelled) {
            if (self->RetrieveWorkFunction(inCancelled)) {
                self->Completion(inCancelled, kResultCancelled, nullptr, nullptr, false);
            }
        };
    }
    int result = kResultSuccess;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "CompoundAsyncOperation::CallAsynchronously");
        result = mResult;
        mRequestIDs.emplace(requestID, Request(tryToCancel, IntermediateCompletion()));
        if (result >= 0) {
            mWorkFunctions.emplace(requestID, inWork);
        }
    }
    if (result < 0) {
        Completion(requestID, result, nullptr, nullptr, false);
        return false;
    }
    if (inExecutor->Post(runner)) {
        return true;
    }
    if (RetrieveWorkFunction(requestID)) {
        Completion(requestID, kResultNotStarted, nullptr, nullptr, false);
    }
    return false;
}

void CompoundAsyncOperation::CreateSubOperationUniform(shared_ptr<CompoundAsyncOperation>& outSubOperation,
                                                       const IntermediateCompletion& inIntermediate,
                                                       bool inSerial) {
    outSubOperation.reset();
    const RequestCompletion completion = MakeRequestCompletion(false);
    shared_ptr<CompoundAsyncOperation> sub;
    WorkFunction work;
    Registered registered;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "CompoundAsyncOperation::CreateSubOperation");
        if (mResult < 0) {
            return;
        }
        sub = Create(FinalCompletion(), mServer, inSerial);
        work = [sub](const Guid& inRequestID, const RequestCompletion& inCompletion) {
            return sub->SubOperationInitiateHelper(inRequestID, inCompletion);
        };
        // Known to the parent in the same breath as its result was read: from here on a failure of the parent
        // reaches the child, so that no child runs that nobody waits for.
        registered = RegisterLocked(work, completion,
                                    Request([sub](const Guid&) { sub->TryToCancel(); }, inIntermediate));
    }
    outSubOperation = sub;
    Start(registered, work, completion);
}

bool CompoundAsyncOperation::SubOperationInitiateHelper(const Guid& inRequestID,
                                                        const RequestCompletion& inCompletion) {
    TraceOperation(kTraceLevel_Lifetime, "SubOperationInitiateHelper(): inRequestID == ", inRequestID,
                   inCompletion ? "" : ", No completion function");
    FinalCompletion final;
    if (inCompletion) {
        final = [inCompletion, inRequestID](int inResult) {
            inCompletion(inRequestID, inResult, nullptr, nullptr);
        };
    }
    int result = kResultSuccess;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "CompoundAsyncOperation::SubOperationInitiateHelper");
        if (!mEndedUnseen || !mRequestIDs.empty()) {
            mFinalCompletion.swap(final);
            return true;
        }
        mEndedUnseen = false;
        result = mResult;
    }
    if (final) {
        DeliverFinal(final, result);
    }
    return true;
}

int CompoundAsyncOperation::GetResult() const {
    ScopedLock lock(IZOCDataServer::GetLock(), "CompoundAsyncOperation::GetResult");
    return mResult;
}

}  // namespace ZOCL
