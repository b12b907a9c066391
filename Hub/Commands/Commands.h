// The commands of zohub. Each takes the words behind its name and gives the exit code.
#pragma once

#include <string>
#include <vector>

namespace zohub {

int RunServe(std::vector<std::string> const& inWords);
int RunUserAdd(std::vector<std::string> const& inWords);
int RunImport(std::vector<std::string> const& inWords);
int RunExport(std::vector<std::string> const& inWords);
int RunCheck(std::vector<std::string> const& inWords);

}  // namespace zohub
