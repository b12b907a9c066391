// What share, latest and resolve have in common, whether or not their user is asked on the way.
#pragma once

#include <string>
#include <vector>

#include "Changes.h"

namespace zo {

extern const char* const kConflictsHint;

/// "1 change", "3 changes".
std::string Counted(std::size_t inCount, const char* inWhat);

std::size_t CountConflicts(const std::vector<Change>& inChanges);

/// How the session stands to what is shared.
struct LatestState {
    std::vector<Change> outgoing;
    std::vector<Change> incoming;
    /// The shared commit that the session is based on, and the newest one.
    std::string base;
    std::string head;
};
LatestState LoadLatestState(Context& ioContext, const WorkSession& inSession);

/// Of how many items both sides had changed the metadata, and none of it is in conflict after a pull. Takes
/// what the session has to share then.
std::size_t CountMerged(const LatestState& inBefore, const std::vector<Change>& inAfter);

/// After a push or pull: what is open, and what was seen.
void RememberMoved(Context& ioContext, const WorkSession& inSession, const std::string& inCommit,
                   const std::string& inBase);

/// For people: what a pull has brought, and how many items of metadata were merged.
void SayGot(Output& ioOutput, const LatestState& inBefore, const std::string& inBase, std::size_t inMerged);

/// What to say when the hub refuses a share.
Failure RefusedShare(Context& ioContext, const WorkSession& inSession, const Outcome& inOutcome,
                     const std::string& inSeenCommit);

}  // namespace zo
