// The object of an asset's properties as bulk forms carry it: always the whole.
#pragma once

#include "Model/BulkRecords.h"

namespace ZOCL {

/// The properties that are there, none for a new asset, overlaid with what the edit sets. A locator of the
/// edit goes before the one of its properties; an empty one there says nothing.
dto::AssetProperties MakeBulkAssetProperties(const optional<dto::AssetProperties>& inPresent,
                                             const BulkAssetEdit& inEdit);

}  // namespace ZOCL
