// Every change goes through here: a transaction on the user's session, committed when the work is done and
// rolled back when it fails or is cancelled.
#pragma once

#include <functional>
#include <string>
#include <vector>

#include "Sessions.h"

namespace zo {

/// An open transaction; the view is the transaction as a production.
struct OpenTransaction {
    LoadedProduction view;
    ZOCL::InterfaceRef<ZOCL::IZOCTransaction> transaction;
};

/// What a verb has written: one object and one line for each thing.
struct Written {
    std::vector<Json> records;
    std::vector<std::string> lines;

    void Add(const Json& inRecord, const std::string& inLine) {
        records.push_back(inRecord);
        lines.push_back(inLine);
    }
};

struct WritePlan {
    ZOCL::ImmutableString type = ZOCL::kTransactionType_Edit;
    /// The message of the commit, unless the user gave another one.
    std::string message;
};

/// Writes what inWork writes, and tells it. Takes up the transaction that was left open, which then stays
/// open; else opens one and commits it, or with --keep-open leaves it open. When inWork throws, is cancelled,
/// or the commit is refused, a transaction that was opened here is rolled back and the Failure goes on.
/// Other zo processes of this user and state directory wait meanwhile.
void Write(Context& ioContext, const WritePlan& inPlan,
           const std::function<Written(const WorkSession&, const OpenTransaction&)>& inWork);

/// Commits in the same way, without telling anything; for verbs that do more than write. Gives the session's
/// new commit. A transaction must not have been left open.
std::string WriteQuietly(Context& ioContext, const WorkSession& inSession, const WritePlan& inPlan,
                         const std::function<void(const OpenTransaction&)>& inWork);

/// Throws a Failure when a transaction was left open: it has to end before what is tried here.
void RefuseWithOpenTransaction(Context& ioContext, const std::string& inWhat);

/// Ends the transaction that was left open.
void CommitOpenTransaction(Context& ioContext, const std::string& inMessage);
void RollBackOpenTransaction(Context& ioContext);

/// Tells of something that would be written.
void TellDryRun(Context& ioContext, const Written& inWouldBe);

}  // namespace zo
