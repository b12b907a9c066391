// One run of the three-way merge over three packets.
#pragma once

#include <string>
#include <vector>

#include "OrvaneXMPCompareAndMerge/detail/Alignment.h"
#include "OrvaneXMPCompareAndMerge/IThreeWayConflictResolutionStrategy_v1.h"
#include "OrvaneXMPCompareAndMerge/IThreeWayMergeResult_v1.h"

namespace OrvaneXMPCompareAndMerge {

using Strategies = std::vector<ostcore::shared_ptr<IThreeWayConflictResolutionStrategy_v1>>;

/// What a run leaves behind.
struct MergeOutcome {
    Packet merged;
    std::vector<Decision> decisions;
    std::vector<RFL::InterfaceRef<IThreeWayResolvedConflict_v1>> resolved;
    std::vector<RFL::InterfaceRef<IThreeWayUnResolvedConflict_v1>> unresolved;
};

/// Walks the three trees once, side by side. Whether two sides say the same below a node that is taken apart
/// is learned on the way back up, so nothing is compared twice. A node that turns out to be changed by one
/// side alone is taken whole, and what was decided below it is forgotten; no conflict can lie there.
class Merger {
public:
    Merger(const Packet& inBase, const Packet& inLatest, const Packet& inUser,
           const Strategies& inStrategies);
    MergeOutcome Run();

private:
    using PathStep = OrvaneXMP::PathStep;
    using Sides = Row<3>;

    /// Which sides say the same.
    struct Sameness {
        bool baseLatest = true;
        bool baseUser = true;
        bool latestUser = true;

        Sameness& operator&=(const Sameness& inOther) noexcept;
    };
    struct Merged {
        Node node;
        Sameness same;
    };
    /// Fields or qualifiers, with the sides that have the very same nodes in the same places.
    struct MergedFields {
        std::vector<Field> fields;
        Sameness same;
        bool isLatest = true;
        bool isUser = true;
    };
    /// The content of an array, apart from its qualifiers.
    struct MergedItems {
        std::vector<Node> items;
        Sameness same;
        bool isLatest = true;
        bool isUser = true;
    };

    Node MergeAbout();
    Merged MergeBelow(const PathStep& inStep, const Sides& inSides);
    Merged MergeNode(const Sides& inSides);
    bool IsTakenApart(const Sides& inSides) const;
    Merged TakeApart(const Sides& inSides);
    Merged MergeStructure(const Sides& inSides);
    Merged MergeArray(const Sides& inSides, const MergedItems& inItems);
    MergedItems MergeLanguages(const Sides& inSides);
    MergedItems MergeUnordered(const Sides& inSides);
    MergedFields MergeFields(const std::array<Range<Field>, 3>& inSides, PathStep (*inStep)(const Name&));
    MergedFields MergeQualifiers(const Sides& inSides);

    Node Settle(const Sides& inSides);
    Node Resolve(const Sides& inSides, ConflictReason inReason, NodeType inType);
    Node LeaveToPerson(const Sides& inSides, ConflictReason inReason, NodeType inType,
                       RFL::InterfaceRef<IMergeError_v1> inError);
    Node AskStrategy(IThreeWayConflictResolutionStrategy_v1& inStrategy, const Sides& inSides,
                     ConflictReason inReason, NodeType inType);
    void Record(DecisionCause inCause, ResolvedSource inSource, const Node& inNode,
                ConflictReason inReason = ConflictReason::ChangedOnBothSides,
                const std::string& inStrategyName = {});
    const SharedPath& Here();
    void MergePrefixes();

    const Packet& mBase;
    const Packet& mLatest;
    const Packet& mUser;
    const Strategies& mStrategies;
    MergeOutcome mOutcome;
    /// The way to the node that is looked at, and the beginnings of it that decisions share already.
    Path mPath;
    std::vector<SharedPath> mSharedPaths;
};

}  // namespace OrvaneXMPCompareAndMerge
