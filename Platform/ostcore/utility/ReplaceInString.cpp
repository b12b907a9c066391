// Replaces several marks in one pass.
#include "ostcore/utility/ReplaceInString.h"

namespace ostcore {
namespace utility {
namespace {

bool BeginsWithAt(std::string_view inText, std::size_t inPosition, std::string_view inMark) {
    return !inMark.empty() && inText.compare(inPosition, inMark.size(), inMark) == 0;
}

}  // namespace

std::string ReplaceInString(std::string_view inText, const std::vector<Replacement>& inReplacements) {
    std::string result;
    result.reserve(inText.size());
    std::size_t position = 0;
    while (position < inText.size()) {
        const auto found = std::find_if(
            inReplacements.begin(), inReplacements.end(),
            [&](const Replacement& inEach) { return BeginsWithAt(inText, position, inEach.first); });
        if (found == inReplacements.end()) {
            result.push_back(inText[position++]);
        } else {
            result.append(found->second);
            position += found->first.size();
        }
    }
    return result;
}

}  // namespace utility
}  // namespace ostcore
