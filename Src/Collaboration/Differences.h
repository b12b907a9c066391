// What differs between two commits.
#pragma once

#include "dto/Differences.h"
#include "JSONServerResource.h"
#include "Resources/Implements.h"
#include "ZOClient/IZOCDifferences.h"

namespace ZOCL {

class Differences final : public Implements<JSONServerResource<dto::Differences>, Readable<IZOCDifferences>> {
public:
    std::vector<Entry> GetEnclosureDifferences() override;
    std::vector<Entry> GetAssetDifferences() override;
    std::vector<Entry> GetPropertiesDifferences() override;
    bool HasDifferences() override;
    bool HasConflicts() override;
    bool HasAssetConflicts() override;
    bool HasEnclosureConflicts() override;
    bool HasPropertiesConflicts() override;
    ImmutableString GetCommitID() override;
    ImmutableString GetBaseCommitID() override;
};

}  // namespace ZOCL
