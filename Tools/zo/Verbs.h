// The verbs, one function each. A verb returns when it is done and throws a Failure when it is not.
#pragma once

namespace zo {

class Context;

void RunHub(Context& ioContext);
void RunLogin(Context& ioContext);
void RunLogout(Context& ioContext);
void RunWhoAmI(Context& ioContext);
void RunProductions(Context& ioContext);
void RunOpen(Context& ioContext);
void RunShow(Context& ioContext);
void RunAssets(Context& ioContext);
void RunGet(Context& ioContext);
void RunSession(Context& ioContext);
void RunStatus(Context& ioContext);
void RunAdd(Context& ioContext);
void RunIngest(Context& ioContext);
void RunSet(Context& ioContext);
void RunPut(Context& ioContext);
void RunRemove(Context& ioContext);
void RunXmp(Context& ioContext);
void RunCommit(Context& ioContext);
void RunRollback(Context& ioContext);
void RunPending(Context& ioContext);
void RunShare(Context& ioContext);
void RunLatest(Context& ioContext);
void RunConflicts(Context& ioContext);
void RunResolve(Context& ioContext);
void RunDiff(Context& ioContext);
void RunHistory(Context& ioContext);
void RunWatch(Context& ioContext);
void RunDesk(Context& ioContext);
void RunHelp(Context& ioContext);
void RunVersion(Context& ioContext);
void RunCompletion(Context& ioContext);
void RunMan(Context& ioContext);

}  // namespace zo
