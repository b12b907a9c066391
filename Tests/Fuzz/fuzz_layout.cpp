// Any bytes either are refused with a place and a reason, or make a tree of views that reads back the same
// from what is written of it, and of which a dialog with distinct controls can be made.
#include <cstdint>
#include <cstdlib>
#include <set>

#include "ostcore/utility/ReplaceInString.h"
#include "ostcore/utility/StringConversion.h"
#include "ostlyra/Layout.h"
#include "ostlyra/Tags.h"
#include "ostui/Dialog.h"

using namespace ostlyra;

namespace {

constexpr std::size_t kLargestText = 1024 * 1024;

void Require(bool inHolds) {
    if (!inHolds) {
        std::abort();
    }
}

std::string Written(const Tag& inTag, const ostui::ViewParameter& inParameter) {
    if (inTag.FindParameter(inParameter.name)->kind != ValueKind::kText) {
        return inParameter.value;
    }
    return '"' +
           ostcore::utility::ReplaceInString(inParameter.value,
                                             {{"\\", "\\\\"}, {"\"", "\\\""}, {"\n", "\\n"}, {"\t", "\\t"}}) +
           '"';
}

std::string Written(const ostui::View& inView) {
    const Tag* const tag = FindTag(inView.tag);
    std::string text = inView.tag + "(";
    for (const ostui::ViewParameter& parameter : inView.parameters) {
        // What the parser has made up it makes up again.
        if (parameter.value.substr(0, 1) != "#" ||
            tag->FindParameter(parameter.name)->kind == ValueKind::kText) {
            text += parameter.name + ":" + Written(*tag, parameter) + ",";
        }
    }
    text += ")";
    if (tag->content == TagContent::kNothing) {
        return text + ";";
    }
    text += "{";
    for (const ostui::View& child : inView.children) {
        text += Written(child);
    }
    return text + "}";
}

bool IsSame(const ostui::View& inLeft, const ostui::View& inRight) {
    const auto isSame = [](const ostui::ViewParameter& inOne, const ostui::ViewParameter& inOther) {
        return inOne.name == inOther.name && inOne.value == inOther.value;
    };
    return inLeft.tag == inRight.tag &&
           std::equal(inLeft.parameters.begin(), inLeft.parameters.end(), inRight.parameters.begin(),
                      inRight.parameters.end(), isSame) &&
           std::equal(inLeft.children.begin(), inLeft.children.end(), inRight.children.begin(),
                      inRight.children.end(), &IsSame);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* inBytes, std::size_t inSize) {
    const std::string input(reinterpret_cast<const char*>(inBytes), inSize);
    // Some layouts that are pulled in are good, the others are the input again.
    const auto source = [&](const std::string& inName) {
        return ostcore::optional<std::string>(
            inName[0] == 'Z' ? "layout " + inName + " { view ost_tab_view(name: 'page') {} }" : input);
    };
    LayoutError error;
    const auto layout = ParseLayout(input, error, source);
    if (!layout) {
        Require(!error.message.empty() && error.line > 0 && error.column > 0);
        Require(ostcore::utility::IsValidUTF8(error.AsText()));
        return 0;
    }
    const std::string text = "layout " + layout->name + "{view " + Written(layout->view) + "}";
    const auto again = ParseLayout(text, error);
    Require(again ? IsSame(again->view, layout->view) : text.size() > kLargestText);
    ostui::Dialog dialog(layout->name, layout->view);
    std::set<std::string> identifiers;
    for (const ostui::Control& control : dialog.GetControls()) {
        Require(!control.id.empty() && identifiers.insert(control.id).second);
    }
    return 0;
}
