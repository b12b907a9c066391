// The command line of zohub, read strictly.
#pragma once

#include <cstdint>
#include <initializer_list>
#include <map>
#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

namespace zohub {

/// A command line that makes no sense; ends with exit code 2 and the text.
class UsageError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

class Arguments {
public:
    struct Option {
        char const* name;  ///< with its dashes
        bool takesValue = true;
    };

    /// Throws UsageError for an unknown option, a missing value, or an option without repeat given twice.
    Arguments(std::vector<std::string> const& inWords, std::initializer_list<Option> inOptions);

    bool Has(std::string const& inName) const { return mValues.count(inName) != 0; }
    std::string Get(std::string const& inName, std::string const& inDefault = {}) const;
    std::string Need(std::string const& inName) const;
    std::uint64_t Number(std::string const& inName, std::uint64_t inDefault, std::uint64_t inMaximum) const;
    std::vector<std::string> All(std::string const& inName) const;

    /// The words that are no options, exactly this many.
    std::vector<std::string> const& Words(std::size_t inCount, std::string const& inUsage) const;

    /// --data, else ZOHUB_DATA, else XDG_STATE_HOME/zohub, else ~/.local/state/zohub.
    std::string DataDirectory() const;

private:
    std::multimap<std::string, std::string> mValues;
    std::vector<std::string> mWords;
};

}  // namespace zohub
