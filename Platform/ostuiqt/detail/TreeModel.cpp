// The model over a tree.
#include "ostuiqt/detail/TreeModel.h"

#include <QtGui/QGuiApplication>

#include "ostuiqt/detail/Icons.h"
#include "ostuiqt/detail/Text.h"

namespace ZOClientQt {
namespace detail {

using ostui::TreeColumn;
using ostui::TreeRow;

TreeModel::TreeModel(const ostcore::shared_ptr<ostui::Tree>& inTree, Icons& ioIcons)
    : mTree(inTree), mIcons(ioIcons), mState(ReadState()) {
    ReadTitles();
}

TreeModel::State TreeModel::ReadState() const {
    return {mTree->GetRevision(), mTree->GetRowsRevision(), mTree->GetSortColumn(), mTree->IsSortAscending()};
}

void TreeModel::ReadTitles() {
    mTitles.assign(mTree->GetColumns().size(), QString());
    for (const TreeColumn& column : mTree->GetColumns()) {
        const int cell = mTree->GetCell(column.id);
        if (cell >= 0 && cell < static_cast<int>(mTitles.size())) {
            mTitles[static_cast<std::size_t>(cell)] = ToQt(column.title);
        }
    }
}

TreeModel::Change TreeModel::Sync() {
    const State was = mState;
    const State is = ReadState();
    if (is.revision == was.revision) {
        return Change::kNothing;
    }
    if (is.rows != was.rows || mTree->GetColumns().size() != mTitles.size()) {
        beginResetModel();
        mState = is;
        ReadTitles();
        endResetModel();
        return Change::kRows;
    }
    if (is.sortColumn != was.sortColumn || is.isAscending != was.isAscending) {
        // No change of layout: views would ask for places as they were, and the tree has new ones already.
        beginResetModel();
        mState = is;
        endResetModel();
        return Change::kOrder;
    }
    mState = is;
    ReadTitles();
    if (!mTitles.empty()) {
        Q_EMIT headerDataChanged(Qt::Horizontal, 0, columnCount({}) - 1);
    }
    return Change::kColumns;
}

QModelIndex TreeModel::FindRow(int inRow) const {
    const bool exists = inRow >= 0 && inRow < static_cast<int>(mTree->GetRows().size()) && !mTitles.empty();
    return exists ? createIndex(mTree->GetPlace(inRow), 0, static_cast<quintptr>(inRow)) : QModelIndex();
}

std::string TreeModel::GetColumnID(int inCell) const {
    for (const TreeColumn& column : mTree->GetColumns()) {
        if (mTree->GetCell(column.id) == inCell) {
            return column.id;
        }
    }
    return {};
}

const TreeRow* TreeModel::Find(const QModelIndex& inIndex) const {
    const std::vector<TreeRow>& rows = mTree->GetRows();
    const bool exists = inIndex.isValid() && inIndex.internalId() < rows.size();
    return exists ? &rows[inIndex.internalId()] : nullptr;
}

QModelIndex TreeModel::index(int inPlace, int inCell, const QModelIndex& inParent) const {
    const std::vector<int>& children =
        mTree->GetChildren(inParent.isValid() ? GetRow(inParent) : TreeRow::kTopLevel);
    if (inPlace < 0 || inPlace >= static_cast<int>(children.size()) || inCell < 0 ||
        inCell >= static_cast<int>(mTitles.size())) {
        return {};
    }
    return createIndex(inPlace, inCell, static_cast<quintptr>(children[static_cast<std::size_t>(inPlace)]));
}

QModelIndex TreeModel::parent(const QModelIndex& inIndex) const {
    const TreeRow* const row = Find(inIndex);
    return row && row->parent != TreeRow::kTopLevel ? FindRow(row->parent) : QModelIndex();
}

int TreeModel::rowCount(const QModelIndex& inParent) const {
    if (inParent.column() > 0) {
        return 0;
    }
    return static_cast<int>(
        mTree->GetChildren(inParent.isValid() ? GetRow(inParent) : TreeRow::kTopLevel).size());
}

bool TreeModel::hasChildren(const QModelIndex& inParent) const {
    return rowCount(inParent) > 0;
}

Qt::ItemFlags TreeModel::flags(const QModelIndex& inIndex) const {
    return Find(inIndex) ? Qt::ItemIsEnabled | Qt::ItemIsSelectable : Qt::NoItemFlags;
}

QVariant TreeModel::data(const QModelIndex& inIndex, int inRole) const {
    const TreeRow* const row = Find(inIndex);
    if (!row) {
        return {};
    }
    const auto cell = static_cast<std::size_t>(inIndex.column());
    switch (inRole) {
        case Qt::DisplayRole:
            return cell < row->cells.size() ? ToQt(row->cells[cell]) : QString();
        case Qt::DecorationRole:
            return cell == 0 && !row->icon.empty() ? QVariant(mIcons.Get(row->icon)) : QVariant();
        case Qt::ToolTipRole:
            return ToTip(row->tooltip);
        default:
            return {};
    }
}

QVariant TreeModel::headerData(int inCell, Qt::Orientation inOrientation, int inRole) const {
    const bool exists = inCell >= 0 && inCell < static_cast<int>(mTitles.size());
    if (inOrientation != Qt::Horizontal || !exists) {
        return {};
    }
    if (inRole == Qt::TextAlignmentRole) {
        // Heads do not follow the direction of their own accord.
        const Qt::Alignment leading = QGuiApplication::isRightToLeft() ? Qt::AlignRight : Qt::AlignLeft;
        return QVariant::fromValue(leading | Qt::AlignAbsolute | Qt::AlignVCenter);
    }
    return inRole == Qt::DisplayRole ? QVariant(mTitles[static_cast<std::size_t>(inCell)]) : QVariant();
}

}  // namespace detail
}  // namespace ZOClientQt
