// Items that both sides have changed: those that are in conflict, and those that a pull would bring into it.
#pragma once

#include <string>
#include <vector>

#include "Changes.h"

namespace zo {

/// What one side did since the common ancestor.
struct ConflictSide {
    /// "added", "updated", "removed".
    std::string change;
    /// Who changed it last and when; not-a-date-time when the hub does not tell.
    std::string who;
    boost::posix_time::ptime when;
    /// Which properties of an asset or of the production it changed; empty when there is no more to say.
    std::vector<std::string> parts;

    /// "updated (name, description) by ada, 2026-11-24 17:52".
    std::string Text() const;
};

struct Conflict {
    ItemKey key;
    /// Of the asset, for people; empty for the production's own items.
    std::string asset;
    /// "the XMP metadata of clip01".
    std::string text;
    ConflictSide mine;
    ConflictSide theirs;
    /// The common ancestor.
    std::string baseCommit;
    /// Where to decide it; empty for one that is only predicted.
    std::string acceptMineURL;
    std::string acceptTheirsURL;
};

/// The open conflicts of the session.
std::vector<Conflict> LoadOpenConflicts(Context& ioContext, const WorkSession& inSession);

/// What getting the latest would bring into conflict, worked out from the incoming and outgoing differences
/// by the laws of the hub's merge; changes nothing. What is in conflict already is left out, unless
/// the shared side has changed again.
std::vector<Conflict> PredictConflicts(Context& ioContext, const WorkSession& inSession,
                                       const std::vector<Change>& inOutgoing,
                                       const std::vector<Change>& inIncoming,
                                       const std::string& inBaseCommit);

/// The state is "open", "predicted" or "resolved".
Json ConflictJson(const Conflict& inConflict, const char* inState);
void PrintConflicts(Context& ioContext, const std::vector<Conflict>& inConflicts);

}  // namespace zo
