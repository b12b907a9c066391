// Where windows stand and how the columns of their trees are set, kept between runs in the registry value
// "UIProperties" as one JSON text.
#pragma once

#include <map>
#include <string>

#include "ostui/Dialog.h"
#include "ZOClient/Types.h"

namespace ZOCL {

struct ColumnProperties {
    optional<int> width;
    /// Its place among the columns.
    optional<int> index;

    friend bool operator==(const ColumnProperties& inLeft, const ColumnProperties& inRight) {
        return inLeft.width == inRight.width && inLeft.index == inRight.index;
    }
};

struct TreeProperties {
    std::map<std::string, ColumnProperties> columns;
    /// Empty: the order of the list.
    std::string sortColumnID;
    bool isSortDirectionAscending = true;

    friend bool operator==(const TreeProperties& inLeft, const TreeProperties& inRight) {
        return inLeft.columns == inRight.columns && inLeft.sortColumnID == inRight.sortColumnID &&
               inLeft.isSortDirectionAscending == inRight.isSortDirectionAscending;
    }
};

struct DialogProperties {
    optional<ostui::Geometry> geometry;
    std::map<std::string, TreeProperties> trees;
};

// One map for the process, read from the registry when it is first asked for and guarded by a lock of its
// own. What cannot be read (other types, numbers out of range, no JSON at all) counts as not there; what
// others keep in the text stays in it. Threads: any; blocks on the registry, for a bounded time.

/// Empty for a window that nothing is known of.
DialogProperties GetDialogProperties(const std::string& inDialogID);
/// Merges what is given into the map and into the registry's text, of which nothing else is touched: geometry
/// only when it is set, and those trees. What is as it was is not written.
void SetDialogProperties(const std::string& inDialogID, const DialogProperties& inProperties);

/// Reads the registry now, in the place of what is known. For tests, and processes that outlive a registry.
void ForgetUIProperties();

}  // namespace ZOCL
