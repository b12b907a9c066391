// A production, an editing session or a transaction: one class, whose role its links tell.
#pragma once

#include "dto/Production.h"
#include "JSONServerResource.h"
#include "Resources/Implements.h"
#include "ZOClient/IZOCProduction.h"

namespace ZOCL {

class AssetList;

class Production final : public Implements<JSONServerResource<dto::Production>, Readable<IZOCProduction>> {
public:
    Production();
    ~Production() override;

    UString GetName() override;
    void SetName(const UString& inName) override;
    ImmutableString GetIdentifier() override;
    UString GetDescription() override;
    void SetDescription(const UString& inDescription) override;
    InterfaceRef<IZOCAssetList> GetAssets() override;
    InterfaceRef<IZOCAssetList> GetAssetsWithParent(const ImmutableString& inParentID) override;
    bool GetAssetByIdentifier(const Guid& inRequestID, const ImmutableString& inIdentifier,
                              const RequestCompletion& inCompletion) override;
    InterfaceRef<IZOCAsset> GetAssetByIdentifier(const ImmutableString& inIdentifier) override;
    ImmutableString GetAssetURL(const ImmutableString& inAssetID, const ImmutableString& inCommit) override;
    ImmutableString GetSessionsLink() override;
    ImmutableString GetMostRecentRevision() override;
    ImmutableString GetLoadedRevision() override;
    InterfaceRef<IZOCEnclosures> GetEnclosures() override;
    bool Copy(const Guid& inRequestID, const RequestCompletion& inCompletion, const UString& inName,
              const UString& inDescription, bool inIsTemporary) override;
    ptime GetCreationTime() override;
    ptime GetModificationTime() override;
    ImmutableString GetOwner() override;
    std::vector<ImmutableString> GetTags() override;
    InterfaceRef<IZOCProduction> GetLatestVersion() override;
    bool IsEditingSession() override;
    bool IsTransaction() override;
    bool IsTemplate() override;

    /// Puts the whole object of base properties to the "edit" link, with the held tag.
    bool UpdateProductionBaseProperties(const Guid& inRequestID, const RequestCompletion& inCompletion);

protected:
    void PostLoadDTO() override;
    std::string GetTraceName() override;

private:
    bool HasLink(const ImmutableString& inRelation);
    ImmutableString GetAssetsLink();
    void SetProperty(std::string_view inKey, const UString& inValue, const char* inLabel);
    void ReportMissingLists();
    void ReportMissingAsset(const ImmutableString& inIdentifier);

    InterfaceRef<AssetList> mAssets ZO_GUARDED_BY(IZOCDataServer::GetLock());
    InterfaceRef<IZOCEnclosures> mEnclosures ZO_GUARDED_BY(IZOCDataServer::GetLock());
};

/// The body of a creation.
ostcore::serialization::JSONValue MakeProductionCreationBody(const UString& inName,
                                                             const UString& inDescription,
                                                             bool inIsTemporary);

}  // namespace ZOCL
