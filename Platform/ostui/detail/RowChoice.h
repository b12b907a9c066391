// What a user types to choose rows of a numbered list: "1,3-5", "all".
#pragma once

#include <string_view>
#include <vector>

#include "ostcore/Types.h"

namespace ostui {
namespace detail {

/// The places that a text names, from 0, ascending; none when the text names anything but numbers from 1 to
/// inCount, ranges of them and inWordForAll, parted by commas or spaces.
ostcore::optional<std::vector<int>> ParseRowChoice(std::string_view inText, int inCount,
                                                   std::string_view inWordForAll);
/// The shortest such text for places that ascend.
ostcore::U8String RowChoiceText(const std::vector<int>& inPlaces, int inCount, std::string_view inWordForAll);

}  // namespace detail
}  // namespace ostui
