// The assets of a tree: an immutable map from asset identifier to the hash of the asset's state.
//
// It is a hash trie whose shape depends on nothing but what it holds: equal maps have equal roots, two
// commits share all parts that are equal, and one change among 50,000 assets writes a handful of small
// objects.
#pragma once

#include <cstdint>
#include <functional>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include "Store/Storage.h"

namespace zohub {

class AssetMap {
public:
    AssetMap(Transaction& inTransaction, std::string inRoot);

    std::optional<std::string> Find(std::string const& inAssetId) const;

    /// The states of those of the assets that are there. Reads each part of the map once.
    std::map<std::string, std::string> FindAll(std::vector<std::string> const& inAssetIds) const;

    /// All entries, in no order that means something.
    std::map<std::string, std::string> All() const;

    /// An empty optional removes the asset.
    using Changes = std::map<std::string, std::optional<std::string>>;

    struct Written {
        std::string root;  ///< empty for an empty map
        std::uint64_t count = 0;
    };

    /// Writes the map with the changes applied; this object keeps showing the old one.
    Written Apply(Changes const& inChanges) const;

    /// An asset whose states differ between two maps; an empty hash says that it is not there.
    struct Difference {
        std::string id;
        std::string left;
        std::string right;
    };

    struct Comparison {
        std::vector<Difference> differences;  ///< by identifier
        std::uint64_t nodesRead = 0;          ///< what it cost: parts that are equal are never looked at
    };

    /// This map is the left one.
    Comparison CompareTo(AssetMap const& inRight) const;

private:
    Transaction& mTransaction;
    std::string mRoot;
};

}  // namespace zohub
