// Two histories of one file become one, in the order of time.
#pragma once

#include "Collaboration/XMPMergeStrategyBase.h"

namespace ZOCL {

/// Interleaves the events of two arrays by stEvt:when; an event that both have at the same turn stands once,
/// and of events at the same time the first array's goes first. Events are taken whole. An absent node when
/// events have to be compared of which one has no readable time, and when the two are not arrays of one kind
/// with the same qualifiers. Linear.
OrvaneXMP::Node MergeHistory(const OrvaneXMP::Node& inFirst, const OrvaneXMP::Node& inSecond);

class MeridaneHistoryStrategy final : public XMPMergeStrategyBase {
public:
    bool InterestedInResolvingConflict(const Path& inFullPath, NodeType inNodeType, ConflictReason inReason,
                                       bool inIsInArrayOrStruct) override;
    std::int32_t ResolveConflict(ConflictReason inReason, const SideNode& inBase, const SideNode& inLatest,
                                 const SideNode& inUser, Node& outResolvedNode,
                                 ResolvedSource& outResolvedSource, std::int32_t& outResolvedStatus) override;
    const char* GetName() const noexcept override { return "MeridaneHistoryStrategy"; }
};

}  // namespace ZOCL
