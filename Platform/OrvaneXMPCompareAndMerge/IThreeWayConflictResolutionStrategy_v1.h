// A rule by which conflicts of a three-way merge are settled without a person.
#pragma once

#include "OrvaneXMPCompareAndMerge/Types.h"
#include "RFL/RFLUnknown.h"

namespace OrvaneXMPCompareAndMerge {

/// Implemented by whoever knows the properties. The merge asks its strategies in the order of their
/// registration, on the thread of the merge; the first that is interested decides alone. A strategy that
/// keeps state is made anew for each merge. Exceptions of both operations are caught by the merge: the
/// conflict stays unresolved, with the error beside it.
class ZOPLATFORM_EXPORT IThreeWayConflictResolutionStrategy_v1 : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x6f586d7053747261ull, 0x7465677900000001ull};

    /// Whether this strategy handles the node. The path leads from the properties of the packet to the node
    /// and has at least one step; its names are expanded ones, so prefixes do not matter. The last argument
    /// is true for a node below a property: within a structure, an array, or as a qualifier.
    virtual bool InterestedInResolvingConflict(const Path& inFullPath, NodeType inNodeType,
                                               ConflictReason inReason, bool inIsInArrayOrStruct) = 0;

    /// Returns kResolved with all three results set, or the number of the reason when the conflict stays. An
    /// absent outResolvedNode takes the property out. The status is kResolvedStatus_ByStrategy.
    virtual std::int32_t ResolveConflict(ConflictReason inReason, const SideNode& inBase,
                                         const SideNode& inLatest, const SideNode& inUser,
                                         Node& outResolvedNode, ResolvedSource& outResolvedSource,
                                         std::int32_t& outResolvedStatus) = 0;

    /// For reports, in ASCII; valid as long as the strategy.
    virtual const char* GetName() const noexcept = 0;

protected:
    ~IThreeWayConflictResolutionStrategy_v1() override;
};

}  // namespace OrvaneXMPCompareAndMerge
