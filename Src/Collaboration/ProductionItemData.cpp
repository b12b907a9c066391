// Names, places and kinds of what the windows for sharing and resolving list.
#include "Collaboration/ProductionItemData.h"

#include "ostcore/config/ZString.h"
#include "ostcore/utility/StringConversion.h"

namespace ZOCL {

using ostcore::utility::ToUTF8;

const ImmutableString kConflictType_XMPMetadata("XMPMetadata");
const ImmutableString kConflictType_ProductionProperties("ProductionProperties");
const ImmutableString kConflictType_Enclosure("Enclosure");

namespace {

/// Bins that lie deeper are told by the nearest of those above them; also ends the walk of a ring.
constexpr std::size_t kMaximumDepth = 64;

const char* ConflictKindKey(ConflictKind inKind) {
    switch (inKind) {
        case ConflictKind::kXMPMetadata:
            return "$$$/Cadenzo/ZOCL/ZOResolveDialog/ConflictTypeXMPMetadata=XMP Metadata";
        case ConflictKind::kProductionProperties:
            return "$$$/ZOCL/ProductionSettingsItemName=Production Settings";
        case ConflictKind::kEnclosure:
            return "$$$/Cadenzo/ZOCL/ZOResolveDialog/ConflictTypeEnclosure=Attached Data";
        case ConflictKind::kAsset:
            break;
    }
    return "$$$/Cadenzo/ZOCL/ZOResolveDialog/ConflictTypeAsset=Asset";
}

}  // namespace

UString GetConflictKindText(ConflictKind inKind) {
    return ostcore::ZString(ConflictKindKey(inKind)).AsString();
}

ProductionItems::ProductionItems(const std::vector<IZOCAssetList::AssetListItem>& inAssets) {
    mItems.reserve(inAssets.size());
    mPositions.reserve(inAssets.size());
    for (const auto& asset : inAssets) {
        ProductionItemData item;
        item.assetIdentifier = asset.assetIdentifier;
        item.displayName = ImmutableString(ToUTF8(asset.name));
        item.type = asset.assetType;
        item.parentIdentifier = asset.parentIdentifier;
        item.mediaLocatorIdentifier = asset.mediaLocatorIdentifier;
        mPositions.emplace(item.assetIdentifier, mItems.size());
        mItems.push_back(std::move(item));
    }
    // The path of each bin is found once, however many assets lie in it.
    std::unordered_map<ImmutableString, ImmutableString> paths;
    for (ProductionItemData& item : mItems) {
        const auto added = paths.emplace(item.parentIdentifier, ImmutableString());
        if (added.second) {
            added.first->second = PathBelow(item.parentIdentifier);
        }
        item.path = added.first->second;
    }
}

const ProductionItemData* ProductionItems::Find(const ImmutableString& inIdentifier) const {
    const auto found = mPositions.find(inIdentifier);
    return found == mPositions.end() ? nullptr : &mItems[found->second];
}

ImmutableString ProductionItems::PathBelow(const ImmutableString& inBin) const {
    std::string path;
    const ProductionItemData* bin = Find(inBin);
    for (std::size_t depth = 0; bin && depth < kMaximumDepth; ++depth) {
        path.insert(0, "/" + bin->displayName.str());
        bin = Find(bin->parentIdentifier);
    }
    return ImmutableString(path.empty() ? "/" : path);
}

ProductionItemData ProductionItems::Describe(const InterfaceRef<IZOCAsset>& inAsset) const {
    ProductionItemData item;
    item.assetIdentifier = inAsset->GetAssetIdentifier();
    item.displayName = ImmutableString(ToUTF8(inAsset->GetName()));
    item.asset = inAsset;
    inAsset->GetAssetType(item.type);
    item.parentIdentifier = inAsset->GetParentAssetIdentifier();
    item.path = PathBelow(item.parentIdentifier);
    item.mediaLocatorIdentifier = inAsset->GetMediaLocatorIdentifier();
    return item;
}

}  // namespace ZOCL
