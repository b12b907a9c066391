// What sharing, getting the latest and resolving have in common: they run on an executor of their own, can be
// torn down by the system, and tell who got in the way.
#pragma once

#include <atomic>

#include "Collaboration/RecentCommitMetadataBase.h"
#include "Operations/ForceAbortEnabledOperation.h"
#include "ostcore/threads/Executor.h"
#include "ostcore/threads/Mutex.h"
#include "RFL/BatchOperation.h"
#include "ZOClient/IZOCEditingSession.h"

namespace ZOCL {

/// Run does the work, once, on an executor and never on the main thread; later steps run where requests
/// complete. The end is claimed once, by Finish or by ForceAbort, whichever comes first: exactly one
/// OperationCompleteMessage for a Start that returned true, none after ForceAbort. Whoever runs it asks
/// WasForceAborted and GetForceAbortResult before GetResult.
///
/// Threads: any, but Start on the main thread. What a getter gives is final when the message has come.
class WorkflowOperation : public RFL::IBatchOperation,
                          public RFL::IThreadedQueueRequest,
                          public ForceAbortEnabledOperation,
                          public RecentCommitMetadataBase {
public:
    WorkflowOperation(const WorkflowOperation&) = delete;
    WorkflowOperation& operator=(const WorkflowOperation&) = delete;

    std::uint32_t AddRef() noexcept override;
    std::uint32_t Release() noexcept override;
    /// Answers IBatchOperation, IThreadedQueueRequest and IForceAbortEnabledOperation.
    int QueryInterface(const RFL::InterfaceID& inID, void** outInterface) noexcept override;
    int QueryInterfaceNoAddRef(const RFL::InterfaceID& inID, void** outInterface) noexcept override;

    ImmutableString GetStationID() override { return mStationID; }
    /// False after an Abort.
    bool Start() override;
    /// Notes the wish to stop; what is at the server already is let to finish.
    void Abort() override;
    /// As Abort, and from here on nothing is posted.
    void ForceAbort(int inResult) override;

    /// kResultFailure until the operation has ended.
    int GetResult() const noexcept { return mResult.load(std::memory_order_acquire); }

protected:
    explicit WorkflowOperation(const char* inExecutorLabel);
    ~WorkflowOperation() override;

    bool IsCanceled() const noexcept { return mCanceled.load(std::memory_order_acquire) == 1; }
    /// Stores the result and tells of the end. Once for each way through the operation; hold no lock.
    void Finish(int inResult);
    /// Ends with kResultHTTPPreconditionFailed, after the history was asked who changed the session.
    void FinishAfterForeignCommit(const InterfaceRef<IZOCProduction>& inProduction,
                                  const ImmutableString& inKnownCommit);
    void PostProgress(std::size_t inDone, std::size_t inAll);
    void PostDescription(const UString& inText);

    /// Leaf lock of what the derived class hands out.
    ostcore::threads::Mutex mMutex;

private:
    void OnRecentRevisionFound(int inResult, const InterfaceRef<IZOCHistoryVersion>& inVersion);

    RFL::RefCount mReferences;
    const ImmutableString mStationID;
    const char* const mExecutorLabel;
    shared_ptr<ostcore::threads::AsyncExecutor> mExecutor;
    std::atomic<int> mResult{kResultFailure};
    std::atomic<int> mCanceled{0};
    std::atomic<int> mHasEnded{0};
};

/// The commit that the server's answer names; null without one. Threads: any.
ImmutableString GetCommitIdFromResponse(const shared_ptr<ostnet::Response>& inResponse);

}  // namespace ZOCL
