// history, diff: commits, and what differs between two states.
#include <cstdlib>

#include "Changes.h"
#include "Failure.h"
#include "Numbers.h"
#include "ostcore/utility/StringConversion.h"
#include "Verbs.h"
#include "Versions.h"

namespace zo {
namespace {

constexpr std::uint64_t kUsualCount = 20;
constexpr std::uint64_t kMaximumCount = 1000000;

void ListHistory(Context& ioContext, const LoadedProduction& inProduction, std::uint64_t inCount) {
    Table table({{"WHEN"}, {"WHO", 5}, {"COMMIT", 8}, {"MESSAGE", 12}, {"FROM", 8}});
    for (const Version& version : LoadVersions(ioContext, inProduction, inCount, "")) {
        ioContext.Out().Record(VersionJson("version", version));
        table.AddRow({ShortTime(version.time), version.committerName, version.shortCommit, version.message,
                      version.Origin()});
    }
    if (table.IsEmpty()) {
        return ioContext.Out().Note("there is no commit");
    }
    ioContext.Out().Print(table);
}

// --- diff

std::vector<Change> ChosenChanges(Context& ioContext, AssetNames& ioNames) {
    const Arguments& args = ioContext.Args();
    if (args.Has("from") || args.Has("to")) {
        if (args.Has("incoming")) {
            throw Failure(ExitCode::Usage, "--incoming does not go with --from and --to");
        }
        CheckIsCommit(args.ValueOr("from", "0"));
        CheckIsCommit(args.ValueOr("to", "0"));
        const LoadedProduction view = LoadForReading(ioContext);
        ioNames.Add(ioContext, view);
        return LoadChanges(ioContext,
                           ZOCL::GetDifferencesByCommit(ioContext.Server(), ZOCL::ImmutableString(view.id),
                                                        ZOCL::ImmutableString(args.ValueOr("from", "")),
                                                        ZOCL::ImmutableString(args.ValueOr("to", ""))),
                           "comparing two commits of " + view.name);
    }
    const WorkSession session = RequireSession(ioContext);
    ioNames.Add(ioContext, session.view);
    ioNames.Add(ioContext, LoadSharedProduction(ioContext, session));
    return args.Has("incoming") ? LoadIncoming(ioContext, session) : LoadOutgoing(ioContext, session);
}

Json DifferenceJson(const Change& inChange, const AssetNames& inNames) {
    Json json("difference");
    const std::string asset = inChange.AssetID();
    json.Set("kind", ItemKindName(inChange.kind)).Set("change", inChange.What()).Set("assetId", asset);
    json.Set("asset", asset.empty() ? std::string() : inNames.NameOf(asset));
    json.Set("name", inChange.kind == ItemKind::Enclosure ? inChange.entry.name : ZOCL::ImmutableString());
    json.Set("committer", inChange.entry.committer).Set("committed", inChange.entry.committed);
    return json.Set("conflict", inChange.entry.IsInConflict());
}

}  // namespace

void RunHistory(Context& ioContext) {
    const std::uint64_t count = NumberOption(ioContext.Args(), "count", kUsualCount, 1, kMaximumCount);
    // A production at an older commit has no history of its own: it is that of its line.
    const OpenRecord open = RequireOpen(ioContext);
    const bool isShared = ioContext.Args().Has("shared") || open.session.empty();
    ListHistory(ioContext,
                isShared ? LoadProductionAt(ioContext, open.production, "")
                         : LoadByHubURL(ioContext, open.session, "loading the session on " + open.name),
                count);
}

void RunDiff(Context& ioContext) {
    AssetNames names;
    const std::vector<Change> changes = ChosenChanges(ioContext, names);
    names.Add(changes);
    Table table({{"CHANGE"}, {"WHAT", 16}, {"WHO", 5}, {"WHEN"}, {"CONFLICT"}});
    for (const Change& change : changes) {
        ioContext.Out().Record(DifferenceJson(change, names));
        table.AddRow({change.What(), names.Describe(change), change.entry.committer.str(),
                      ShortTime(change.entry.committed), change.entry.IsInConflict() ? "yes" : "no"});
    }
    if (table.IsEmpty()) {
        return ioContext.Out().Note("nothing differs");
    }
    ioContext.Out().Print(table);
}

}  // namespace zo
