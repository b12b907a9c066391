// The types of assets, and the names that assets and their metadata go by.
#include "ostcore/config/ZString.h"
#include "ostcore/utility/StringConversion.h"
#include "ZOClient/IZOCAsset.h"

// X(constant, value, key and English text)
#define ZOCL_ASSET_TYPE_TABLE(X)                                                                    \
    X(kAssetType_Bin, "bin", "$$$/ZOCL/AssetType/Bin=Bin")                                          \
    X(kAssetType_SmartBin, "smartbin", "$$$/ZOCL/AssetType/SmartBin=Smart Bin")                     \
    X(kAssetType_MasterClip, "masterclip", "$$$/ZOCL/AssetType/MasterClip=MasterClip")              \
    X(kAssetType_SubClip, "subclip", "$$$/ZOCL/AssetType/SubClip=SubClip")                          \
    X(kAssetType_Sequence, "sequence", "$$$/ZOCL/AssetType/Sequence=Sequence")                      \
    X(kAssetType_Synthetic, "synthetic", "$$$/ZOCL/AssetType/Synthetic=Synthetic")                  \
    X(kAssetType_Synthetic_SF, "synthetic-sf", "$$$/ZOCL/AssetType/SFSynthetic=Stratafx Synthetic") \
    X(kAssetType_Composition, "composition", "$$$/ZOCL/AssetType/Composition=Composition")

namespace ZOCL {

#define ZOCL_ASSET_TYPE_CONSTANT(constant, value, text) const ImmutableString constant(value);
ZOCL_ASSET_TYPE_TABLE(ZOCL_ASSET_TYPE_CONSTANT)
#undef ZOCL_ASSET_TYPE_CONSTANT

namespace {

struct TypeText {
    std::string_view type;
    std::string_view text;
};

#define ZOCL_ASSET_TYPE_TEXT(constant, value, text) {value, text},
constexpr TypeText kTypeTexts[] = {ZOCL_ASSET_TYPE_TABLE(ZOCL_ASSET_TYPE_TEXT)};
#undef ZOCL_ASSET_TYPE_TEXT

}  // namespace

UString GetAssetTypeDisplayName(const ImmutableString& inType) {
    for (const TypeText& entry : kTypeTexts) {
        if (entry.type == inType.view()) {
            return ostcore::ZString(entry.text).AsString();
        }
    }
    return ostcore::ZString("$$$/ZOCL/AssetType/Unrecognized=Unrecognized Asset").AsString();
}

bool IsZOAssetName(const UString& inName) {
    constexpr std::size_t kGuidLength = 36;
    if (inName.size() != kGuidLength + 2 || inName.front() != u'{' || inName.back() != u'}') {
        return false;
    }
    Guid guid;
    return Guid::Parse(ostcore::utility::ToUTF8(inName.substr(1, kGuidLength)), guid);
}

void GetXMPEnclosureMapForAssetList(const std::vector<IZOCAssetList::AssetListItem>& inItems,
                                    XMPEnclosureMap& outMap) {
    for (const IZOCAssetList::AssetListItem& item : inItems) {
        outMap.emplace(GetXMPEnclosureName(item.mediaLocatorIdentifier), item);
    }
}

}  // namespace ZOCL
