// Share, latest and resolve with their user before them: the flows of the library, with its windows on the
// terminal.
#pragma once

#include <string>
#include <vector>

#include "Sessions.h"

namespace zo {

/// When a verb asks its user on the way: wherever there is one, or only when --interactive says so.
enum class Asks { Usually, WhenTold };

/// Whether the verb asks on the way. It does not when one of the options is there that decide beforehand.
/// With --interactive throws a Failure (usage) where that contradicts another option, or where nobody can be
/// asked.
bool AsksOnTheWay(Context& ioContext, Asks inWhen, const std::vector<std::string>& inDeciding);

/// Each runs one flow, remembers the session's commit as seen, and says in one line what came of it. Throws a
/// Failure unless all was done: conflicts remain, cancelled when the user stopped, else what went wrong. The
/// caller holds the WriteLock.
void ShareWithUser(Context& ioContext, WorkSession& ioSession);
void GetLatestWithUser(Context& ioContext, WorkSession& ioSession);
void ResolveWithUser(Context& ioContext, WorkSession& ioSession);

}  // namespace zo
