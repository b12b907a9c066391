// Rows, their order and the selection.
#include "ostui/Tree.h"

#include <algorithm>
#include <string_view>
#include <unordered_set>

#include "ostui/detail/SortKey.h"

namespace ostui {
namespace {

/// The key of a row and its first bytes as a number, which settle most comparisons.
struct Keyed {
    std::uint64_t head = 0;
    std::string_view key;
    int row = 0;
};

std::uint64_t HeadOf(std::string_view inKey) noexcept {
    std::uint64_t head = 0;
    for (std::size_t i = 0; i < sizeof(head); ++i) {
        head = (head << 8) | (i < inKey.size() ? static_cast<unsigned char>(inKey[i]) : 0u);
    }
    return head;
}

int Compare(const Keyed& inLeft, const Keyed& inRight) noexcept {
    if (inLeft.head != inRight.head) {
        return inLeft.head < inRight.head ? -1 : 1;
    }
    return inLeft.key.compare(inRight.key);
}

/// The indices of the rows by the text of a cell; rows with equal texts by their index, in both directions.
std::vector<int> OrderByCell(const std::vector<TreeRow>& inRows, std::size_t inCell, bool inIsAscending) {
    std::string keys;
    std::vector<std::size_t> ends;
    ends.reserve(inRows.size());
    for (const TreeRow& row : inRows) {
        if (inCell < row.cells.size()) {
            detail::AppendSortKey(row.cells[inCell], keys);
        }
        ends.push_back(keys.size());
    }
    std::vector<Keyed> order;
    order.reserve(inRows.size());
    std::size_t begin = 0;
    for (const std::size_t end : ends) {
        const std::string_view key = std::string_view(keys).substr(begin, end - begin);
        order.push_back({HeadOf(key), key, static_cast<int>(order.size())});
        begin = end;
    }
    std::sort(order.begin(), order.end(), [&](const Keyed& inLeft, const Keyed& inRight) {
        const int compared = Compare(inLeft, inRight);
        return compared == 0 ? inLeft.row < inRight.row : (compared < 0) == inIsAscending;
    });
    std::vector<int> rows;
    rows.reserve(order.size());
    for (const Keyed& keyed : order) {
        rows.push_back(keyed.row);
    }
    return rows;
}

}  // namespace

void Tree::SetColumns(std::vector<TreeColumn> inColumns) {
    mColumns = std::move(inColumns);
    mCellOrder.clear();
    for (const TreeColumn& column : mColumns) {
        mCellOrder.push_back(column.id);
    }
    Touch();
}

void Tree::SetRows(std::vector<TreeRow> inRows) {
    for (std::size_t row = 0; row < inRows.size(); ++row) {
        int& parent = inRows[row].parent;
        if (parent < 0 || parent >= static_cast<int>(row)) {
            parent = TreeRow::kTopLevel;
        }
    }
    ReplaceRows(std::move(inRows));
}

void Tree::RemoveRows(const std::set<std::string>& inIDs) {
    constexpr int kGone = -2;
    std::vector<int> newIndices;
    newIndices.reserve(mRows.size());
    int count = 0;
    for (const TreeRow& row : mRows) {
        const bool isTop = row.parent == TreeRow::kTopLevel;
        const bool isBelow = !isTop && newIndices[static_cast<std::size_t>(row.parent)] == kGone;
        newIndices.push_back(isBelow || inIDs.count(row.id) > 0 ? kGone : count++);
    }
    if (count == static_cast<int>(mRows.size())) {
        return;
    }
    std::vector<TreeRow> kept;
    kept.reserve(static_cast<std::size_t>(count));
    for (std::size_t row = 0; row < mRows.size(); ++row) {
        if (newIndices[row] != kGone) {
            kept.push_back(mRows[row]);
            int& parent = kept.back().parent;
            parent = parent == TreeRow::kTopLevel ? parent : newIndices[static_cast<std::size_t>(parent)];
        }
    }
    ReplaceRows(std::move(kept));
}

void Tree::ReplaceRows(std::vector<TreeRow> inRows) {
    const std::vector<std::string> selected = GetSelectedIDs();
    std::unordered_set<std::string_view> wanted(selected.begin(), selected.end());
    mRows = std::move(inRows);
    ++mRowsRevision;
    mSelection.clear();
    for (std::size_t row = 0; row < mRows.size() && !wanted.empty(); ++row) {
        if (wanted.erase(mRows[row].id) > 0) {
            mSelection.push_back(static_cast<int>(row));
        }
    }
    const bool isSelectionChanged = !wanted.empty();
    Touch();
    if (isSelectionChanged) {
        TellSelection();
    }
}

void Tree::SetSelectionMode(SelectionMode inMode) {
    if (inMode == mSelectionMode) {
        return;
    }
    mSelectionMode = inMode;
    const std::size_t most = inMode == SelectionMode::kNone     ? 0
                             : inMode == SelectionMode::kSingle ? 1
                                                                : mRows.size();
    const bool isSelectionChanged = mSelection.size() > most;
    mSelection.resize(std::min(mSelection.size(), most));
    Touch();
    if (isSelectionChanged) {
        TellSelection();
    }
}

void Tree::SetOnSelectionChanged(function<void()> inFunction) {
    mOnSelectionChanged.swap(inFunction);
}

void Tree::SetOnActivated(function<void(int inRow)> inFunction) {
    mOnActivated.swap(inFunction);
}

void Tree::SetOnChanged(function<void()> inFunction) {
    mOnChanged.swap(inFunction);
}

std::vector<std::string> Tree::GetSelectedIDs() const {
    std::vector<std::string> ids;
    for (const int row : mSelection) {
        ids.push_back(mRows[static_cast<std::size_t>(row)].id);
    }
    return ids;
}

void Tree::SetSort(const std::string& inColumnID, bool inIsAscending) {
    if (inColumnID != mSortColumn || inIsAscending != mIsSortAscending) {
        mSortColumn = inColumnID;
        mIsSortAscending = inIsAscending;
        Touch();
    }
}

void Tree::ClickColumn(const std::string& inColumnID) {
    if (GetCell(inColumnID) >= 0) {
        SetSort(inColumnID, inColumnID == mSortColumn ? !mIsSortAscending : true);
    }
}

const std::vector<int>& Tree::GetChildren(int inRow) const {
    static const std::vector<int> kNone;
    SortAll();
    const bool exists = inRow >= TreeRow::kTopLevel && inRow < static_cast<int>(mRows.size());
    return exists ? mChildren[static_cast<std::size_t>(inRow + 1)] : kNone;
}

std::vector<int> Tree::GetRowsInOrder() const {
    std::vector<int> rows;
    rows.reserve(mRows.size());
    // What is still to come, the next one last.
    std::vector<int> pending(GetChildren(TreeRow::kTopLevel).rbegin(),
                             GetChildren(TreeRow::kTopLevel).rend());
    while (!pending.empty()) {
        const int row = pending.back();
        pending.pop_back();
        rows.push_back(row);
        const std::vector<int>& children = GetChildren(row);
        pending.insert(pending.end(), children.rbegin(), children.rend());
    }
    return rows;
}

int Tree::GetPlace(int inRow) const {
    SortAll();
    const bool exists = inRow >= 0 && inRow < static_cast<int>(mRows.size());
    return exists ? mPlaces[static_cast<std::size_t>(inRow)] : -1;
}

void Tree::SortAll() const {
    if (mIsOrderKnown) {
        return;
    }
    const int cell = GetCell(mSortColumn);
    std::vector<int> order;
    if (cell >= 0) {
        order = OrderByCell(mRows, static_cast<std::size_t>(cell), mIsSortAscending);
    } else {
        order.resize(mRows.size());
        for (std::size_t row = 0; row < order.size(); ++row) {
            order[row] = static_cast<int>(row);
        }
    }
    mChildren.assign(mRows.size() + 1, {});
    mPlaces.assign(mRows.size(), 0);
    for (const int row : order) {
        std::vector<int>& siblings =
            mChildren[static_cast<std::size_t>(mRows[static_cast<std::size_t>(row)].parent + 1)];
        mPlaces[static_cast<std::size_t>(row)] = static_cast<int>(siblings.size());
        siblings.push_back(row);
    }
    mIsOrderKnown = true;
}

bool Tree::Select(const std::vector<int>& inRows) {
    std::vector<int> rows = inRows;
    std::sort(rows.begin(), rows.end());
    rows.erase(std::unique(rows.begin(), rows.end()), rows.end());
    const bool exist = rows.empty() || (rows.front() >= 0 && rows.back() < static_cast<int>(mRows.size()));
    const bool isAllowed = rows.empty() || mSelectionMode == SelectionMode::kMultiple ||
                           (mSelectionMode == SelectionMode::kSingle && rows.size() == 1);
    if (!exist || !isAllowed) {
        return false;
    }
    if (rows != mSelection) {
        mSelection = std::move(rows);
        TellBackEnd();
        TellSelection();
    }
    return true;
}

void Tree::Activate(int inRow) {
    const function<void(int)> onActivated = mOnActivated;
    if (onActivated && inRow >= 0 && inRow < static_cast<int>(mRows.size())) {
        onActivated(inRow);
    }
}

void Tree::SetColumnWidth(const std::string& inColumnID, int inWidth) {
    for (TreeColumn& column : mColumns) {
        if (column.id == inColumnID) {
            column.width = std::max(inWidth, 0);
            return;
        }
    }
}

void Tree::MoveColumn(const std::string& inColumnID, int inPlace) {
    const auto found = std::find_if(mColumns.begin(), mColumns.end(),
                                    [&](const TreeColumn& inColumn) { return inColumn.id == inColumnID; });
    if (found == mColumns.end()) {
        return;
    }
    const auto to = mColumns.begin() + std::clamp(inPlace, 0, static_cast<int>(mColumns.size()) - 1);
    if (found < to) {
        std::rotate(found, found + 1, to + 1);
    } else {
        std::rotate(to, found, found + 1);
    }
}

int Tree::GetCell(const std::string& inColumnID) const {
    const auto found = std::find(mCellOrder.begin(), mCellOrder.end(), inColumnID);
    return found == mCellOrder.end() ? -1 : static_cast<int>(found - mCellOrder.begin());
}

void Tree::Touch() {
    ++mRevision;
    mIsOrderKnown = false;
    TellBackEnd();
}

void Tree::TellBackEnd() {
    const function<void()> onChanged = mOnChanged;
    if (onChanged) {
        onChanged();
    }
}

void Tree::TellSelection() {
    const function<void()> onSelectionChanged = mOnSelectionChanged;
    if (onSelectionChanged) {
        onSelectionChanged();
    }
}

}  // namespace ostui
