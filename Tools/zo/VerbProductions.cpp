// productions, open, show: the productions of the hub and the one that is worked on.
#include <map>

#include "Assets.h"
#include "Failure.h"
#include "ostcore/utility/StringConversion.h"
#include "Sessions.h"
#include "Verbs.h"
#include "Writing.h"

namespace zo {
namespace {

using ostcore::utility::ToUTF8;

LoadedProduction NamedOrOpen(Context& ioContext, const std::string& inCommit) {
    const auto named = ioContext.Args().Positional(0);
    if (named) {
        return LoadProduction(ioContext, *named, inCommit);
    }
    if (inCommit.empty()) {
        return LoadForReading(ioContext);
    }
    return LoadProductionAt(ioContext, RequireOpen(ioContext).production, inCommit);
}

// Where a production stands on its shared line.
struct Position {
    std::string latestCommit;
    bool isLatest = true;
};

Position PositionOf(const LoadedProduction& inProduction, const LoadedProduction& inLatest) {
    if (!inLatest.production) {
        return {inProduction.commit, true};
    }
    return {inLatest.commit, inLatest.commit == inProduction.commit};
}

std::string CommitText(const LoadedProduction& inProduction, const Position& inPosition) {
    return inProduction.commit +
           (inPosition.isLatest ? " (latest)" : " (a newer commit exists: " + inPosition.latestCommit + ")");
}

const char* ViewOf(const ZOCL::InterfaceRef<ZOCL::IZOCProduction>& inProduction) {
    return inProduction->IsTransaction()      ? "transaction"
           : inProduction->IsEditingSession() ? "session"
                                              : "shared";
}

void ShowProduction(Context& ioContext, const LoadedProduction& inLoaded) {
    const Position position = PositionOf(inLoaded, LoadLatestVersion(ioContext, inLoaded));
    std::map<std::string, std::uint64_t> counts;
    std::uint64_t total = 0;
    for (const AssetItem& item : LoadAssetList(ioContext, inLoaded)->GetAllItems()) {
        ++counts[item.assetType.str()];
        ++total;
    }
    const auto enclosures = inLoaded.production->GetEnclosures();
    LoadResource(ioContext, enclosures, "loading the enclosures of " + inLoaded.name);
    const auto& production = inLoaded.production;

    Json json("production");
    json.Set("id", inLoaded.id).Set("name", inLoaded.name).Set("description", production->GetDescription());
    json.Set("owner", production->GetOwner())
        .Set("created", production->GetCreationTime())
        .Set("modified", production->GetModificationTime());
    json.Set("url", inLoaded.url).Set("template", production->IsTemplate()).Set("commit", inLoaded.commit);
    json.Set("latestCommit", position.latestCommit).Set("isLatest", position.isLatest);
    json.Set("view", ViewOf(production));
    json.SetList("tags", production->GetTags()).SetList("enclosures", enclosures->GetEnclosureNames());
    Json byType = Json::Part();
    std::string byTypeText;
    for (const auto& [type, count] : counts) {
        byType.Set(type.c_str(), count);
        byTypeText += (byTypeText.empty() ? "" : ", ") + std::to_string(count) + " " + type;
    }
    json.Set("assets", total).Set("assetsByType", byType);

    Output& out = ioContext.Out();
    out.Record(json);
    out.Field("production", inLoaded.name + (production->IsTransaction()      ? " (the open transaction)"
                                             : production->IsEditingSession() ? " (your session)"
                                                                              : ""));
    out.Field("id", inLoaded.id);
    if (!production->GetDescription().empty()) {
        out.Field("description", ToUTF8(production->GetDescription()));
    }
    out.Field("owner", production->GetOwner());
    out.Field("created", ShortTime(production->GetCreationTime()));
    out.Field("modified", ShortTime(production->GetModificationTime()));
    out.Field("commit", CommitText(inLoaded, position));
    out.Field("assets", std::to_string(total) + (byTypeText.empty() ? "" : ": " + byTypeText));
    for (const auto& name : enclosures->GetEnclosureNames()) {
        out.Field("enclosure", name);
    }
}

void ShowAsset(Context& ioContext, const LoadedProduction& inLoaded, const std::string& inWhich) {
    const auto list = LoadAssetList(ioContext, inLoaded);
    const std::vector<AssetItem> items = list->GetAllItems();
    const AssetItem& item = FindAsset(items, inWhich, inLoaded.name);
    const AssetDetails details = LoadDetails(ioContext, list, {item}, Locators::Load).front();
    Output& out = ioContext.Out();
    out.Record(AssetJson(details));
    out.Field("asset", ToUTF8(item.name));
    out.Field("id", item.assetIdentifier);
    out.Field("type", item.assetType);
    if (!item.description.empty()) {
        out.Field("description", ToUTF8(item.description));
    }
    if (!item.parentIdentifier.empty()) {
        out.Field("parent", item.parentIdentifier);
    }
    if (!item.mediaLocatorIdentifier.empty()) {
        out.Field("locator", item.mediaLocatorIdentifier);
    }
    if (details.locator && !details.locator->GetMediaHRef().empty()) {
        out.Field("media", details.locator->GetMediaHRef());
    }
    for (const EnclosureText& text : EnclosuresOf(details.enclosures)) {
        out.Field("enclosure", text.name);
    }
    for (const RenditionText& text : RenditionsOf(details.renditions)) {
        out.Field("rendition", text.flavour);
    }
}

}  // namespace

void RunProductions(Context& ioContext) {
    const bool templates = ioContext.Args().Has("templates");
    const auto entries = ListProductions(ioContext, templates ? ListKind::Templates : ListKind::Productions);
    Table table({{"NAME", 12}, {"ID", 8}, {"OWNER", 5}, {"MODIFIED"}, {"DESCRIPTION", 11}});
    for (const auto& entry : entries) {
        Json json("production");
        json.Set("id", entry.identifier).Set("name", entry.name).Set("description", entry.description);
        json.Set("owner", entry.owner)
            .Set("modified", entry.lastModified)
            .Set("modifiedOfAllSessions", entry.lastModifiedOfAllSessions);
        ioContext.Out().Record(json.Set("url", entry.url).Set("template", templates));
        table.AddRow({ToUTF8(entry.name), entry.identifier.str(), entry.owner.str(),
                      ShortTime(entry.lastModified), ToUTF8(entry.description)});
    }
    if (table.IsEmpty()) {
        ioContext.Out().Note(templates ? "there are no templates"
                                       : "there are no productions that you may see");
        return;
    }
    ioContext.Out().Print(table);
}

void RunOpen(Context& ioContext) {
    const Arguments& args = ioContext.Args();
    const std::string commit = args.ValueOr("commit", "");
    if (args.Has("commit") && args.Has("latest")) {
        throw Failure(ExitCode::Usage, "--commit and --latest exclude each other");
    }
    if (!args.Positional(0) && !args.Has("commit") && !args.Has("latest")) {
        throw Failure(ExitCode::Usage, "no production is named", "name one, or use --commit or --latest");
    }
    ioContext.Server();
    const Target& target = ioContext.ConnectedTarget();
    const auto former = ioContext.Remembered().Open(target.server, target.user);
    if (former && !former->transaction.empty()) {
        RefuseWithOpenTransaction(ioContext, "opening a production");
    }

    LoadedProduction loaded = args.Positional(0) || !commit.empty() ? NamedOrOpen(ioContext, commit)
                                                                    : LoadOpenProduction(ioContext);
    const LoadedProduction latest = LoadLatestVersion(ioContext, loaded);
    if (args.Has("latest")) {
        if (!latest.production) {
            throw Failure(ExitCode::NotFound, loaded.name + " has no link to its latest version",
                          "open it by name to get the newest commit");
        }
        loaded = latest;
    }
    const Position position = PositionOf(loaded, latest);
    const std::string formerCommit =
        former && former->production == loaded.id ? former->commit : std::string();
    const bool moved = !formerCommit.empty() && formerCommit != loaded.commit;
    const bool dryRun = args.Has("dry-run");
    if (!dryRun) {
        RememberOpen(ioContext, loaded);
    }
    Json json("open");
    json.Set("id", loaded.id).Set("name", loaded.name).Set("commit", loaded.commit).Set("url", loaded.url);
    json.Set("latestCommit", position.latestCommit).Set("isLatest", position.isLatest);
    json.Set("previousCommit", formerCommit).Set("moved", moved).Set("dryRun", dryRun);
    ioContext.Out().Record(json);
    ioContext.Out().Say(std::string(dryRun ? "would open " : "opened ") + loaded.name + " at commit " +
                        CommitText(loaded, position));
    if (moved) {
        ioContext.Out().Say("moved from commit " + formerCommit);
    }
}

void RunShow(Context& ioContext) {
    const LoadedProduction loaded = NamedOrOpen(ioContext, "");
    if (const auto asset = ioContext.Args().Value("asset")) {
        ShowAsset(ioContext, loaded, *asset);
    } else {
        ShowProduction(ioContext, loaded);
    }
}

}  // namespace zo
