// The rows that the windows for sharing and resolving show: assets of a session, and conflicts.
#pragma once

#include <unordered_map>
#include <vector>

#include "ZOClient/IZOCAsset.h"

namespace ZOCL {

/// One asset of a session, or one that the session has removed. Texts are UTF-8, empty when not known.
struct ProductionItemData {
    ImmutableString assetIdentifier;
    ImmutableString displayName;
    /// Loaded, for an asset that had to be fetched since the session's list has it no more; null for all
    /// others.
    InterfaceRef<IZOCAsset> asset;
    /// Where it lies: the names of the bins above it, each behind a "/"; "/" at the top.
    ImmutableString path;
    /// kAssetType_*, or another text that a newer client wrote; of a conflict also kConflictType_*.
    ImmutableString type;
    ImmutableString parentIdentifier;
    ImmutableString mediaLocatorIdentifier;
};

/// The types of conflicts that are not about an asset as such.
extern const ImmutableString kConflictType_XMPMetadata;
/// "ProductionProperties"; also the identifier of that row.
extern const ImmutableString kConflictType_ProductionProperties;
extern const ImmutableString kConflictType_Enclosure;

enum class ConflictKind {
    /// The asset's own properties and renditions.
    kAsset,
    /// The XMP enclosure of an asset.
    kXMPMetadata,
    /// The properties of the production.
    kProductionProperties,
    /// Any other enclosure, of an asset or of the production.
    kEnclosure
};

/// One conflict of a session. The identifier is that of its asset; for what is no asset's it is the type of
/// the production's properties, or the name of the enclosure, so that a host can name the row in any case.
struct ConflictItemData : ProductionItemData {
    ConflictKind kind = ConflictKind::kAsset;
    /// Null unless the conflict is one of an enclosure.
    ImmutableString enclosureName;
    /// Null when the server does not offer that side.
    ImmutableString acceptTheirsURL;
    ImmutableString acceptYoursURL;
    /// The asset of the conflict; the session for what is no asset's.
    ImmutableString assetURL;
    /// The identifier of the other side's content, "removed" when there is none.
    ImmutableString conflictsWithContentID;
};

/// What the column "Conflict Type" says, localised. Threads: any.
UString GetConflictKindText(ConflictKind inKind);

/// The assets of a session as rows. A plain value.
class ProductionItems {
public:
    ProductionItems() = default;
    explicit ProductionItems(const std::vector<IZOCAssetList::AssetListItem>& inAssets);

    /// In the order of the list.
    const std::vector<ProductionItemData>& All() const noexcept { return mItems; }
    /// Null when there is none.
    const ProductionItemData* Find(const ImmutableString& inIdentifier) const;
    /// The row of a loaded asset that is not in the list.
    ProductionItemData Describe(const InterfaceRef<IZOCAsset>& inAsset) const;

private:
    ImmutableString PathBelow(const ImmutableString& inBin) const;

    std::vector<ProductionItemData> mItems;
    std::unordered_map<ImmutableString, std::size_t> mPositions;
};

}  // namespace ZOCL
