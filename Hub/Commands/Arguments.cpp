// The command line of zohub.
#include "Commands/Arguments.h"

#include <charconv>
#include <cstdlib>

namespace zohub {

namespace {

std::string Environment(char const* inName) {
    char const* const value = std::getenv(inName);
    return value ? value : "";
}

}  // namespace

Arguments::Arguments(std::vector<std::string> const& inWords, std::initializer_list<Option> inOptions) {
    for (std::size_t i = 0; i < inWords.size(); ++i) {
        std::string const& word = inWords[i];
        if (word.size() < 2 || word[0] != '-') {
            mWords.push_back(word);
            continue;
        }
        std::size_t const equals = word.find('=');
        std::string const name = word.substr(0, equals);
        Option const* known = nullptr;
        for (auto const& option : inOptions)
            if (name == option.name)
                known = &option;
        if (!known)
            throw UsageError("unknown option " + name + "; see zohub --help");
        if (!known->takesValue && equals != std::string::npos)
            throw UsageError(name + " takes no value");
        if (!known->takesValue) {
            mValues.emplace(name, "");
        } else if (equals != std::string::npos) {
            mValues.emplace(name, word.substr(equals + 1));
        } else if (i + 1 < inWords.size()) {
            mValues.emplace(name, inWords[++i]);
        } else {
            throw UsageError(name + " needs a value");
        }
    }
}

std::string Arguments::Get(std::string const& inName, std::string const& inDefault) const {
    auto const range = mValues.equal_range(inName);
    return range.first == range.second ? inDefault : std::prev(range.second)->second;
}

std::string Arguments::Need(std::string const& inName) const {
    std::string const value = Get(inName);
    if (value.empty())
        throw UsageError(inName + " is needed; see zohub --help");
    return value;
}

std::uint64_t Arguments::Number(std::string const& inName, std::uint64_t inDefault,
                                std::uint64_t inMaximum) const {
    if (!Has(inName))
        return inDefault;
    std::string const text = Get(inName);
    std::uint64_t value = 0;
    auto const [end, error] = std::from_chars(text.data(), text.data() + text.size(), value);
    if (text.empty() || error != std::errc() || end != text.data() + text.size() || value > inMaximum)
        throw UsageError(inName + " needs a number from 0 to " + std::to_string(inMaximum));
    return value;
}

std::vector<std::string> Arguments::All(std::string const& inName) const {
    std::vector<std::string> values;
    auto const range = mValues.equal_range(inName);
    for (auto at = range.first; at != range.second; ++at)
        values.push_back(at->second);
    return values;
}

std::vector<std::string> const& Arguments::Words(std::size_t inCount, std::string const& inUsage) const {
    if (mWords.size() != inCount)
        throw UsageError("usage: zohub " + inUsage);
    return mWords;
}

std::string Arguments::DataDirectory() const {
    if (Has("--data"))
        return Need("--data");
    if (auto const own = Environment("ZOHUB_DATA"); !own.empty())
        return own;
    if (auto const state = Environment("XDG_STATE_HOME"); !state.empty())
        return state + "/zohub";
    if (auto const home = Environment("HOME"); !home.empty())
        return home + "/.local/state/zohub";
    throw UsageError("no data directory is known: give --data DIR");
}

}  // namespace zohub
