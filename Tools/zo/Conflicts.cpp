// Puts the two sides of each conflict side by side.
#include "Conflicts.h"

#include <set>

#include "DisplayWidth.h"
#include "Failure.h"
#include "ItemState.h"

namespace zo {
namespace {

using ZOCL::ImmutableString;
using ChangeMap = std::map<ItemKey, Change>;

ChangeMap ByKey(const std::vector<Change>& inChanges) {
    ChangeMap map;
    for (const Change& change : inChanges) {
        map.emplace(KeyOf(change), change);
    }
    return map;
}

std::vector<Change> LoadBetween(Context& ioContext, const std::string& inProduction,
                                const std::string& inFrom, const std::string& inTo) {
    return LoadChanges(ioContext,
                       ZOCL::GetDifferencesByCommit(ioContext.Server(), ImmutableString(inProduction),
                                                    ImmutableString(inFrom), ImmutableString(inTo)),
                       "comparing the commits " + inFrom + " and " + inTo);
}

// Looks at both sides of one base.
class Comparison {
public:
    Comparison(Context& ioContext, const WorkSession& inSession, const LoadedProduction& inShared,
               const AssetNames& inNames, std::string inBaseCommit, const std::vector<Change>& inMine,
               const std::vector<Change>& inTheirs)
        : mContext(ioContext),
          mSession(inSession),
          mShared(inShared),
          mNames(inNames),
          mBaseCommit(std::move(inBaseCommit)),
          mMine(ByKey(inMine)),
          mTheirs(ByKey(inTheirs)) {}

    const ChangeMap& Mine() const { return mMine; }
    const ChangeMap& Theirs() const { return mTheirs; }

    /// Whether one side has removed the asset and the other changed it or something in it.
    bool IsRemovedAgainstChange(const ItemKey& inAsset) const {
        const bool mine = IsRemoved(mMine, inAsset);
        const bool theirs = IsRemoved(mTheirs, inAsset);
        return mine != theirs && Touches(mine ? mTheirs : mMine, inAsset.assetID);
    }

    /// Whether both changed the item, in different ways. The item is in both maps.
    bool IsAtOdds(const ItemKey& inKey) {
        const Change& mine = mMine.at(inKey);
        const Change& theirs = mTheirs.at(inKey);
        if (mine.IsRemoved() && theirs.IsRemoved()) {
            return false;
        }
        if (mine.IsRemoved() != theirs.IsRemoved()) {
            return true;
        }
        const ItemState mineState = StateOf(mine);
        const ItemState theirState = StateOf(theirs);
        return inKey.kind == ItemKind::Enclosure ? mineState.content != theirState.content
                                                 : AreAtOdds(BaseState(inKey), mineState, theirState);
    }

    Conflict Describe(const ItemKey& inKey) {
        Conflict conflict;
        conflict.key = inKey;
        conflict.baseCommit = mBaseCommit;
        conflict.asset = inKey.assetID.empty() ? std::string() : mNames.NameOf(inKey.assetID);
        Change named;
        named.kind = inKey.kind;
        named.entry.identifier = ImmutableString(inKey.assetID);
        named.entry.name = ImmutableString(inKey.kind == ItemKind::Enclosure ? inKey.name : conflict.asset);
        conflict.text = mNames.Describe(named);
        conflict.mine = SideOf(mMine, inKey);
        conflict.theirs = SideOf(mTheirs, inKey);
        return conflict;
    }

private:
    static bool IsRemoved(const ChangeMap& inSide, const ItemKey& inKey) {
        const auto found = inSide.find(inKey);
        return found != inSide.end() && found->second.IsRemoved();
    }

    static const Change* FirstWithin(const ChangeMap& inSide, const std::string& inAssetID) {
        for (const auto& [key, change] : inSide) {
            if (key.assetID == inAssetID) {
                return &change;
            }
        }
        return nullptr;
    }
    static bool Touches(const ChangeMap& inSide, const std::string& inAssetID) {
        return FirstWithin(inSide, inAssetID) != nullptr;
    }

    std::string DocumentOf(const Change& inChange) const {
        return inChange.IsRemoved() ? std::string() : inChange.entry.itemURL.str();
    }
    ItemState StateOf(const Change& inChange) {
        return LoadItemState(mContext, DocumentOf(inChange), "loading " + mNames.Describe(inChange));
    }
    ItemState BaseState(const ItemKey& inKey) {
        if (inKey.kind == ItemKind::Properties) {
            const auto base = mContext.Server()->GetProductionByIdAndCommitId(
                ImmutableString(mSession.productionID), ImmutableString(mBaseCommit));
            const auto resource = RFL::QueryInterface<ZOCL::IZOCServerResource>(base);
            return LoadItemState(mContext, resource ? resource->GetHTTPURL().str() : std::string(),
                                 "loading the properties of " + mSession.productionName);
        }
        const auto url =
            mShared.production->GetAssetURL(ImmutableString(inKey.assetID), ImmutableString(mBaseCommit));
        return LoadItemState(mContext, url.str(), "loading " + mNames.NameOf(inKey.assetID));
    }

    // An asset of which only something inside was changed has no entry of its own: that inside speaks.
    ConflictSide SideOf(const ChangeMap& inSide, const ItemKey& inKey) {
        const auto found = inSide.find(inKey);
        const Change* change = found != inSide.end()           ? &found->second
                               : inKey.kind == ItemKind::Asset ? FirstWithin(inSide, inKey.assetID)
                                                               : nullptr;
        ConflictSide side;
        if (!change) {
            side.change = "unchanged";
            return side;
        }
        const bool isInside = KeyOf(*change).kind != inKey.kind;
        side.change = isInside ? "updated" : change->What();
        side.who = change->entry.committer.str();
        side.when = change->entry.committed;
        if (isInside) {
            side.parts.push_back(mNames.IsXMP(*change) ? "XMP metadata"
                                                       : "enclosure " + change->entry.name.str());
        } else if (side.change == "updated" && inKey.kind != ItemKind::Enclosure) {
            side.parts = ChangedParts(BaseState(inKey), StateOf(*change));
        }
        return side;
    }

    Context& mContext;
    const WorkSession& mSession;
    const LoadedProduction& mShared;
    const AssetNames& mNames;
    const std::string mBaseCommit;
    const ChangeMap mMine;
    const ChangeMap mTheirs;
};

AssetNames NamesOf(Context& ioContext, const WorkSession& inSession, const LoadedProduction& inShared) {
    AssetNames names;
    names.Add(ioContext, inSession.view);
    names.Add(ioContext, inShared);
    return names;
}

std::string Joined(const std::vector<std::string>& inWords) {
    std::string text;
    for (const std::string& word : inWords) {
        text += (text.empty() ? "" : ", ") + word;
    }
    return text;
}

Json SideJson(const ConflictSide& inSide) {
    Json json = Json::Part();
    json.Set("change", inSide.change).Set("committer", inSide.who).Set("committed", inSide.when);
    return json.SetList("parts", inSide.parts);
}

}  // namespace

std::string ConflictSide::Text() const {
    std::string text = change + (parts.empty() ? "" : " (" + Joined(parts) + ")");
    if (!who.empty()) {
        text += " by " + who;
    }
    return when.is_special() ? text : text + ", " + ShortTime(when);
}

std::vector<Conflict> LoadOpenConflicts(Context& ioContext, const WorkSession& inSession) {
    const auto differences = inSession.session->GetOutgoingChanges();
    const std::vector<Change> outgoing =
        LoadChanges(ioContext, differences, "loading the conflicts of " + inSession.productionName);
    std::map<std::string, std::vector<Change>> byBase;
    for (const Change& change : outgoing) {
        if (change.entry.IsInConflict()) {
            byBase[change.entry.baseCommitID.str()].push_back(change);
        }
    }
    if (byBase.empty()) {
        return {};
    }
    const LoadedProduction shared = LoadSharedProduction(ioContext, inSession);
    const AssetNames names = NamesOf(ioContext, inSession, shared);
    std::vector<Conflict> conflicts;
    for (const auto& [base, changes] : byBase) {
        Comparison comparison(
            ioContext, inSession, shared, names, base,
            LoadBetween(ioContext, inSession.view.id, base, inSession.view.commit),
            LoadBetween(ioContext, inSession.productionID, base, differences->GetBaseCommitID().str()));
        for (const Change& change : changes) {
            Conflict conflict = comparison.Describe(KeyOf(change));
            conflict.acceptMineURL = change.entry.acceptYoursURL.str();
            conflict.acceptTheirsURL = change.entry.acceptTheirsURL.str();
            conflicts.push_back(std::move(conflict));
        }
    }
    return conflicts;
}

std::vector<Conflict> PredictConflicts(Context& ioContext, const WorkSession& inSession,
                                       const std::vector<Change>& inOutgoing,
                                       const std::vector<Change>& inIncoming,
                                       const std::string& inBaseCommit) {
    if (inOutgoing.empty() || inIncoming.empty()) {
        return {};
    }
    const LoadedProduction shared = LoadSharedProduction(ioContext, inSession);
    const AssetNames names = NamesOf(ioContext, inSession, shared);
    Comparison comparison(ioContext, inSession, shared, names, inBaseCommit, inOutgoing, inIncoming);
    std::vector<Conflict> conflicts;
    // An asset that one side removed is decided as a whole.
    std::set<std::string> whole;
    for (const ChangeMap* side : {&comparison.Mine(), &comparison.Theirs()}) {
        for (const auto& [key, change] : *side) {
            if (key.kind == ItemKind::Asset && change.IsRemoved() && comparison.IsRemovedAgainstChange(key) &&
                whole.insert(key.assetID).second) {
                conflicts.push_back(comparison.Describe(key));
            }
        }
    }
    for (const auto& [key, change] : comparison.Mine()) {
        const bool isDecided = !key.assetID.empty() && whole.count(key.assetID) != 0;
        if (!isDecided && comparison.Theirs().count(key) != 0 && comparison.IsAtOdds(key)) {
            conflicts.push_back(comparison.Describe(key));
        }
    }
    return conflicts;
}

Json ConflictJson(const Conflict& inConflict, const char* inState) {
    Json json("conflict");
    json.Set("state", inState).Set("kind", ItemKindName(inConflict.key.kind));
    json.Set("assetId", inConflict.key.assetID)
        .Set("asset", inConflict.asset)
        .Set("name", inConflict.key.name);
    json.Set("text", inConflict.text).Set("baseCommit", inConflict.baseCommit);
    return json.Set("mine", SideJson(inConflict.mine)).Set("theirs", SideJson(inConflict.theirs));
}

void PrintConflicts(Context& ioContext, const std::vector<Conflict>& inConflicts) {
    Output& out = ioContext.Out();
    for (const Conflict& conflict : inConflicts) {
        out.Line(out.Bold(ForTerminal(conflict.text)));
        out.Line("  mine    " + ForTerminal(conflict.mine.Text()));
        out.Line("  theirs  " + ForTerminal(conflict.theirs.Text()));
    }
}

}  // namespace zo
