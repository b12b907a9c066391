// Renditions of assets: lists, creation from a plain body, payload at its edit-media address.
#include "Base/Digest.h"
#include "Base/Error.h"
#include "Base/Text.h"
#include "Routes/ItemOwner.h"
#include "Routes/ItemRules.h"

namespace zohub {

namespace {

Response RenditionResponse(Call& ioCall, ItemOwner const& inOwner, RenditionState const& inRendition,
                           int inStatus) {
    DocumentWriter const writer(ioCall.api, inOwner.GetView());
    std::string text;
    writer.AppendRendition(text, inOwner.Href(), inRendition);
    Response response = JsonResponse(inStatus, std::move(text));
    response.etag = writer.RenditionTag(inRendition);
    if (inStatus == 201)
        response.headers.emplace_back("Location", inOwner.Href() + "/r/" + PercentEncode(inRendition.id));
    return response;
}

Response ListRenditions(Call& ioCall, OwnerKind inKind) {
    ItemOwner owner(ioCall, inKind);
    return JsonResponse(
        200, DocumentWriter(ioCall.api, owner.GetView()).RenditionList(owner.Href(), owner.Renditions()));
}

Response LoadRendition(Call& ioCall, OwnerKind inKind) {
    ItemOwner owner(ioCall, inKind);
    return RenditionResponse(ioCall, owner, owner.GetRendition(ioCall.parameters[inKind.NextParameter()]),
                             200);
}

Payload PreparePayload(Request const& inRequest) {
    return {nullptr, inRequest.body, std::string(), Sha256Hex(inRequest.body)};
}

std::string FlavourOf(Request const& inRequest) {
    std::string type(inRequest.Header("Content-Type"));
    if (!IsMediaType(type))
        throw Failure(415, "media-type-missing",
                      "A rendition needs its media type in the Content-Type header.");
    return type;
}

ItemData DataOf(Call const& inCall) {
    return {inCall.request.body, FlavourOf(inCall.request), inCall.payload.hash};
}

Response CreateRendition(Call& ioCall, OwnerKind inKind) {
    ItemOwner owner = ItemOwner::ForWriting(ioCall, inKind);
    RequireRoomForRendition(owner.Renditions().size());
    RenditionState const rendition = NewRendition(DataOf(ioCall));
    ioCall.repository.AddContent(ioCall.payload.hash, ioCall.request.body);
    owner.Renditions().push_back(rendition);
    owner.Commit(ioCall, "Added a rendition");
    return RenditionResponse(ioCall, owner, rendition, 201);
}

Response LoadMedia(Call& ioCall, OwnerKind inKind) {
    ItemOwner owner(ioCall, inKind);
    RenditionState const& rendition = owner.GetRendition(ioCall.parameters[inKind.NextParameter()]);
    auto bytes = ioCall.transaction.FindContent(rendition.content);
    if (!bytes)
        throw std::runtime_error("the content " + rendition.content + " is missing; run zohub check");
    Response response;
    response.SetBody(std::move(*bytes), rendition.type);
    response.etag = "\"" + rendition.content + "\"";
    return response;
}

Response PutMedia(Call& ioCall, OwnerKind inKind) {
    ItemOwner owner = ItemOwner::ForWriting(ioCall, inKind);
    RenditionState& rendition = owner.GetRendition(ioCall.parameters[inKind.NextParameter()]);
    if (!IfMatchHolds(ioCall.request, "\"" + rendition.content + "\""))
        RequireMatch(ioCall.request, DocumentWriter(ioCall.api, owner.GetView()).RenditionTag(rendition),
                     "The rendition");
    ItemData const data = DataOf(ioCall);
    ioCall.repository.AddContent(data.hash, data.bytes);
    if (data.hash != rendition.content || data.type != rendition.type) {
        SetData(rendition, data);
        owner.Commit(ioCall, "Changed a rendition");
    }
    return RenditionResponse(ioCall, owner, rendition, 200);
}

Response DeleteRendition(Call& ioCall, OwnerKind inKind) {
    ItemOwner owner = ItemOwner::ForWriting(ioCall, inKind);
    RenditionState const rendition = owner.GetRendition(ioCall.parameters[inKind.NextParameter()]);
    RequireMatch(ioCall.request, DocumentWriter(ioCall.api, owner.GetView()).RenditionTag(rendition),
                 "The rendition");
    std::erase_if(owner.Renditions(), [&](RenditionState const& r) { return r.id == rendition.id; });
    owner.Commit(ioCall, "Removed a rendition");
    return EmptyResponse(204);
}

}  // namespace

void AddRenditionRoutes(std::vector<Route>& ioRoutes) {
    using Handler = Response (*)(Call&, OwnerKind);
    using Prepare = Payload (*)(Request const&);
    auto const add = [&ioRoutes](char const* inMethod, OwnerKind inKind, char const* inTail,
                                 Handler inHandler, Prepare inPrepare = nullptr) {
        ioRoutes.push_back({inMethod, inKind.Pattern() + "/r" + inTail, SignIn::Needed,
                            [inKind, inHandler](Call& ioCall) { return inHandler(ioCall, inKind); },
                            inPrepare});
    };
    for (bool isPinned : {false, true}) {
        OwnerKind const kind{true, isPinned};
        add("GET", kind, "", ListRenditions);
        add("GET", kind, "/{}", LoadRendition);
        add("GET", kind, "/{}/media", LoadMedia);
    }
    OwnerKind const live{true, false};
    add("POST", live, "", CreateRendition, PreparePayload);
    add("PUT", live, "/{}/media", PutMedia, PreparePayload);
    add("DELETE", live, "/{}", DeleteRendition);
}

}  // namespace zohub
