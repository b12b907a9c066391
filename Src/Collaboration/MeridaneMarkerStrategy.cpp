// Reads the three sides into marker sets and merges them.
#include "Collaboration/MeridaneMarkerStrategy.h"

#include "Collaboration/MarkerSetMerge.h"
#include "Collaboration/XMPMergeNames.h"

namespace ZOCL {

bool MeridaneMarkerStrategy::InterestedInResolvingConflict(const Path& inFullPath, NodeType inNodeType,
                                                           ConflictReason inReason,
                                                           bool inIsInArrayOrStruct) {
    return IsProperty(inFullPath, inIsInArrayOrStruct, XMPNames::Tracks()) &&
           IsArrayConflict(inNodeType, inReason);
}

std::int32_t MeridaneMarkerStrategy::ResolveConflict(ConflictReason inReason, const SideNode& inBase,
                                                     const SideNode& inLatest, const SideNode& inUser,
                                                     Node& outResolvedNode, ResolvedSource& outResolvedSource,
                                                     std::int32_t& outResolvedStatus) {
    try {
        outResolvedNode =
            MergeMarkerSets(MarkerSet(inBase.node), MarkerSet(inLatest.node), MarkerSet(inUser.node));
    } catch (const MarkerConflict&) {
        return LeaveConflict(inReason);
    }
    outResolvedSource = ResolvedSource::New;
    outResolvedStatus = OrvaneXMPCompareAndMerge::kResolvedStatus_ByStrategy;
    return OrvaneXMPCompareAndMerge::kResolved;
}

}  // namespace ZOCL
