// Reads numbers strictly.
#include "Numbers.h"

#include <charconv>

#include "Failure.h"

namespace zo {

std::uint64_t NumberOption(const Arguments& inArguments, const std::string& inName, std::uint64_t inDefault,
                           std::uint64_t inLowest, std::uint64_t inHighest) {
    const auto text = inArguments.Value(inName);
    if (!text) {
        return inDefault;
    }
    std::uint64_t number = 0;
    const char* const end = text->data() + text->size();
    const auto read = std::from_chars(text->data(), end, number);
    if (read.ec != std::errc() || read.ptr != end || number < inLowest || number > inHighest) {
        throw Failure(ExitCode::Usage, "--" + inName + " takes a whole number from " +
                                           std::to_string(inLowest) + " to " + std::to_string(inHighest) +
                                           ", not '" + *text + "'");
    }
    return number;
}

}  // namespace zo
