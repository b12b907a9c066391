// The assets of a production, read from one body.
#pragma once

#include <unordered_map>

#include "dto/Asset.h"
#include "JSONServerResource.h"
#include "Resources/Implements.h"
#include "ZOClient/IZOCAsset.h"

namespace ZOCL {

using BoundAssets = ostcore::serialization::BoundList<dto::Asset>;

/// Positions of a list's assets by identifier and by name, the first of equal ones. Made once, when it is
/// first asked for, so that a look-up for each of many thousand assets stays linear as a whole.
class AssetIndex {
public:
    explicit AssetIndex(const dto::ContainedAssets& inBody) : mAssets(inBody.Assets()) {}

    const BoundAssets& Assets() const { return mAssets; }
    /// False when there is none.
    bool FindByIdentifier(std::string_view inIdentifier, dto::Asset& outAsset) const;
    bool FindByName(std::string_view inName, dto::Asset& outAsset) const;

private:
    void Build() const;

    const BoundAssets mAssets;
    mutable std::once_flag mOnce;
    /// The keys lie in the body that mAssets holds.
    mutable std::unordered_map<std::string_view, std::size_t> mByIdentifier;
    mutable std::unordered_map<std::string_view, std::size_t> mByName;
};

class AssetList final : public Implements<JSONServerResource<dto::ContainedAssets>, Readable<IZOCAssetList>,
                                          Writable<IZOCWritableAssetList>> {
public:
    std::vector<AssetListItem> GetAllItems() override;
    std::vector<AssetListItem> GetAssetsByType(const ImmutableString& inType) override;
    std::vector<AssetListItem> GetAssetsWithParentIdentifier(const ImmutableString& inParent) override;
    InterfaceRef<IZOCAsset> GetAssetByName(const UString& inName) override;
    InterfaceRef<IZOCAsset> GetAssetByIdentifier(const ImmutableString& inIdentifier) override;
    InterfaceRef<IZOCAssetList> GetLatestVersion() override;

    bool RestoreAsset(const ImmutableString& inContentID, const Guid& inRequestID,
                      const RequestCompletion& inCompletion) override;
    ImmutableString GetAssetFactoryURL() override;

    /// Makes an asset found by its identifier until the list is loaded anew.
    void AddAsset(const InterfaceRef<IZOCAsset>& inAsset, const char* inLabel);
    /// Forgets what the list holds, for one that is being replaced.
    void InvalidateContent();

protected:
    void PostLoadDTO() override;

private:
    using AddedAssets = std::map<ImmutableString, InterfaceRef<IZOCAsset>>;

    shared_ptr<const AssetIndex> GetIndex(const char* inLabel);
    template <class Predicate>
    std::vector<AssetListItem> CollectItems(const char* inLabel, const Predicate& inPredicate);
    InterfaceRef<IZOCAsset> MakeAsset(const dto::Asset& inBody);

    shared_ptr<const AssetIndex> mIndex ZO_GUARDED_BY(IZOCDataServer::GetLock());
    AddedAssets mAddedAssets ZO_GUARDED_BY(IZOCDataServer::GetLock());
};

}  // namespace ZOCL
