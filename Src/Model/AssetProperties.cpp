// The value type of an asset's properties: its order, and its form on the wire.
#include "Model/AssetProperties.h"

#include <set>

#include "ostcore/utility/StringConversion.h"

namespace ZOCL {

using ostcore::serialization::AddToObject;
using ostcore::serialization::AppendToArray;
using ostcore::serialization::JSONValue;
using ostcore::utility::ToUTF16;

namespace {

JSONValue MakeTicks(const ostmediatypes::TickTime& inTime) {
    JSONValue object = JSONValue::EmptyObject();
    AddToObject(object, "ticks", inTime.Ticks());
    return object;
}

JSONValue MakeList(const std::vector<ImmutableString>& inTexts) {
    JSONValue list = JSONValue::EmptyArray();
    for (const ImmutableString& text : inTexts) {
        AppendToArray(list, text);
    }
    return list;
}

bool SameSet(const std::vector<ImmutableString>& inLeft, const std::vector<ImmutableString>& inRight) {
    return std::set<ImmutableString>(inLeft.begin(), inLeft.end()) ==
           std::set<ImmutableString>(inRight.begin(), inRight.end());
}

}  // namespace

AssetBaseProperties::AssetBaseProperties(const UString& inName, const UString& inDescription,
                                         const ImmutableString& inAssetType, const ImmutableString& inParent,
                                         bool inIsMulticam, const ostmediatypes::TickTime& inZeroPoint,
                                         const ImmutableString& inSmartBinQuery)
    : name(inName),
      description(inDescription),
      assetType(inAssetType),
      parent(inParent),
      isMulticam(inIsMulticam),
      zeroPoint(inZeroPoint),
      smartBinQuery(inSmartBinQuery) {}

namespace {
auto RemainingFields(const AssetBaseProperties& inProperties) {
    return std::tie(inProperties.assetType, inProperties.parent, inProperties.mediaLocator,
                    inProperties.isMulticam, inProperties.zeroPoint, inProperties.smartBinQuery,
                    inProperties.tags);
}
}  // namespace

bool operator==(const AssetBaseProperties& inLeft, const AssetBaseProperties& inRight) {
    return inLeft.name == inRight.name && inLeft.description == inRight.description &&
           RemainingFields(inLeft) == RemainingFields(inRight);
}

bool operator!=(const AssetBaseProperties& inLeft, const AssetBaseProperties& inRight) {
    return !(inLeft == inRight);
}

bool operator<(const AssetBaseProperties& inLeft, const AssetBaseProperties& inRight) {
    const auto left = std::tie(inLeft.name, inLeft.description);
    const auto right = std::tie(inRight.name, inRight.description);
    return left != right ? left < right : RemainingFields(inLeft) < RemainingFields(inRight);
}

AssetBaseProperties ToAssetBaseProperties(const dto::AssetProperties& inProperties) {
    AssetBaseProperties result;
    result.name = ToUTF16(inProperties.Name());
    result.description = ToUTF16(inProperties.Description());
    result.assetType = inProperties.AssetType();
    result.parent = inProperties.Parent();
    result.mediaLocator = inProperties.MediaLocator();
    result.tags = inProperties.Tags();
    result.isMulticam = inProperties.Boolean("isMulticamEnabled", false);
    result.zeroPoint = ostmediatypes::TickTime(inProperties.Ticks("zeroPoint"));
    result.smartBinQuery = inProperties.String("smartBinQuery");
    return result;
}

dto::AssetProperties MakeAssetProperties(const AssetBaseProperties& inProperties) {
    dto::AssetProperties result;
    result.Set("name", inProperties.name);
    result.Set("description", inProperties.description);
    result.Set("mediaLocator", inProperties.mediaLocator);
    result.Set("zo:parent", inProperties.parent);
    result.Set("tags", MakeList(inProperties.tags));
    result.Set("cdzo:assetType", inProperties.assetType);
    result.Set("projectItemProperties", "");
    result.Set("mergedClipMediaLocators", JSONValue::EmptyArray());
    if (inProperties.isMulticam) {
        result.Set("isMulticamEnabled", true);
    }
    if (inProperties.zeroPoint != ostmediatypes::kTime_Zero) {
        result.Set("zeroPoint", MakeTicks(inProperties.zeroPoint));
    }
    if (!inProperties.smartBinQuery.empty()) {
        result.Set("smartBinQuery", inProperties.smartBinQuery);
    }
    return result;
}

bool UpdateAssetProperties(dto::AssetProperties& ioProperties, const AssetBaseProperties& inWanted) {
    const AssetBaseProperties present = ToAssetBaseProperties(ioProperties);
    bool changed = false;
    const auto setIf = [&](bool inDiffers, std::string_view inKey, const JSONValue& inValue) {
        if (inDiffers) {
            ioProperties.Set(inKey, inValue);
            changed = true;
        }
    };
    setIf(present.name != inWanted.name, "name", inWanted.name);
    setIf(present.description != inWanted.description, "description", inWanted.description);
    setIf(present.mediaLocator != inWanted.mediaLocator, "mediaLocator", inWanted.mediaLocator);
    setIf(present.parent != inWanted.parent, "zo:parent", inWanted.parent);
    setIf(!SameSet(present.tags, inWanted.tags), "tags", MakeList(inWanted.tags));
    setIf(present.assetType != inWanted.assetType, "cdzo:assetType", inWanted.assetType);
    setIf(present.isMulticam != inWanted.isMulticam, "isMulticamEnabled", inWanted.isMulticam);
    setIf(present.zeroPoint != inWanted.zeroPoint, "zeroPoint", MakeTicks(inWanted.zeroPoint));
    setIf(present.smartBinQuery != inWanted.smartBinQuery, "smartBinQuery", inWanted.smartBinQuery);
    return changed;
}

bool ReadSubClip(const dto::AssetProperties& inProperties, SubClip& outSubClip) {
    if (inProperties.Object("subClip").IsNull()) {
        return false;
    }
    const auto stored = inProperties.Structure<dto::SubClip>("subClip");
    // Assets that were made in bulk carry the key in any case; without boundaries it says that there is none.
    const std::int64_t invalid = ostmediatypes::kTime_Invalid.Ticks();
    outSubClip.startBoundary = ostmediatypes::TickTime(stored.Ticks("mStartBoundary", invalid));
    outSubClip.endBoundary = ostmediatypes::TickTime(stored.Ticks("mEndBoundary", invalid));
    outSubClip.boundaryIsHard = stored.Boolean("mBoundaryIsHard", true);
    return outSubClip.startBoundary.IsValid() || outSubClip.endBoundary.IsValid();
}

void WriteSubClip(dto::AssetProperties& ioProperties, const SubClip& inSubClip) {
    JSONValue object = ioProperties.Object("subClip");
    AddToObject(object, "mStartBoundary", MakeTicks(inSubClip.startBoundary));
    AddToObject(object, "mEndBoundary", MakeTicks(inSubClip.endBoundary));
    AddToObject(object, "mBoundaryIsHard", inSubClip.boundaryIsHard);
    ioProperties.Set("subClip", object);
}

}  // namespace ZOCL
