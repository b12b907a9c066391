// Media locators: created and changed by a two-field form, found by their identifier.
#include "Base/Error.h"
#include "Base/Text.h"
#include "Http/Multipart.h"
#include "Routes/Documents.h"
#include "Routes/RouteTable.h"

namespace zohub {

namespace {

Response LocatorResponse(Call& ioCall, LocatorRecord const& inLocator, int inStatus) {
    std::string const href = ioCall.api + "/l/" + PercentEncode(inLocator.id);
    std::string text = "{\"zo:mediaLocatorId\":";
    AppendJsonString(text, inLocator.id);
    text += ",\"properties\":" + inLocator.properties + ",\"links\":";
    {
        LinkWriter links(text);
        links.Plain("self", href);
        links.Plain("edit", href);
    }
    text += '}';
    Response response = JsonResponse(inStatus, std::move(text));
    if (inStatus == 201)
        response.headers.emplace_back("Location", href);
    response.etag = MakeETag(response.body->Plain());
    return response;
}

// Who made the locator may use it, and everyone who may read a production that speaks of it.
bool MayUse(Call& ioCall, LocatorRecord const& inLocator) {
    return ioCall.actor.isAdmin || inLocator.owner == ioCall.actor.name ||
           ioCall.transaction.IsLocatorVisibleTo(ioCall.actor.name, inLocator.id);
}

LocatorRecord GetLocator(Call& ioCall) {
    auto locator = ioCall.transaction.FindLocator(ioCall.parameters[0]);
    if (!locator || !MayUse(ioCall, *locator))
        throw Failure(404, "not-found", "The media locator does not exist, or you have no access to it.");
    return std::move(*locator);
}

std::string ReadProperties(Form const& inForm) {
    Json const properties = ParseJsonObject(inForm.Get(":medialocator").bytes, "The field \":medialocator\"");
    CheckLocatorProperties(properties);
    return JsonText(properties);
}

Response CreateLocator(Call& ioCall) {
    Form const form(ioCall.request);
    LocatorRecord locator;
    locator.id = std::string(form.Get(":id").bytes);
    if (!IsIdentifier(locator.id))
        throw Failure(400, "identifier-invalid", "The field \":id\" is not an identifier.");
    locator.properties = ReadProperties(form);
    if (ioCall.transaction.FindLocator(locator.id))
        throw Failure(409, "locator-exists",
                      "There is a media locator with that identifier already; load it and PUT.");
    locator.owner = ioCall.actor.name;
    locator.created = locator.modified = ioCall.now;
    ioCall.transaction.PutLocator(locator);
    return LocatorResponse(ioCall, locator, 201);
}

Response EditLocator(Call& ioCall) {
    Form const form(ioCall.request);
    LocatorRecord locator = GetLocator(ioCall);
    if (form.Get(":id").bytes != locator.id)
        throw Failure(400, "identifier-differs",
                      "The field \":id\" names another media locator than the address.");
    RequireMatch(ioCall.request, LocatorResponse(ioCall, locator, 200).etag, "The media locator");
    locator.properties = ReadProperties(form);
    locator.modified = ioCall.now;
    ioCall.transaction.PutLocator(locator);
    return LocatorResponse(ioCall, locator, 200);
}

}  // namespace

void AddLocatorRoutes(std::vector<Route>& ioRoutes) {
    std::string const base = std::string(kApiPath) + "/l";
    ioRoutes.push_back({"POST", base, SignIn::Needed, CreateLocator});
    ioRoutes.push_back({"GET", base + "/{}", SignIn::Needed,
                        [](Call& ioCall) { return LocatorResponse(ioCall, GetLocator(ioCall), 200); }});
    ioRoutes.push_back({"PUT", base + "/{}", SignIn::Needed, EditLocator});
}

}  // namespace zohub
