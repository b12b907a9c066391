// Reads layouts: texts that say which controls a window has and how they are arranged. The language is told
// in Docs/layouts.md, its tags and parameters stand in ostlyra/Tags.h.
#pragma once

#include <string>
#include <string_view>

#include "ostcore/Export.h"
#include "ostcore/Types.h"
#include "ostui/View.h"

namespace ostlyra {

using ostcore::function;
using ostcore::optional;

/// Why a text is no layout, and where.
struct ZOPLATFORM_EXPORT LayoutError {
    /// The layout whose text is meant: one that was pulled in, or the outer one; empty before its name is
    /// known.
    std::string layout;
    /// From 1; a column is a character, not a byte.
    int line = 0;
    int column = 0;
    /// What was expected, and what was found.
    std::string message;

    /// "ZOProgressDialog:3:14: expected ..."
    std::string AsText() const;
};

struct Layout {
    std::string name;
    /// An "ost_dialog" or an "ost_tab_view", with all layouts in it that "ost_layout_script" pulls in. Each
    /// control has an identifier, and no identifier stands twice.
    ostui::View view;
};

/// Gives the text of another layout by its name; none when there is no such layout.
using LayoutSource = function<optional<std::string>(const std::string& inName)>;

/// None when the text is no layout; outError then says why. The text may come from anywhere: its size, its
/// depth and the number of its views are bounded. Threads: any; inSource is called on the caller's.
ZOPLATFORM_EXPORT optional<Layout> ParseLayout(std::string_view inText, LayoutError& outError,
                                               const LayoutSource& inSource = LayoutSource());

}  // namespace ostlyra
