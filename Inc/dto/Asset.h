// An asset as the server tells of it, and the list of a production's assets.
#pragma once

#include "dto/Enclosure.h"
#include "dto/Rendition.h"
#include "dto/TransferStructure.h"

namespace ZOCL {
namespace dto {

/// The part of a clip that a sub-clip shows.
class SubClip : public TransferStructure<SubClip> {
public:
    using TransferStructure::TransferStructure;
    static constexpr const char* kName = "ZOCL::dto::SubClip";
    static const BindingTable& Table();
};

/// The object under "properties". It is kept as it was read: keys that are set go in their place, all others
/// go back to the server unchanged.
class AssetProperties : public TransferStructure<AssetProperties> {
public:
    using TransferStructure::TransferStructure;
    static constexpr const char* kName = "ZOCL::dto::AssetProperties";
    static const BindingTable& Table();

    std::string_view Name() const { return Text("name"); }
    std::string_view Description() const { return Text("description"); }
    ImmutableString MediaLocator() const { return String("mediaLocator"); }
    ImmutableString Parent() const { return String("zo:parent"); }
    ImmutableString AssetType() const { return String("cdzo:assetType"); }
    std::vector<ImmutableString> Tags() const { return Strings("tags"); }

    void Set(std::string_view inKey, const JSONValue& inValue);
    void Remove(std::string_view inKey);
};

class Asset : public TransferStructure<Asset> {
public:
    using TransferStructure::TransferStructure;
    static constexpr const char* kName = "ZOCL::dto::Asset";
    static const BindingTable& Table();

    ImmutableString Identifier() const { return String("zo:assetId"); }
    ImmutableString GetETag() const { return String("zo:etag"); }
    ImmutableString ContentID() const { return String("zo:assetContentId"); }
    AssetProperties Properties() const { return Structure<AssetProperties>("properties"); }
    bool HasEnclosures() const { return !Object("enclosures").IsNull(); }
    ContainedEnclosures Enclosures() const { return Structure<ContainedEnclosures>("enclosures"); }
    bool HasRenditions() const { return !Object("renditions").IsNull(); }
    ContainedRenditions Renditions() const { return Structure<ContainedRenditions>("renditions"); }

    void SetProperties(const AssetProperties& inProperties);
};

class ContainedAssets : public TransferStructure<ContainedAssets> {
public:
    using TransferStructure::TransferStructure;
    static constexpr const char* kName = "ZOCL::dto::ContainedAssets";
    static const BindingTable& Table();

    BoundList<Asset> Assets() const { return List<Asset>("assets"); }
};

}  // namespace dto
}  // namespace ZOCL
