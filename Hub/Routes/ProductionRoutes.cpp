// Productions and templates: lists, creation, loading at a commit, properties, copies.
#include <set>

#include "Base/Error.h"
#include "Base/Text.h"
#include "Routes/Creation.h"
#include "Routes/Documents.h"
#include "Routes/RouteTable.h"

namespace zohub {

namespace {

Creation BodyOf(Call& ioCall) {
    return ReadCreation(ParseJsonObject(ioCall.request.body, "The body of the creation"));
}

Response ListOf(Call& ioCall, std::string const& inKind, std::string const& inSelf, bool inMayCreate) {
    bool const seesAll = ioCall.actor.isAdmin || inKind == kLineTemplate;
    auto const lines = seesAll ? ioCall.transaction.ListLines(inKind)
                               : ioCall.transaction.ListLinesVisibleTo(ioCall.actor.name, inKind);
    std::string text = "{\"stats\":{\"totalResults\":" + std::to_string(lines.size()) + "},\"productions\":[";
    for (auto const& line : lines) {
        View const view = ioCall.repository.Open(line.id, "", ioCall.actor);
        if (text.back() != '[')
            text += ',';
        DocumentWriter(ioCall.api, view)
            .AppendProductionItem(text, ioCall.transaction.LastModifiedOf(line.id));
    }
    text += "],\"links\":";
    {
        LinkWriter links(text);
        links.Plain("self", inSelf);
        if (inMayCreate)
            links.Plain("create", inSelf);
    }
    text += '}';
    return JsonResponse(200, std::move(text));
}

Response ListProductions(Call& ioCall) {
    return ListOf(ioCall, kLineProduction, ioCall.api + "/p", true);
}

Response ListTemplates(Call& ioCall) {
    return ListOf(ioCall, kLineTemplate, ioCall.api + "/templates", false);
}

std::string PropertiesOf(Creation const& inCreation, Json inProperties) {
    inProperties["name"] = inCreation.name;
    inProperties["description"] = inCreation.description;
    return JsonText(inProperties);
}

Response CreateProduction(Call& ioCall) {
    Creation const creation = BodyOf(ioCall);
    TreeRoot tree;
    tree.properties = PropertiesOf(creation, Json::object());
    auto const line = ioCall.repository.CreateLine(kLineProduction, tree, "Created " + creation.name,
                                                   ioCall.actor, creation.isTemporary, ioCall.now);
    return LineResponse(ioCall, ioCall.repository.Open(line.id, "", ioCall.actor), 201);
}

// From a template as well: what is made is always a production of the one who asks.
Response CopyProduction(Call& ioCall) {
    View const source = OpenView(ioCall, false);
    Creation const creation = BodyOf(ioCall);
    TreeRoot tree = source.tree;
    tree.properties = PropertiesOf(creation, Json::parse(source.tree.properties));
    auto const line = ioCall.repository.CreateLine(kLineProduction, tree, "Copied to " + creation.name,
                                                   ioCall.actor, creation.isTemporary, ioCall.now);
    for (auto const& scope : std::set{source.line.production, ScopeOf(source.line)})
        ioCall.transaction.CopyReferences(scope, line.id);
    return LineResponse(ioCall, ioCall.repository.Open(line.id, "", ioCall.actor), 201);
}

Response EditProduction(Call& ioCall) {
    View view = OpenForWriting(ioCall);
    RequireMatch(ioCall.request, DocumentWriter(ioCall.api, view).ProductionTag(), "The production");
    Json const properties = ParseJsonObject(ioCall.request.body, "The properties of the production");
    CheckProductionProperties(properties);
    Repository::Edit edit;
    edit.properties = JsonText(properties);
    if (*edit.properties != view.tree.properties)
        ioCall.repository.CommitEdit(view, edit, "Changed the properties", ioCall.actor, ioCall.now);
    return LineResponse(ioCall, view, 200);
}

}  // namespace

View OpenView(Call& ioCall, bool inIsPinned) {
    return ioCall.repository.Open(ioCall.parameters[0], inIsPinned ? ioCall.parameters[1] : std::string(),
                                  ioCall.actor);
}

void RequireWritable(View const& inView) {
    if (inView.mayWrite)
        return;
    if (inView.line.isEnded)
        throw Failure(409, "transaction-ended",
                      "The transaction was committed; open another one on its session.");
    if (inView.mayManage)
        throw Failure(403, "transaction-needed",
                      "A session is written to through a transaction; open one and write there.");
    throw Failure(403, "not-permitted",
                  inView.line.kind == kLineTemplate
                      ? "You may read this template but not change it; make a production of it."
                      : "Only its owner may change a session or a transaction.");
}

View OpenForWriting(Call& ioCall) {
    View view = OpenView(ioCall, false);
    RequireWritable(view);
    return view;
}

Response LineResponse(Call& ioCall, View const& inView, int inStatus) {
    DocumentWriter const writer(ioCall.api, inView);
    Response response = JsonResponse(inStatus, writer.Production());
    response.etag = writer.ProductionTag();
    if (inStatus == 201)
        response.headers.emplace_back("Location", writer.LivePrefix());
    return response;
}

Creation ReadCreation(Json const& inBody) {
    CheckKeys(
        inBody,
        {{"name", JsonKind::String}, {"description", JsonKind::String}, {"isTemporary", JsonKind::Boolean}},
        "the body of the creation");
    CheckProductionProperties(inBody);
    Creation creation{StringUnder(inBody, "name"), StringUnder(inBody, "description"), false};
    if (inBody.contains("isTemporary"))
        creation.isTemporary = inBody["isTemporary"].get<bool>();
    return creation;
}

void AddProductionRoutes(std::vector<Route>& ioRoutes) {
    std::string const base = std::string(kApiPath) + "/p";
    ioRoutes.push_back({"GET", base, SignIn::Needed, ListProductions});
    ioRoutes.push_back({"POST", base, SignIn::Needed, CreateProduction});
    ioRoutes.push_back({"GET", std::string(kApiPath) + "/templates", SignIn::Needed, ListTemplates});
    ioRoutes.push_back({"GET", base + "/{}", SignIn::Needed,
                        [](Call& ioCall) { return LineResponse(ioCall, OpenView(ioCall, false), 200); }});
    ioRoutes.push_back({"GET", base + "/{}/at/{}", SignIn::Needed,
                        [](Call& ioCall) { return LineResponse(ioCall, OpenView(ioCall, true), 200); }});
    ioRoutes.push_back({"PUT", base + "/{}", SignIn::Needed, EditProduction});
    ioRoutes.push_back({"POST", base + "/{}/copy", SignIn::Needed, CopyProduction});
}

}  // namespace zohub
