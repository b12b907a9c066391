// Get latest: merges at the server, merges metadata, and hands over to the host and to what comes next.
#include "Collaboration/ZOSyncOperation.h"
#include "Frame/ProgressWindow.h"
#include "Model/SessionConflictMessage.h"
#include "ostcore/config/ZString.h"
#include "ostcore/threads/MainThread.h"
#include "ostcore/utility/StringConversion.h"
#include "Workflows/WorkflowTools.h"
#include "ZOClient/Dialogs.h"
#include "ZOClient/XMPMerge.h"

namespace ZOCL {
namespace Publish {

using ostcore::ZString;

namespace {

const char kTitle[] = "$$$/ZOCL/ZOSyncProgressDialog/ZOSyncProgressDialogTitle=Get Latest Changes";
const char kCaption[] = "$$$/ZOCL/ZOSyncProgressDialogCaption=Getting latest version of \"@0\"";
const char kOperationName[] = "$$$/ZOCL/SyncString=Get Latest Changes";
const char kErrorTitle[] = "$$$/ZOCL/SyncDialogTitle=Orvane Meridane Sync";
const char kErrorMessage[] = "$$$/ZOCL/SyncDialogError=There was an error syncing the production.";

/// What goes on after the host has reloaded.
struct SyncState {
    UString productionName;
    ImmutableString sessionURL;
    ImmutableString productionURL;
    ResolveCompletion resolveCompletion;
    ConflictsKeptFunction conflictsKept;
    std::set<ImmutableString> types;
    shared_ptr<PublishWorkflowTracker> tracker;
    WorkflowContinuation workflowContinuation;
    bool isSilent = false;
    shared_ptr<const LoginWatch> login;

    int result = kResultFailure;
    bool pullSucceeded = false;
    bool hasConflicts = false;
    ImmutableString commitId = ImmutableString();
};

void OnSyncContinue(const shared_ptr<SyncState>& inState, int inResult, const ImmutableString& inCommitId) {
    if (inResult < 0 || IsStopped(inState->result) || inState->login->HasEnded()) {
        return;
    }
    if (inState->hasConflicts && !inState->isSilent) {
        Resolve(inState->productionName, inState->sessionURL, inState->productionURL,
                inState->resolveCompletion, inState->conflictsKept, inState->types, inState->tracker,
                inState->workflowContinuation);
    } else if (inState->workflowContinuation) {
        inState->workflowContinuation(inState->pullSucceeded, !inState->hasConflicts,
                                      inCommitId.empty() ? inState->commitId : inCommitId, inState->tracker);
    }
}

void TellFailure(const InterfaceRef<ZOSyncOperation>& inOperation, int inResult) {
    if (inResult == kResultHTTPPreconditionFailed) {
        ShowSessionConflictMessage(IZOCDataServer::GetLoggedInServerRef(), ZString(kOperationName).AsString(),
                                   inOperation->GetRecentCommitMetadata(), UString());
    } else if (inResult < 0 && inResult != kResultCancelled && inResult != kResultDialogCancelled) {
        ShowMessage(kErrorTitle, kErrorMessage);
    }
}

void MergeMetadata(SyncState& ioState) {
    ioState.hasConflicts = AutoResolveXMPConflicts(ioState.sessionURL, ioState.commitId);
    // What was merged is a commit of the session, so what comes next starts from there.
    const ImmutableString merged = GetLoadedCommit(FindSession(ioState.sessionURL));
    if (!merged.empty()) {
        ioState.commitId = merged;
    }
}

}  // namespace

int Sync(const UString& inProductionName, const ImmutableString& inSessionURL,
         const ImmutableString& inProductionURL, const SyncCompletion& inSyncCompletion,
         const ResolveCompletion& inResolveCompletion, const ConflictsKeptFunction& inConflictsKept,
         const std::set<ImmutableString>& inIgnoredTransactionTypes,
         const shared_ptr<PublishWorkflowTracker>& inTracker,
         const WorkflowContinuation& inWorkflowContinuation, bool inSilent) {
    if (!ostcore::threads::IsMainThread()) {
        return kResultFailure;
    }
    const auto state = boost::make_shared<SyncState>(
        SyncState{inProductionName, inSessionURL, inProductionURL, inResolveCompletion, inConflictsKept,
                  inIgnoredTransactionTypes, inTracker, inWorkflowContinuation, inSilent,
                  boost::make_shared<const LoginWatch>()});
    {
        const ScopedSilence silence(inSilent);
        const InterfaceRef<ZOSyncOperation> operation(new ZOSyncOperation(inSessionURL, inProductionURL));
        DoIndeterminateProgressDialog(
            ZString(kTitle).AsString(),
            ZString(kCaption, {ostcore::utility::ToUTF8(inProductionName)}).AsString(), operation, false,
            true);
        state->result = GetEffectiveResult(operation);
        if (!inSilent && !state->login->HasEnded()) {
            TellFailure(operation, state->result);
        }
        state->pullSucceeded = operation->PullSucceeded();
        state->hasConflicts = operation->HasConflicts();
        state->commitId = operation->GetCommitId();
        if (operation->HasEnclosureConflicts() && !state->login->HasEnded()) {
            MergeMetadata(*state);
        }
    }
    const Continuation onContinue =
        MakeContinuation([state](int inResult, const ImmutableString& inCommitId) {
            OnSyncContinue(state, inResult, inCommitId);
        });
    if (!state->login->HasEnded()) {
        RefreshSandbox(inSessionURL);
    }
    if (inSyncCompletion) {
        inSyncCompletion(state->pullSucceeded, state->hasConflicts, state->commitId, onContinue);
    } else {
        onContinue(state->result, state->commitId);
    }
    return state->result;
}

}  // namespace Publish
}  // namespace ZOCL
