// Help texts for people, made from the command table.
#pragma once

#include <string>

#include "CommandTable.h"

namespace zo {

/// "zo get [OPTIONS] [ASSET]"
std::string SynopsisOf(const Command& inCommand);
/// "-o, --output PATH"
std::string OptionText(const Option& inOption);
/// The list of all verbs.
std::string OverviewHelp();
/// All about one verb.
std::string CommandHelp(const Command& inCommand);

}  // namespace zo
