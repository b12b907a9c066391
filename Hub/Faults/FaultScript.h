// The script of zohub serve --faults: which requests meet a fault, and which. Docs/hub-faults.md tells its
// grammar.
#pragma once

#include <cstdint>
#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

#include "Http/FaultPlan.h"

namespace zohub {

/// A line that makes no sense: where it is and what belongs there.
class FaultScriptError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

/// Where a request goes: a method and the segments of a path, "*" for any one, and "**" at the end for all
/// that follow.
struct FaultTarget {
    std::string method;  ///< empty for any
    std::vector<std::string> segments;

    bool Matches(Request const& inRequest) const;
};

/// Which of the requests that a rule matches it is meant for.
struct FaultOccasion {
    std::uint64_t first = 1;
    std::optional<std::uint64_t> last;
    std::uint64_t step = 1;
    double chance = 1;

    /// The number counts from 1; the draw is from 0 to below 1.
    bool Includes(std::uint64_t inNumber, double inDraw) const;
};

struct FaultRule {
    std::size_t line = 0;
    std::string text;                  ///< the action as it was written
    std::string method;                ///< empty for any
    std::vector<FaultTarget> targets;  ///< none for every address
    std::size_t formParts = 0;         ///< a form with at least so many
    FaultOccasion occasion;
    FaultPlan plan;
    bool expiresToken = false;

    bool Matches(Request const& inRequest) const;
};

struct FaultScript {
    std::uint64_t seed = 1;
    std::vector<FaultRule> rules;
};

/// The name stands in errors. Throws FaultScriptError.
FaultScript ParseFaultScript(std::string const& inText, std::string const& inName);

/// The addresses of a link relation, as the script names it; empty for one that this hub does not have.
std::vector<FaultTarget> TargetsOfRelation(std::string const& inRelation);

/// Segments of a path pattern.
std::vector<std::string> SplitPattern(std::string const& inPattern);

}  // namespace zohub
