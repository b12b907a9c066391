// Reading an asset.
#include "Model/Asset.h"

#include "Model/AssetProperties.h"
#include "Model/Renditions.h"
#include "Model/ResourceCreation.h"
#include "Model/ServerResourceWithEnclosures.h"
#include "ostcore/debug/DebugDatabase.h"
#include "ostcore/utility/StringConversion.h"

namespace ZOCL {

using ostcore::utility::ToUTF16;

int Asset::QueryInterfaceNoAddRef(const RFL::InterfaceID& inID, void** outInterface) noexcept {
    if (inID == kInterfaceID) {
        *outInterface = this;
        return kResultSuccess;
    }
    return Implements::QueryInterfaceNoAddRef(inID, outInterface);
}

bool Asset::GetAssetType(ImmutableString& outType) {
    const dto::AssetProperties properties = GetProperties("ZOCL::Asset::GetAssetType");
    outType = properties.AssetType();
    // Lets a test's sequence behave as a composition.
    if (outType == kAssetType_Sequence && properties.Name() == "*** Pretend SF Comp" &&
        ostcore::debug::DebugDatabase::GetBool("ZOCL.TreatSpecialSequencesAsComps", false)) {
        outType = kAssetType_Composition;
    }
    return !outType.empty();
}

UString Asset::GetAssetTypeDisplayName() {
    ImmutableString type;
    GetAssetType(type);
    return ZOCL::GetAssetTypeDisplayName(type);
}

ImmutableString Asset::GetMediaLocatorIdentifier() {
    return GetProperties("Asset::GetMediaLocatorIdentifier").MediaLocator();
}

InterfaceRef<IZOCMediaLocator> Asset::GetMediaLocator(bool inLoad) {
    const ImmutableString id = GetProperties("Asset::GetMediaLocator").MediaLocator();
    if (id.empty()) {
        return nullptr;
    }
    const InterfaceRef<IZOCMediaLocator> locator = GetServer()->GetMediaLocator(id);
    if (inLoad) {
        if (const auto resource = RFL::QueryInterface<IZOCServerResource>(locator)) {
            resource->Load(true);
        }
    }
    return locator;
}

bool Asset::HasMediaLocator() {
    return !GetProperties("Asset::HasMediaLocator").MediaLocator().empty();
}

UString Asset::GetName() {
    return ToUTF16(GetProperties("Asset::GetName").Name());
}

UString Asset::GetDescription() {
    return ToUTF16(GetProperties("Asset::GetDescription").Description());
}

std::vector<ImmutableString> Asset::GetTags() {
    return GetProperties("Asset::GetTags").Tags();
}

ImmutableString Asset::GetAssetIdentifier() {
    return GetBody("Asset::GetAssetIdentifier").Identifier();
}

ImmutableString Asset::GetParentAssetIdentifier() {
    return GetProperties("Asset::GetParentAssetIdentifier").Parent();
}

ImmutableString Asset::GetContentIdentifier() {
    return GetBody("Asset::GetContentIdentifier").ContentID();
}

AssetBaseProperties Asset::GetAssetBaseProperties() {
    return ToAssetBaseProperties(GetProperties("Asset::GetAssetBaseProperties"));
}

bool Asset::GetSubClip(SubClip& outSubClip) {
    return ReadSubClip(GetProperties("Asset::GetSubClip"), outSubClip);
}

InterfaceRef<IZOCEnclosures> Asset::GetEnclosures() {
    const ImmutableString link = GetLinkHref(kRelation_Enclosures);
    const dto::Asset body = GetBody("Asset::GetEnclosures");
    if (body.HasEnclosures()) {
        return MakeFromBody<Enclosures>(body.Enclosures(), link, GetServer(), GetWritability());
    }
    return MakeAtURL<Enclosures>(link, GetServer(), GetWritability());
}

InterfaceRef<IZOCRenditions> Asset::GetRenditions() {
    const ImmutableString link = GetLinkHref(kRelation_Renditions);
    const dto::Asset body = GetBody("Asset::GetRenditions");
    if (body.HasRenditions()) {
        return MakeFromBody<Renditions>(body.Renditions(), link, GetServer(), GetWritability());
    }
    return MakeAtURL<Renditions>(link, GetServer(), GetWritability());
}

InterfaceRef<IZOCAsset> Asset::GetLatestVersion() {
    return MakeAtURL<Asset>(GetLinkHref(kRelation_LatestVersion), GetServer(), GetWritability());
}

std::string Asset::GetTraceName() {
    const dto::AssetProperties properties = GetProperties("Asset::GetName");
    return std::string(properties.Name());
}

}  // namespace ZOCL
