// Finds the conflicts of a session.
#pragma once

#include "Collaboration/PrepareChangesOperation.h"

namespace ZOCL {

/// Results, cancel and threads as PrepareChangesOperation. A conflict about an asset that the session has
/// removed is fetched as in sharing; when that fails the row stays, with the name that the differences tell.
class ZOPrepareResolveOperation final : public PrepareChangesOperation {
public:
    explicit ZOPrepareResolveOperation(const ImmutableString& inSessionURL);

    UString GetDescription() override { return u"ZOPrepareResolveOperation"; }

    /// One row for each conflict: of assets, of enclosures, and of the production's properties.
    std::vector<ConflictItemData> GetConflicts() const;
    /// The session's commit that the conflicts were read at, which the first answer to one has to name; null
    /// when they could not be read.
    ImmutableString GetCommitId() const;

private:
    using Entry = IZOCDifferences::Entry;

    ~ZOPrepareResolveOperation() override = default;
    void OnAssetList(const Assets& inAssets) override;
    std::vector<AssetToFetch> OnChanges(const InterfaceRef<IZOCDifferences>& inChanges) override;
    void OnAsset(const AssetToFetch& inRequest, const InterfaceRef<IZOCAsset>& inAsset) override;

    ConflictItemData MakeAssetRow(const Entry& inEntry) const;
    ConflictItemData MakeEnclosureRow(const Entry& inEntry) const;
    const ProductionItemData* FindAssetOfXMP(const Entry& inEntry) const;

    // Set before the changes are loaded.
    ProductionItems mAssets;
    XMPEnclosureMap mXMPEnclosures;
    std::vector<ConflictItemData> mConflicts ZO_GUARDED_BY(mMutex);
};

}  // namespace ZOCL
