// A tree with columns in a window of the library: makes its columns from their texts, and keeps how its user
// has set them.
#pragma once

#include <vector>

#include "Dialogs/UIProperties.h"
#include "ostui/Tree.h"

namespace ZOCL {

/// Main thread.
class ZOMultiColumnTree {
public:
    explicit ZOMultiColumnTree(const shared_ptr<ostui::Tree>& inTree) : mTree(inTree) {}

    /// Each is a text with its key, "$$$/.../Col_Name=Name"; the identifier of the column is the last part of
    /// the key. The rows are sorted by the first one.
    void SetColumns(const std::vector<const char*>& inTexts);
    /// Columns that are not known, and numbers that make no sense for these, have no effect.
    void ApplyAllColumnProperties(const TreeProperties& inProperties);
    TreeProperties StoreAllColumnProperties() const;

private:
    const shared_ptr<ostui::Tree> mTree;
};

}  // namespace ZOCL
