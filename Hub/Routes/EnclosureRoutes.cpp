// Enclosures of assets and productions: lists, creation, metadata, payloads, and both by content identifier.
#include "Base/Digest.h"
#include "Base/Error.h"
#include "Base/Text.h"
#include "Http/Multipart.h"
#include "Routes/ItemOwner.h"
#include "Routes/ItemRules.h"

namespace zohub {

namespace {

ItemData DataOf(Payload const& inPayload) {
    return {inPayload.bytes, inPayload.type, inPayload.hash};
}

Response EnclosureResponse(Call& ioCall, ItemOwner const& inOwner, EnclosureState const& inEnclosure,
                           int inStatus) {
    DocumentWriter const writer(ioCall.api, inOwner.GetView());
    std::string text;
    writer.AppendEnclosure(text, inOwner.Href(), inEnclosure);
    Response response = JsonResponse(inStatus, std::move(text));
    response.etag = writer.EnclosureTag(inEnclosure);
    if (inStatus == 201)
        response.headers.emplace_back("Location", inOwner.Href() + "/e/" + PercentEncode(inEnclosure.id));
    return response;
}

Response ListEnclosures(Call& ioCall, OwnerKind inKind) {
    ItemOwner owner(ioCall, inKind);
    return JsonResponse(
        200, DocumentWriter(ioCall.api, owner.GetView()).EnclosureList(owner.Href(), owner.Enclosures()));
}

Response LoadEnclosure(Call& ioCall, OwnerKind inKind) {
    ItemOwner owner(ioCall, inKind);
    return EnclosureResponse(ioCall, owner, owner.GetEnclosure(ioCall.parameters[inKind.NextParameter()]),
                             200);
}

Payload PreparePayload(Request const& inRequest) {
    auto const form = std::make_shared<Form const>(inRequest);
    FormPart const& part = form->Get(":enclosure");
    return {form, part.bytes, part.contentType, Sha256Hex(part.bytes)};
}

Response CreateEnclosure(Call& ioCall, OwnerKind inKind) {
    ItemOwner owner = ItemOwner::ForWriting(ioCall, inKind);
    Payload const& payload = ioCall.payload;
    EnclosureState enclosure = NewEnclosure(payload.form->Get(":name").bytes, DataOf(payload));
    for (auto const& other : owner.Enclosures())
        if (other.name == enclosure.name)
            FailEnclosureExists();
    RequireRoomForEnclosure(owner.Enclosures().size(),
                            inKind.isAsset ? kMaxEnclosuresOfAsset : kMaxEnclosuresOfProduction);
    ioCall.repository.AddContent(payload.hash, payload.bytes);
    enclosure.isNote = owner.TakesNotes();
    owner.Enclosures().push_back(enclosure);
    owner.Commit(ioCall, "Added an enclosure");
    return EnclosureResponse(ioCall, owner, enclosure, 201);
}

Response PutEnclosure(Call& ioCall, OwnerKind inKind) {
    ItemOwner owner = ItemOwner::ForWriting(ioCall, inKind);
    EnclosureState& enclosure = owner.GetEnclosureToChange(ioCall.parameters[inKind.NextParameter()]);
    RequireMatch(ioCall.request, DocumentWriter(ioCall.api, owner.GetView()).EnclosureTag(enclosure),
                 "The enclosure");
    Payload const& payload = ioCall.payload;
    if (payload.hash != enclosure.content) {
        ioCall.repository.AddContent(payload.hash, payload.bytes);
        SetData(enclosure, DataOf(payload));
        owner.Commit(ioCall, "Changed an enclosure");
    }
    return EnclosureResponse(ioCall, owner, enclosure, 200);
}

Response DeleteEnclosure(Call& ioCall, OwnerKind inKind) {
    ItemOwner owner = ItemOwner::ForWriting(ioCall, inKind);
    EnclosureState const enclosure = owner.GetEnclosureToChange(ioCall.parameters[inKind.NextParameter()]);
    RequireMatch(ioCall.request, DocumentWriter(ioCall.api, owner.GetView()).EnclosureTag(enclosure),
                 "The enclosure");
    std::erase_if(owner.Enclosures(), [&](EnclosureState const& e) { return e.id == enclosure.id; });
    owner.Commit(ioCall, "Removed an enclosure");
    return EmptyResponse(204);
}

ReferenceRecord GetReference(Call& ioCall, char const* inKind) {
    View const view = OpenView(ioCall, false);
    auto reference = ioCall.repository.FindReference(view.line, inKind, ioCall.parameters[1]);
    if (!reference)
        throw Failure(404, "not-found", "This production has no content with that identifier.");
    return std::move(*reference);
}

// The document of an enclosure that had this content in some commit; it can be read, not changed.
Response EnclosureByContent(Call& ioCall) {
    ReferenceRecord const reference = GetReference(ioCall, kReferenceEnclosure);
    View view = OpenView(ioCall, false);
    view.mayWrite = false;
    EnclosureState const enclosure{reference.item, reference.name, reference.type, reference.key, 0};
    Json document = Json::object();
    document["zo:enclosureContentId"] = enclosure.content;
    document["zo:enclosureId"] = enclosure.id;
    document["name"] = enclosure.name;
    std::string const prefix = DocumentWriter(ioCall.api, view).LivePrefix();
    document["links"] = Json::array({{{"rel", "self"}, {"href", prefix + "/ce/" + enclosure.content}},
                                     {{"rel", std::string(kRelationBase) + "/enclosures/enclosure"},
                                      {"href", prefix + "/pe/" + enclosure.content}}});
    return JsonResponse(200, JsonText(document));
}

Response PayloadOf(Call& ioCall, char const* inKind) {
    ReferenceRecord const reference = GetReference(ioCall, inKind);
    Response response;
    response.etag = "\"" + reference.key + "\"";
    response.isImmutable = true;
    if (ioCall.HasCurrent(response.etag))
        return response;
    auto bytes = ioCall.transaction.FindContent(reference.key);
    if (!bytes)
        throw std::runtime_error("the content " + reference.key + " is missing; run zohub check");
    response.SetBody(std::move(*bytes), reference.type);
    return response;
}

}  // namespace

void AddEnclosureRoutes(std::vector<Route>& ioRoutes) {
    for (bool isAsset : {false, true}) {
        for (bool isPinned : {false, true}) {
            OwnerKind const kind{isAsset, isPinned};
            std::string const list = kind.Pattern() + "/e";
            ioRoutes.push_back(
                {"GET", list, SignIn::Needed, [kind](Call& ioCall) { return ListEnclosures(ioCall, kind); }});
            ioRoutes.push_back({"GET", list + "/{}", SignIn::Needed,
                                [kind](Call& ioCall) { return LoadEnclosure(ioCall, kind); }});
            if (isPinned)
                continue;
            ioRoutes.push_back({"POST", list, SignIn::Needed,
                                [kind](Call& ioCall) { return CreateEnclosure(ioCall, kind); },
                                PreparePayload});
            ioRoutes.push_back({"PUT", list + "/{}", SignIn::Needed,
                                [kind](Call& ioCall) { return PutEnclosure(ioCall, kind); }, PreparePayload});
            ioRoutes.push_back({"DELETE", list + "/{}", SignIn::Needed,
                                [kind](Call& ioCall) { return DeleteEnclosure(ioCall, kind); }});
        }
    }
    std::string const production = OwnerKind().Pattern();
    ioRoutes.push_back({"GET", production + "/ce/{}", SignIn::Needed, EnclosureByContent});
    ioRoutes.push_back({"GET", production + "/pe/{}", SignIn::Needed,
                        [](Call& ioCall) { return PayloadOf(ioCall, kReferenceEnclosure); }});
    ioRoutes.push_back({"GET", production + "/pr/{}", SignIn::Needed,
                        [](Call& ioCall) { return PayloadOf(ioCall, kReferenceRendition); }});
}

}  // namespace zohub
