// Which icon stands for what.
#include "Dialogs/AssetIcons.h"

namespace ZOCL {

std::string GetAssetIcon(const ImmutableString& inAssetType) {
    const struct {
        const ImmutableString& type;
        const char* icon;
    } icons[] = {{kAssetType_Bin, "SP_Folder_Sm"},           {kAssetType_SmartBin, "SP_SmartBin_Sm"},
                 {kAssetType_Sequence, "SP_Sequence_Sm"},    {kAssetType_MasterClip, "SP_VideoColored_Sm"},
                 {kAssetType_SubClip, "SP_VideoSubClip_Sm"}, {kAssetType_Composition, "SP_SFComp_Sm"},
                 {kAssetType_Synthetic_SF, "SP_SFComp_Sm"},  {kAssetType_Synthetic, "SP_VideoColored_Sm"}};
    for (const auto& entry : icons) {
        if (entry.type == inAssetType) {
            return entry.icon;
        }
    }
    return {};
}

std::string GetChangeIcon(ConflictKind inKind, const ImmutableString& inAssetType) {
    switch (inKind) {
        case ConflictKind::kXMPMetadata:
            return kIconMetadata;
        case ConflictKind::kProductionProperties:
            return kIconProduction;
        case ConflictKind::kAsset:
        case ConflictKind::kEnclosure:
            break;
    }
    return GetAssetIcon(inAssetType);
}

}  // namespace ZOCL
