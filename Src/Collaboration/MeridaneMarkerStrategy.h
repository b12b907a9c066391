// Markers that two users set on one clip come together.
#pragma once

#include "Collaboration/XMPMergeStrategyBase.h"

namespace ZOCL {

/// By the rules of MarkerSetMerge.h; one contradiction leaves all of xmpDM:Tracks to the user.
class MeridaneMarkerStrategy final : public XMPMergeStrategyBase {
public:
    bool InterestedInResolvingConflict(const Path& inFullPath, NodeType inNodeType, ConflictReason inReason,
                                       bool inIsInArrayOrStruct) override;
    std::int32_t ResolveConflict(ConflictReason inReason, const SideNode& inBase, const SideNode& inLatest,
                                 const SideNode& inUser, Node& outResolvedNode,
                                 ResolvedSource& outResolvedSource, std::int32_t& outResolvedStatus) override;
    const char* GetName() const noexcept override { return "MeridaneMarkerStrategy"; }
};

}  // namespace ZOCL
