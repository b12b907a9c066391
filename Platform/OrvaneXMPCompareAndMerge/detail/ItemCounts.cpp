// Groups equal items by sorting them, and merges by counts.
#include "OrvaneXMPCompareAndMerge/detail/ItemCounts.h"

#include <algorithm>
#include <tuple>

namespace OrvaneXMPCompareAndMerge {

namespace {

enum class Side : std::uint8_t { Base, Latest, User };

struct Occurrence {
    const Node* node;
    std::size_t hash;
    std::uint32_t index;
    Side side;

    /// Equal nodes have equal keys. The hash tells those apart whose qualifiers differ.
    auto Key() const { return std::make_tuple(node->GetKind(), node->Value(), hash); }
};

void Gather(const Node& inArray, Side inSide, std::vector<Occurrence>& ioAll) {
    std::uint32_t index = 0;
    for (const Node& item : inArray.Items()) {
        ioAll.push_back({&item, item.Qualifiers().empty() ? 0 : item.Hash(), index++, inSide});
    }
}

std::vector<Occurrence> Sorted(const Node& inBase, const Node& inLatest, const Node& inUser) {
    std::vector<Occurrence> all;
    all.reserve(inBase.Items().size() + inLatest.Items().size() + inUser.Items().size());
    Gather(inBase, Side::Base, all);
    Gather(inLatest, Side::Latest, all);
    Gather(inUser, Side::User, all);
    std::sort(all.begin(), all.end(), [](const Occurrence& inLeft, const Occurrence& inRight) {
        return inLeft.Key() < inRight.Key();
    });
    return all;
}

}  // namespace

std::uint32_t ItemCounts::Group::Wanted() const noexcept {
    if (latest == user || base == user) {
        return latest;
    }
    if (base == latest) {
        return user;
    }
    const bool bothHaveFewer = latest < base && user < base;
    return bothHaveFewer ? std::min(latest, user) : std::max(latest, user);
}

ItemCounts::ItemCounts(const Node& inBase, const Node& inLatest, const Node& inUser)
    : mLatest(inLatest),
      mUser(inUser),
      mGroupOfLatest(inLatest.Items().size()),
      mGroupOfUser(inUser.Items().size()) {
    // The items of one key, most often one group, begin at firstNode and firstGroup.
    std::vector<const Node*> nodes;
    std::size_t firstGroup = 0;
    const Occurrence* first = nullptr;
    const std::vector<Occurrence> all = Sorted(inBase, inLatest, inUser);
    for (const Occurrence& each : all) {
        if (!first || first->Key() != each.Key()) {
            first = &each;
            firstGroup = mGroups.size();
        }
        std::size_t group = firstGroup;
        while (group < nodes.size() && *nodes[group] != *each.node) {
            ++group;
        }
        if (group == nodes.size()) {
            nodes.push_back(each.node);
            mGroups.emplace_back();
        }
        switch (each.side) {
            case Side::Base:
                ++mGroups[group].base;
                break;
            case Side::Latest:
                ++mGroups[group].latest;
                mGroupOfLatest[each.index] = static_cast<std::uint32_t>(group);
                break;
            case Side::User:
                ++mGroups[group].user;
                mGroupOfUser[each.index] = static_cast<std::uint32_t>(group);
                break;
        }
    }
    for (const Group& group : mGroups) {
        mIsBaseLatest = mIsBaseLatest && group.base == group.latest;
        mIsBaseUser = mIsBaseUser && group.base == group.user;
        mIsLatestUser = mIsLatestUser && group.latest == group.user;
    }
}

ItemCounts::Merged ItemCounts::Merge() const {
    Merged merged{{}, true, true};
    std::vector<std::uint32_t> left;
    left.reserve(mGroups.size());
    for (const Group& group : mGroups) {
        left.push_back(group.Wanted());
        merged.isLatest = merged.isLatest && left.back() == group.latest;
        merged.isUser = merged.isUser && left.back() == group.user;
    }
    const auto take = [&](const Node& inArray, const std::vector<std::uint32_t>& inGroups) {
        for (std::size_t at = 0; at < inGroups.size(); ++at) {
            if (left[inGroups[at]] > 0) {
                --left[inGroups[at]];
                merged.items.push_back(inArray.Items()[at]);
            }
        }
    };
    take(mLatest, mGroupOfLatest);
    take(mUser, mGroupOfUser);
    return merged;
}

}  // namespace OrvaneXMPCompareAndMerge
