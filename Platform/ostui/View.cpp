// Parameters of views as texts, numbers and flags.
#include "ostui/View.h"

#include <algorithm>
#include <charconv>

#include "ostcore/config/ZString.h"

namespace ostui {

const std::string* View::Find(std::string_view inName) const noexcept {
    const auto found =
        std::find_if(parameters.begin(), parameters.end(),
                     [&](const ViewParameter& inParameter) { return inParameter.name == inName; });
    return found == parameters.end() ? nullptr : &found->value;
}

std::string View::GetIdentifier() const {
    const std::string* const value = Find("identifier");
    return value ? *value : std::string();
}

U8String View::GetText(std::string_view inName) const {
    const std::string* const value = Find(inName);
    return value ? ostcore::ZString(*value).AsUTF8() : U8String();
}

int View::GetNumber(std::string_view inName, int inDefault) const noexcept {
    const std::string* const value = Find(inName);
    if (!value) {
        return inDefault;
    }
    int number = 0;
    const char* const end = value->data() + value->size();
    const auto [stop, error] = std::from_chars(value->data(), end, number);
    return error == std::errc() && stop == end ? number : inDefault;
}

bool View::GetFlag(std::string_view inName, bool inDefault) const noexcept {
    const std::string* const value = Find(inName);
    if (!value || (*value != "true" && *value != "false")) {
        return inDefault;
    }
    return *value == "true";
}

}  // namespace ostui
