// What a three-way merge made, from where each value came, and what it could not settle.
#pragma once

#include <string>
#include <vector>

#include "OrvaneXMPCompareAndMerge/IThreeWayResolvedConflict_v1.h"
#include "OrvaneXMPCompareAndMerge/IThreeWayUnResolvedConflict_v1.h"
#include "OrvaneXMPCompareAndMerge/Types.h"
#include "RFL/RFLUnknown.h"

namespace OrvaneXMPCompareAndMerge {

/// Why a node of the result is what it is.
enum class DecisionCause : std::int32_t {
    /// Both sides say the same, and base something else.
    BothSidesSame = 0,
    OnlyUserChanged = 1,
    OnlyLatestChanged = 2,
    /// The items that either side added to or removed from an unordered array.
    ItemsMerged = 3,
    /// A conflict that a strategy settled.
    Strategy = 4,
    /// A conflict that nothing settled; the node is the user's.
    Unresolved = 5
};

/// One decision about a node and all that lies below it. That of an array whose qualifiers were decided each
/// for itself is about its items alone.
struct Decision {
    SharedPath path;
    DecisionCause cause;
    ResolvedSource source;
    /// True when the node is not in the result.
    bool isGone;
    /// Of the causes Strategy and Unresolved.
    ConflictReason reason;
    /// Of the cause Strategy.
    std::string strategyName;
};

/// Immutable. Threads: any. References are valid as long as the result.
class ZOPLATFORM_EXPORT IThreeWayMergeResult_v1 : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x6f586d704d657267ull, 0x6552736c74000001ull};

    /// The merged packet. At each unresolved conflict it holds what the user has.
    virtual const Packet& GetMergedPacket() const noexcept = 0;
    /// In the order of the names in the tree. Nodes that all three agree on are not listed.
    virtual const std::vector<Decision>& GetDecisions() const noexcept = 0;
    virtual const std::vector<RFL::InterfaceRef<IThreeWayResolvedConflict_v1>>& GetResolvedConflicts()
        const noexcept = 0;
    virtual const std::vector<RFL::InterfaceRef<IThreeWayUnResolvedConflict_v1>>& GetUnResolvedConflicts()
        const noexcept = 0;

protected:
    ~IThreeWayMergeResult_v1() override;
};

}  // namespace OrvaneXMPCompareAndMerge
