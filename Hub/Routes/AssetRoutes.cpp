// Assets: lists, single assets, creation, properties, deletion, restoring.
#include "Base/Digest.h"
#include "Base/Error.h"
#include "Base/Text.h"
#include "Routes/Documents.h"
#include "Routes/RouteTable.h"

namespace zohub {

namespace {

constexpr std::size_t kBytesPerAsset = 3400;

Response AssetResponse(Call& ioCall, View const& inView, AssetState const& inAsset, std::string const& inHash,
                       int inStatus) {
    DocumentWriter const writer(ioCall.api, inView);
    std::string text;
    writer.AppendAsset(text, inAsset, inHash, true);
    Response response = JsonResponse(inStatus, std::move(text));
    response.etag = writer.AssetTag(inHash);
    if (inStatus == 201)
        response.headers.emplace_back("Location", writer.AssetHref(inAsset.id));
    return response;
}

void AppendListLinks(std::string& ioTarget, DocumentWriter const& inWriter, std::string const& inTail) {
    ioTarget += ",\"links\":";
    LinkWriter links(ioTarget);
    links.Plain("self", inWriter.Prefix() + inTail);
    links.Plain("latest-version", inWriter.LivePrefix() + inTail);
    links.Plain("up", inWriter.Prefix());
    links.Named("/assets/asset#byId", inWriter.LivePrefix() + "/at/{commitId}/a/{assetId}");
    if (inWriter.IsWritable()) {
        links.Plain("create", inWriter.LivePrefix() + "/a");
        links.Named("/assets#restore", inWriter.LivePrefix() + "/restore/{assetContentId}");
    }
}

std::string WriteList(Call& ioCall, View const& inView, bool inIsFull, std::string const& inTail,
                      std::string const* inParent) {
    DocumentWriter const writer(ioCall.api, inView);
    std::string text;
    if (!inParent)
        text.reserve(inView.tree.assetCount * (inIsFull ? kBytesPerAsset : kBytesPerAsset / 2) +
                     kBytesPerAsset);
    text = "{\"assets\":[";
    std::size_t count = 0;
    for (auto const& [id, hash] : AssetMap(ioCall.transaction, inView.tree.assets).All()) {
        AssetState const asset = ioCall.repository.LoadAsset(hash);
        if (inParent && asset.parent != *inParent)
            continue;
        if (count++ != 0)
            text += ',';
        writer.AppendAsset(text, asset, hash, inIsFull);
    }
    text += "],\"stats\":{\"totalResults\":" + std::to_string(count) + "}";
    AppendListLinks(text, writer, inTail);
    text += '}';
    return text;
}

Response ListAssets(Call& ioCall, bool inIsPinned, bool inIsFull) {
    View const view = OpenView(ioCall, inIsPinned);
    DocumentWriter const writer(ioCall.api, view);
    auto const asked = ioCall.request.query.find("parentId");
    std::string const* const parent = asked == ioCall.request.query.end() ? nullptr : &asked->second;
    std::string tail = inIsFull ? "/full" : "/a";
    if (parent)
        tail += "?parentId=" + PercentEncode(*parent);

    // All that decides on the bytes: the assets, the address and what the reader may do.
    std::string const state =
        writer.Prefix() + tail + (writer.IsWritable() ? "\nw\n" : "\nr\n") + view.tree.assets;
    std::string const tag = MakeETag(state);
    Response response;
    response.etag = tag;
    if (ioCall.HasCurrent(tag))
        return response;
    response.contentType = kJsonType;
    response.body =
        ioCall.cache.FindOrMake(state, [&] { return WriteList(ioCall, view, inIsFull, tail, parent); });
    return response;
}

Response LoadAsset(Call& ioCall, bool inIsPinned) {
    View const view = OpenView(ioCall, inIsPinned);
    std::string hash;
    AssetState const asset = ioCall.repository.GetAsset(view, ioCall.parameters[inIsPinned ? 2 : 1], &hash);
    return AssetResponse(ioCall, view, asset, hash, 200);
}

// Writes the one state and answers with its document.
Response CommitAsset(Call& ioCall, View& ioView, AssetState const& inAsset, std::string const& inTitle,
                     int inStatus) {
    std::string const hash = ioCall.repository.AddAsset(ScopeOf(ioView.line), inAsset);
    Repository::Edit edit;
    edit.assets[inAsset.id] = hash;
    ioCall.repository.CommitEdit(ioView, edit, inTitle, ioCall.actor, ioCall.now);
    return AssetResponse(ioCall, ioView, inAsset, hash, inStatus);
}

Response CreateAsset(Call& ioCall) {
    View view = OpenForWriting(ioCall);
    Json const body = ParseJsonObject(ioCall.request.body, "The body of the new asset");
    CheckKeys(body, {{"zo:assetId", JsonKind::StringOrNull}, {"properties", JsonKind::Object}},
              "the body of the new asset");
    if (!body.contains("properties"))
        throw Failure(400, "properties-missing", "The body of a new asset needs \"properties\".");
    CheckAssetProperties(body["properties"]);
    AssetState asset;
    asset.id = StringUnder(body, "zo:assetId");
    if (asset.id.empty())
        asset.id = NewKey(kLongKey);
    if (!IsIdentifier(asset.id))
        throw Failure(400, "identifier-invalid",
                      "\"zo:assetId\" is not an identifier; leave it out to get one.");
    if (ioCall.repository.FindAsset(view, asset.id))
        throw Failure(409, "asset-exists", "This production has an asset with that identifier already.");
    SetAssetProperties(asset, body["properties"]);
    return CommitAsset(ioCall, view, asset, "Added an asset", 201);
}

Response EditAsset(Call& ioCall) {
    View view = OpenForWriting(ioCall);
    std::string hash;
    AssetState asset = ioCall.repository.GetAsset(view, ioCall.parameters[1], &hash);
    RequireMatch(ioCall.request, DocumentWriter(ioCall.api, view).AssetTag(hash), "The asset");
    Json const properties = ParseJsonObject(ioCall.request.body, "The properties of the asset");
    CheckAssetProperties(properties);
    std::string const before = asset.properties;
    SetAssetProperties(asset, properties);
    if (asset.properties == before)
        return AssetResponse(ioCall, view, asset, hash, 200);
    return CommitAsset(ioCall, view, asset, "Changed an asset's properties", 200);
}

Response DeleteAsset(Call& ioCall) {
    View view = OpenForWriting(ioCall);
    std::string hash;
    AssetState const asset = ioCall.repository.GetAsset(view, ioCall.parameters[1], &hash);
    RequireMatch(ioCall.request, DocumentWriter(ioCall.api, view).AssetTag(hash), "The asset");
    Repository::Edit edit;
    edit.assets[asset.id] = std::nullopt;
    ioCall.repository.CommitEdit(view, edit, "Removed an asset", ioCall.actor, ioCall.now);
    return EmptyResponse(204);
}

// Any earlier state of an asset of this production, deleted or not, becomes its state again.
Response RestoreAsset(Call& ioCall) {
    View view = OpenForWriting(ioCall);
    std::string const& hash = ioCall.parameters[1];
    if (!ioCall.repository.FindReference(view.line, kReferenceAsset, hash))
        throw Failure(404, "not-found",
                      "This production never had an asset state with that content identifier.");
    AssetState const asset = ioCall.repository.LoadAsset(hash);
    std::string present;
    bool const exists = ioCall.repository.FindAsset(view, asset.id, &present).has_value();
    if (exists && present == hash)
        return AssetResponse(ioCall, view, asset, hash, 200);
    return CommitAsset(ioCall, view, asset, "Restored an asset", exists ? 200 : 201);
}

}  // namespace

void AddAssetRoutes(std::vector<Route>& ioRoutes) {
    std::string const live = std::string(kApiPath) + "/p/{}";
    for (bool isPinned : {false, true}) {
        std::string const base = isPinned ? live + "/at/{}" : live;
        ioRoutes.push_back({"GET", base + "/a", SignIn::Needed,
                            [isPinned](Call& ioCall) { return ListAssets(ioCall, isPinned, false); }});
        ioRoutes.push_back({"GET", base + "/full", SignIn::Needed,
                            [isPinned](Call& ioCall) { return ListAssets(ioCall, isPinned, true); }});
        ioRoutes.push_back({"GET", base + "/a/{}", SignIn::Needed,
                            [isPinned](Call& ioCall) { return LoadAsset(ioCall, isPinned); }});
    }
    ioRoutes.push_back({"POST", live + "/a", SignIn::Needed, CreateAsset});
    ioRoutes.push_back({"PUT", live + "/a/{}", SignIn::Needed, EditAsset});
    ioRoutes.push_back({"DELETE", live + "/a/{}", SignIn::Needed, DeleteAsset});
    ioRoutes.push_back({"POST", live + "/restore/{}", SignIn::Needed, RestoreAsset});
}

}  // namespace zohub
