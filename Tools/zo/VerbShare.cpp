// share, latest: the session becomes a commit that all see, and gets what others have shared.
#include <algorithm>

#include "Conflicts.h"
#include "Failure.h"
#include "GuidedFlow.h"
#include "ostcore/utility/StringConversion.h"
#include "Payloads.h"
#include "Sharing.h"
#include "Verbs.h"
#include "WriteLock.h"
#include "Writing.h"
#include "ZOClient/XMPMerge.h"

namespace zo {
namespace {

using ostcore::utility::ToUTF16;

// --- share

Json ShareJson(const WorkSession& inSession, std::size_t inChanges, const std::string& inMessage) {
    Json json("share");
    json.Set("session", inSession.view.id).Set("production", inSession.productionID);
    return json.Set("changes", inChanges).Set("message", inMessage);
}

void TellWouldShare(Context& ioContext, const WorkSession& inSession, const std::vector<Change>& inOutgoing,
                    const std::string& inMessage) {
    const std::string head = LoadSharedProduction(ioContext, inSession).commit;
    const auto differences = inSession.session->GetOutgoingChanges();
    LoadResource(ioContext, differences, "loading what there is to share");
    const bool isBehind = differences->GetBaseCommitID().view() != head;
    const bool conflicts = CountConflicts(inOutgoing) != 0;
    Json json = ShareJson(inSession, inOutgoing.size(), inMessage);
    json.Set("commit", "").Set("shared", false).Set("behind", isBehind).Set("conflicts", conflicts);
    ioContext.Out().Record(json.Set("dryRun", true));
    ioContext.Out().Say("would share " + Counted(inOutgoing.size(), "change") + " of " +
                        inSession.productionName +
                        (conflicts  ? ", but conflicts remain: zo conflicts"
                         : isBehind ? ", but there is something newer: zo latest"
                                    : ""));
}

void Share(Context& ioContext, const WorkSession& inSession, const std::vector<Change>& inOutgoing,
           const std::string& inMessage) {
    const std::string seen = SeenCommit(ioContext, inSession);
    const auto server = ioContext.Server();
    const Outcome outcome = ioContext.Loop().Run(
        [&](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
            return inSession.session->Push(inRequest, inCompletion, ToUTF16(inMessage),
                                           ZOCL::kResolveStrategy_None, ToUTF16(seen));
        },
        [server](const ZOCL::Guid& inRequest) { server->TryToCancelRequest(inRequest); });
    if (!outcome.Succeeded()) {
        throw RefusedShare(ioContext, inSession, outcome, seen);
    }
    const std::string commit = TextInAnswer(outcome.response, "zo:commitId");
    const bool isNew = commit != inSession.view.commit;
    RememberMoved(ioContext, inSession, commit, TextInAnswer(outcome.response, "zo:baseCommitId"));
    Json json = ShareJson(inSession, inOutgoing.size(), inMessage);
    json.Set("commit", commit).Set("shared", isNew).Set("behind", false).Set("conflicts", false);
    ioContext.Out().Record(json.Set("dryRun", false));
    ioContext.Out().Say(isNew ? "shared " + Counted(inOutgoing.size(), "change") + " of " +
                                    inSession.productionName + " (commit " + commit + ")"
                              : "there was nothing to share");
}

// --- latest

int StrategyOf(const std::string& inName) {
    return inName == "mine"     ? ZOCL::kMergeStrategy_Yours
           : inName == "theirs" ? ZOCL::kMergeStrategy_Theirs
           : inName == "safe"   ? ZOCL::kMergeStrategy_Safe
                                : ZOCL::kMergeStrategy_Interactive;
}

Json LatestJson(const WorkSession& inSession, const LatestState& inState) {
    Json json("latest");
    json.Set("session", inSession.view.id).Set("production", inSession.productionID);
    return json.Set("previousBaseCommit", inState.base).Set("incoming", inState.incoming.size());
}

void TellConflicts(Context& ioContext, const std::vector<Conflict>& inConflicts, const char* inState) {
    for (const Conflict& conflict : inConflicts) {
        ioContext.Out().Record(ConflictJson(conflict, inState));
    }
    if (!inConflicts.empty()) {
        PrintConflicts(ioContext, inConflicts);
    }
}

void TellWouldGet(Context& ioContext, const WorkSession& inSession, const LatestState& inState) {
    const std::vector<Conflict> conflicts =
        PredictConflicts(ioContext, inSession, inState.outgoing, inState.incoming, inState.base);
    Json json = LatestJson(inSession, inState);
    json.Set("commit", inSession.view.commit).Set("baseCommit", inState.head);
    json.Set("conflicts", conflicts.size()).Set("moved", inState.base != inState.head);
    Output& out = ioContext.Out();
    out.Record(json.Set("dryRun", true));
    out.Say(inState.base == inState.head
                ? "there is nothing newer than what the session is based on"
                : "would get " + Counted(inState.incoming.size(), "change") + " of others; " +
                      (conflicts.empty() ? "none" : std::to_string(conflicts.size())) + " would conflict" +
                      (conflicts.empty() ? "" : ":"));
    TellConflicts(ioContext, conflicts, "predicted");
}

Outcome Pull(Context& ioContext, const WorkSession& inSession, const std::string& inStrategy,
             const std::string& inCommit) {
    const auto server = ioContext.Server();
    return ioContext.Loop().Run(
        [&](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
            return inSession.session->Pull(inRequest, inCompletion, StrategyOf(inStrategy),
                                           ToUTF16(inCommit));
        },
        [server](const ZOCL::Guid& inRequest) { server->TryToCancelRequest(inRequest); });
}

// Merges the metadata that both sides changed; gives what is still in conflict.
std::vector<Conflict> MergeMetadata(Context& ioContext, WorkSession& ioSession,
                                    const std::vector<Conflict>& inConflicts, const std::string& inBase) {
    const bool hasEnclosure = std::any_of(inConflicts.begin(), inConflicts.end(), [](const Conflict& inOne) {
        return inOne.key.kind == ItemKind::Enclosure;
    });
    if (!hasEnclosure) {
        return inConflicts;
    }
    const auto resource = RFL::QueryInterface<ZOCL::IZOCServerResource>(ioSession.session);
    ZOCL::AutoResolveXMPConflicts(resource->GetHTTPURL(), ZOCL::ImmutableString(ioSession.view.commit));
    RefreshSession(ioContext, ioSession);
    RememberMoved(ioContext, ioSession, ioSession.view.commit, inBase);
    return LoadOpenConflicts(ioContext, ioSession);
}

void GetLatest(Context& ioContext, WorkSession& ioSession, const LatestState& inState) {
    const std::string strategy = ioContext.Args().ValueOr("strategy", "interactive");
    const std::string what = "getting the latest of " + ioSession.productionName;
    const Outcome outcome = Pull(ioContext, ioSession, strategy, inState.head);
    if (outcome.result == ZOCL::kResultHTTPConflict && strategy == "safe") {
        throw Failure(ExitCode::ConflictsRemain, what + ": it would bring conflicts, so nothing was changed",
                      "'zo latest --dry-run' lists them");
    }
    if (outcome.result == ZOCL::kResultHTTPPreconditionFailed) {
        throw SessionMoved(ioContext, ioSession, what, SeenCommit(ioContext, ioSession));
    }
    if (!outcome.Succeeded()) {
        throw Failure::OfRequest(what, outcome.result, outcome.response);
    }
    const std::string base = TextInAnswer(outcome.response, "zo:baseCommitId");
    RememberMoved(ioContext, ioSession, TextInAnswer(outcome.response, "zo:commitId"), base);
    RefreshSession(ioContext, ioSession);
    const std::vector<Conflict> opened = LoadOpenConflicts(ioContext, ioSession);
    const std::vector<Conflict> conflicts = MergeMetadata(ioContext, ioSession, opened, base);
    const std::size_t merged = opened.size() - std::min(opened.size(), conflicts.size());
    Json json = LatestJson(ioSession, inState);
    json.Set("commit", ioSession.view.commit).Set("baseCommit", base);
    json.Set("conflicts", conflicts.size()).Set("moved", base != inState.base).Set("merged", merged);
    Output& out = ioContext.Out();
    out.Record(json.Set("dryRun", false));
    SayGot(out, inState, base, merged);
    TellConflicts(ioContext, conflicts, "open");
    if (!conflicts.empty()) {
        throw Failure(ExitCode::ConflictsRemain, Counted(conflicts.size(), "item") + " in conflict",
                      kConflictsHint);
    }
}

}  // namespace

void RunShare(Context& ioContext) {
    const bool asks = AsksOnTheWay(ioContext, Asks::Usually, {"message"});
    RefuseWithOpenTransaction(ioContext, "sharing");
    const WriteLock lock(ioContext);
    WorkSession session = RequireSession(ioContext);
    if (asks) {
        return ShareWithUser(ioContext, session);
    }
    const std::vector<Change> outgoing = LoadOutgoing(ioContext, session);
    const std::string message = ioContext.Args().ValueOr("message", "");
    if (ioContext.Args().Has("dry-run")) {
        TellWouldShare(ioContext, session, outgoing, message);
    } else {
        Share(ioContext, session, outgoing, message);
    }
}

void RunLatest(Context& ioContext) {
    const bool asks = AsksOnTheWay(ioContext, Asks::WhenTold, {"strategy"});
    const bool dryRun = ioContext.Args().Has("dry-run");
    if (!dryRun) {
        RefuseWithOpenTransaction(ioContext, "getting the latest");
    }
    RequireOpen(ioContext);
    const WriteLock lock(ioContext);
    // With no session there is nothing to bring up to date: a new one is based on the newest commit.
    WorkSession session = dryRun ? RequireSession(ioContext) : OpenSession(ioContext);
    if (asks) {
        return GetLatestWithUser(ioContext, session);
    }
    const LatestState state = LoadLatestState(ioContext, session);
    if (dryRun) {
        TellWouldGet(ioContext, session, state);
    } else {
        GetLatest(ioContext, session, state);
    }
}

}  // namespace zo
