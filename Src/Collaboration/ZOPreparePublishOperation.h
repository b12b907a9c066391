// Gathers what the window for sharing lists.
#pragma once

#include "Collaboration/PrepareChangesOperation.h"

namespace ZOCL {

/// Results, cancel and threads as PrepareChangesOperation. Assets that the session has removed are fetched
/// from the commit that still holds them; one that cannot be fetched is left out.
class ZOPreparePublishOperation final : public PrepareChangesOperation {
public:
    /// inProductionURL is that of the session, whose assets are listed.
    ZOPreparePublishOperation(const ImmutableString& inProductionURL,
                              const InterfaceRef<IZOCEditingSession>& inSession);

    UString GetDescription() override { return u"ZOPreparePublishOperation"; }

    /// All assets of the session, changed or not, in the order of its list, then those that it has removed.
    std::vector<ProductionItemData> GetItems() const;

private:
    ~ZOPreparePublishOperation() override = default;
    void OnAssetList(const Assets& inAssets) override;
    std::vector<AssetToFetch> OnChanges(const InterfaceRef<IZOCDifferences>& inChanges) override;
    void OnAsset(const AssetToFetch& inRequest, const InterfaceRef<IZOCAsset>& inAsset) override;

    // Set before the changes are loaded.
    ProductionItems mAssets;
    std::vector<ProductionItemData> mItems ZO_GUARDED_BY(mMutex);
};

}  // namespace ZOCL
