// Replaces several marks in a text at once, as the templates of links and messages need it.
#pragma once

#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "ostcore/Export.h"

namespace ostcore {
namespace utility {

/// What to look for and what to put in its place.
using Replacement = std::pair<std::string, std::string>;

/// Replaces each `from` by its `to`, in one pass from left to right. What was put in is not scanned again, so
/// a value that looks like a mark stays as it is. Where several marks begin at one place, the first of the
/// list wins. Nothing is escaped. An empty mark is ignored.
ZOPLATFORM_EXPORT std::string ReplaceInString(std::string_view inText,
                                              const std::vector<Replacement>& inReplacements);

}  // namespace utility
}  // namespace ostcore
