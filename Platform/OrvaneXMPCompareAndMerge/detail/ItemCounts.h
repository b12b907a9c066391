// How often each item stands in three unordered arrays, and what becomes of that.
#pragma once

#include <vector>

#include "OrvaneXMPCompareAndMerge/Types.h"

namespace OrvaneXMPCompareAndMerge {

/// The items of one merge of unordered arrays of simple items; an absent node has none. It refers to the
/// nodes that it was made of.
class ItemCounts {
public:
    ItemCounts(const Node& inBase, const Node& inLatest, const Node& inUser);

    bool IsBaseLatest() const noexcept { return mIsBaseLatest; }
    bool IsBaseUser() const noexcept { return mIsBaseUser; }
    bool IsLatestUser() const noexcept { return mIsLatestUser; }

    struct Merged {
        std::vector<Node> items;
        bool isLatest;
        bool isUser;
    };
    /// The items of latest that stay, in their order, and those that only the user has, in theirs.
    Merged Merge() const;

private:
    /// Equal items.
    struct Group {
        std::uint32_t base = 0;
        std::uint32_t latest = 0;
        std::uint32_t user = 0;

        std::uint32_t Wanted() const noexcept;
    };

    const Node& mLatest;
    const Node& mUser;
    std::vector<Group> mGroups;
    /// The group of each item.
    std::vector<std::uint32_t> mGroupOfLatest;
    std::vector<std::uint32_t> mGroupOfUser;
    bool mIsBaseLatest = true;
    bool mIsBaseUser = true;
    bool mIsLatestUser = true;
};

}  // namespace OrvaneXMPCompareAndMerge
