// Texts on a terminal: how many columns they take, and forms of them that are safe and short enough.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

#include "ostcore/Types.h"

namespace ostui {
namespace detail {

/// Columns: 2 for wide East Asian characters and emoji, 0 for combining marks, 1 for the rest. Knows no
/// locale.
std::size_t DisplayWidth(std::string_view inText);
/// Cut to at most that many columns, with an ellipsis as the last one when something was cut.
ostcore::U8String Truncate(std::string_view inText, std::size_t inColumns);
/// Filled up with spaces.
ostcore::U8String PadTo(ostcore::U8String inText, std::size_t inColumns);

/// What comes from a server must not steer the terminal: control characters, marks that change the direction
/// of writing and what is no UTF-8 become U+FFFD. Line ends and tabs stay.
ostcore::U8String SafeText(std::string_view inText);
/// The same for one line: line ends and tabs become spaces.
ostcore::U8String SafeLine(std::string_view inText);

/// Lines of at most that many columns, broken at spaces; a longer word stays whole. 0 columns: as it is.
ostcore::U8String Wrap(std::string_view inText, std::size_t inColumns);

}  // namespace detail
}  // namespace ostui
