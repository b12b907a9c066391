// Options whose value is a number.
#pragma once

#include <cstdint>
#include <string>

#include "Arguments.h"

namespace zo {

/// Throws a Failure (usage) for anything but a whole number within the bounds.
std::uint64_t NumberOption(const Arguments& inArguments, const std::string& inName, std::uint64_t inDefault,
                           std::uint64_t inLowest, std::uint64_t inHighest);

}  // namespace zo
