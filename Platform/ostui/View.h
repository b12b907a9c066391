// How the controls of a window are arranged: a tree of views, as a layout text describes it.
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "ostcore/Export.h"
#include "ostcore/Types.h"

namespace ostui {

using ostcore::U8String;

struct ViewParameter {
    std::string name;
    /// Without quotation marks and escapes; UTF-8.
    std::string value;
};

/// One view and what is in it. The tags and their parameters are told in Docs/layouts.md.
struct ZOPLATFORM_EXPORT View {
    std::string tag;
    std::vector<ViewParameter> parameters;
    std::vector<View> children;
    /// Where it stands in the layout text, from 1; 0 when it was not read from one.
    int line = 0;
    int column = 0;

    /// Null when it has no such parameter.
    const std::string* Find(std::string_view inName) const noexcept;
    /// The parameter "identifier"; a parsed view of a control always has one (the parser makes up "#1", "#2"
    /// for those without).
    std::string GetIdentifier() const;
    /// A "$$$/..." value is given in the user's language. Empty when it has no such parameter.
    U8String GetText(std::string_view inName) const;
    int GetNumber(std::string_view inName, int inDefault) const noexcept;
    bool GetFlag(std::string_view inName, bool inDefault) const noexcept;
};

}  // namespace ostui
