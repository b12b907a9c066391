// Which assets the window for sharing can name.
#include "Collaboration/ZOPreparePublishOperation.h"

#include <algorithm>

namespace ZOCL {

using ostcore::threads::MutexLock;

ZOPreparePublishOperation::ZOPreparePublishOperation(const ImmutableString& inProductionURL,
                                                     const InterfaceRef<IZOCEditingSession>& inSession)
    : PrepareChangesOperation(inProductionURL, inSession) {}

std::vector<ProductionItemData> ZOPreparePublishOperation::GetItems() const {
    MutexLock lock(mMutex);
    return mItems;
}

void ZOPreparePublishOperation::OnAssetList(const Assets& inAssets) {
    mAssets = ProductionItems(inAssets);
    MutexLock lock(mMutex);
    mItems = mAssets.All();
}

std::vector<PrepareChangesOperation::AssetToFetch> ZOPreparePublishOperation::OnChanges(
    const InterfaceRef<IZOCDifferences>& inChanges) {
    std::vector<AssetToFetch> removed;
    for (const IZOCDifferences::Entry& entry : inChanges->GetAssetDifferences()) {
        if (entry.differenceType == kDifferenceType_Removed && !entry.assetURL.empty()) {
            removed.push_back({entry.assetURL});
        }
    }
    std::sort(removed.begin(), removed.end(), [](const AssetToFetch& inLeft, const AssetToFetch& inRight) {
        return inLeft.url.view() < inRight.url.view();
    });
    return removed;
}

void ZOPreparePublishOperation::OnAsset(const AssetToFetch&, const InterfaceRef<IZOCAsset>& inAsset) {
    ProductionItemData item = mAssets.Describe(inAsset);
    MutexLock lock(mMutex);
    mItems.push_back(std::move(item));
}

}  // namespace ZOCL
