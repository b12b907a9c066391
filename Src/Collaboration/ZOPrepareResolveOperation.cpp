// How conflicts in the differences become rows.
#include "Collaboration/ZOPrepareResolveOperation.h"

#include "Collaboration/XMPEnclosureBase.h"
#include "ostcore/config/ZString.h"
#include "Resources/JoinText.h"

namespace ZOCL {

using ostcore::threads::MutexLock;

namespace {

const char kProductionSettings[] = "$$$/ZOCL/ProductionSettingsItemName=Production Settings";

/// Takes over what is known of the asset that a row is about.
void TakeAsset(const ProductionItemData& inAsset, ConflictItemData& ioRow) {
    const ImmutableString type = ioRow.kind == ConflictKind::kAsset ? inAsset.type : ioRow.type;
    static_cast<ProductionItemData&>(ioRow) = inAsset;
    ioRow.type = type;
    if (ioRow.kind == ConflictKind::kEnclosure) {
        ioRow.displayName = ImmutableString(JoinText(inAsset.displayName, ": ", ioRow.enclosureName));
    }
}

ConflictItemData MakePropertiesRow(const IZOCDifferences::Entry&) {
    ConflictItemData row;
    row.kind = ConflictKind::kProductionProperties;
    row.assetIdentifier = kConflictType_ProductionProperties;
    row.displayName = ImmutableString(ostcore::ZString(kProductionSettings).AsUTF8());
    row.path = ImmutableString("/");
    row.type = kConflictType_ProductionProperties;
    return row;
}

}  // namespace

ZOPrepareResolveOperation::ZOPrepareResolveOperation(const ImmutableString& inSessionURL)
    : PrepareChangesOperation(inSessionURL, nullptr) {}

std::vector<ConflictItemData> ZOPrepareResolveOperation::GetConflicts() const {
    MutexLock lock(mMutex);
    return mConflicts;
}

ImmutableString ZOPrepareResolveOperation::GetCommitId() const {
    const InterfaceRef<IZOCDifferences> changes = GetOutgoingChanges();
    return changes ? changes->GetCommitID() : ImmutableString();
}

void ZOPrepareResolveOperation::OnAssetList(const Assets& inAssets) {
    mAssets = ProductionItems(inAssets);
    GetXMPEnclosureMapForAssetList(inAssets, mXMPEnclosures);
}

std::vector<PrepareChangesOperation::AssetToFetch> ZOPrepareResolveOperation::OnChanges(
    const InterfaceRef<IZOCDifferences>& inChanges) {
    std::vector<ConflictItemData> rows;
    std::vector<AssetToFetch> requests;
    const auto addRows = [&](const std::vector<Entry>& inEntries, const auto& inMakeRow) {
        for (const Entry& entry : inEntries) {
            if (!entry.IsInConflict()) {
                continue;
            }
            const bool isGone = !entry.identifier.empty() && !mAssets.Find(entry.identifier);
            if (isGone && !entry.assetURL.empty()) {
                requests.push_back({entry.assetURL, rows.size()});
            }
            ConflictItemData row = inMakeRow(entry);
            row.acceptTheirsURL = entry.acceptTheirsURL;
            row.acceptYoursURL = entry.acceptYoursURL;
            row.assetURL = entry.assetURL;
            row.conflictsWithContentID = entry.conflictsWithContentID;
            rows.push_back(std::move(row));
        }
    };
    addRows(inChanges->GetAssetDifferences(), [this](const Entry& inEntry) { return MakeAssetRow(inEntry); });
    addRows(inChanges->GetEnclosureDifferences(),
            [this](const Entry& inEntry) { return MakeEnclosureRow(inEntry); });
    addRows(inChanges->GetPropertiesDifferences(), MakePropertiesRow);
    MutexLock lock(mMutex);
    mConflicts.swap(rows);
    return requests;
}

ConflictItemData ZOPrepareResolveOperation::MakeAssetRow(const Entry& inEntry) const {
    ConflictItemData row;
    row.assetIdentifier = inEntry.identifier;
    row.displayName = inEntry.name;
    if (const ProductionItemData* const asset = mAssets.Find(inEntry.identifier)) {
        TakeAsset(*asset, row);
    }
    return row;
}

ConflictItemData ZOPrepareResolveOperation::MakeEnclosureRow(const Entry& inEntry) const {
    const ImmutableString base = GetXMPEnclosureBase(inEntry.name);
    ConflictItemData row;
    row.kind = base.empty() ? ConflictKind::kEnclosure : ConflictKind::kXMPMetadata;
    row.type = base.empty() ? kConflictType_Enclosure : kConflictType_XMPMetadata;
    row.enclosureName = inEntry.name;
    row.assetIdentifier = inEntry.identifier.empty() ? inEntry.name : inEntry.identifier;
    row.displayName = base.empty() ? inEntry.name : base;
    const ProductionItemData* const asset = base.empty() || !inEntry.identifier.empty()
                                                ? mAssets.Find(inEntry.identifier)
                                                : FindAssetOfXMP(inEntry);
    if (asset) {
        TakeAsset(*asset, row);
    }
    return row;
}

/// The production keeps the packet of a clip under the clip's media locator; of several clips with one
/// locator the first stands for all.
const ProductionItemData* ZOPrepareResolveOperation::FindAssetOfXMP(const Entry& inEntry) const {
    const auto found = mXMPEnclosures.lower_bound(inEntry.name);
    return found == mXMPEnclosures.end() || found->first != inEntry.name
               ? nullptr
               : mAssets.Find(found->second.assetIdentifier);
}

void ZOPrepareResolveOperation::OnAsset(const AssetToFetch& inRequest,
                                        const InterfaceRef<IZOCAsset>& inAsset) {
    const ProductionItemData asset = mAssets.Describe(inAsset);
    MutexLock lock(mMutex);
    TakeAsset(asset, mConflicts[inRequest.row]);
}

}  // namespace ZOCL
