// Transactions on a session: the list of the open ones, their making, commit and rollback.
#include "Base/Error.h"
#include "Model/Sessions.h"
#include "Routes/Documents.h"
#include "Routes/RouteTable.h"

namespace zohub {

namespace {

constexpr std::size_t kMaxMetadata = 64 * 1024;

// For reading, so without the owner's rights.
View OpenSessionToRead(Call& ioCall) {
    View session = OpenView(ioCall, false);
    if (!session.IsSession())
        throw Failure(404, "not-found", "Transactions stand on sessions only.");
    return session;
}

Response ListTransactions(Call& ioCall) {
    View const session = OpenSessionToRead(ioCall);
    auto const lines = ioCall.transaction.ListLinesOn(session.line.id, kLineTransaction);
    std::string const self = DocumentWriter(ioCall.api, session).LivePrefix() + "/transactions";
    std::string text = "{\"links\":";
    {
        LinkWriter links(text);
        links.Plain("self", self);
        if (session.mayManage)
            links.Plain("create", self);
    }
    text += ",\"stats\":{\"totalResults\":" + std::to_string(lines.size()) + "},\"transactions\":[";
    for (auto const& line : lines) {
        if (text.back() != '[')
            text += ',';
        AppendTransactionItem(text, ioCall.api, line);
    }
    text += "]}";
    return JsonResponse(200, std::move(text));
}

Sessions::Opening ReadOpening(Request const& inRequest) {
    Json const body = ParseJsonObject(inRequest.body, "The body of the transaction");
    CheckKeys(body,
              {{":commitId", JsonKind::StringOrNull},
               {":requireHead", JsonKind::BooleanOrNull},
               {"metadata", JsonKind::ObjectOrNull}},
              "the body of the transaction");
    Sessions::Opening opening;
    opening.commit = StringUnder(body, ":commitId");
    opening.requireHead = body.value(":requireHead", Json(false)) == Json(true);
    Json const metadata = body.value("metadata", Json());
    opening.metadata = metadata.is_object() ? JsonText(metadata) : "{}";
    if (opening.metadata.size() > kMaxMetadata)
        throw Failure(413, "metadata-too-large", "A transaction's metadata has at most 64 KiB.");
    return opening;
}

Response CreateTransaction(Call& ioCall) {
    Sessions::Opening const opening = ReadOpening(ioCall.request);
    View const session = OpenSession(ioCall);
    View const transaction =
        Sessions(ioCall.transaction, ioCall.actor, ioCall.now).OpenTransaction(session, opening);
    return LineResponse(ioCall, transaction, 201);
}

Response CommitTransaction(Call& ioCall) {
    Json const body = ParseJsonObject(ioCall.request.body, "The body of the commit");
    CheckKeys(body, {{":resolveStrategy", JsonKind::String}, {":commitMessage", JsonKind::String}},
              "the body of the commit");
    ResolveStrategy const strategy = ReadResolveStrategy(StringUnder(body, ":resolveStrategy"));
    std::string const title = CheckedMessage(StringUnder(body, ":commitMessage"));
    View transaction = OpenTransaction(ioCall);
    View const session = Sessions(ioCall.transaction, ioCall.actor, ioCall.now)
                             .CommitTransaction(transaction, strategy, title);
    return LineResponse(ioCall, session, 200);
}

Response RollBack(Call& ioCall) {
    View const transaction = OpenTransaction(ioCall);
    Sessions(ioCall.transaction, ioCall.actor, ioCall.now).Discard(transaction);
    return EmptyResponse(204);
}

}  // namespace

View OpenTransaction(Call& ioCall) {
    View transaction = OpenView(ioCall, false);
    if (!transaction.IsTransaction())
        throw Failure(404, "not-found", "This address is there for transactions only.");
    RequireWritable(transaction);
    RequireMatch(ioCall.request, DocumentWriter(ioCall.api, transaction).ProductionTag(), "The transaction");
    return transaction;
}

void AddTransactionRoutes(std::vector<Route>& ioRoutes) {
    std::string const line = std::string(kApiPath) + "/p/{}";
    ioRoutes.push_back({"GET", line + "/transactions", SignIn::Needed, ListTransactions});
    ioRoutes.push_back({"POST", line + "/transactions", SignIn::Needed, CreateTransaction});
    ioRoutes.push_back({"POST", line + "/commit", SignIn::Needed, CommitTransaction});
    ioRoutes.push_back({"POST", line + "/rollback", SignIn::Needed, RollBack});
}

}  // namespace zohub
