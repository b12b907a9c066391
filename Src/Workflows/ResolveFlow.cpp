// A step of settling conflicts, and the way from one to the next.
#include "Workflows/ResolveFlow.h"

#include "Model/SessionConflictMessage.h"
#include "ostcore/config/ZString.h"
#include "ostcore/debug/Trace.h"
#include "ostcore/logging/SyslogLogger.h"
#include "Workflows/WorkflowTools.h"
#include "ZOClient/Dialogs.h"

namespace ZOCL {

using ostcore::ZString;

namespace {

const char kTitle[] = "$$$/ZOCL/ZOResolveProgressDialog/ZOResolveProgressDialogTitle=Resolve Conflicts";
const char kCaption[] = "$$$/ZOCL/ZOResolveProgressCaptionDefault=Resolving...";
const char kOperationName[] = "$$$/ZOCL/ResolveString=Resolve Conflicts";
const char kErrorTitle[] = "$$$/ZOCL/ResolveDialogErrorTitle=Orvane Meridane";
const char kErrorMessage[] = "$$$/ZOCL/ResolveDialogError=Conflict resolution could not be completed.";
const char kChannel[] = "Resolve.ResolveConflicts";
const char kFailed[] = "Conflict resolution failed";

void LogFailure(int inResult) {
    const std::string result = GetResultName(inResult);
    ostcore::debug::Trace(kChannel, ostcore::debug::kTraceLevel_Error,
                          std::string(kFailed) + ", result: " + result);
    if (const auto logger = ostcore::logging::GetStructuredLogger()) {
        logger->Log(ostcore::logging::SyslogSeverity::Error, kFailed,
                    {{"channel", kChannel}, {"result", result}});
    }
}

void TellFailure(const InterfaceRef<ZOResolveOperation>& inOperation, int inResult) {
    if (inResult >= 0 || inResult == kResultCancelled || inResult == kResultDialogCancelled) {
        return;
    }
    if (inResult == kResultHTTPPreconditionFailed) {
        return ShowSessionConflictMessage(IZOCDataServer::GetLoggedInServerRef(),
                                          ZString(kOperationName).AsString(),
                                          inOperation->GetRecentCommitMetadata(), UString());
    }
    LogFailure(inResult);
    ShowMessage(kErrorTitle, kErrorMessage);
}

}  // namespace

ResolveFlow::Step ResolveFlow::Run(const std::vector<ConflictItemData>& inItems,
                                   Publish::ResolveType inType) {
    const InterfaceRef<ZOResolveOperation> operation(
        new ZOResolveOperation(mSettings.sessionURL, inItems, inType, mCommitId));
    DoProgressDialog(ZString(kTitle).AsString(), ZString(kCaption).AsString(), operation, true, true);
    Step step;
    step.result = GetEffectiveResult(operation);
    if (!HasLoginEnded()) {
        TellFailure(operation, step.result);
    }
    if (step.result == kResultDialogCancelled) {
        return step;
    }
    // Also after a failure: what was settled before it is settled.
    step.settled = operation->GetResolvedCount();
    if (!operation->GetCommitId().empty()) {
        mCommitId = operation->GetCommitId();
    }
    if (step.settled > 0) {
        TellHost(operation);
    }
    if (step.settled > 0 && !HasLoginEnded()) {
        RefreshSandbox(mSettings.sessionURL);
    }
    return step;
}

void ResolveFlow::TellHost(const InterfaceRef<ZOResolveOperation>& inOperation) {
    const bool isKept = inOperation->GetResolveType() == Publish::kResolveType_AcceptYours;
    if (!isKept && inOperation->AssetsReplaced() && mSettings.resolveCompletion) {
        const InterfaceRef<IZOCDataServer> server = IZOCDataServer::GetLoggedInServerRef();
        const InterfaceRef<IZOCProduction> production =
            server && !mSettings.productionURL.empty() ? server->GetProductionFromURL(mSettings.productionURL)
                                                       : nullptr;
        mSettings.resolveCompletion(true, production, mCommitId, BeginHostPart());
    }
    if (isKept && mSettings.conflictsKept) {
        mSettings.conflictsKept(inOperation->GetResolvedAssetURLs(), BeginHostPart());
    }
}

Publish::Continuation ResolveFlow::BeginHostPart() {
    ++mHostParts;
    return MakeContinuation([self = shared_from_this()](int inResult, const ImmutableString& inCommitId) {
        self->OnHostDone(inResult, inCommitId);
    });
}

void ResolveFlow::OnHostDone(int inResult, const ImmutableString& inCommitId) {
    --mHostParts;
    mHasHostRefused = mHasHostRefused || inResult < 0;
    if (!inCommitId.empty()) {
        mCommitId = inCommitId;
    }
    if (mOnHostDone) {
        mOnHostDone();
    }
    GoOnWhenReady();
}

void ResolveFlow::Finish() {
    mIsFinished = true;
    GoOnWhenReady();
}

void ResolveFlow::GoOnWhenReady() {
    if (!mIsFinished || WaitsForHost() || mHasHostRefused || !mSettings.next || HasLoginEnded()) {
        return;
    }
    mIsFinished = false;
    mSettings.next(true, true, mCommitId, mSettings.tracker);
}

}  // namespace ZOCL
