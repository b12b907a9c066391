// What differs between two trees, told item by item, and which commit changed an item last.
//
// The items are: an asset (that it exists, its properties, its renditions), each enclosure by its name, and
// the properties of the production. Two items are equal when a client would see the same: the identifier
// under which the hub keeps an enclosure, the order of a list and the order of keys do not count.
#pragma once

#include <compare>
#include <map>
#include <string>
#include <vector>

#include "Model/Objects.h"
#include "Store/Storage.h"

namespace zohub {

bool SameProperties(std::string const& inLeft, std::string const& inRight);
bool SameItem(EnclosureState const& inLeft, EnclosureState const& inRight);
bool SameItem(RenditionState const& inLeft, RenditionState const& inRight);

/// What makes the two the same item on both sides.
inline std::string const& KeyOf(EnclosureState const& inState) {
    return inState.name;
}
inline std::string const& KeyOf(RenditionState const& inState) {
    return inState.id;
}

template <class State>
State const* FindByKey(std::vector<State> const& inItems, std::string const& inKey) {
    for (auto const& item : inItems)
        if (KeyOf(item) == inKey)
            return &item;
    return nullptr;
}

/// Whether the lists hold equal items, in any order.
template <class State>
bool SameItems(std::vector<State> const& inLeft, std::vector<State> const& inRight) {
    if (inLeft.size() != inRight.size())
        return false;
    for (auto const& left : inLeft) {
        State const* const right = FindByKey(inRight, KeyOf(left));
        if (!right || !SameItem(left, *right))
            return false;
    }
    return true;
}

/// Properties and renditions: what an asset's own entry in the differences is about.
bool SameCore(AssetState const& inLeft, AssetState const& inRight);
/// Core and enclosures.
bool SameAsset(AssetState const& inLeft, AssetState const& inRight);

enum class ChangeType { Added, Updated, Removed };

struct AssetChange {
    ChangeType type = ChangeType::Updated;
    std::string id;
    std::string name;      ///< on the right side; of a removed asset, on the left one
    std::string leftHash;  ///< of its state on the left side; empty for an added asset
};

struct EnclosureChange {
    ChangeType type = ChangeType::Updated;
    std::string asset;     ///< empty for an enclosure of the production
    EnclosureState state;  ///< on the right side; of a removed one, on the left one
};

struct TreeDiff {
    std::vector<AssetChange> assets;  ///< by identifier
    /// Those of the production first, then by asset; also those of assets that were added or removed.
    std::vector<EnclosureChange> enclosures;
    bool properties = false;
};

TreeDiff CompareTrees(Transaction& inTransaction, TreeRoot const& inLeft, TreeRoot const& inRight);

/// One entry of the differences.
struct ChangedItem {
    enum class Kind { Asset, Enclosure, Properties };
    Kind kind = Kind::Properties;
    std::string asset;
    std::string enclosure;  ///< its name

    auto operator<=>(ChangedItem const&) const = default;
};

/// Who made the commit, and when.
struct Change {
    std::string committer;
    Micros time = 0;
};

/// For the entries of the differences, the last commit of the right side that changed each. The walk goes
/// from inRight towards the past and ends at inLeftCommit, when all are found, or after a bounded number of
/// commits; what was not found by then is absent.
std::map<ChangedItem, Change> FindLastChanges(Transaction& inTransaction, TreeDiff const& inDiff,
                                              CommitRecord const& inRight, std::string const& inLeftCommit);

}  // namespace zohub
