// The command line, read by the command table.
#pragma once

#include <map>
#include <optional>
#include <string>
#include <vector>

#include "CommandTable.h"

namespace zo {

/// A command line that the table accepts.
class Arguments {
public:
    /// Throws a Failure (usage) for anything that the table does not allow.
    static Arguments Parse(const std::vector<std::string>& inWords);

    const Command& GetCommand() const noexcept { return *mCommand; }
    bool Has(const std::string& inOption) const { return mOptions.count(inOption) != 0; }
    std::optional<std::string> Value(const std::string& inOption) const;
    std::string ValueOr(const std::string& inOption, const std::string& inDefault) const;
    /// By position; nothing when it was left out.
    std::optional<std::string> Positional(std::size_t inIndex) const;
    /// All from a position on.
    std::vector<std::string> PositionalsFrom(std::size_t inIndex) const;

private:
    friend class ArgumentsReader;
    const Command* mCommand = nullptr;
    /// Switches have an empty value. The last of several wins.
    std::map<std::string, std::string> mOptions;
    std::vector<std::string> mPositionals;
};

/// Whether --json stands among the words, for errors of a line that does not parse.
bool AsksForJson(const std::vector<std::string>& inWords);

}  // namespace zo
