// commit, rollback, pending: transactions that were left open, and those of others.
#include "Failure.h"
#include "Verbs.h"
#include "Writing.h"

namespace zo {

void RunCommit(Context& ioContext) {
    CommitOpenTransaction(ioContext, ioContext.Args().ValueOr("message", "Changes made with zo"));
}

void RunRollback(Context& ioContext) {
    RollBackOpenTransaction(ioContext);
}

void RunPending(Context& ioContext) {
    const OpenRecord open = RequireOpen(ioContext);
    const WorkSession session = RequireSession(ioContext);
    const auto list = session.session->GetOrCreateTransactionList();
    LoadResource(ioContext, list, "listing the transactions on the session on " + session.productionName);
    Table table({{"OWNER", 5}, {"APPLICATION", 8}, {"MACHINE", 8}, {"TYPE"}, {"SINCE"}, {"ID", 8}, {"MINE"}});
    for (const auto& entry : list->GetAllItems()) {
        const bool isMine = entry.url.view() == open.transaction;
        const auto& metadata = entry.metadata;
        Json json("pending");
        json.Set("id", entry.identifier).Set("session", entry.sessionIdentifier).Set("owner", entry.owner);
        json.Set("application", metadata.applicationName)
            .Set("applicationBuild", metadata.applicationBuildNumber)
            .Set("machine", metadata.machineName)
            .Set("machineIP", metadata.machineIP);
        json.Set("transactionType", metadata.transactionType).Set("created", entry.created);
        ioContext.Out().Record(json.Set("baseCommit", entry.baseCommit).Set("leftOpenHere", isMine));
        table.AddRow({entry.owner.str(), metadata.applicationName.str(), metadata.machineName.str(),
                      metadata.transactionType.str(), ShortTime(entry.created), entry.identifier.str(),
                      isMine ? "yes" : "no"});
    }
    if (table.IsEmpty()) {
        return ioContext.Out().Note("no transaction is open on your session");
    }
    ioContext.Out().Print(table);
}

}  // namespace zo
