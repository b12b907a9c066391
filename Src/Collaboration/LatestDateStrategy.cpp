// Compares the dates of the three sides.
#include "Collaboration/LatestDateStrategy.h"

#include <utility>

#include "OrvaneXMP/DateTime.h"

namespace ZOCL {

using OrvaneXMP::DateTime;

ostcore::optional<LatestDateStrategy::ResolvedSource> LatestDateStrategy::FindWinner(
    const SideNode& inBase, const SideNode& inLatest, const SideNode& inUser) const {
    const std::pair<ResolvedSource, const SideNode&> sides[] = {
        {ResolvedSource::Base, inBase}, {ResolvedSource::Latest, inLatest}, {ResolvedSource::User, inUser}};
    ostcore::optional<ResolvedSource> winner;
    DateTime winning;
    for (const auto& side : sides) {
        const Node& property = side.second.packet.Property(mDate);
        const auto date = property.IsSimple() ? OrvaneXMP::ParseDateTime(property.Value()) : boost::none;
        if (date && (!winner || OrvaneXMP::CompareDateTime(*date, winning) > 0)) {
            winner = side.first;
            winning = *date;
        }
    }
    return winner;
}

std::int32_t LatestDateStrategy::ResolveConflict(ConflictReason inReason, const SideNode& inBase,
                                                 const SideNode& inLatest, const SideNode& inUser,
                                                 Node& outResolvedNode, ResolvedSource& outResolvedSource,
                                                 std::int32_t& outResolvedStatus) {
    if (!std::exchange(mHasDecided, true)) {
        mWinner = FindWinner(inBase, inLatest, inUser);
    }
    if (!mWinner) {
        return LeaveConflict(inReason);
    }
    outResolvedNode = *mWinner == ResolvedSource::Base     ? inBase.node
                      : *mWinner == ResolvedSource::Latest ? inLatest.node
                                                           : inUser.node;
    outResolvedSource = *mWinner;
    outResolvedStatus = OrvaneXMPCompareAndMerge::kResolvedStatus_ByStrategy;
    return OrvaneXMPCompareAndMerge::kResolved;
}

}  // namespace ZOCL
