// Sharing, getting the latest and resolving conflicts: the flows of windows and operations that a host starts
// from its buttons.
#pragma once

#include <set>
#include <string>
#include <vector>

#include "RFL/Messaging.h"
#include "ZOClient/Export.h"
#include "ZOClient/IZOCProduction.h"
#include "ZOClient/Types.h"

namespace ZOCL {

/// Posted to the library's station, and delivered before anything is sent, when the user has pressed Share:
/// the host writes what it has pending. If that moves the session's head, the head that the host's writes
/// have left is shared.
struct ZOCL_EXPORT ZOCommittedToPublishMessage : RFL::MessageImpl<ZOCommittedToPublishMessage> {};

/// All functions run on the main thread, show their windows there (see Dialogs.h for what holds without a
/// back end) and pump its queue; hold no lock. Off the main thread they do nothing and report failure.
///
/// The functions of the host are called on the main thread; an empty one is passed over. Those that get a
/// continuation let the host join in: the session has been changed, the host reloads what it must, and then
/// calls the continuation with a result and the session's commit, which lets the flow go on; a negative
/// result ends it. A continuation may be called later and on any thread; the first call counts. For an empty
/// function the flow goes on by itself.
///
/// The current sandbox (ZOSandbox.h), when it is that of the session, is marked and updated after each step.
namespace Publish {

using Continuation = function<void(int inResult, const ImmutableString& inCommitId)>;
/// inCommitId is the new commit of the production, null without one.
using PublishCompletion = function<void(bool inSucceeded, const ImmutableString& inCommitId)>;
/// inSyncDone: the server has merged. inHasConflicts: something is left to be resolved. inCommitId is the
/// session's commit.
using SyncCompletion = function<void(bool inSyncDone, bool inHasConflicts, const ImmutableString& inCommitId,
                                     const Continuation& inContinue)>;
/// Assets of the session took the shared version: the host reloads them.
using ResolveCompletion =
    function<void(bool inSucceeded, const InterfaceRef<IZOCProduction>& inHeadProduction,
                  const ImmutableString& inCommitId, const Continuation& inContinue)>;
/// The user's version of these assets was kept.
using ConflictsKeptFunction =
    function<void(const std::vector<ImmutableString>& inAssetURLs, const Continuation& inContinue)>;

/// How the Share window of a workflow ended. Shared by the calls of one workflow, written when the window has
/// closed. Threads: any.
class ZOCL_EXPORT PublishWorkflowTracker {
public:
    struct Outcome {
        /// False: the workflow has not come to the window.
        bool wasShown = false;
        bool wasShared = false;
        /// Of the last attempt to share; kResultDialogCancelled when there was none.
        int result = 0;
        /// The new commit of the production; null when nothing was shared.
        ImmutableString commitId;
    };

    PublishWorkflowTracker();
    ~PublishWorkflowTracker();
    PublishWorkflowTracker(const PublishWorkflowTracker&) = delete;
    PublishWorkflowTracker& operator=(const PublishWorkflowTracker&) = delete;

    Outcome GetOutcome() const;
    void SetOutcome(const Outcome& inOutcome);

private:
    struct State;
    shared_ptr<State> mState;
};

/// What a workflow does when its step has ended: whether the step was carried out, whether no conflicts are
/// left, the session's commit, and the tracker of the workflow.
using WorkflowContinuation =
    function<void(bool inIsDone, bool inIsFreeOfConflicts, const ImmutableString& inCommitId,
                  const shared_ptr<PublishWorkflowTracker>& inTracker)>;

/// How a conflict is settled.
enum ResolveType : int {
    /// The shared version replaces the user's.
    kResolveType_AcceptTheirs = 0,
    /// The same, and the host keeps a copy of the user's version.
    kResolveType_AcceptTheirsAndCopy = 1,
    /// The user's version is kept.
    kResolveType_AcceptYours = 2
};

/// One conflict of a session.
struct ConflictItem {
    UString displayName;
    UString path;
    /// What is in conflict, localised.
    UString typeText;
    /// Names it to ResolveIndividualConflicts. An asset and its metadata have the same.
    ImmutableString identifier;
    /// The values of ResolveType that may be used, ascending.
    std::vector<int> resolveTypes;
};

/// Shares a session as one commit of its production. inCommitId is the session's commit that the user has
/// seen. The host says what it knows of the sandbox: inNeedsSync runs Sync first when the user agrees,
/// inHasConflicts alone runs Resolve; then the Share window comes up, in which the user writes a comment.
///
/// True: the session was shared, or the chain is running, its end being in the tracker. False: the user
/// declined, or nothing was shared.
///
/// inSilent shows no window but the warning of an outage, and shares at once with inCommitMessage; then only
/// the session's URL, the commit and the completion matter. The completion gets the outcome of each attempt;
/// none is made for an unknown session or an empty commit.
///
/// inIgnoredTransactionTypes goes with the workflow: Resolve takes it as inCopyableTypes.
ZOCL_EXPORT bool Publish(const UString& inProductionName, const ImmutableString& inSessionURL,
                         const ImmutableString& inCommitId, bool inNeedsSync, bool inHasConflicts,
                         const PublishCompletion& inPublishCompletion, const SyncCompletion& inSyncCompletion,
                         const ResolveCompletion& inResolveCompletion,
                         const ConflictsKeptFunction& inConflictsKept,
                         const std::set<ImmutableString>& inIgnoredTransactionTypes,
                         const shared_ptr<PublishWorkflowTracker>& inTracker, bool inSilent,
                         const UString& inCommitMessage);

/// Gets the latest: merges the newest commit of the production into the session, then merges what metadata is
/// in conflict. Unless inSilent, which shows no window (see Publish), conflicts that are left go on to
/// Resolve. Returns the result of the merge at the server; a failure has been told to the user.
ZOCL_EXPORT int Sync(const UString& inProductionName, const ImmutableString& inSessionURL,
                     const ImmutableString& inProductionURL, const SyncCompletion& inSyncCompletion,
                     const ResolveCompletion& inResolveCompletion,
                     const ConflictsKeptFunction& inConflictsKept,
                     const std::set<ImmutableString>& inIgnoredTransactionTypes,
                     const shared_ptr<PublishWorkflowTracker>& inTracker,
                     const WorkflowContinuation& inWorkflowContinuation, bool inSilent);

/// Lets the user settle the conflicts of a session in a window. inCopyableTypes are the types of assets of
/// which the host can keep a copy (kAssetType_*). True: no conflict is left.
ZOCL_EXPORT bool Resolve(const UString& inProductionName, const ImmutableString& inSessionURL,
                         const ImmutableString& inProductionURL, const ResolveCompletion& inResolveCompletion,
                         const ConflictsKeptFunction& inConflictsKept,
                         const std::set<ImmutableString>& inCopyableTypes,
                         const shared_ptr<PublishWorkflowTracker>& inTracker,
                         const WorkflowContinuation& inWorkflowContinuation);

/// Settles the conflicts of these identifiers (ConflictItem), all in one way, under progress windows. True:
/// they are settled. False also when none of them is in conflict, and, with nothing changed, when one of them
/// does not allow the way.
ZOCL_EXPORT bool ResolveIndividualConflicts(
    const UString& inProductionName, const ImmutableString& inSessionURL,
    const ImmutableString& inProductionURL, const std::vector<ImmutableString>& inConflictIdentifiers,
    ResolveType inResolveType, const ResolveCompletion& inResolveCompletion,
    const ConflictsKeptFunction& inConflictsKept, const std::set<ImmutableString>& inCopyableTypes);

/// Lists the conflicts of a session as the server tells them now, under a progress window. False, and an
/// empty list, when that could not be found out.
ZOCL_EXPORT bool GetCurrentConflictList(const UString& inProductionName, const ImmutableString& inSessionURL,
                                        const std::set<ImmutableString>& inCopyableTypes,
                                        std::vector<ConflictItem>& outItems);

}  // namespace Publish
}  // namespace ZOCL
