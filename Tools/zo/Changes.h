// What differs between two states, item by item, with who changed it and when.
#pragma once

#include <map>
#include <string>
#include <tuple>
#include <vector>

#include "Sessions.h"
#include "ZOClient/IZOCDifferences.h"

namespace zo {

enum class ItemKind { Asset, Enclosure, Properties };
/// "asset", "enclosure", "properties".
const char* ItemKindName(ItemKind inKind);

struct Change {
    ItemKind kind = ItemKind::Asset;
    ZOCL::IZOCDifferences::Entry entry;

    std::string AssetID() const { return entry.identifier.str(); }
    /// "added", "updated", "removed".
    std::string What() const;
    bool IsRemoved() const { return entry.differenceType == ZOCL::kDifferenceType_Removed; }
};

/// Items of one key are the same item.
struct ItemKey {
    ItemKind kind;
    std::string assetID;
    /// Of an enclosure; empty for the others.
    std::string name;

    friend bool operator<(const ItemKey& inLeft, const ItemKey& inRight) {
        return std::tie(inLeft.kind, inLeft.assetID, inLeft.name) <
               std::tie(inRight.kind, inRight.assetID, inRight.name);
    }
};
ItemKey KeyOf(const Change& inChange);

/// Of differences that are loaded: assets, then enclosures, then the properties of the production.
std::vector<Change> ChangesOf(const ZOCL::InterfaceRef<ZOCL::IZOCDifferences>& inDifferences);
/// The same, loaded here.
std::vector<Change> LoadChanges(Context& ioContext,
                                const ZOCL::InterfaceRef<ZOCL::IZOCDifferences>& inDifferences,
                                const std::string& inWhat);
std::vector<Change> LoadOutgoing(Context& ioContext, const WorkSession& inSession);
std::vector<Change> LoadIncoming(Context& ioContext, const WorkSession& inSession);

/// The names of assets for people, and their locators' enclosures; the first production that knows an asset
/// counts.
class AssetNames {
public:
    void Add(Context& ioContext, const LoadedProduction& inProduction);
    /// The names that differences tell, for assets that no production knows.
    void Add(const std::vector<Change>& inChanges);
    /// The identifier for an asset that no production knows.
    std::string NameOf(const std::string& inAssetID) const;
    /// "the properties of clip01", "the XMP metadata of clip01", "the enclosure notes.txt".
    std::string Describe(const Change& inChange) const;
    bool IsXMP(const Change& inChange) const;

private:
    struct Known {
        std::string name;
        std::string xmpEnclosure;
    };
    std::map<std::string, Known> mKnown;
};

}  // namespace zo
