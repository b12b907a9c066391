// Sessions: the list of a production, their making and end, push and pull.
#include "Base/Error.h"
#include "Base/Text.h"
#include "Http/Multipart.h"
#include "Model/Sessions.h"
#include "Routes/Creation.h"
#include "Routes/Documents.h"
#include "Routes/RouteTable.h"

namespace zohub {

namespace {

constexpr std::size_t kMaxMessage = 64 * 1024;

View OpenProduction(Call& ioCall) {
    View view = OpenView(ioCall, false);
    if (view.IsSession() || view.IsTransaction())
        throw Failure(404, "not-found", "Sessions stand on productions only.");
    return view;
}

Response ListSessions(Call& ioCall) {
    View const production = OpenProduction(ioCall);
    std::string const& id = production.line.id;
    auto const lines = ioCall.actor.isAdmin
                           ? ioCall.transaction.ListLinesOn(id, kLineSession)
                           : ioCall.transaction.ListLinesOnOwnedBy(id, kLineSession, ioCall.actor.name);
    std::string items;
    std::size_t count = 0;
    for (auto const& line : lines) {
        if (line.isTemporary)
            continue;
        items += count++ == 0 ? "" : ",";
        AppendSessionItem(items, ioCall.api, line);
    }
    std::string const self = DocumentWriter(ioCall.api, production).LivePrefix() + "/sessions";
    std::string text = "{\"links\":";
    {
        LinkWriter links(text);
        links.Plain("self", self);
        if (production.mayWrite)
            links.Plain("create", self);
    }
    text += ",\"stats\":{\"totalResults\":" + std::to_string(count) + "},\"sessions\":[" + items + "]}";
    return JsonResponse(200, std::move(text));
}

// A session without a name goes by that of its production.
Response CreateSession(Call& ioCall) {
    View const production = OpenProduction(ioCall);
    if (!production.mayWrite)
        throw Failure(403, "not-permitted",
                      "You may read this template but not work on it; make a production of it.");
    Json body = ParseJsonObject(ioCall.request.body, "The body of the creation");
    CheckKeys(body, {{"name", JsonKind::String}}, "the body of the creation");
    if (StringUnder(body, "name").empty())
        body["name"] = StringUnder(Json::parse(production.tree.properties), "name");
    Creation const creation = ReadCreation(body);
    Json const metadata = {{"name", creation.name}, {"description", creation.description}};
    View const session = Sessions(ioCall.transaction, ioCall.actor, ioCall.now)
                             .Create(production, JsonText(metadata), creation.isTemporary);
    return LineResponse(ioCall, session, 201);
}

Response DeleteSession(Call& ioCall) {
    View const session = OpenView(ioCall, false);
    if (!session.IsSession())
        throw Failure(405, "method-not-allowed",
                      "Only a session can be deleted; a transaction is rolled back instead.");
    RequireMatch(ioCall.request, DocumentWriter(ioCall.api, session).ProductionTag(), "The session");
    RequireManager(session);
    Sessions(ioCall.transaction, ioCall.actor, ioCall.now).Discard(session);
    return EmptyResponse(204);
}

std::string TextField(Form const& inForm, char const* inName) {
    FormPart const* const part = inForm.Find(inName);
    std::string text(part ? part->bytes : std::string_view());
    if (!IsValidUtf8(text))
        throw Failure(400, "text-invalid", std::string("The field \"") + inName + "\" is not UTF-8.");
    return text;
}

PullStrategy ReadPullStrategy(std::string const& inText) {
    if (inText.empty() || inText == "interactive")
        return PullStrategy::Interactive;
    if (inText == "accept-yours")
        return PullStrategy::Yours;
    if (inText == "accept-theirs")
        return PullStrategy::Theirs;
    if (inText == "safe")
        return PullStrategy::Safe;
    throw Failure(400, "strategy-unknown",
                  "\":mergeStrategy\" is empty, \"interactive\", \"accept-yours\", \"accept-theirs\" or "
                  "\"safe\".");
}

Response Push(Call& ioCall) {
    Form const form(ioCall.request);
    Sessions::Sharing sharing;
    sharing.commit = TextField(form, ":commitId");
    sharing.message = CheckedMessage(TextField(form, ":commitMessage"));
    sharing.strategy = ReadResolveStrategy(TextField(form, ":resolveStrategy"));
    View session = OpenSession(ioCall);
    Sessions(ioCall.transaction, ioCall.actor, ioCall.now).Push(session, sharing);
    return LineResponse(ioCall, session, 200);
}

Response Pull(Call& ioCall) {
    Form const form(ioCall.request);
    std::string const commit = TextField(form, ":commitId");
    PullStrategy const strategy = ReadPullStrategy(TextField(form, ":mergeStrategy"));
    View session = OpenSession(ioCall);
    Sessions(ioCall.transaction, ioCall.actor, ioCall.now).Pull(session, commit, strategy);
    return LineResponse(ioCall, session, 200);
}

}  // namespace

void RequireManager(View const& inSession) {
    if (!inSession.mayManage)
        throw Failure(403, "not-permitted", "Only its owner may change a session.");
}

View OpenSession(Call& ioCall) {
    View session = OpenView(ioCall, false);
    if (!session.IsSession())
        throw Failure(404, "not-found", "This address is there for sessions only.");
    RequireManager(session);
    RequireMatch(ioCall.request, DocumentWriter(ioCall.api, session).ProductionTag(), "The session");
    return session;
}

ResolveStrategy ReadResolveStrategy(std::string const& inText) {
    if (inText.empty() || inText == "NONE")
        return ResolveStrategy::None;
    if (inText == "AUTO")
        return ResolveStrategy::Auto;
    throw Failure(400, "strategy-unknown", "\":resolveStrategy\" is \"NONE\" or \"AUTO\".");
}

std::string CheckedMessage(std::string inText) {
    if (inText.size() > kMaxMessage)
        throw Failure(413, "message-too-long", "A commit message has at most 64 KiB.");
    return inText;
}

void AddSessionRoutes(std::vector<Route>& ioRoutes) {
    std::string const line = std::string(kApiPath) + "/p/{}";
    ioRoutes.push_back({"GET", line + "/sessions", SignIn::Needed, ListSessions});
    ioRoutes.push_back({"POST", line + "/sessions", SignIn::Needed, CreateSession});
    ioRoutes.push_back({"DELETE", line, SignIn::Needed, DeleteSession});
    ioRoutes.push_back({"POST", line + "/push", SignIn::Needed, Push});
    ioRoutes.push_back({"POST", line + "/pull", SignIn::Needed, Pull});
}

}  // namespace zohub
