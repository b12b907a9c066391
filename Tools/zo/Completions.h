// Completion scripts for shells, made from the command table.
#pragma once

#include <string>

namespace zo {

std::string BashCompletion();
std::string ZshCompletion();
std::string FishCompletion();

}  // namespace zo
