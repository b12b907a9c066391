// Opens, fills and ends transactions.
#include "Writing.h"

#include "Failure.h"
#include "ostcore/utility/StringConversion.h"
#include "WriteLock.h"

namespace zo {
namespace {

using ostcore::utility::ToUTF16;
using ZOCL::ImmutableString;

// The session may move between being loaded and the opening of the transaction.
constexpr int kAttempts = 3;

enum class End { Commit, LeaveOpen };

OpenTransaction Describe(const LoadedProduction& inView) {
    return {inView, RFL::QueryInterface<ZOCL::IZOCTransaction>(inView.production)};
}

// What this program left behind is rolled back; others are waited for.
void WaitForOthers(Context& ioContext, const WorkSession& inSession) {
    const auto session = inSession.session;
    const Outcome outcome = ioContext.Loop().Run(
        [session](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
            return session->GetPendingTransactions(ZOCL::kNoConflictTransactionTypes,
                                                   [inRequest, inCompletion](int inResult) {
                                                       inCompletion(inRequest, inResult, nullptr, nullptr);
                                                   });
        },
        [](const ZOCL::Guid&) {});
    if (!outcome.Succeeded()) {
        throw Failure::OfRequest("waiting for the pending transactions of others", outcome.result, nullptr,
                                 "'zo pending' shows whose they are");
    }
}

OpenTransaction Begin(Context& ioContext, WorkSession& ioSession, const ImmutableString& inType) {
    const std::string what = "opening a transaction on the session on " + ioSession.productionName;
    WaitForOthers(ioContext, ioSession);
    for (int attempt = 1;; ++attempt) {
        const auto session = ioSession.session;
        ioContext.Loop().ThrowIfInterrupted();
        // Not to be cancelled half-way: it could be open then without our knowing it.
        const Outcome outcome = ioContext.Loop().RunToEnd(
            [&](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
                return session->CreateTransaction(inRequest, inCompletion, inType);
            });
        const auto production = RFL::QueryInterface<ZOCL::IZOCProduction>(outcome.resource);
        if (outcome.Succeeded() && production) {
            return Describe(DescribeProduction(production));
        }
        const bool hasMoved = outcome.result == ZOCL::kResultHTTPPreconditionFailed;
        if (!hasMoved || attempt == kAttempts) {
            throw Failure::OfRequest(what, outcome.Succeeded() ? ZOCL::kResultFailure : outcome.result,
                                     outcome.response);
        }
        RefreshSession(ioContext, ioSession);
    }
}

// Null when it was rolled back or was gone already, else why it stays.
std::unique_ptr<Failure> RollBack(Context& ioContext, const OpenTransaction& inTransaction) {
    ioContext.Loop().Drain();
    const Outcome outcome = ioContext.Loop().RunToEnd(
        [&](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
            return inTransaction.transaction->Rollback(inRequest, inCompletion);
        });
    if (outcome.Succeeded()) {
        return nullptr;
    }
    return std::make_unique<Failure>(Failure::OfRequest(
        "rolling back the transaction", outcome.result, outcome.response,
        "it stays pending until the next change of yours, which rolls it back; 'zo pending' shows it"));
}

// The new commit of the session.
std::string Commit(Context& ioContext, const WorkSession& inSession, const OpenTransaction& inTransaction,
                   const std::string& inMessage) {
    const Outcome outcome = ioContext.Loop().RunToEnd(
        [&](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
            return inTransaction.transaction->Commit(inRequest, inCompletion, ToUTF16(inMessage));
        });
    const std::string what = "committing the transaction";
    if (outcome.result == ZOCL::kResultHTTPPreconditionFailed) {
        throw SessionMoved(ioContext, inSession, what, inSession.view.commit);
    }
    if (!outcome.Succeeded()) {
        throw Failure::OfRequest(what, outcome.result, outcome.response,
                                 HintAfterLostAnswer(outcome.result, outcome.response));
    }
    const std::string commit = TextInAnswer(outcome.response, "zo:commitId");
    const auto session = RFL::QueryInterface<ZOCL::IZOCProduction>(outcome.resource);
    return session ? session->GetLoadedRevision().str() : commit;
}

// Rolls back what was opened here when the function throws.
template <class Function>
auto OrRollBack(Context& ioContext, const OpenTransaction& inTransaction, const Function& inFunction) {
    try {
        return inFunction();
    } catch (...) {
        if (const auto failure = RollBack(ioContext, inTransaction)) {
            ioContext.Out().Error(*failure);
        }
        throw;
    }
}

struct Told {
    const char* state;
    std::string commit;
    std::string message;
    std::size_t changes = 0;
};

void Tell(Context& ioContext, const WorkSession& inSession, const OpenTransaction& inTransaction,
          const Written& inWritten, const Told& inTold) {
    Output& out = ioContext.Out();
    out.EndProgress();
    for (const Json& record : inWritten.records) {
        out.Record(record);
    }
    for (const std::string& line : inWritten.lines) {
        out.Say(line);
    }
    Json json("transaction");
    json.Set("state", inTold.state).Set("id", inTransaction.view.id).Set("session", inSession.view.id);
    json.Set("commit", inTold.commit).Set("message", inTold.message).Set("changes", inTold.changes);
    out.Record(json.Set("dryRun", false));
}

void RememberCommit(Context& ioContext, const WorkSession& inSession, const std::string& inCommit) {
    ChangeOpen(ioContext, [&](OpenRecord& ioRecord) {
        ioRecord.session = inSession.view.url;
        ioRecord.seenCommit = inCommit;
        ioRecord.transaction.clear();
    });
}

// The transaction that was left open; forgotten, with a Failure, when it has ended elsewhere.
OpenTransaction LoadOpenTransaction(Context& ioContext, const OpenRecord& inOpen) {
    const std::string what = "loading the open transaction on " + inOpen.name;
    const auto isGone = [&] {
        ChangeOpen(ioContext, [](OpenRecord& ioRecord) { ioRecord.transaction.clear(); });
        return Failure(ExitCode::SessionChanged, what + ": it has been committed or rolled back elsewhere",
                       "'zo history' shows what was committed; then do the change again");
    };
    try {
        const OpenTransaction transaction = Describe(LoadByHubURL(ioContext, inOpen.transaction, what));
        if (transaction.view.production->IsTransaction()) {
            return transaction;
        }
    } catch (const Failure& failure) {
        if (failure.Code() != ExitCode::NotFound) {
            throw;
        }
    }
    throw isGone();
}

void WriteIntoOpen(Context& ioContext, const OpenRecord& inOpen,
                   const std::function<Written(const WorkSession&, const OpenTransaction&)>& inWork) {
    const WorkSession session = RequireSession(ioContext);
    const OpenTransaction transaction = LoadOpenTransaction(ioContext, inOpen);
    try {
        const Written written = inWork(session, transaction);
        Tell(ioContext, session, transaction, written, {"open", "", "", written.records.size()});
    } catch (...) {
        ioContext.Out().Note(
            "the transaction stays open, with what was written before; 'zo rollback' drops it");
        throw;
    }
    ioContext.Out().Say("the transaction stays open: 'zo commit' or 'zo rollback' ends it");
}

void WriteIntoNew(Context& ioContext, const WritePlan& inPlan, End inEnd,
                  const std::function<Written(const WorkSession&, const OpenTransaction&)>& inWork) {
    WorkSession session = OpenSession(ioContext);
    const OpenTransaction transaction = Begin(ioContext, session, inPlan.type);
    const std::string message = ioContext.Args().ValueOr("message", inPlan.message);
    std::string commit;
    const Written written = OrRollBack(ioContext, transaction, [&] {
        Written all = inWork(session, transaction);
        if (inEnd == End::Commit) {
            ioContext.Loop().ThrowIfInterrupted();
            commit = Commit(ioContext, session, transaction, message);
        } else {
            ChangeOpen(ioContext, [&](OpenRecord& ioRecord) { ioRecord.transaction = transaction.view.url; });
        }
        return all;
    });
    const std::size_t changes = written.records.size();
    if (inEnd == End::LeaveOpen) {
        Tell(ioContext, session, transaction, written, {"open", "", "", changes});
        ioContext.Out().Say("the transaction stays open: 'zo commit' or 'zo rollback' ends it");
        return;
    }
    RememberCommit(ioContext, session, commit);
    Tell(ioContext, session, transaction, written, {"committed", commit, message, changes});
    ioContext.Out().Say("committed to your session on " + session.productionName + " (" + commit + ")");
}

}  // namespace

void Write(Context& ioContext, const WritePlan& inPlan,
           const std::function<Written(const WorkSession&, const OpenTransaction&)>& inWork) {
    RequireOpen(ioContext);
    const WriteLock lock(ioContext);
    const OpenRecord open = RequireOpen(ioContext);
    if (!open.transaction.empty()) {
        return WriteIntoOpen(ioContext, open, inWork);
    }
    WriteIntoNew(ioContext, inPlan, ioContext.Args().Has("keep-open") ? End::LeaveOpen : End::Commit, inWork);
}

std::string WriteQuietly(Context& ioContext, const WorkSession& inSession, const WritePlan& inPlan,
                         const std::function<void(const OpenTransaction&)>& inWork) {
    WorkSession session = inSession;
    const OpenTransaction transaction = Begin(ioContext, session, inPlan.type);
    const std::string commit = OrRollBack(ioContext, transaction, [&] {
        inWork(transaction);
        ioContext.Loop().ThrowIfInterrupted();
        return Commit(ioContext, session, transaction, inPlan.message);
    });
    RememberCommit(ioContext, session, commit);
    return commit;
}

void RefuseWithOpenTransaction(Context& ioContext, const std::string& inWhat) {
    if (!RequireOpen(ioContext).transaction.empty()) {
        throw Failure(ExitCode::Failure, inWhat + ": a transaction of yours is open",
                      "end it with 'zo commit' or 'zo rollback' first");
    }
}

namespace {

OpenRecord RequireOpenTransaction(Context& ioContext) {
    const OpenRecord open = RequireOpen(ioContext);
    if (open.transaction.empty()) {
        throw Failure(ExitCode::NotFound, "no transaction of yours is open on " + open.name,
                      "a change with --keep-open leaves one open");
    }
    return open;
}

}  // namespace

void CommitOpenTransaction(Context& ioContext, const std::string& inMessage) {
    RequireOpen(ioContext);
    const WriteLock lock(ioContext);
    const OpenRecord open = RequireOpenTransaction(ioContext);
    const WorkSession session = RequireSession(ioContext);
    const OpenTransaction transaction = LoadOpenTransaction(ioContext, open);
    const std::string commit = Commit(ioContext, session, transaction, inMessage);
    RememberCommit(ioContext, session, commit);
    Tell(ioContext, session, transaction, {}, {"committed", commit, inMessage, 0});
    ioContext.Out().Say("committed to your session on " + session.productionName + " (" + commit + ")");
}

void RollBackOpenTransaction(Context& ioContext) {
    RequireOpen(ioContext);
    const WriteLock lock(ioContext);
    const OpenRecord open = RequireOpenTransaction(ioContext);
    const WorkSession session = RequireSession(ioContext);
    const OpenTransaction transaction = LoadOpenTransaction(ioContext, open);
    if (const auto failure = RollBack(ioContext, transaction)) {
        throw Failure(*failure);
    }
    ChangeOpen(ioContext, [](OpenRecord& ioRecord) { ioRecord.transaction.clear(); });
    Tell(ioContext, session, transaction, {}, {"rolled-back", session.view.commit, "", 0});
    ioContext.Out().Say("rolled back; your session on " + session.productionName + " is as it was");
}

void TellDryRun(Context& ioContext, const Written& inWouldBe) {
    for (const Json& record : inWouldBe.records) {
        ioContext.Out().Record(record);
    }
    for (const std::string& line : inWouldBe.lines) {
        ioContext.Out().Say("would have " + line);
    }
    Json json("transaction");
    json.Set("state", "none").Set("id", "").Set("session", "").Set("commit", "");
    json.Set("message", "").Set("changes", inWouldBe.records.size());
    ioContext.Out().Record(json.Set("dryRun", true));
}

}  // namespace zo
