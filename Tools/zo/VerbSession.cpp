// session, status: the user's own line on the open production, and how it stands to what is shared.
#include <chrono>

#include "Changes.h"
#include "Failure.h"
#include "ostcore/utility/StringConversion.h"
#include "PasswordInput.h"
#include "Verbs.h"
#include "WriteLock.h"
#include "Writing.h"
#include "ZOClient/Library.h"
#include "ZOClient/ZOSandbox.h"

namespace zo {
namespace {

// A state that is not told by then is shown as uncertain.
constexpr std::chrono::seconds kPatience{20};

struct Counts {
    std::size_t assets = 0;
    std::size_t enclosures = 0;
    std::size_t properties = 0;
    std::size_t conflicts = 0;

    explicit Counts(const std::vector<Change>& inChanges) {
        for (const Change& change : inChanges) {
            ++(change.kind == ItemKind::Asset       ? assets
               : change.kind == ItemKind::Enclosure ? enclosures
                                                    : properties);
            conflicts += change.entry.IsInConflict() ? 1 : 0;
        }
    }
    std::size_t All() const { return assets + enclosures + properties; }
    Json AsJson() const {
        return Json::Part().Set("assets", assets).Set("enclosures", enclosures).Set("properties", properties);
    }
};

std::string Plural(std::size_t inCount, const char* inWhat) {
    return std::to_string(inCount) + " " + inWhat + (inCount == 1 ? "" : "s");
}

// --- session

void ShowSession(Context& ioContext) {
    const WorkSession session = RequireSession(ioContext);
    if (!ioContext.Args().Has("dry-run")) {
        RememberSession(ioContext, session);
    }
    const auto outgoing = session.session->GetOutgoingChanges();
    const Counts counts(LoadChanges(ioContext, outgoing, "loading what the session has to share"));
    const std::string base = outgoing->GetBaseCommitID().str();
    const auto& production = session.view.production;
    const std::string transaction = RequireOpen(ioContext).transaction;
    Json json("session");
    json.Set("id", session.view.id)
        .Set("production", session.productionID)
        .Set("name", session.productionName);
    json.Set("owner", production->GetOwner()).Set("commit", session.view.commit).Set("baseCommit", base);
    json.Set("created", production->GetCreationTime()).Set("modified", production->GetModificationTime());
    json.Set("outgoing", counts.AsJson()).Set("transactionOpen", !transaction.empty());
    json.Set("url", session.view.url).Set("state", "open").Set("dryRun", false);
    Output& out = ioContext.Out();
    out.Record(json);
    out.Field("session", session.view.id);
    out.Field("production", session.productionName);
    out.Field("owner", production->GetOwner());
    out.Field("created", ShortTime(production->GetCreationTime()));
    out.Field("modified", ShortTime(production->GetModificationTime()));
    out.Field("commit", session.view.commit);
    out.Field("based on", base);
    out.Field("to share", Plural(counts.All(), "change"));
    if (!transaction.empty()) {
        out.Field("transaction", "open; 'zo commit' or 'zo rollback' ends it");
    }
}

void ConfirmDiscard(Context& ioContext, const WorkSession& inSession, std::size_t inChanges) {
    if (ioContext.Args().Has("yes")) {
        return;
    }
    const std::string what = "discarding the session on " + inSession.productionName + " with " +
                             Plural(inChanges, "change") + " that nobody else has";
    if (!ioContext.Out().MayAsk()) {
        throw Failure(ExitCode::Usage, what + " needs --yes where nobody can be asked");
    }
    const std::string answer =
        AskOnTerminal(what + " cannot be undone. Discard it? [y/N] ", ioContext.Signals());
    if (answer != "y" && answer != "Y" && answer != "yes") {
        throw Failure(ExitCode::Cancelled, "the session was kept");
    }
}

void DiscardSession(Context& ioContext) {
    const WorkSession session = RequireSession(ioContext);
    const std::vector<Change> outgoing = LoadOutgoing(ioContext, session);
    const bool dryRun = ioContext.Args().Has("dry-run");
    Json json("session");
    json.Set("id", session.view.id)
        .Set("production", session.productionID)
        .Set("name", session.productionName);
    json.Set("commit", session.view.commit).Set("outgoing", Counts(outgoing).AsJson());
    json.Set("state", dryRun ? "open" : "discarded").Set("dryRun", dryRun);
    if (dryRun) {
        ioContext.Out().Record(json);
        return ioContext.Out().Say("would discard the session on " + session.productionName + " with " +
                                   Plural(outgoing.size(), "change"));
    }
    ConfirmDiscard(ioContext, session, outgoing.size());
    const WriteLock lock(ioContext);
    const auto resource = RFL::QueryInterface<ZOCL::IZOCWritableServerResource>(session.view.production);
    const Outcome outcome = ioContext.Loop().RunToEnd(
        [&](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
            return resource && resource->Delete(inRequest, inCompletion);
        });
    if (!outcome.Succeeded()) {
        throw Failure::OfRequest("discarding the session on " + session.productionName, outcome.result,
                                 outcome.response);
    }
    ChangeOpen(ioContext, [](OpenRecord& ioRecord) {
        ioRecord.session = ioRecord.seenCommit = ioRecord.transaction = "";
    });
    ioContext.Out().Record(json);
    ioContext.Out().Say("discarded the session on " + session.productionName);
}

// --- status

struct SandboxState {
    bool isDirty = false;
    bool isInSync = true;
    bool hasConflicts = false;
    bool isDirtyCertain = true;
    bool isSyncCertain = true;
};

// Asks the library's sandbox, as every host does, and waits until it has told of its state.
SandboxState LookAtSandbox(Context& ioContext, const WorkSession& inSession) {
    const auto sandbox = boost::make_shared<ZOCL::ZOSandbox>(ZOCL::ImmutableString(inSession.view.url));
    ZOCL::SetCurrentZOSandbox(sandbox);
    bool isTold = false;
    RFL::Listener listener(ZOCL::GetStationID());
    listener.AddHandler<ZOCL::ZOSandboxStateChangedMessage>(
        [&](const ZOCL::ZOSandboxStateChangedMessage&) { isTold = true; });
    if (ZOCL::UpdateCurrentZOSandboxAsync()) {
        ioContext.Loop().WaitUntil([&] { return isTold; }, kPatience);
    }
    SandboxState state;
    state.isDirty = sandbox->IsDirty();
    state.isInSync = sandbox->IsInSync();
    state.hasConflicts = sandbox->HasConflicts();
    state.isDirtyCertain = !sandbox->IsDirtyStateUncertain();
    state.isSyncCertain = !sandbox->IsSyncStateUncertain();
    ZOCL::SetCurrentZOSandbox(nullptr);
    return state;
}

const char* YesNo(bool inIs) {
    return inIs ? "yes" : "no";
}

void PrintState(Context& ioContext, const SandboxState& inState, const Counts& inOutgoing,
                const Counts& inIncoming) {
    Table table({{"", 0}, {"STATE"}, {"CERTAIN"}, {"WHAT IT MEANS", 20}});
    table.AddRow({"dirty", YesNo(inState.isDirty), YesNo(inState.isDirtyCertain),
                  inState.isDirty ? Plural(inOutgoing.All(), "change") + " to share" : "nothing to share"});
    table.AddRow({"in sync", YesNo(inState.isInSync), YesNo(inState.isSyncCertain),
                  inState.isInSync ? "based on the newest shared commit"
                                   : Plural(inIncoming.All(), "change") + " of others to get: zo latest"});
    table.AddRow(
        {"conflicts", YesNo(inState.hasConflicts), YesNo(inState.isDirtyCertain),
         inState.hasConflicts ? Plural(inOutgoing.conflicts, "item") + " to decide: zo conflicts" : "none"});
    ioContext.Out().Print(table);
}

Json StatusJson(const OpenRecord& inOpen, const SandboxState& inState) {
    Json json("status");
    json.Set("production", inOpen.production).Set("name", inOpen.name);
    json.Set("dirty", inState.isDirty).Set("inSync", inState.isInSync).Set("conflicts", inState.hasConflicts);
    json.Set("dirtyCertain", inState.isDirtyCertain).Set("inSyncCertain", inState.isSyncCertain);
    return json.Set("transactionOpen", !inOpen.transaction.empty());
}

}  // namespace

void RunSession(Context& ioContext) {
    if (*ioContext.Args().Positional(0) == "discard") {
        DiscardSession(ioContext);
    } else {
        ShowSession(ioContext);
    }
}

void RunStatus(Context& ioContext) {
    const OpenRecord open = RequireOpen(ioContext);
    Output& out = ioContext.Out();
    const auto session = FindSession(ioContext);
    if (!session) {
        Json json = StatusJson(open, SandboxState());
        const Counts none({});
        json.Set("session", "").Set("commit", "").Set("baseCommit", "").Set("openConflicts", 0);
        out.Record(json.Set("outgoing", none.AsJson()).Set("incoming", none.AsJson()));
        return out.Line(ioContext.ConnectedTarget().user + " has no session on " + open.name +
                        " yet; the first change makes one");
    }
    const auto differences = session->session->GetOutgoingChanges();
    const Counts outgoing(LoadChanges(ioContext, differences, "loading what the session has to share"));
    const Counts incoming(LoadIncoming(ioContext, *session));
    const SandboxState state = LookAtSandbox(ioContext, *session);
    RememberSession(ioContext, *session);
    Json json = StatusJson(open, state);
    json.Set("session", session->view.id).Set("commit", session->view.commit);
    json.Set("baseCommit", differences->GetBaseCommitID()).Set("openConflicts", outgoing.conflicts);
    out.Record(json.Set("outgoing", outgoing.AsJson()).Set("incoming", incoming.AsJson()));
    out.Field("production", open.name);
    out.Field("session", session->view.id + " of " + ioContext.ConnectedTarget().user);
    if (!open.transaction.empty()) {
        out.Field("transaction", "open; 'zo commit' or 'zo rollback' ends it");
    }
    PrintState(ioContext, state, outgoing, incoming);
}

}  // namespace zo
