// The content of a multi-column tree control: columns, rows, their order and the selection. Sorting is done
// here, once for all back ends.
#pragma once

#include <cstdint>
#include <set>
#include <string>
#include <vector>

#include "ostcore/Export.h"
#include "ostcore/Types.h"

namespace ostui {

using ostcore::function;
using ostcore::U8String;

struct TreeColumn {
    /// Names it in the stored properties; stays the same in every language.
    std::string id;
    U8String title;
    /// In pixels of a display at 96 dpi; 0 leaves it to the back end.
    int width = 0;
};

struct TreeRow {
    static constexpr int kTopLevel = -1;

    /// What its owner knows it by; need not be shown. Unique in the tree.
    std::string id;
    /// One a column; missing ones are empty.
    std::vector<U8String> cells;
    /// The name of an icon ("SP_Folder_Sm") before the first cell; empty is none.
    std::string icon;
    U8String tooltip;
    /// The index of the row that holds it, which stands before it in the list of rows; kTopLevel for none.
    int parent = kTopLevel;
};

/// Rows are addressed by their index in the list that SetRows was given. Main thread only.
class ZOPLATFORM_EXPORT Tree {
public:
    // --- The logic's side.

    void SetColumns(std::vector<TreeColumn> inColumns);
    /// Clears the selection, except rows whose identifier is in both lists. Keeps the sort. A parent that
    /// does not stand before its row counts as kTopLevel.
    void SetRows(std::vector<TreeRow> inRows);
    /// Takes rows away, with the rows below them.
    void RemoveRows(const std::set<std::string>& inIDs);
    /// No selection, one row, or several. One row at first.
    enum class SelectionMode { kNone, kSingle, kMultiple };
    void SetSelectionMode(SelectionMode inMode);
    /// Called after the selection has changed, by user or logic; may change the tree in turn. A row that is
    /// selected still, at another index, is no change.
    void SetOnSelectionChanged(function<void()> inFunction);
    /// Called when a row is opened: a double click, or the enter key.
    void SetOnActivated(function<void(int inRow)> inFunction);

    const std::vector<TreeColumn>& GetColumns() const noexcept { return mColumns; }
    const std::vector<TreeRow>& GetRows() const noexcept { return mRows; }
    SelectionMode GetSelectionMode() const noexcept { return mSelectionMode; }
    /// Ascending by index.
    const std::vector<int>& GetSelection() const noexcept { return mSelection; }
    std::vector<std::string> GetSelectedIDs() const;

    // --- The order. Texts are compared by their case-folded form with runs of digits as numbers; equal rows
    // stay in the order of the list.

    /// An unknown or empty identifier: the order of the list.
    void SetSort(const std::string& inColumnID, bool inIsAscending);
    /// What a click on a column's head does: ascending at first, a second click flips the direction.
    void ClickColumn(const std::string& inColumnID);
    const std::string& GetSortColumn() const noexcept { return mSortColumn; }
    bool IsSortAscending() const noexcept { return mIsSortAscending; }
    /// The rows below a row, or kTopLevel's, in the order in which they are shown. Valid until the rows or
    /// the sort change.
    const std::vector<int>& GetChildren(int inRow) const;
    /// All rows from top to bottom, the rows below a row right after it.
    std::vector<int> GetRowsInOrder() const;
    /// The place of a row among those of its parent; -1 when there is no such row.
    int GetPlace(int inRow) const;

    // --- The back end's side.

    /// In the place of what was selected. False, without effect, when a row does not exist or the mode does
    /// not allow it.
    bool Select(const std::vector<int>& inRows);
    void Activate(int inRow);
    /// Widths and places of columns: neither the revision changes nor is anybody told.
    void SetColumnWidth(const std::string& inColumnID, int inWidth);
    /// Moves a column to a place of its own; GetColumns gives them in that order, cells keep theirs.
    void MoveColumn(const std::string& inColumnID, int inPlace);
    /// The index of the cell that a column shows; -1 when there is no such column.
    int GetCell(const std::string& inColumnID) const;
    /// Changes with rows, columns, sort and selection mode, so that a back end sees what to show anew.
    std::uint64_t GetRevision() const noexcept { return mRevision; }
    /// Changes when other rows take the place of those that were there.
    std::uint64_t GetRowsRevision() const noexcept { return mRowsRevision; }
    /// Called after each change of what the revision tells and of the selection, whoever made it; set by the
    /// dialog that holds the tree.
    void SetOnChanged(function<void()> inFunction);

private:
    void SortAll() const;
    void ReplaceRows(std::vector<TreeRow> inRows);
    void Touch();
    void TellBackEnd();
    void TellSelection();

    std::vector<TreeColumn> mColumns;
    std::vector<std::string> mCellOrder;
    std::vector<TreeRow> mRows;
    std::vector<int> mSelection;
    SelectionMode mSelectionMode = SelectionMode::kSingle;
    std::string mSortColumn;
    bool mIsSortAscending = true;
    /// By row + 1; made when first asked for after a change.
    mutable std::vector<std::vector<int>> mChildren;
    mutable std::vector<int> mPlaces;
    mutable bool mIsOrderKnown = false;
    std::uint64_t mRevision = 0;
    std::uint64_t mRowsRevision = 0;
    function<void()> mOnSelectionChanged;
    function<void(int)> mOnActivated;
    function<void()> mOnChanged;
};

}  // namespace ostui
