// Productions and templates: lists, creation, loading at a commit, properties, copies.
#include "Base/Error.h"
#include "Base/Text.h"
#include "Routes/Documents.h"
#include "Routes/RouteTable.h"

namespace zohub {

namespace {

Response ProductionResponse(Call& ioCall, View const& inView, int inStatus) {
    DocumentWriter const writer(ioCall.api, inView);
    Response response = JsonResponse(inStatus, writer.Production());
    response.etag = writer.ProductionTag();
    if (inStatus == 201)
        response.headers.emplace_back("Location", writer.LivePrefix());
    return response;
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
        DocumentWriter(ioCall.api, view).AppendProductionItem(text);
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

struct Creation {
    std::string name;
    std::string description;
    bool isTemporary = false;
};

Creation ReadCreation(Call& ioCall) {
    Json const body = ParseJsonObject(ioCall.request.body, "The body of the creation");
    CheckKeys(
        body,
        {{"name", JsonKind::String}, {"description", JsonKind::String}, {"isTemporary", JsonKind::Boolean}},
        "the body of the creation");
    CheckProductionProperties(body);
    Creation creation{StringUnder(body, "name"), StringUnder(body, "description"), false};
    if (body.contains("isTemporary"))
        creation.isTemporary = body["isTemporary"].get<bool>();
    return creation;
}

std::string PropertiesOf(Creation const& inCreation, Json inProperties) {
    inProperties["name"] = inCreation.name;
    inProperties["description"] = inCreation.description;
    return JsonText(inProperties);
}

Response CreateProduction(Call& ioCall) {
    Creation const creation = ReadCreation(ioCall);
    TreeRoot tree;
    tree.properties = PropertiesOf(creation, Json::object());
    auto const line = ioCall.repository.CreateLine(kLineProduction, tree, "Created " + creation.name,
                                                   ioCall.actor, creation.isTemporary, ioCall.now);
    return ProductionResponse(ioCall, ioCall.repository.Open(line.id, "", ioCall.actor), 201);
}

// From a template as well: what is made is always a production of the one who asks.
Response CopyProduction(Call& ioCall) {
    View const source = OpenView(ioCall, false);
    Creation const creation = ReadCreation(ioCall);
    TreeRoot tree = source.tree;
    tree.properties = PropertiesOf(creation, Json::parse(source.tree.properties));
    auto const line = ioCall.repository.CreateLine(kLineProduction, tree, "Copied to " + creation.name,
                                                   ioCall.actor, creation.isTemporary, ioCall.now);
    ioCall.transaction.CopyReferences(source.line.production, line.id);
    return ProductionResponse(ioCall, ioCall.repository.Open(line.id, "", ioCall.actor), 201);
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
    return ProductionResponse(ioCall, view, 200);
}

}  // namespace

View OpenView(Call& ioCall, bool inIsPinned) {
    return ioCall.repository.Open(ioCall.parameters[0], inIsPinned ? ioCall.parameters[1] : std::string(),
                                  ioCall.actor);
}

View OpenForWriting(Call& ioCall) {
    View view = OpenView(ioCall, false);
    if (!view.mayWrite)
        throw Failure(403, "not-permitted",
                      "You may read this template but not change it; make a production of it.");
    return view;
}

void AddProductionRoutes(std::vector<Route>& ioRoutes) {
    std::string const base = std::string(kApiPath) + "/p";
    ioRoutes.push_back({"GET", base, SignIn::Needed, ListProductions});
    ioRoutes.push_back({"POST", base, SignIn::Needed, CreateProduction});
    ioRoutes.push_back({"GET", std::string(kApiPath) + "/templates", SignIn::Needed, ListTemplates});
    ioRoutes.push_back({"GET", base + "/{}", SignIn::Needed, [](Call& ioCall) {
                            return ProductionResponse(ioCall, OpenView(ioCall, false), 200);
                        }});
    ioRoutes.push_back({"GET", base + "/{}/at/{}", SignIn::Needed, [](Call& ioCall) {
                            return ProductionResponse(ioCall, OpenView(ioCall, true), 200);
                        }});
    ioRoutes.push_back({"PUT", base + "/{}", SignIn::Needed, EditProduction});
    ioRoutes.push_back({"POST", base + "/{}/copy", SignIn::Needed, CopyProduction});
}

}  // namespace zohub
