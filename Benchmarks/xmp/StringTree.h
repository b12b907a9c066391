// The baseline: expat with namespaces into a plain tree of strings.
#pragma once

#include <memory>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

struct StringElement {
    std::string name;
    std::vector<std::pair<std::string, std::string>> attributes;
    std::string text;
    std::vector<std::unique_ptr<StringElement>> children;
};

/// Null for what is not well-formed.
std::unique_ptr<StringElement> ParseToStrings(std::string_view inText);
