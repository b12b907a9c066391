// The view of a tree.
#include "ostuiqt/detail/TreeWidget.h"

#include <algorithm>
#include <map>

#include <QtCore/QScopedValueRollback>
#include <QtGui/QGuiApplication>
#include <QtGui/QKeyEvent>
#include <QtWidgets/QHeaderView>
#include <QtWidgets/QScrollBar>
#include <QtWidgets/QStyledItemDelegate>
#include <QtWidgets/QTreeView>

#include "ostuiqt/detail/Text.h"

namespace ZOClientQt {
namespace detail {

using ostui::Control;
using ostui::Dialog;
using ostui::Tree;
using ostui::TreeColumn;
using ostui::TreeRow;

namespace {

/// Trees up to this size open with all that is in them to be seen.
constexpr std::size_t kMostRowsExpanded = 1000;
constexpr std::size_t kRowsMeasured = 100;
constexpr int kCellPadding = 24;
constexpr int kIconRoom = 28;
constexpr int kNarrowest = 64;
constexpr int kWidest = 320;
constexpr int kFewestRowsShown = 4;
constexpr int kMostRowsShown = 12;
constexpr int kRowPadding = 8;

/// Enter opens a row, and is not the default button's then.
class View final : public QTreeView {
public:
    using QTreeView::QTreeView;

    /// As large as its columns and its first rows.
    QSize sizeHint() const override {
        const int rows = std::clamp(model() ? model()->rowCount({}) : 0, kFewestRowsShown, kMostRowsShown);
        const int frame = 2 * frameWidth();
        return {header()->length() + frame + verticalScrollBar()->sizeHint().width(),
                header()->sizeHint().height() + rows * (fontMetrics().height() + kRowPadding) + frame};
    }

private:
    void keyPressEvent(QKeyEvent* inEvent) override {
        const bool isEnter = inEvent->key() == Qt::Key_Return || inEvent->key() == Qt::Key_Enter;
        const bool isPlain = (inEvent->modifiers() & ~Qt::KeypadModifier) == Qt::NoModifier;
        if (!isEnter) {
            QTreeView::keyPressEvent(inEvent);
        } else if (isPlain && currentIndex().isValid()) {
            inEvent->accept();
            Q_EMIT activated(currentIndex());
        } else {
            inEvent->ignore();
        }
    }
};

/// Paths and amounts keep their own direction in a window that is read from the right.
class CellDelegate final : public QStyledItemDelegate {
public:
    using QStyledItemDelegate::QStyledItemDelegate;
    QString displayText(const QVariant& inText, const QLocale&) const override {
        constexpr char16_t kLeftToRightMark = 0x200E;
        const QString text = inText.toString();
        return QGuiApplication::isRightToLeft() && !text.isRightToLeft() ? QChar(kLeftToRightMark) + text
                                                                         : text;
    }
};

QAbstractItemView::SelectionMode ToQtMode(Tree::SelectionMode inMode) {
    switch (inMode) {
        case Tree::SelectionMode::kNone:
            return QAbstractItemView::NoSelection;
        case Tree::SelectionMode::kMultiple:
            return QAbstractItemView::ExtendedSelection;
        default:
            return QAbstractItemView::SingleSelection;
    }
}

}  // namespace

TreeWidget::TreeWidget(ControlHost& ioHost, const Control& inControl, QWidget* inParent)
    : ControlWidget(ioHost, inControl),
      mTree(inControl.tree),
      mView(new View(inParent)),
      mModel(new TreeModel(mTree, ioHost.GetIcons())) {
    mModel->setParent(mView);
    mView->setModel(mModel);
    // Heights are asked of one row, not of all.
    mView->setUniformRowHeights(true);
    mView->setAlternatingRowColors(false);
    mView->setAllColumnsShowFocus(true);
    mView->setSelectionBehavior(QAbstractItemView::SelectRows);
    mView->setEditTriggers(QAbstractItemView::NoEditTriggers);
    mView->setHorizontalScrollMode(QAbstractItemView::ScrollPerPixel);
    mView->setTextElideMode(Qt::ElideRight);
    mView->setItemDelegate(new CellDelegate(mView));
    SetWidget(mView);
    ConnectHeader();
    connect(mView->selectionModel(), &QItemSelectionModel::selectionChanged, this,
            [this] { TellSelection(); });
    connect(mView, &QTreeView::activated, this, [this](const QModelIndex& inIndex) {
        Act([tree = mTree, row = TreeModel::GetRow(inIndex)](Dialog&) { tree->Activate(row); });
    });
    connect(mView, &QTreeView::expanded, this,
            [this](const QModelIndex& inIndex) { RememberExpanded(inIndex, true); });
    connect(mView, &QTreeView::collapsed, this,
            [this](const QModelIndex& inIndex) { RememberExpanded(inIndex, false); });
}

void TreeWidget::ConnectHeader() {
    QHeaderView* const header = mView->header();
    header->setSectionsClickable(true);
    header->setSectionsMovable(true);
    header->setFirstSectionMovable(true);
    header->setStretchLastSection(true);
    header->setMinimumSectionSize(kNarrowest / 2);
    header->setSortIndicatorShown(true);
    header->setSortIndicator(-1, Qt::AscendingOrder);
    connect(header, &QHeaderView::sectionClicked, this, [this](int inCell) {
        Act([tree = mTree, id = mModel->GetColumnID(inCell)](Dialog&) { tree->ClickColumn(id); });
    });
    connect(header, &QHeaderView::sectionResized, this, [this, header](int inCell, int, int inWidth) {
        // The last one takes what the others leave.
        if (!mIsUpdating && mView->isVisible() && header->visualIndex(inCell) != header->count() - 1) {
            mTree->SetColumnWidth(mModel->GetColumnID(inCell), inWidth);
        }
    });
    connect(header, &QHeaderView::sectionMoved, this, [this](int inCell) {
        if (!mIsUpdating) {
            TellMovedColumn(inCell);
        }
    });
}

void TreeWidget::UpdateContent(const Control&) {
    const QScopedValueRollback<bool> updating(mIsUpdating, true);
    mView->setSelectionMode(ToQtMode(mTree->GetSelectionMode()));
    const int current = mView->currentIndex().isValid() ? TreeModel::GetRow(mView->currentIndex()) : -1;
    const TreeModel::Change change = mModel->Sync();
    if (!mHasShown || change == TreeModel::Change::kRows) {
        ShowRows();
        ShowColumns();
    } else if (change == TreeModel::Change::kColumns) {
        ShowColumns();
    }
    mHasShown = true;
    ShowSort();
    if (change == TreeModel::Change::kOrder) {
        ExpandRows();
        ShowSelection();
        mView->selectionModel()->setCurrentIndex(mModel->FindRow(current), QItemSelectionModel::NoUpdate);
    } else {
        ShowSelection();
    }
}

void TreeWidget::ShowRows() {
    const std::vector<TreeRow>& rows = mTree->GetRows();
    const bool isFlat = std::all_of(rows.begin(), rows.end(),
                                    [](const TreeRow& inRow) { return inRow.parent == TreeRow::kTopLevel; });
    // A list needs no room for handles.
    mView->setRootIsDecorated(!isFlat);
    ExpandRows();
}

void TreeWidget::ExpandRows() {
    if (!mView->rootIsDecorated()) {
        return;
    }
    const std::vector<TreeRow>& rows = mTree->GetRows();
    const bool isSmall = rows.size() <= kMostRowsExpanded;
    for (std::size_t row = 0; row < rows.size(); ++row) {
        const std::string& id = rows[row].id;
        const bool isWanted = isSmall ? mCollapsed.count(id) == 0 : mExpanded.count(id) > 0;
        if (isWanted && !mTree->GetChildren(static_cast<int>(row)).empty()) {
            mView->expand(mModel->FindRow(static_cast<int>(row)));
        }
    }
}

void TreeWidget::RememberExpanded(const QModelIndex& inIndex, bool inIsExpanded) {
    const auto row = static_cast<std::size_t>(TreeModel::GetRow(inIndex));
    if (!mIsUpdating && row < mTree->GetRows().size()) {
        const std::string& id = mTree->GetRows()[row].id;
        (inIsExpanded ? mExpanded : mCollapsed).insert(id);
        (inIsExpanded ? mCollapsed : mExpanded).erase(id);
    }
}

void TreeWidget::ShowColumns() {
    QHeaderView* const header = mView->header();
    int place = 0;
    for (const TreeColumn& column : mTree->GetColumns()) {
        const int cell = mTree->GetCell(column.id);
        if (cell < 0 || cell >= header->count()) {
            continue;
        }
        header->moveSection(header->visualIndex(cell), place++);
        header->resizeSection(cell, column.width > 0 ? column.width : ChooseWidth(cell));
    }
}

int TreeWidget::ChooseWidth(int inCell) const {
    const QFontMetrics metrics = mView->fontMetrics();
    int width =
        metrics.horizontalAdvance(mModel->headerData(inCell, Qt::Horizontal, Qt::DisplayRole).toString());
    const std::vector<TreeRow>& rows = mTree->GetRows();
    bool hasIcons = false;
    for (std::size_t row = 0; row < std::min(rows.size(), kRowsMeasured); ++row) {
        if (static_cast<std::size_t>(inCell) < rows[row].cells.size()) {
            const QString text = ToQt(rows[row].cells[static_cast<std::size_t>(inCell)]);
            width = std::max(width, metrics.horizontalAdvance(text.left(kWidest)));
        }
        hasIcons = hasIcons || !rows[row].icon.empty();
    }
    width += kCellPadding + (inCell == 0 && hasIcons ? kIconRoom : 0) +
             (inCell == 0 && mView->rootIsDecorated() ? 2 * mView->indentation() : 0);
    return std::clamp(width, kNarrowest, kWidest);
}

void TreeWidget::ShowSort() {
    const int cell = mTree->GetCell(mTree->GetSortColumn());
    mView->header()->setSortIndicator(cell,
                                      mTree->IsSortAscending() ? Qt::AscendingOrder : Qt::DescendingOrder);
}

void TreeWidget::ShowSelection() {
    QItemSelectionModel* const selection = mView->selectionModel();
    std::vector<int> shown;
    for (const QModelIndex& index : selection->selectedRows()) {
        shown.push_back(TreeModel::GetRow(index));
    }
    std::sort(shown.begin(), shown.end());
    if (shown == mTree->GetSelection()) {
        return;
    }
    // Neighbours are selected as one range: a selection of all rows is a single one.
    std::map<int, std::vector<int>> placesByParent;
    for (const int row : mTree->GetSelection()) {
        placesByParent[mTree->GetRows()[static_cast<std::size_t>(row)].parent].push_back(
            mTree->GetPlace(row));
    }
    QItemSelection wanted;
    for (auto& [parent, places] : placesByParent) {
        std::sort(places.begin(), places.end());
        const QModelIndex above = mModel->FindRow(parent);
        for (std::size_t from = 0, to = 0; from < places.size(); from = to) {
            to = from + 1;
            while (to < places.size() && places[to] == places[to - 1] + 1) {
                ++to;
            }
            wanted.append(
                QItemSelectionRange(mModel->index(places[from], 0, above),
                                    mModel->index(places[to - 1], mModel->columnCount({}) - 1, above)));
        }
    }
    selection->select(wanted, QItemSelectionModel::ClearAndSelect);
    if (!mTree->GetSelection().empty()) {
        const QModelIndex first = mModel->FindRow(mTree->GetSelection().front());
        selection->setCurrentIndex(first, QItemSelectionModel::NoUpdate);
        mView->scrollTo(first);
    }
}

void TreeWidget::TellSelection() {
    if (mIsUpdating) {
        return;
    }
    std::vector<int> rows;
    for (const QModelIndex& index : mView->selectionModel()->selectedRows()) {
        rows.push_back(TreeModel::GetRow(index));
    }
    Act([id = GetID(), rows](Dialog& ioDialog) { ioDialog.SelectRows(id, rows); });
}

void TreeWidget::TellMovedColumn(int inCell) {
    mTree->MoveColumn(mModel->GetColumnID(inCell), mView->header()->visualIndex(inCell));
}

}  // namespace detail
}  // namespace ZOClientQt
