// Walks rows of named or spoken nodes side by side.
#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <string_view>
#include <vector>

#include "OrvaneXMPCompareAndMerge/detail/Shape.h"

namespace OrvaneXMPCompareAndMerge {

using OrvaneXMP::Field;
using OrvaneXMP::Name;
using OrvaneXMP::Range;

inline const Node& AbsentNode() noexcept {
    static const Node absent;
    return absent;
}

/// What stands under one key on each side.
template <std::size_t Sides>
using Row = std::array<const Node*, Sides>;

/// Calls inBody(key, Row) once for each key that any side has, in the order of the keys. Each side is sorted
/// by key, each key once.
template <std::size_t Sides, class Entries, class KeyOf, class NodeOf, class Body>
void ForEachKey(const std::array<Entries, Sides>& inSides, const KeyOf& inKeyOf, const NodeOf& inNodeOf,
                const Body& inBody) {
    std::array<std::size_t, Sides> at{};
    for (;;) {
        const typename std::remove_reference_t<decltype(inKeyOf(inSides[0][0]))>* least = nullptr;
        for (std::size_t side = 0; side < Sides; ++side) {
            if (at[side] < inSides[side].size() && (!least || inKeyOf(inSides[side][at[side]]) < *least)) {
                least = &inKeyOf(inSides[side][at[side]]);
            }
        }
        if (!least) {
            return;
        }
        Row<Sides> row;
        for (std::size_t side = 0; side < Sides; ++side) {
            const bool hasKey = at[side] < inSides[side].size() && inKeyOf(inSides[side][at[side]]) == *least;
            row[side] = hasKey ? &inNodeOf(inSides[side][at[side]++]) : &AbsentNode();
        }
        inBody(*least, row);
    }
}

/// Fields or qualifiers, by name.
template <std::size_t Sides, class Body>
void ForEachName(const std::array<Range<Field>, Sides>& inSides, const Body& inBody) {
    ForEachKey(
        inSides, [](const Field& inField) -> const Name& { return inField.name; },
        [](const Field& inField) -> const Node& { return inField.node; }, inBody);
}

struct SpokenItem {
    std::string_view language;
    const Node* node;
};

/// The items of a language alternative, sorted by language.
inline std::vector<SpokenItem> ByLanguage(const Node& inAlternative) {
    std::vector<SpokenItem> items;
    items.reserve(inAlternative.Items().size());
    for (const Node& item : inAlternative.Items()) {
        items.push_back({LanguageOf(item), &item});
    }
    std::sort(items.begin(), items.end(), [](const SpokenItem& inLeft, const SpokenItem& inRight) {
        return inLeft.language < inRight.language;
    });
    return items;
}

/// The items of language alternatives, by language.
template <std::size_t Sides, class Body>
void ForEachLanguage(const std::array<std::vector<SpokenItem>, Sides>& inSides, const Body& inBody) {
    ForEachKey(
        inSides, [](const SpokenItem& inItem) -> const std::string_view& { return inItem.language; },
        [](const SpokenItem& inItem) -> const Node& { return *inItem.node; }, inBody);
}

}  // namespace OrvaneXMPCompareAndMerge
