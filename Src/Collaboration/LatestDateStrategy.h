// The rule that the side with the latest date wins, for the strategies that go by a date.
#pragma once

#include "Collaboration/XMPMergeStrategyBase.h"

namespace ZOCL {

/// The winner is found at the first conflict of a merge and stays for all others, so that properties that
/// belong together come from one side. Equal dates go to base before latest before user. A date that cannot
/// be read counts as none; without any date the conflict stays.
class LatestDateStrategy : public XMPMergeStrategyBase {
public:
    std::int32_t ResolveConflict(ConflictReason inReason, const SideNode& inBase, const SideNode& inLatest,
                                 const SideNode& inUser, Node& outResolvedNode,
                                 ResolvedSource& outResolvedSource, std::int32_t& outResolvedStatus) override;

protected:
    explicit LatestDateStrategy(const OrvaneXMP::Name& inDate) : mDate(inDate) {}
    ~LatestDateStrategy() override = default;

private:
    ostcore::optional<ResolvedSource> FindWinner(const SideNode& inBase, const SideNode& inLatest,
                                                 const SideNode& inUser) const;

    const OrvaneXMP::Name mDate;
    bool mHasDecided = false;
    ostcore::optional<ResolvedSource> mWinner;
};

}  // namespace ZOCL
