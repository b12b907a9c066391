// The run of a workflow's operation, its end, and what it reads of answers.
#include "Collaboration/WorkflowOperation.h"

#include "ostcore/serialization/JSONReaders.h"

namespace ZOCL {

WorkflowOperation::WorkflowOperation(const char* inExecutorLabel)
    : mStationID(RFL::StationRegistry::RegisterUniqueStation()), mExecutorLabel(inExecutorLabel) {}
WorkflowOperation::~WorkflowOperation() = default;

std::uint32_t WorkflowOperation::AddRef() noexcept {
    return mReferences.Add();
}

std::uint32_t WorkflowOperation::Release() noexcept {
    const std::uint32_t left = mReferences.Drop();
    if (left == 0) {
        delete this;
    }
    return left;
}

int WorkflowOperation::QueryInterface(const RFL::InterfaceID& inID, void** outInterface) noexcept {
    const int result = QueryInterfaceNoAddRef(inID, outInterface);
    if (result >= 0) {
        AddRef();
    }
    return result;
}

int WorkflowOperation::QueryInterfaceNoAddRef(const RFL::InterfaceID& inID, void** outInterface) noexcept {
    if (inID == RFL::IBatchOperation::kInterfaceID) {
        *outInterface = static_cast<RFL::IBatchOperation*>(this);
    } else if (inID == RFL::RFLUnknown::kInterfaceID) {
        *outInterface = static_cast<RFL::RFLUnknown*>(static_cast<RFL::IBatchOperation*>(this));
    } else if (inID == RFL::IThreadedQueueRequest::kInterfaceID) {
        *outInterface = static_cast<RFL::IThreadedQueueRequest*>(this);
    } else if (inID == IForceAbortEnabledOperation::kInterfaceID) {
        *outInterface = static_cast<IForceAbortEnabledOperation*>(this);
    } else {
        *outInterface = nullptr;
        return kResultInterfaceNotSupported;
    }
    return kResultSuccess;
}

bool WorkflowOperation::Start() {
    if (IsCanceled()) {
        return false;
    }
    mExecutor = ostcore::threads::CreateIOBoundExecutor(mExecutorLabel);
    const InterfaceRef<WorkflowOperation> self(this);
    return mExecutor && mExecutor->Post([self] { self->Run(); });
}

void WorkflowOperation::Abort() {
    mCanceled.store(1, std::memory_order_release);
}

void WorkflowOperation::ForceAbort(int inResult) {
    ForceAbortEnabledOperation::ForceAbort(inResult);
    mHasEnded.store(1, std::memory_order_release);
    mCanceled.store(1, std::memory_order_release);
}

void WorkflowOperation::Finish(int inResult) {
    if (mHasEnded.exchange(1, std::memory_order_acq_rel) != 0) {
        return;
    }
    mResult.store(inResult, std::memory_order_release);
    RFL::StationUtils::PostMessageToUIThread(mStationID, RFL::OperationCompleteMessage(), false);
}

void WorkflowOperation::FinishAfterForeignCommit(const InterfaceRef<IZOCProduction>& inProduction,
                                                 const ImmutableString& inKnownCommit) {
    const InterfaceRef<WorkflowOperation> self(this);
    const bool isStarted = FindRecentRevisionWithCommitMetadata(
        inProduction, inKnownCommit, [self](int inResult, const InterfaceRef<IZOCHistoryVersion>& inVersion) {
            self->OnRecentRevisionFound(inResult, inVersion);
        });
    if (!isStarted) {
        Finish(kResultHTTPPreconditionFailed);
    }
}

void WorkflowOperation::OnRecentRevisionFound(int inResult,
                                              const InterfaceRef<IZOCHistoryVersion>& inVersion) {
    ProcessRecentRevisionResult(inResult, inVersion);
    Finish(kResultHTTPPreconditionFailed);
}

void WorkflowOperation::PostProgress(std::size_t inDone, std::size_t inAll) {
    if (!WasForceAborted()) {
        RFL::StationUtils::PostMessageToUIThread(
            mStationID,
            RFL::UpdateOperationProgressMessage(static_cast<double>(inDone), static_cast<double>(inAll)),
            false);
    }
}

void WorkflowOperation::PostDescription(const UString& inText) {
    if (!WasForceAborted()) {
        RFL::StationUtils::PostMessageToUIThread(mStationID, RFL::UpdateOperationDescriptionMessage(inText),
                                                 false);
    }
}

ImmutableString GetCommitIdFromResponse(const shared_ptr<ostnet::Response>& inResponse) {
    if (!inResponse || !inResponse->payload || inResponse->payload->empty()) {
        return ImmutableString();
    }
    try {
        const auto body = ostcore::serialization::JSONParse(inResponse->payload);
        return ostcore::serialization::ReadMandatoryString(body, "zo:commitId");
    } catch (const std::exception&) {
        // Not JSON, or of another shape: such a body names no commit.
        return ImmutableString();
    }
}

}  // namespace ZOCL
