// Manual pages in roff (man(7)), made from the command table.
#pragma once

#include <string>
#include <utility>
#include <vector>

#include "CommandTable.h"

namespace zo {

std::string OverviewManPage();
std::string CommandManPage(const Command& inCommand);
/// File name, such as "zo-get.1", and page.
std::vector<std::pair<std::string, std::string>> AllManPages();

}  // namespace zo
