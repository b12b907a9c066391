// The three-way merge of trees. One table decides every item; the rest is finding the items.
#include "Model/TreeMerge.h"

#include <algorithm>
#include <map>
#include <optional>
#include <tuple>

#include "Base/Digest.h"
#include "Model/Repository.h"

namespace zohub {

namespace {

enum class Side { Theirs, Mine, Both };

// Null stands for an absent item. Equal is asked for two that are there.
template <class Value, class Equal>
Side Decide(Value const* inBase, Value const* inTheirs, Value const* inMine, bool inIsOpen,
            Equal const& inEqual) {
    auto const same = [&](Value const* inLeft, Value const* inRight) {
        return inLeft && inRight ? inEqual(*inLeft, *inRight) : inLeft == inRight;
    };
    if (same(inTheirs, inMine))
        return Side::Theirs;
    if (inIsOpen)
        return Side::Both;
    if (same(inMine, inBase))
        return Side::Theirs;
    return same(inTheirs, inBase) ? Side::Mine : Side::Both;
}

char const* KindOf(EnclosureState const&) {
    return kConflictEnclosure;
}
char const* KindOf(RenditionState const&) {
    return kConflictRendition;
}

using ConflictKey = std::tuple<std::string, std::string, std::string>;  // item, kind, name

ConflictKey ConflictKeyOf(ConflictRecord const& inConflict) {
    return {inConflict.item, inConflict.kind, inConflict.name};
}

// Conflicts by item. What a conflict says of their side is filled in by Open at the end.
class ConflictSet {
public:
    explicit ConflictSet(std::vector<ConflictRecord> const& inConflicts) {
        for (auto const& conflict : inConflicts)
            mConflicts.emplace(ConflictKeyOf(conflict), conflict);
    }

    ConflictRecord const* Find(std::string const& inItem, std::string const& inKind,
                               std::string const& inName) const {
        auto const at = mConflicts.find({inItem, inKind, inName});
        return at == mConflicts.end() ? nullptr : &at->second;
    }

    bool HasAnyOf(std::string const& inItem) const {
        auto const at = mConflicts.lower_bound({inItem, "", ""});
        return at != mConflicts.end() && std::get<0>(at->first) == inItem;
    }

    /// Keeps the base commit of a conflict that is there already.
    void Add(ConflictRecord const& inConflict) { mConflicts.emplace(ConflictKeyOf(inConflict), inConflict); }

    std::vector<ConflictRecord> All() const {
        std::vector<ConflictRecord> all;
        for (auto const& [key, conflict] : mConflicts)
            all.push_back(conflict);
        return all;
    }

    std::vector<std::string> Assets() const {
        std::vector<std::string> assets;
        for (auto const& [key, conflict] : mConflicts)
            if (!conflict.item.empty() && (assets.empty() || assets.back() != conflict.item))
                assets.push_back(conflict.item);
        return assets;
    }

private:
    std::map<ConflictKey, ConflictRecord> mConflicts;
};

std::optional<AssetState> LoadIfThere(Repository& inRepository, std::string const& inHash) {
    return inHash.empty() ? std::nullopt : std::optional(inRepository.LoadAsset(inHash));
}

// Stores the state unless it is one of those that are known; gives its hash.
std::string Store(Repository& inRepository, std::string const& inReferencesOf, AssetState const& inState,
                  std::initializer_list<std::string_view> inKnown) {
    std::string hash = Sha256Hex(WriteAssetState(inState));
    if (std::find(inKnown.begin(), inKnown.end(), hash) == inKnown.end())
        inRepository.AddAsset(inReferencesOf, inState);
    return hash;
}

void TakeProperties(AssetState& ioTarget, AssetState const& inSource) {
    ioTarget.properties = inSource.properties;
    ioTarget.parent = inSource.parent;
    ioTarget.locator = inSource.locator;
}

class Merger {
public:
    Merger(Transaction& inTransaction, MergeInput const& inInput)
        : mTransaction(inTransaction),
          mRepository(inTransaction),
          mInput(inInput),
          mOpen(inInput.open),
          mFound({}) {}

    MergeResult Run() {
        MergeResult result;
        result.tree = mInput.mine;
        result.tree.properties = MergeProperties();
        result.tree.enclosures =
            MergeList(mInput.base.enclosures, mInput.theirs.enclosures, mInput.mine.enclosures, "");
        auto const written = AssetMap(mTransaction, mInput.mine.assets).Apply(MergeAssets());
        result.tree.assets = written.root;
        result.tree.assetCount = written.count;
        result.conflicts = OpenConflicts(mTransaction, mInput.theirs, result.tree, mFound.All());
        return result;
    }

private:
    // The decision with the strategy applied; opens a conflict when it is to be kept.
    template <class Value, class Equal>
    Value const* Choose(Value const* inBase, Value const* inTheirs, Value const* inMine, Equal const& inEqual,
                        std::string const& inItem, std::string const& inKind, std::string const& inName) {
        switch (Decide(inBase, inTheirs, inMine, mOpen.Find(inItem, inKind, inName) != nullptr, inEqual)) {
            case Side::Theirs:
                return inTheirs;
            case Side::Mine:
                return inMine;
            case Side::Both:
                break;
        }
        AddConflict(inItem, inKind, inName);
        return mInput.strategy == MergeStrategy::Theirs ? inTheirs : inMine;
    }

    void AddConflict(std::string const& inItem, std::string const& inKind, std::string const& inName) {
        if (mInput.strategy != MergeStrategy::Keep)
            return;
        ConflictRecord const* const open = mOpen.Find(inItem, inKind, inName);
        mFound.Add({"", inKind, inItem, inName, "", open ? open->baseCommit : mInput.baseCommit});
    }

    std::string MergeProperties() {
        return *Choose(&mInput.base.properties, &mInput.theirs.properties, &mInput.mine.properties,
                       SameProperties, "", kConflictProperties, "");
    }

    // Their order, and behind it what only mine has.
    template <class State>
    std::vector<State> MergeList(std::vector<State> const& inBase, std::vector<State> const& inTheirs,
                                 std::vector<State> const& inMine, std::string const& inAsset) {
        auto const equal = [](State const& a, State const& b) { return SameItem(a, b); };
        std::vector<State> merged;
        auto const add = [&](State const& inState, State const* inTheirsState, State const* inMineState) {
            auto const& key = KeyOf(inState);
            State const* const chosen = Choose(FindByKey(inBase, key), inTheirsState, inMineState, equal,
                                               inAsset, KindOf(inState), key);
            if (chosen)
                merged.push_back(*chosen);
        };
        for (auto const& theirs : inTheirs)
            add(theirs, &theirs, FindByKey(inMine, KeyOf(theirs)));
        for (auto const& mine : inMine)
            if (!FindByKey(inTheirs, KeyOf(mine)))
                add(mine, nullptr, &mine);
        return merged;
    }

    struct Hashes {
        std::string base;
        std::string theirs;
        std::string mine;
    };

    AssetMap::Changes MergeAssets() {
        std::map<std::string, Hashes> touched = FindTouched();
        AssetMap::Changes changes;
        for (auto const& [id, hashes] : touched) {
            std::string const merged = MergeAsset(id, hashes);
            if (merged != hashes.mine)
                changes[id] = merged.empty() ? std::nullopt : std::optional(merged);
        }
        return changes;
    }

    // The assets that they changed, and those in conflict. All others stay as they are in mine.
    std::map<std::string, Hashes> FindTouched() {
        AssetMap const base(mTransaction, mInput.base.assets);
        std::map<std::string, Hashes> touched;
        auto const theirs = base.CompareTo(AssetMap(mTransaction, mInput.theirs.assets));
        for (auto const& difference : theirs.differences)
            touched[difference.id] = {difference.left, difference.right, difference.left};
        for (auto const& id : mOpen.Assets()) {
            if (touched.count(id))
                continue;
            std::string const hash = base.Find(id).value_or("");
            touched[id] = {hash, hash, hash};
        }
        auto const mine = base.CompareTo(AssetMap(mTransaction, mInput.mine.assets));
        for (auto const& difference : mine.differences)
            if (auto const at = touched.find(difference.id); at != touched.end())
                at->second.mine = difference.right;
        return touched;
    }

    // The hash of the merged state; empty when the asset is gone.
    std::string MergeAsset(std::string const& inId, Hashes const& inHashes) {
        if (inHashes.theirs == inHashes.mine)
            return inHashes.mine;
        bool const isOpen = mOpen.HasAnyOf(inId);
        if (!isOpen && inHashes.mine == inHashes.base)
            return inHashes.theirs;
        if (!isOpen && inHashes.theirs == inHashes.base)
            return inHashes.mine;
        auto const base = LoadIfThere(mRepository, inHashes.base);
        auto const theirs = LoadIfThere(mRepository, inHashes.theirs);
        auto const mine = LoadIfThere(mRepository, inHashes.mine);
        if (!theirs || !mine)
            return MergeExistence(inId, inHashes, base, theirs ? *theirs : *mine);
        AssetState const merged = MergeParts(base ? *base : AssetState(), *theirs, *mine);
        return Store(mRepository, mInput.referencesOf, merged, {inHashes.theirs, inHashes.mine});
    }

    // One side has no such asset, and the other one has inPresent.
    std::string MergeExistence(std::string const& inId, Hashes const& inHashes,
                               std::optional<AssetState> const& inBase, AssetState const& inPresent) {
        bool const isTouched = inBase && !SameAsset(*inBase, inPresent);
        if (!mOpen.HasAnyOf(inId) && !isTouched)
            return inBase ? std::string() : (inHashes.mine.empty() ? inHashes.theirs : inHashes.mine);
        AddConflict(inId, kConflictAsset, "");
        return mInput.strategy == MergeStrategy::Theirs ? inHashes.theirs : inHashes.mine;
    }

    AssetState MergeParts(AssetState const& inBase, AssetState const& inTheirs, AssetState const& inMine) {
        auto const equal = [](AssetState const& a, AssetState const& b) {
            return SameProperties(a.properties, b.properties);
        };
        AssetState merged;
        merged.id = inMine.id;
        TakeProperties(merged, *Choose(inBase.id.empty() ? nullptr : &inBase, &inTheirs, &inMine, equal,
                                       inMine.id, kConflictAsset, ""));
        merged.enclosures = MergeList(inBase.enclosures, inTheirs.enclosures, inMine.enclosures, inMine.id);
        merged.renditions = MergeList(inBase.renditions, inTheirs.renditions, inMine.renditions, inMine.id);
        return merged;
    }

    Transaction& mTransaction;
    Repository mRepository;
    MergeInput const& mInput;
    ConflictSet mOpen;
    ConflictSet mFound;
};

// Whether the sides of a conflict still differ, and what theirs is now.
class Settler {
public:
    Settler(Transaction& inTransaction, TreeRoot const& inTheirs, TreeRoot const& inMine)
        : mRepository(inTransaction),
          mTheirs(inTheirs),
          mMine(inMine),
          mTheirAssets(inTransaction, inTheirs.assets),
          mMyAssets(inTransaction, inMine.assets) {}

    void Settle(ConflictRecord inConflict) {
        if (inConflict.item.empty())
            SettleOfProduction(std::move(inConflict));
        else
            SettleOfAsset(std::move(inConflict));
    }

    std::vector<ConflictRecord> Finish() const { return mOpen.All(); }

private:
    void KeepOpen(ConflictRecord inConflict, std::string const& inTheirs) {
        inConflict.theirsContent = inTheirs.empty() ? kConflictRemoved : inTheirs;
        mOpen.Add(inConflict);
    }

    void SettleOfProduction(ConflictRecord inConflict) {
        if (inConflict.kind == kConflictEnclosure)
            SettleListed(std::move(inConflict), mTheirs.enclosures, mMine.enclosures);
        else if (!SameProperties(mTheirs.properties, mMine.properties))
            KeepOpen(std::move(inConflict), Sha256Hex(mTheirs.properties));
    }

    void SettleOfAsset(ConflictRecord inConflict) {
        std::string const theirHash = mTheirAssets.Find(inConflict.item).value_or("");
        std::string const myHash = mMyAssets.Find(inConflict.item).value_or("");
        if (theirHash == myHash)
            return;
        if (theirHash.empty() || myHash.empty()) {
            inConflict.kind = kConflictAsset;
            inConflict.name.clear();
            KeepOpen(std::move(inConflict), theirHash);
            return;
        }
        AssetState const theirs = mRepository.LoadAsset(theirHash);
        AssetState const mine = mRepository.LoadAsset(myHash);
        if (inConflict.kind == kConflictEnclosure)
            SettleListed(std::move(inConflict), theirs.enclosures, mine.enclosures);
        else if (inConflict.kind == kConflictRendition)
            SettleListed(std::move(inConflict), theirs.renditions, mine.renditions);
        else if (!SameProperties(theirs.properties, mine.properties))
            KeepOpen(std::move(inConflict), theirHash);
    }

    template <class State>
    void SettleListed(ConflictRecord inConflict, std::vector<State> const& inTheirs,
                      std::vector<State> const& inMine) {
        State const* const theirs = FindByKey(inTheirs, inConflict.name);
        State const* const mine = FindByKey(inMine, inConflict.name);
        if (theirs && mine ? SameItem(*theirs, *mine) : theirs == mine)
            return;
        KeepOpen(std::move(inConflict), theirs ? theirs->content : std::string());
    }

    Repository mRepository;
    TreeRoot const& mTheirs;
    TreeRoot const& mMine;
    AssetMap const mTheirAssets;
    AssetMap const mMyAssets;
    ConflictSet mOpen{{}};
};

// Makes the item of that key in the list what it is in theirs.
template <class State>
void TakeListed(std::vector<State>& ioMine, std::vector<State> const& inTheirs, std::string const& inKey) {
    State const* const theirs = FindByKey(inTheirs, inKey);
    auto const mine = std::find_if(ioMine.begin(), ioMine.end(),
                                   [&](State const& inState) { return KeyOf(inState) == inKey; });
    if (!theirs && mine != ioMine.end())
        ioMine.erase(mine);
    else if (theirs && mine != ioMine.end())
        *mine = *theirs;
    else if (theirs)
        ioMine.push_back(*theirs);
}

// Their state of what the conflict is about, put into mine. Both sides have the asset.
void TakePart(AssetState& ioMine, AssetState const& inTheirs, ConflictRecord const& inConflict) {
    if (inConflict.kind == kConflictEnclosure)
        TakeListed(ioMine.enclosures, inTheirs.enclosures, inConflict.name);
    else if (inConflict.kind == kConflictRendition)
        TakeListed(ioMine.renditions, inTheirs.renditions, inConflict.name);
    else
        TakeProperties(ioMine, inTheirs);
}

}  // namespace

MergeResult MergeTrees(Transaction& inTransaction, MergeInput const& inInput) {
    return Merger(inTransaction, inInput).Run();
}

std::vector<ConflictRecord> OpenConflicts(Transaction& inTransaction, TreeRoot const& inTheirs,
                                          TreeRoot const& inMine,
                                          std::vector<ConflictRecord> const& inConflicts) {
    Settler settler(inTransaction, inTheirs, inMine);
    for (auto const& conflict : inConflicts)
        settler.Settle(conflict);
    return settler.Finish();
}

TreeRoot TakeTheirs(Transaction& inTransaction, TreeRoot const& inTheirs, TreeRoot const& inMine,
                    std::vector<ConflictRecord> const& inConflicts, std::string const& inReferencesOf) {
    Repository repository(inTransaction);
    AssetMap const theirAssets(inTransaction, inTheirs.assets);
    AssetMap const myAssets(inTransaction, inMine.assets);
    TreeRoot tree = inMine;
    AssetMap::Changes changes;
    std::map<std::string, AssetState> changed;
    for (auto const& conflict : inConflicts) {
        if (conflict.item.empty()) {
            if (conflict.kind == kConflictEnclosure)
                TakeListed(tree.enclosures, inTheirs.enclosures, conflict.name);
            else
                tree.properties = inTheirs.properties;
            continue;
        }
        auto const theirs = theirAssets.Find(conflict.item);
        auto const mine = myAssets.Find(conflict.item);
        if (!theirs || !mine) {
            changes[conflict.item] = theirs;
            continue;
        }
        auto const at = changed.try_emplace(conflict.item, repository.LoadAsset(*mine)).first;
        TakePart(at->second, repository.LoadAsset(*theirs), conflict);
    }
    for (auto const& [id, state] : changed)
        changes[id] = Store(repository, inReferencesOf, state, {*theirAssets.Find(id), *myAssets.Find(id)});
    if (changes.empty())
        return tree;
    auto const written = myAssets.Apply(changes);
    tree.assets = written.root;
    tree.assetCount = written.count;
    return tree;
}

}  // namespace zohub
