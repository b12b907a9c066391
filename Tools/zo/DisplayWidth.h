// How many columns of a terminal a text takes, and texts made safe and short for one.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace zo {

/// Columns: 2 for wide East Asian characters and emoji, 0 for combining marks, 1 for all else. Knows no
/// locale. The text is UTF-8; a byte that is not counts as one column.
std::size_t DisplayWidth(std::string_view inText);

/// The text cut to at most inColumns, with an ellipsis as its last column when something was cut.
std::string Truncate(std::string_view inText, std::size_t inColumns);

/// Text of foreign origin as a terminal may be given it: control characters, line and paragraph separators
/// and marks that change the direction of writing become U+FFFD, as do bytes that are no UTF-8.
std::string ForTerminal(std::string_view inText);

}  // namespace zo
