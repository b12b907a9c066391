// Texts made comparable byte by byte: without case, and with runs of digits as numbers.
#pragma once

#include <string>
#include <string_view>

namespace ostui {
namespace detail {

/// Appends the key of a text. Two keys compare, as bytes, as their texts are ordered: by their composed
/// (NFC), case-folded form, in which a run of the digits 0 to 9 is a number of any length.
void AppendSortKey(std::string_view inText, std::string& ioKeys);

}  // namespace detail
}  // namespace ostui
