// From differences to lines.
#include "Dialogs/PublishChangeList.h"

#include <map>
#include <set>

#include "Dialogs/AssetIcons.h"
#include "ostcore/config/ZString.h"
#include "ostcore/utility/StringConversion.h"

namespace ZOCL {

using ostcore::utility::ToUTF8;

namespace {

const char kAdd[] = "$$$/Cadenzo/ZOCL/AssetAdd=Add";
const char kEdit[] = "$$$/Cadenzo/ZOCL/AssetEdit=Edit";
const char kDelete[] = "$$$/Cadenzo/ZOCL/AssetDelete=Delete";
const char kMetadataName[] = "$$$/ZOCL/ZOPublishDialog/XMPEnclosureItem=@0 XMP";

U8String ActionText(const ImmutableString& inDifferenceType) {
    const char* const key = inDifferenceType == kDifferenceType_Added     ? kAdd
                            : inDifferenceType == kDifferenceType_Removed ? kDelete
                                                                          : kEdit;
    return ostcore::ZString(key).AsUTF8();
}

class Rows {
public:
    explicit Rows(const std::vector<ProductionItemData>& inItems) {
        for (const ProductionItemData& item : inItems) {
            mByIdentifier.emplace(item.assetIdentifier, &item);
            if (!item.mediaLocatorIdentifier.empty()) {
                mByXMPEnclosure.emplace(GetXMPEnclosureName(item.mediaLocatorIdentifier), &item);
            }
        }
    }

    void AddAsset(const IZOCDifferences::Entry& inEntry) {
        const ProductionItemData* const item = Find(mByIdentifier, inEntry.identifier);
        if (!item && inEntry.differenceType == kDifferenceType_Removed) {
            return;
        }
        Add({"asset/" + inEntry.identifier.str(), item ? item->displayName.str() : inEntry.name.str(),
             ConflictKind::kAsset, inEntry.differenceType, item});
    }

    void AddEnclosure(const IZOCDifferences::Entry& inEntry) {
        if (const ProductionItemData* const item = Find(mByXMPEnclosure, inEntry.name)) {
            return Add({"metadata/" + inEntry.name.str(),
                        ostcore::ZString(kMetadataName, {item->displayName.str()}).AsUTF8(),
                        ConflictKind::kXMPMetadata, inEntry.differenceType, item});
        }
        if (inEntry.identifier.empty()) {
            return Add({"enclosure/" + inEntry.name.str(), inEntry.name.str(), ConflictKind::kEnclosure,
                        inEntry.differenceType, nullptr});
        }
        // Of an asset that was removed there is a row already, or none is wanted.
        if (const ProductionItemData* const item = Find(mByIdentifier, inEntry.identifier)) {
            Add({"asset/" + inEntry.identifier.str(), item->displayName.str(), ConflictKind::kAsset,
                 kDifferenceType_Updated, item});
        }
    }

    void AddProperties(const IZOCDifferences::Entry& inEntry) {
        Add({"properties", ToUTF8(GetConflictKindText(ConflictKind::kProductionProperties)),
             ConflictKind::kProductionProperties, inEntry.differenceType, nullptr});
    }

    std::vector<ostui::TreeRow> Take() { return std::move(mRows); }

private:
    using Index = std::map<ImmutableString, const ProductionItemData*>;
    struct Line {
        std::string id;
        std::string name;
        ConflictKind kind;
        ImmutableString differenceType;
        const ProductionItemData* item;
    };

    static const ProductionItemData* Find(const Index& inIndex, const ImmutableString& inKey) {
        const auto found = inIndex.find(inKey);
        return found == inIndex.end() ? nullptr : found->second;
    }

    void Add(const Line& inLine) {
        if (!mIDs.insert(inLine.id).second) {
            return;
        }
        ostui::TreeRow row;
        row.id = inLine.id;
        row.icon = GetChangeIcon(inLine.kind, inLine.item ? inLine.item->type : ImmutableString());
        row.cells = {inLine.name, ActionText(inLine.differenceType), ToUTF8(GetConflictKindText(inLine.kind)),
                     inLine.item ? inLine.item->path.str() : std::string()};
        mRows.push_back(std::move(row));
    }

    Index mByIdentifier;
    Index mByXMPEnclosure;
    std::set<std::string> mIDs;
    std::vector<ostui::TreeRow> mRows;
};

}  // namespace

PublishChanges ReadPublishChanges(const InterfaceRef<IZOCDifferences>& inDifferences) {
    PublishChanges changes;
    if (inDifferences) {
        changes.assets = inDifferences->GetAssetDifferences();
        changes.enclosures = inDifferences->GetEnclosureDifferences();
        changes.properties = inDifferences->GetPropertiesDifferences();
    }
    return changes;
}

std::vector<ostui::TreeRow> MakePublishRows(const std::vector<ProductionItemData>& inItems,
                                            const PublishChanges& inChanges) {
    Rows rows(inItems);
    for (const auto& entry : inChanges.assets) {
        rows.AddAsset(entry);
    }
    for (const auto& entry : inChanges.enclosures) {
        rows.AddEnclosure(entry);
    }
    for (const auto& entry : inChanges.properties) {
        rows.AddProperties(entry);
    }
    return rows.Take();
}

}  // namespace ZOCL
