// An asset of a production as a resource.
#pragma once

#include "dto/Asset.h"
#include "JSONServerResource.h"
#include "Resources/Implements.h"
#include "ZOClient/IZOCAsset.h"

namespace ZOCL {

/// Setters change the body that is held; the server learns of it with UpdatePropertiesOnServer. Keys of the
/// properties that this client does not know go back as they came.
class Asset final
    : public Implements<JSONServerResource<dto::Asset>, Readable<IZOCAsset>, Writable<IZOCWritableAsset>> {
public:
    /// Answers with the object itself, for code of this floor.
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f634173736574ull, 0x0000000000000003ull};

    int QueryInterfaceNoAddRef(const RFL::InterfaceID& inID, void** outInterface) noexcept override;

    bool GetAssetType(ImmutableString& outType) override;
    UString GetAssetTypeDisplayName() override;
    ImmutableString GetMediaLocatorIdentifier() override;
    InterfaceRef<IZOCMediaLocator> GetMediaLocator(bool inLoad) override;
    bool HasMediaLocator() override;
    UString GetName() override;
    UString GetDescription() override;
    std::vector<ImmutableString> GetTags() override;
    ImmutableString GetAssetIdentifier() override;
    ImmutableString GetParentAssetIdentifier() override;
    ImmutableString GetContentIdentifier() override;
    AssetBaseProperties GetAssetBaseProperties() override;
    bool GetSubClip(SubClip& outSubClip) override;
    InterfaceRef<IZOCEnclosures> GetEnclosures() override;
    InterfaceRef<IZOCRenditions> GetRenditions() override;
    InterfaceRef<IZOCAsset> GetLatestVersion() override;

    bool SetMediaLocatorAndUpdate(const InterfaceRef<IZOCMediaLocator>& inLocator, const Guid& inRequestID,
                                  const RequestCompletion& inCompletion) override;
    bool SetMediaLocatorAndUpdate(const InterfaceRef<IZOCMediaLocator>& inLocator) override;
    bool SetAssetBaseProperties(const AssetBaseProperties& inProperties) override;
    bool SetAssetBasePropertiesAndUpdate(const AssetBaseProperties& inProperties, const Guid& inRequestID,
                                         const RequestCompletion& inCompletion) override;
    void SetSubClip(const SubClip& inSubClip) override;
    bool SetMediaLocator(const InterfaceRef<IZOCMediaLocator>& inLocator) override;
    bool UpdatePropertiesOnServer() override;
    bool UpdatePropertiesOnServer(const Guid& inRequestID, const RequestCompletion& inCompletion) override;
    ImmutableString GetEnclosureFactoryURL() override;
    ImmutableString GetRenditionFactoryURL() override;

    /// All properties as they are held, with those that this client does not know.
    dto::AssetProperties GetStoredProperties() const { return GetProperties("Asset::GetStoredProperties"); }

protected:
    std::string GetTraceName() override;

private:
    struct PropertiesWrite {
        InterfaceRef<ServerResource> target;
        shared_ptr<RecycledMemory const> body;
        ImmutableString eTag;
    };
    /// False, with a trace, when the asset has no "edit" link.
    bool PreparePropertiesWrite(PropertiesWrite& outWrite);
    dto::AssetProperties GetProperties(const char* inLabel) const { return GetBody(inLabel).Properties(); }
};

}  // namespace ZOCL
