// Reads and writes choices of rows.
#include "ostui/detail/RowChoice.h"

#include <algorithm>
#include <charconv>
#include <set>
#include <string>

#include "ostcore/utility/StringConversion.h"

namespace ostui {
namespace detail {

using ostcore::optional;
using ostcore::U8String;

namespace {

constexpr std::string_view kSeparators = ", \t";

/// A number from 1 to inCount; 0 for anything else.
int ParseNumber(std::string_view inText, int inCount) {
    int number = 0;
    const auto [end, error] = std::from_chars(inText.data(), inText.data() + inText.size(), number);
    const bool isWhole = error == std::errc() && end == inText.data() + inText.size();
    return isWhole && number >= 1 && number <= inCount ? number : 0;
}

/// Takes the next word off the text; empty at its end.
std::string_view TakeWord(std::string_view& ioText) {
    ioText.remove_prefix(std::min(ioText.find_first_not_of(kSeparators), ioText.size()));
    const std::string_view word = ioText.substr(0, ioText.find_first_of(kSeparators));
    ioText.remove_prefix(word.size());
    return word;
}

}  // namespace

optional<std::vector<int>> ParseRowChoice(std::string_view inText, int inCount,
                                          std::string_view inWordForAll) {
    std::set<int> places;
    for (std::string_view word = TakeWord(inText); !word.empty(); word = TakeWord(inText)) {
        int first = 1;
        int last = inCount;
        if (!ostcore::utility::EqualsIgnoreCaseASCII(word, inWordForAll)) {
            const std::size_t dash = word.find('-');
            first = ParseNumber(word.substr(0, dash), inCount);
            last = dash == std::string_view::npos ? first : ParseNumber(word.substr(dash + 1), inCount);
            if (first == 0 || last < first) {
                return {};
            }
        }
        for (int number = first; number <= last; ++number) {
            places.insert(number - 1);
        }
    }
    return std::vector<int>(places.begin(), places.end());
}

U8String RowChoiceText(const std::vector<int>& inPlaces, int inCount, std::string_view inWordForAll) {
    if (inCount > 1 && static_cast<int>(inPlaces.size()) == inCount) {
        return U8String(inWordForAll);
    }
    U8String text;
    for (std::size_t at = 0; at < inPlaces.size(); ++at) {
        std::size_t end = at;
        while (end + 1 < inPlaces.size() && inPlaces[end + 1] == inPlaces[end] + 1) {
            ++end;
        }
        text += (text.empty() ? "" : ",") + std::to_string(inPlaces[at] + 1);
        if (end > at) {
            text += "-" + std::to_string(inPlaces[end] + 1);
        }
        at = end;
    }
    return text;
}

}  // namespace detail
}  // namespace ostui
