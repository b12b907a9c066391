// The lines of the Share window: what of a session's changes its user gets to see, and how.
#pragma once

#include <vector>

#include "Collaboration/ProductionItemData.h"
#include "ostui/Tree.h"
#include "ZOClient/IZOCDifferences.h"

namespace ZOCL {

/// What differs, as IZOCDifferences tells it.
struct PublishChanges {
    std::vector<IZOCDifferences::Entry> assets;
    std::vector<IZOCDifferences::Entry> enclosures;
    std::vector<IZOCDifferences::Entry> properties;
};
PublishChanges ReadPublishChanges(const InterfaceRef<IZOCDifferences>& inDifferences);

/// One row for each asset, for the metadata of each asset and for the production's properties that differ, in
/// that order; cells are name, action, kind and path. Other enclosures of an asset count as an edit of it. A
/// removed asset that is not among the items has no row.
std::vector<ostui::TreeRow> MakePublishRows(const std::vector<ProductionItemData>& inItems,
                                            const PublishChanges& inChanges);

}  // namespace ZOCL
