// Layouts written down in C++.
#pragma once

#include <string>
#include <utility>
#include <vector>

#include "ostui/View.h"

namespace ostui {

inline View MakeView(const std::string& inTag, const std::string& inID,
                     const std::vector<std::pair<std::string, std::string>>& inParameters = {},
                     std::vector<View> inChildren = {}) {
    View view;
    view.tag = inTag;
    if (!inID.empty()) {
        view.parameters.push_back({"identifier", inID});
    }
    for (const auto& [name, value] : inParameters) {
        view.parameters.push_back({name, value});
    }
    view.children = std::move(inChildren);
    return view;
}

inline View MakeWindow(std::vector<View> inChildren) {
    return MakeView("ost_dialog", "", {{"name", "$$$/Test/Title=Window"}}, std::move(inChildren));
}

}  // namespace ostui
