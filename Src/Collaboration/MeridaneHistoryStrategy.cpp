// Walks two histories side by side.
#include "Collaboration/MeridaneHistoryStrategy.h"

#include "Collaboration/XMPArrays.h"
#include "Collaboration/XMPMergeNames.h"
#include "OrvaneXMP/DateTime.h"

namespace ZOCL {

using OrvaneXMP::Node;
using OrvaneXMP::Range;

namespace {

ostcore::optional<OrvaneXMP::DateTime> TimeOf(const Node& inEvent) {
    const Node& time = inEvent.FieldNamed(XMPNames::EventTime());
    return time.IsSimple() ? OrvaneXMP::ParseDateTime(time.Value()) : boost::none;
}

/// The array that the conflict ends with, absent when it stays.
Node Resolve(XMPMergeStrategyBase::ConflictReason inReason, const Node& inBase, const Node& inLatest,
             const Node& inUser) {
    using Reason = XMPMergeStrategyBase::ConflictReason;
    switch (inReason) {
        case Reason::ChangedOnBothSides:
            return MergeHistory(inBase.IsPresent() ? MergeHistory(inBase, inLatest) : inLatest, inUser);
        case Reason::RemovedByUser:
            return MergeHistory(inBase, inLatest);
        case Reason::RemovedFromLatest:
            return MergeHistory(inBase, inUser);
        case Reason::OfDifferentKinds:
            break;
    }
    return Node();
}

}  // namespace

Node MergeHistory(const Node& inFirst, const Node& inSecond) {
    if (!inFirst.IsArray() || !inSecond.IsArray() || ShapeOf(inFirst) != ShapeOf(inSecond)) {
        return Node();
    }
    const Range<Node> first = inFirst.Items();
    const Range<Node> second = inSecond.Items();
    std::vector<Node> merged;
    merged.reserve(first.size() + second.size());
    std::size_t a = 0;
    std::size_t b = 0;
    while (a < first.size() && b < second.size()) {
        if (first[a] == second[b]) {
            merged.push_back(first[a]);
            ++a;
            ++b;
            continue;
        }
        const auto firstTime = TimeOf(first[a]);
        const auto secondTime = TimeOf(second[b]);
        if (!firstTime || !secondTime) {
            return Node();
        }
        const bool isFirstNext = OrvaneXMP::CompareDateTime(*firstTime, *secondTime) < 1;
        merged.push_back(isFirstNext ? first[a++] : second[b++]);
    }
    merged.insert(merged.end(), first.begin() + a, first.end());
    merged.insert(merged.end(), second.begin() + b, second.end());
    return ArrayLike(inFirst, std::move(merged));
}

bool MeridaneHistoryStrategy::InterestedInResolvingConflict(const Path& inFullPath, NodeType inNodeType,
                                                            ConflictReason inReason,
                                                            bool inIsInArrayOrStruct) {
    return IsProperty(inFullPath, inIsInArrayOrStruct, XMPNames::History()) &&
           IsArrayConflict(inNodeType, inReason);
}

std::int32_t MeridaneHistoryStrategy::ResolveConflict(ConflictReason inReason, const SideNode& inBase,
                                                      const SideNode& inLatest, const SideNode& inUser,
                                                      Node& outResolvedNode,
                                                      ResolvedSource& outResolvedSource,
                                                      std::int32_t& outResolvedStatus) {
    const Node resolved = Resolve(inReason, inBase.node, inLatest.node, inUser.node);
    if (!resolved.IsPresent()) {
        return LeaveConflict(inReason);
    }
    outResolvedNode = resolved;
    outResolvedSource = ResolvedSource::New;
    outResolvedStatus = OrvaneXMPCompareAndMerge::kResolvedStatus_ByStrategy;
    return OrvaneXMPCompareAndMerge::kResolved;
}

}  // namespace ZOCL
