// The answers to conflicts: the session takes their side of an item, or stays with its own.
#include "Base/Error.h"
#include "Model/TreeMerge.h"
#include "Routes/DifferenceLinks.h"
#include "Routes/RouteTable.h"

namespace zohub {

namespace {

enum class Answer { Theirs, Yours };

constexpr char kTheirsTitle[] = "Took the shared side of a conflict";
constexpr char kYoursTitle[] = "Kept the own side of a conflict";

// The entry of the differences that the link belonged to.
struct Entry {
    std::string kind;
    std::string asset;
    std::string name;

    explicit Entry(Request const& inRequest)
        : kind(ValueOf(inRequest, "kind")),
          asset(ValueOf(inRequest, "asset")),
          name(ValueOf(inRequest, "name")) {}

    // The renditions of an asset are decided together with it.
    bool Covers(ConflictRecord const& inConflict) const {
        if (inConflict.item != asset)
            return false;
        if (kind == kConflictAsset)
            return inConflict.kind == kConflictAsset || inConflict.kind == kConflictRendition;
        return inConflict.kind == kind && inConflict.name == name;
    }

private:
    static std::string ValueOf(Request const& inRequest, char const* inKey) {
        auto const found = inRequest.query.find(inKey);
        return found == inRequest.query.end() ? std::string() : found->second;
    }
};

std::string ReadCommit(Request const& inRequest) {
    Json const body = ParseJsonObject(inRequest.body, "The body of the answer to a conflict");
    CheckKeys(body, {{":commitId", JsonKind::String}}, "the body of the answer to a conflict");
    return StringUnder(body, ":commitId");
}

// Moves the conflicts that the entry covers out of the list.
std::vector<ConflictRecord> Extract(std::vector<ConflictRecord>& ioConflicts, Entry const& inEntry) {
    std::vector<ConflictRecord> chosen;
    std::vector<ConflictRecord> others;
    for (auto& conflict : ioConflicts)
        (inEntry.Covers(conflict) ? chosen : others).push_back(std::move(conflict));
    ioConflicts = std::move(others);
    return chosen;
}

Response Accept(Call& ioCall, Answer inAnswer) {
    std::string const commit = ReadCommit(ioCall.request);
    View session = OpenSession(ioCall);
    auto conflicts = ioCall.transaction.ListConflicts(session.line.id);
    auto const chosen = Extract(conflicts, Entry(ioCall.request));
    if (chosen.empty())
        throw Failure(404, "conflict-gone",
                      "This conflict is no longer open; load the outgoing changes again.");
    if (!commit.empty() && commit != session.line.headCommit)
        throw Failure(412, "session-changed",
                      "The session has changed since the commit that the request names; load it and look "
                      "again.");
    TreeRoot const theirs =
        ioCall.repository.Open(session.line.id, session.line.baseCommit, ioCall.actor).tree;
    bool const takesTheirs = inAnswer == Answer::Theirs;
    TreeRoot const tree =
        takesTheirs ? TakeTheirs(ioCall.transaction, theirs, session.tree, chosen, ScopeOf(session.line))
                    : session.tree;
    ioCall.repository.CommitTree(session, tree, takesTheirs ? kTheirsTitle : kYoursTitle, ioCall.actor,
                                 ioCall.now);
    ioCall.transaction.ReplaceConflicts(session.line.id,
                                        OpenConflicts(ioCall.transaction, theirs, tree, conflicts));
    return LineResponse(ioCall, session, 200);
}

}  // namespace

void AddAcceptRoutes(std::vector<Route>& ioRoutes) {
    std::string const line = std::string(kApiPath) + "/p/{}";
    ioRoutes.push_back({"POST", line + kAcceptTheirsTail, SignIn::Needed,
                        [](Call& ioCall) { return Accept(ioCall, Answer::Theirs); }});
    ioRoutes.push_back({"POST", line + kAcceptYoursTail, SignIn::Needed,
                        [](Call& ioCall) { return Accept(ioCall, Answer::Yours); }});
}

}  // namespace zohub
