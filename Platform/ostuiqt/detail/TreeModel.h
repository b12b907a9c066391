// Shows Qt a tree without a copy of its rows.
#pragma once

#include <vector>

#include <QtCore/QAbstractItemModel>

#include "ostui/Tree.h"

namespace ZOClientQt {
namespace detail {

class Icons;

/// The column of an index is the number of the cell that it shows, whatever the order of the columns; its
/// internal identifier is the number of the row in the tree's list. The tree changes on its own: Sync brings
/// the model after it, before Qt gets to run again.
class TreeModel final : public QAbstractItemModel {
public:
    TreeModel(const ostcore::shared_ptr<ostui::Tree>& inTree, Icons& ioIcons);

    enum class Change { kNothing, kColumns, kOrder, kRows };
    /// Tells the views what has become of the tree since the last call.
    Change Sync();
    /// The index of a row, invalid when there is none of that number.
    QModelIndex FindRow(int inRow) const;
    static int GetRow(const QModelIndex& inIndex) { return static_cast<int>(inIndex.internalId()); }
    /// The identifier of the column that shows a cell; empty when there is none.
    std::string GetColumnID(int inCell) const;

    QModelIndex index(int inPlace, int inCell, const QModelIndex& inParent) const override;
    QModelIndex parent(const QModelIndex& inIndex) const override;
    int rowCount(const QModelIndex& inParent) const override;
    int columnCount(const QModelIndex&) const override { return static_cast<int>(mTitles.size()); }
    bool hasChildren(const QModelIndex& inParent) const override;
    Qt::ItemFlags flags(const QModelIndex& inIndex) const override;
    QVariant data(const QModelIndex& inIndex, int inRole) const override;
    QVariant headerData(int inCell, Qt::Orientation inOrientation, int inRole) const override;

private:
    /// What tells one list of rows, and one order, from another.
    struct State {
        std::uint64_t revision = 0;
        std::uint64_t rows = 0;
        std::string sortColumn;
        bool isAscending = true;
    };
    State ReadState() const;
    void ReadTitles();
    const ostui::TreeRow* Find(const QModelIndex& inIndex) const;

    const ostcore::shared_ptr<ostui::Tree> mTree;
    Icons& mIcons;
    State mState;
    /// By cell.
    std::vector<QString> mTitles;
};

}  // namespace detail
}  // namespace ZOClientQt
