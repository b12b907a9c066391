// Differences: what a session would share, what waits for it, and between any two commits that one may see.
#include "Base/Error.h"
#include "Base/Text.h"
#include "Routes/DifferenceDocument.h"
#include "Routes/DifferenceLinks.h"
#include "Routes/RouteTable.h"

namespace zohub {

namespace {

Response DifferencesResponse(Call& ioCall, Differences const& inDifferences) {
    std::string const state = WhatDecides(inDifferences);
    Response response;
    response.etag = MakeETag(state);
    if (ioCall.HasCurrent(response.etag))
        return response;
    response.contentType = kJsonType;
    response.body = ioCall.cache.FindOrMake(
        state, [&] { return WriteDifferences(ioCall.transaction, ioCall.api, inDifferences); });
    return response;
}

View ReadSession(Call& ioCall) {
    View session = OpenView(ioCall, false);
    if (!session.IsSession())
        throw Failure(404, "not-found",
                      "Only a session has changes of its own and changes that wait for it.");
    return session;
}

View BaseOf(Call& ioCall, View const& inSession) {
    return ioCall.repository.Open(inSession.line.id, inSession.line.baseCommit, ioCall.actor);
}

Response Outgoing(Call& ioCall) {
    Differences differences;
    differences.right = ReadSession(ioCall);
    View const& session = differences.right;
    std::string const prefix = DocumentWriter(ioCall.api, session).LivePrefix();
    differences.self = prefix + kOutgoingTail;
    differences.left = BaseOf(ioCall, session);
    differences.conflicts = ioCall.transaction.ListConflicts(session.line.id);
    if (session.mayManage)
        differences.accept = prefix;
    return DifferencesResponse(ioCall, differences);
}

Response Incoming(Call& ioCall) {
    View const session = ReadSession(ioCall);
    Differences differences;
    differences.self = DocumentWriter(ioCall.api, session).LivePrefix() + kIncomingTail;
    differences.left = BaseOf(ioCall, session);
    differences.right = ioCall.repository.Open(session.line.parent, "", ioCall.actor);
    return DifferencesResponse(ioCall, differences);
}

std::string QueryValue(Call const& inCall, char const* inKey) {
    auto const found = inCall.request.query.find(inKey);
    return found == inCall.request.query.end() ? std::string() : found->second;
}

Response BetweenCommits(Call& ioCall) {
    std::string const& line = ioCall.parameters[0];
    std::string const base = QueryValue(ioCall, "base");
    std::string const commit = QueryValue(ioCall, "commit");
    Differences differences;
    differences.right = ioCall.repository.Open(line, commit, ioCall.actor);
    if (!base.empty()) {
        View left = ioCall.repository.Open(line, base, ioCall.actor);
        left.isPinned = true;  // "HEAD" as well: what is removed later must still be found on this side
        differences.left = std::move(left);
    }
    differences.self = DocumentWriter(ioCall.api, differences.right).LivePrefix() +
                       "/diff?base=" + PercentEncode(base) + "&commit=" + PercentEncode(commit);
    return DifferencesResponse(ioCall, differences);
}

}  // namespace

void AddDifferenceRoutes(std::vector<Route>& ioRoutes) {
    std::string const line = std::string(kApiPath) + "/p/{}";
    ioRoutes.push_back({"GET", line + kOutgoingTail, SignIn::Needed, Outgoing});
    ioRoutes.push_back({"GET", line + kIncomingTail, SignIn::Needed, Incoming});
    ioRoutes.push_back({"GET", line + "/diff", SignIn::Needed, BetweenCommits});
}

}  // namespace zohub
