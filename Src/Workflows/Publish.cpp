// Share: asks for what must come first, and brings up the Share window.
#include "ZOClient/Publish.h"

#include "Dialogs/ZOPublishDialog.h"
#include "ostcore/config/ZString.h"
#include "ostcore/threads/MainThread.h"
#include "ostcore/threads/Mutex.h"
#include "ostcore/utility/StringConversion.h"
#include "Workflows/ShareStep.h"
#include "Workflows/WorkflowTools.h"

namespace ZOCL {
namespace Publish {

using ostcore::ZString;
using ostcore::threads::Mutex;
using ostcore::threads::MutexLock;

namespace {

const char kTitle[] = "$$$/ZOCL/ZOPublishDialog/Title=Share \"@0\"";
const char kSyncPrompt[] =
    "$$$/ZOCL/ZOPublishDialog/PublishSyncPromptStr=The latest changes to the production \"@0\" must be "
    "reconciled with your changes before sharing may continue.";
const char kGetLatest[] = "$$$/ZOCL/ZOPublishDialog/PublishSyncPromptGetLatest=Get Latest Changes";
const char kConflictsPrompt[] =
    "$$$/ZOCL/ZOPublishDialog/PublishConflictsPromptStr=Unresolved conflicts exist between the production on "
    "the server and your version of the production.";
const char kResolveConflicts[] =
    "$$$/ZOCL/ZOPublishDialog/PublishConflictsPromptResolveConflicts=Resolve Conflicts";

/// What the Share window needs of the call that it belongs to.
struct ShareRequest {
    UString productionName;
    ImmutableString sessionURL;
    PublishCompletion completion;
    shared_ptr<const LoginWatch> login;
};

bool IsAgreed(const UString& inProductionName, const char* inPrompt, const char* inButton) {
    const std::vector<U8String> name{ostcore::utility::ToUTF8(inProductionName)};
    return SimpleMessageBoxWithCancel(ZString(kTitle, name).AsString(), ZString(inPrompt, name).AsString(),
                                      ZString(inButton).AsString()) == ostui::kMessageBoxOK;
}

/// Returns whether the session was shared.
bool ShowPublishDialog(bool inIsDone, bool inIsFreeOfConflicts, const ImmutableString& inCommitId,
                       const shared_ptr<PublishWorkflowTracker>& inTracker, const ShareRequest& inRequest) {
    if (!inIsDone || !inIsFreeOfConflicts || inRequest.login->HasEnded()) {
        return false;
    }
    const InterfaceRef<IZOCEditingSession> session = FindSession(inRequest.sessionURL);
    // Finding it may have run the main thread's queue.
    if (inRequest.login->HasEnded()) {
        return false;
    }
    ImmutableString commitId = inCommitId;
    PublishWorkflowTracker::Outcome outcome;
    outcome.wasShown = true;
    outcome.result = kResultDialogCancelled;

    ZOPublishDialog::Settings settings;
    settings.productionName = inRequest.productionName;
    settings.sessionURL = inRequest.sessionURL;
    settings.session = session;
    settings.share = [&](const UString& inComment, const ImmutableString& inMovedTo) {
        // What the host has written is the user's own, and stays so for the next attempt.
        commitId = inMovedTo.empty() ? commitId : inMovedTo;
        ShareStep step;
        step.session = session;
        step.productionName = inRequest.productionName;
        step.comment = inComment;
        step.commitId = commitId;
        step.completion = inRequest.completion;
        const ShareOutcome shared = RunShareStep(step);
        outcome.wasShared = shared.isShared;
        outcome.result = shared.result;
        outcome.commitId = shared.isShared ? shared.commitId : ImmutableString();
        return shared.isShared;
    };
    ZOPublishDialog dialog(settings);
    dialog.RunModal();
    if (inTracker) {
        inTracker->SetOutcome(outcome);
    }
    return outcome.wasShared;
}

bool PublishSilently(const ImmutableString& inSessionURL, const ImmutableString& inCommitId,
                     const UString& inCommitMessage, const PublishCompletion& inCompletion) {
    ShareStep step;
    step.session = FindSession(inSessionURL);
    step.comment = inCommitMessage;
    step.commitId = inCommitId;
    step.completion = inCompletion;
    step.isSilent = true;
    return RunShareStep(step).result >= 0;
}

}  // namespace

struct PublishWorkflowTracker::State {
    mutable Mutex mutex;
    Outcome outcome ZO_GUARDED_BY(mutex);
};

PublishWorkflowTracker::PublishWorkflowTracker() : mState(boost::make_shared<State>()) {}
PublishWorkflowTracker::~PublishWorkflowTracker() = default;

PublishWorkflowTracker::Outcome PublishWorkflowTracker::GetOutcome() const {
    MutexLock lock(mState->mutex);
    return mState->outcome;
}

void PublishWorkflowTracker::SetOutcome(const Outcome& inOutcome) {
    MutexLock lock(mState->mutex);
    mState->outcome = inOutcome;
}

bool Publish(const UString& inProductionName, const ImmutableString& inSessionURL,
             const ImmutableString& inCommitId, bool inNeedsSync, bool inHasConflicts,
             const PublishCompletion& inPublishCompletion, const SyncCompletion& inSyncCompletion,
             const ResolveCompletion& inResolveCompletion, const ConflictsKeptFunction& inConflictsKept,
             const std::set<ImmutableString>& inIgnoredTransactionTypes,
             const shared_ptr<PublishWorkflowTracker>& inTracker, bool inSilent,
             const UString& inCommitMessage) {
    if (!ostcore::threads::IsMainThread()) {
        return false;
    }
    if (inSilent) {
        return PublishSilently(inSessionURL, inCommitId, inCommitMessage, inPublishCompletion);
    }
    const auto login = boost::make_shared<const LoginWatch>();
    const ShareRequest request{inProductionName, inSessionURL, inPublishCompletion, login};
    const WorkflowContinuation showPublishDialog =
        [request](bool inIsDone, bool inIsFreeOfConflicts, const ImmutableString& inCommit,
                  const shared_ptr<PublishWorkflowTracker>& inWorkflowTracker) {
            ShowPublishDialog(inIsDone, inIsFreeOfConflicts, inCommit, inWorkflowTracker, request);
        };
    if (inNeedsSync) {
        return IsAgreed(inProductionName, kSyncPrompt, kGetLatest) && !login->HasEnded() &&
               Sync(inProductionName, inSessionURL, FindProductionURL(FindSession(inSessionURL)),
                    inSyncCompletion, inResolveCompletion, inConflictsKept, inIgnoredTransactionTypes,
                    inTracker, showPublishDialog, false) >= 0;
    }
    if (inHasConflicts) {
        return IsAgreed(inProductionName, kConflictsPrompt, kResolveConflicts) && !login->HasEnded() &&
               Resolve(inProductionName, inSessionURL, FindProductionURL(FindSession(inSessionURL)),
                       inResolveCompletion, inConflictsKept, inIgnoredTransactionTypes, inTracker,
                       showPublishDialog);
    }
    return ShowPublishDialog(true, true, inCommitId, inTracker, request);
}

}  // namespace Publish
}  // namespace ZOCL
