// What may be done about a conflict.
#pragma once

#include <algorithm>
#include <set>
#include <vector>

#include "Collaboration/ProductionItemData.h"
#include "ZOClient/Publish.h"

namespace ZOCL {

/// Values of Publish::ResolveType, ascending. A copy is kept only of what the host can copy.
inline std::vector<int> GetResolveTypes(const ConflictItemData& inItem,
                                        const std::set<ImmutableString>& inCopyableTypes) {
    std::vector<int> types{Publish::kResolveType_AcceptTheirs};
    if (inCopyableTypes.count(inItem.type) != 0) {
        types.push_back(Publish::kResolveType_AcceptTheirsAndCopy);
    }
    types.push_back(Publish::kResolveType_AcceptYours);
    return types;
}

/// Whether each of the items may be settled in this way.
inline bool AllowResolveType(const std::vector<ConflictItemData>& inItems, int inResolveType,
                             const std::set<ImmutableString>& inCopyableTypes) {
    for (const ConflictItemData& item : inItems) {
        const std::vector<int> types = GetResolveTypes(item, inCopyableTypes);
        if (std::find(types.begin(), types.end(), inResolveType) == types.end()) {
            return false;
        }
    }
    return true;
}

}  // namespace ZOCL
