// States and words of sharing and getting the latest.
#include "Sharing.h"

#include <algorithm>
#include <set>

#include "Failure.h"
#include "ZOClient/IZOCEnclosure.h"

namespace zo {
namespace {

using ZOCL::ImmutableString;

constexpr const char* kBehindHint = "get the latest with 'zo latest', then share again";

bool IsXMPEnclosure(const Change& inChange) {
    static const std::string end = ZOCL::GetXMPEnclosureName(ImmutableString("")).str();
    const std::string_view name = inChange.entry.name.view();
    return inChange.kind == ItemKind::Enclosure && name.size() > end.size() &&
           name.substr(name.size() - end.size()) == end;
}

// The metadata that both sides have changed, or that is in conflict already.
std::set<ItemKey> MetadataOfBoth(const LatestState& inState) {
    std::set<ItemKey> incoming;
    for (const Change& change : inState.incoming) {
        incoming.insert(KeyOf(change));
    }
    std::set<ItemKey> both;
    for (const Change& change : inState.outgoing) {
        const bool isOfBoth = incoming.count(KeyOf(change)) != 0 || change.entry.IsInConflict();
        if (IsXMPEnclosure(change) && !change.IsRemoved() && isOfBoth) {
            both.insert(KeyOf(change));
        }
    }
    return both;
}

}  // namespace

const char* const kConflictsHint = "'zo conflicts' shows them, 'zo resolve' decides them";

std::string Counted(std::size_t inCount, const char* inWhat) {
    return std::to_string(inCount) + " " + inWhat + (inCount == 1 ? "" : "s");
}

std::size_t CountConflicts(const std::vector<Change>& inChanges) {
    return static_cast<std::size_t>(
        std::count_if(inChanges.begin(), inChanges.end(),
                      [](const Change& inChange) { return inChange.entry.IsInConflict(); }));
}

LatestState LoadLatestState(Context& ioContext, const WorkSession& inSession) {
    LatestState state;
    const auto outgoing = inSession.session->GetOutgoingChanges();
    const auto incoming = inSession.session->GetIncomingChanges();
    state.outgoing = LoadChanges(ioContext, outgoing, "loading what the session has to share");
    state.incoming = LoadChanges(ioContext, incoming, "loading what others have shared");
    state.base = outgoing->GetBaseCommitID().str();
    state.head = incoming->GetCommitID().str();
    return state;
}

std::size_t CountMerged(const LatestState& inBefore, const std::vector<Change>& inAfter) {
    std::set<ItemKey> merged = MetadataOfBoth(inBefore);
    for (const Change& change : inAfter) {
        if (change.entry.IsInConflict()) {
            merged.erase(KeyOf(change));
        }
    }
    return merged.size();
}

void RememberMoved(Context& ioContext, const WorkSession& inSession, const std::string& inCommit,
                   const std::string& inBase) {
    ChangeOpen(ioContext, [&](OpenRecord& ioRecord) {
        ioRecord.session = inSession.view.url;
        ioRecord.seenCommit = inCommit;
        ioRecord.commit = inBase;
    });
}

void SayGot(Output& ioOutput, const LatestState& inBefore, const std::string& inBase, std::size_t inMerged) {
    ioOutput.Say(inBase == inBefore.base ? "there is nothing newer than what the session is based on"
                                         : "got " + Counted(inBefore.incoming.size(), "change") +
                                               " of others; based on " + inBase + " now");
    if (inMerged != 0) {
        ioOutput.Say("merged the metadata of " + Counted(inMerged, "item") + " that both sides had changed");
    }
}

Failure RefusedShare(Context& ioContext, const WorkSession& inSession, const Outcome& inOutcome,
                     const std::string& inSeenCommit) {
    const std::string what = "sharing the session on " + inSession.productionName;
    if (inOutcome.result == ZOCL::kResultHTTPPreconditionFailed) {
        return SessionMoved(ioContext, inSession, what, inSeenCommit);
    }
    if (inOutcome.result == ZOCL::kResultHTTPConflict) {
        if (CountConflicts(LoadOutgoing(ioContext, inSession)) != 0) {
            return Failure(ExitCode::ConflictsRemain, what + ": conflicts remain", kConflictsHint);
        }
        return Failure::OfRequest(what, inOutcome.result, inOutcome.response, kBehindHint);
    }
    return Failure::OfRequest(what, inOutcome.result, inOutcome.response,
                              HintAfterLostAnswer(inOutcome.result, inOutcome.response));
}

}  // namespace zo
