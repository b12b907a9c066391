// The three-way merge engine.
#pragma once

#include "OrvaneXMPCompareAndMerge/IThreeWayConflictResolutionStrategy_v1.h"
#include "OrvaneXMPCompareAndMerge/IThreeWayMergeResult_v1.h"
#include "OrvaneXMPCompareAndMerge/Types.h"
#include "ostcore/Types.h"
#include "RFL/RFLUnknown.h"

namespace OrvaneXMPCompareAndMerge {

/// Merges what two sides made of a common base, by the rules of Docs/xmp-merge.md.
/// Threads: one at a time; distinct engines may run at once.
class ZOPLATFORM_EXPORT IThreeWayMerge_v1 : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x6f586d7054687265ull, 0x654d657267650001ull};

    /// Asked in the order of registration. Held until the engine goes. Throws std::invalid_argument for null.
    virtual void RegisterStrategy(
        const ostcore::shared_ptr<IThreeWayConflictResolutionStrategy_v1>& inStrategy) = 0;

    /// Never null. Nodes that a side left alone are shared with the arguments, not copied. Throws
    /// std::invalid_argument for properties that are no structure without qualifiers, and std::bad_alloc.
    virtual RFL::InterfaceRef<IThreeWayMergeResult_v1> Merge(const Packet& inBase, const Packet& inLatest,
                                                             const Packet& inUser) = 0;

protected:
    ~IThreeWayMerge_v1() override;
};

}  // namespace OrvaneXMPCompareAndMerge
