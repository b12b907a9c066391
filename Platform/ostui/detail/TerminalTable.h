// A tree as lines of text, its columns aligned by the width of what is shown.
#pragma once

#include <cstddef>
#include <vector>

#include "ostcore/Types.h"
#include "ostui/Tree.h"

namespace ostui {
namespace detail {

/// A line of titles, then one for each of the given rows, cut to the width; 0 cuts nothing. With numbers each
/// row begins with its place, from 1. Cells are made safe.
std::vector<ostcore::U8String> TableLines(const Tree& inTree, const std::vector<int>& inRows,
                                          bool inHasNumbers, std::size_t inWidth);

}  // namespace detail
}  // namespace ostui
