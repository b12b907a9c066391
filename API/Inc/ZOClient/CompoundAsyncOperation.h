// Runs a piece of work that consists of several requests, and tells its caller exactly once that all of it
// has ended.
#pragma once

#include <deque>
#include <functional>
#include <map>
#include <tuple>
#include <type_traits>
#include <utility>

#include "ostcore/threads/Executor.h"
#include "ostmarshal/RPCClient.h"
#include "ZOClient/IZOCDataServer.h"
#include "ZOClient/IZOCServerResource.h"

namespace ZOCL {

/// A chain of requests that ends once.
///
/// Each step starts one request with Initiate. When a request has ended, its intermediate function runs; it
/// may start further steps, and what it returns is the result of this step. The first failure becomes the
/// result of the whole, asks the other requests to cancel, and keeps later steps from starting: they pass
/// through their intermediate functions with that failure. When nothing is in flight any more, the final
/// function runs once, in a new turn of a network worker, with the first failure or 0.
///
/// The contract of a chain: start the next request inside of the intermediate function of the one before,
/// never after it. An operation without any request never calls its final function.
///
/// The object is shared by its caller and by all functions in flight, and lives until the last is gone.
///
/// Threads: any. Functions of the user (work, intermediate, cancel, final) run with no lock of this class
/// held, on whatever thread ends the request before. In a serial operation, requests run one after the other
/// in the order of Initiate; the next starts before the intermediate function of the one before has run.
class ZOCL_EXPORT CompoundAsyncOperation : public enable_shared_from_this<CompoundAsyncOperation> {
public:
    using FinalCompletion = function<void(int inResult)>;
    /// Starts one request. True: it runs, and the completion will be called once. False: nothing started, and
    /// the completion will not be called.
    using WorkFunction = function<bool(const Guid& inRequestID, const RequestCompletion& inCompletion)>;
    /// Runs when a request has ended; what it returns is the result of the step.
    using IntermediateCompletion =
        function<int(int inResult, const InterfaceRef<IZOCServerResource>& inResource,
                     const shared_ptr<ostnet::Response>& inResponse)>;
    /// A way of its own to stop one pending request. May be called for one that has not started.
    using TryToCancelFunction = function<void(const Guid& inRequestID)>;

    /// A null server stands for the logged-in one. The final function may be empty.
    static shared_ptr<CompoundAsyncOperation> Create(const FinalCompletion& inFinalCompletion,
                                                     const InterfaceRef<IZOCDataServer>& inServer,
                                                     bool inSerial);
    ~CompoundAsyncOperation();
    CompoundAsyncOperation(const CompoundAsyncOperation&) = delete;
    CompoundAsyncOperation& operator=(const CompoundAsyncOperation&) = delete;

    /// Starts one request, or queues it in a serial operation. inIntermediate is nullptr, or a function or
    /// lambda of one of these forms:
    ///     int(int inResult)
    ///     int(int inResult, shared_ptr<ostnet::Response> const&)
    ///     int(int inResult, InterfaceRef<T> const&, shared_ptr<ostnet::Response> const&)
    /// where T is any interface; the resource is asked for it, and the reference is null when it has none.
    /// With inForgiveNotModified, HTTP 304 counts as success.
    template <class Intermediate>
    void Initiate(const WorkFunction& inWork, const Intermediate& inIntermediate,
                  const TryToCancelFunction& inTryToCancel = TryToCancelFunction(),
                  bool inForgiveNotModified = false) {
        InitiateUniform(inWork, MakeUniform(inIntermediate), inTryToCancel, inForgiveNotModified);
    }

    /// Runs a function on an executor and counts it as one request; its return value is the result. A
    /// cancelable one that has not begun when the operation fails will not run. False: it will not run.
    bool CallAsynchronously(const shared_ptr<ostcore::threads::Executor>& inExecutor,
                            const function<int()>& inWork, bool inCancelable);

    /// Makes an operation that counts as one request of this one until its final function would run. The
    /// intermediate function is as for Initiate. The result is null when this operation has already failed.
    /// The caller now starts the requests of the sub-operation; it must start at least one.
    template <class Intermediate>
    void CreateSubOperation(shared_ptr<CompoundAsyncOperation>& outSubOperation,
                            const Intermediate& inIntermediate, bool inSerial) {
        CreateSubOperationUniform(outSubOperation, MakeUniform(inIntermediate), inSerial);
    }

    /// Tells the operation that it has failed. Only the first failure has an effect.
    void SetResult(int inResult);
    /// A failure with kResultCancelled. No effect after the end.
    void TryToCancel();
    /// Replaces the cancel function of a request that is in flight or queued; an unknown one is ignored.
    void SetTryToCancelFunction(const Guid& inRequestID, const TryToCancelFunction& inFunction);
    /// Takes the work of CallAsynchronously that has not begun; empty when there is none. Whoever takes it
    /// runs it or ends it.
    function<int()> RetrieveWorkFunction(const Guid& inRequestID);
    /// Receives the end of every request; for the functions that this class hands out.
    void Completion(const Guid& inRequestID, int inResult, const InterfaceRef<IZOCServerResource>& inResource,
                    const shared_ptr<ostnet::Response>& inResponse, bool inForgiveNotModified);

    /// The first failure, or 0.
    int GetResult() const;
    /// Identifies the operation in traces.
    const Guid& GetRequestID() const { return mRequestID; }

private:
    using QueuedWork = std::pair<function<bool()>, Guid>;
    using Request = std::pair<TryToCancelFunction, IntermediateCompletion>;

    CompoundAsyncOperation(const FinalCompletion& inFinalCompletion,
                           const InterfaceRef<IZOCDataServer>& inServer, bool inSerial);

    void InitiateUniform(const WorkFunction& inWork, const IntermediateCompletion& inIntermediate,
                         const TryToCancelFunction& inTryToCancel, bool inForgiveNotModified);
    void CreateSubOperationUniform(shared_ptr<CompoundAsyncOperation>& outSubOperation,
                                   const IntermediateCompletion& inIntermediate, bool inSerial);
    bool SubOperationInitiateHelper(const Guid& inRequestID, const RequestCompletion& inCompletion);
    RequestCompletion MakeRequestCompletion(bool inForgiveNotModified);
    /// What Initiate has settled under the lock.
    struct Registered {
        Guid requestID;
        int result = 0;
        bool queued = false;
    };
    Registered RegisterLocked(const WorkFunction& inWork, const RequestCompletion& inCompletion,
                              const Request& inRequest) ZO_REQUIRES(IZOCDataServer::GetLock());
    void Start(const Registered& inRegistered, const WorkFunction& inWork,
               const RequestCompletion& inCompletion);
    bool TakeNextSerialLocked(const Guid& inRequestID, QueuedWork& outNext)
        ZO_REQUIRES(IZOCDataServer::GetLock());
    bool IsKnownLocked(const Guid& inRequestID) const ZO_REQUIRES(IZOCDataServer::GetLock());
    void Retire(const Guid& inRequestID);
    void DeliverFinal(const FinalCompletion& inFinal, int inResult);
    void CancelRequests(const std::map<Guid, Request>& inRequests,
                        const InterfaceRef<IZOCDataServer>& inServer, int inResult);

    template <class F>
    struct CallShape : CallShape<decltype(&F::operator())> {};
    template <class R, class... A>
    struct CallShape<R (*)(A...)> {
        using Arguments = std::tuple<std::decay_t<A>...>;
    };
    template <class C, class R, class... A>
    struct CallShape<R (C::*)(A...) const> : CallShape<R (*)(A...)> {};
    template <class C, class R, class... A>
    struct CallShape<R (C::*)(A...)> : CallShape<R (*)(A...)> {};

    template <class Signature>
    static bool IsEmpty(const function<Signature>& inFunction) {
        return inFunction.empty();
    }
    template <class Signature>
    static bool IsEmpty(const std::function<Signature>& inFunction) {
        return !inFunction;
    }
    template <class F>
    static bool IsEmpty(const F&) {
        return false;
    }
    static IntermediateCompletion MakeUniform(std::nullptr_t) { return IntermediateCompletion(); }
    static IntermediateCompletion MakeUniform(const IntermediateCompletion& inFunction) { return inFunction; }
    template <class F>
    static IntermediateCompletion MakeUniform(const F& inFunction) {
        using Arguments = typename CallShape<std::decay_t<F>>::Arguments;
        if (IsEmpty(inFunction)) {
            return IntermediateCompletion();
        }
        return MakeUniformFor(inFunction, static_cast<Arguments*>(nullptr));
    }
    template <class F>
    static IntermediateCompletion MakeUniformFor(const F& inFunction, std::tuple<int>*) {
        return [inFunction](int inResult, const InterfaceRef<IZOCServerResource>&,
                            const shared_ptr<ostnet::Response>&) mutable { return inFunction(inResult); };
    }
    template <class F>
    static IntermediateCompletion MakeUniformFor(const F& inFunction,
                                                 std::tuple<int, shared_ptr<ostnet::Response>>*) {
        return [inFunction](int inResult, const InterfaceRef<IZOCServerResource>&,
                            const shared_ptr<ostnet::Response>& inResponse) mutable {
            return inFunction(inResult, inResponse);
        };
    }
    template <class F, class T>
    static IntermediateCompletion MakeUniformFor(
        const F& inFunction, std::tuple<int, InterfaceRef<T>, shared_ptr<ostnet::Response>>*) {
        return [inFunction](int inResult, const InterfaceRef<IZOCServerResource>& inResource,
                            const shared_ptr<ostnet::Response>& inResponse) mutable {
            if constexpr (std::is_same<T, IZOCServerResource>::value) {
                return inFunction(inResult, inResource, inResponse);
            } else {
                return inFunction(inResult, RFL::QueryInterface<T>(inResource), inResponse);
            }
        };
    }

    FinalCompletion mFinalCompletion ZO_GUARDED_BY(IZOCDataServer::GetLock());
    const Guid mRequestID;
    int mResult ZO_GUARDED_BY(IZOCDataServer::GetLock()) = 0;
    InterfaceRef<IZOCDataServer> mServer ZO_GUARDED_BY(IZOCDataServer::GetLock());
    const bool mSerial;
    Guid mCurrentSerialRequest ZO_GUARDED_BY(IZOCDataServer::GetLock());
    std::deque<QueuedWork> mQueuedWork ZO_GUARDED_BY(IZOCDataServer::GetLock());
    std::map<Guid, Request> mRequestIDs ZO_GUARDED_BY(IZOCDataServer::GetLock());
    std::map<Guid, function<int()>> mWorkFunctions ZO_GUARDED_BY(IZOCDataServer::GetLock());
    /// Set when all requests had ended before there was a final function: a sub-operation can be done before
    /// its turn in a serial parent has come.
    bool mEndedUnseen ZO_GUARDED_BY(IZOCDataServer::GetLock()) = false;
};

/// Remote procedure calls as requests of a compound operation.
class ZOCL_EXPORT CompoundAsyncRPCOperation {
public:
    /// Exactly one of the two functions is called for a call that started, and the request of the operation
    /// ends after it: with 0, or with the error when that is negative, else with kResultFailure. Cancelling
    /// the operation cancels the call.
    static void SendRequest(const shared_ptr<CompoundAsyncOperation>& inOperation,
                            const shared_ptr<ostmarshal::RPCClient>& inClient,
                            const shared_ptr<any>& inRequest,
                            const ostmarshal::RPCClient::SuccessFunction& inSuccess,
                            const ostmarshal::RPCClient::FailureFunction& inFailure);
};

}  // namespace ZOCL
