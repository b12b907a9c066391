// Properties of assets in bulk forms: the fixed keys in their order, then whatever else the asset carries.
#include "Model/BulkAssetProperties.h"

#include <algorithm>
#include <array>

#include "Model/AssetProperties.h"

namespace ZOCL {

using ostcore::serialization::AddToObject;
using ostcore::serialization::AppendToArray;
using ostcore::serialization::JSONValue;
using ostcore::serialization::JSONView;

namespace {

constexpr const char* kKey_Name = "name";
constexpr const char* kKey_Description = "description";
constexpr const char* kKey_MediaLocator = "mediaLocator";
constexpr const char* kKey_Parent = "zo:parent";
constexpr const char* kKey_Tags = "tags";
constexpr const char* kKey_SubClip = "subClip";
constexpr const char* kKey_AssetType = "cdzo:assetType";
constexpr const char* kKey_ProjectItemProperties = "projectItemProperties";
constexpr const char* kKey_MergedClipMediaLocators = "mergedClipMediaLocators";
constexpr const char* kKey_IsMulticamEnabled = "isMulticamEnabled";
constexpr const char* kKey_ZeroPoint = "zeroPoint";
constexpr const char* kKey_SmartBinQuery = "smartBinQuery";

constexpr std::array<std::string_view, 12> kFixedKeys{kKey_Name,
                                                      kKey_Description,
                                                      kKey_MediaLocator,
                                                      kKey_Parent,
                                                      kKey_Tags,
                                                      kKey_SubClip,
                                                      kKey_AssetType,
                                                      kKey_ProjectItemProperties,
                                                      kKey_IsMulticamEnabled,
                                                      kKey_ZeroPoint,
                                                      kKey_MergedClipMediaLocators,
                                                      kKey_SmartBinQuery};

JSONValue MakeTicks(const ostmediatypes::TickTime& inTime) {
    JSONValue object = JSONValue::EmptyObject();
    AddToObject(object, "ticks", inTime.Ticks());
    return object;
}

JSONValue MakeSubClip(const SubClip& inSubClip) {
    JSONValue object = JSONValue::EmptyObject();
    AddToObject(object, "mStartBoundary", MakeTicks(inSubClip.startBoundary));
    AddToObject(object, "mEndBoundary", MakeTicks(inSubClip.endBoundary));
    if (!inSubClip.boundaryIsHard) {
        AddToObject(object, "mBoundaryIsHard", false);
    }
    return object;
}

JSONValue MakeList(const std::vector<ImmutableString>& inTexts) {
    JSONValue list = JSONValue::EmptyArray();
    for (const ImmutableString& text : inTexts) {
        AppendToArray(list, text);
    }
    return list;
}

ImmutableString ChooseLocator(const AssetBaseProperties& inPresent, const BulkAssetEdit& inEdit) {
    if (inEdit.mediaLocator) {
        return *inEdit.mediaLocator;
    }
    const bool isGiven = inEdit.properties && !inEdit.properties->mediaLocator.empty();
    return isGiven ? inEdit.properties->mediaLocator : inPresent.mediaLocator;
}

SubClip ChooseSubClip(const dto::AssetProperties& inPresent, const BulkAssetEdit& inEdit) {
    SubClip subClip;
    if (inEdit.subClip) {
        return *inEdit.subClip;
    }
    ReadSubClip(inPresent, subClip);
    return subClip;
}

void AddOptionalKeys(const dto::AssetProperties& inPresent, const AssetBaseProperties& inWanted,
                     JSONValue& ioObject) {
    if (inWanted.isMulticam || inPresent.Has(kKey_IsMulticamEnabled)) {
        AddToObject(ioObject, kKey_IsMulticamEnabled, inWanted.isMulticam);
    }
    if (inWanted.zeroPoint != ostmediatypes::kTime_Zero) {
        AddToObject(ioObject, kKey_ZeroPoint, MakeTicks(inWanted.zeroPoint));
    }
    if (!inWanted.smartBinQuery.empty()) {
        AddToObject(ioObject, kKey_SmartBinQuery, inWanted.smartBinQuery);
    }
}

void AddOtherKeys(const dto::AssetProperties& inPresent, JSONValue& ioObject) {
    const JSONValue& present = inPresent.Body();
    JSONView(present).ForEachMember([&](std::string_view inKey, JSONView inValue) {
        if (std::find(kFixedKeys.begin(), kFixedKeys.end(), inKey) == kFixedKeys.end()) {
            AddToObject(ioObject, inKey, present.Own(inValue));
        }
    });
}

}  // namespace

dto::AssetProperties MakeBulkAssetProperties(const optional<dto::AssetProperties>& inPresent,
                                             const BulkAssetEdit& inEdit) {
    const dto::AssetProperties present = inPresent.value_or(dto::AssetProperties());
    const AssetBaseProperties held = ToAssetBaseProperties(present);
    const AssetBaseProperties wanted = inEdit.properties.value_or(held);
    const JSONValue merged =
        ostcore::serialization::GetVariantInObject(present.Body(), kKey_MergedClipMediaLocators);
    JSONValue object = JSONValue::EmptyObject();
    AddToObject(object, kKey_Name, wanted.name);
    AddToObject(object, kKey_Description, wanted.description);
    AddToObject(object, kKey_MediaLocator, ChooseLocator(held, inEdit));
    AddToObject(object, kKey_Parent, wanted.parent);
    AddToObject(object, kKey_Tags, MakeList(wanted.tags));
    AddToObject(object, kKey_SubClip, MakeSubClip(ChooseSubClip(present, inEdit)));
    AddToObject(object, kKey_AssetType, wanted.assetType);
    AddToObject(object, kKey_ProjectItemProperties, present.String(kKey_ProjectItemProperties));
    AddToObject(object, kKey_MergedClipMediaLocators, merged.IsNull() ? JSONValue::EmptyArray() : merged);
    AddOptionalKeys(present, wanted, object);
    AddOtherKeys(present, object);
    return dto::AssetProperties(object, dto::AlreadyChecked());
}

}  // namespace ZOCL
