// Windows of Qt alone.
#include "BareWindows.h"

#include <algorithm>

#include <QtCore/QAbstractTableModel>
#include <QtWidgets/QHeaderView>
#include <QtWidgets/QLabel>
#include <QtWidgets/QPlainTextEdit>
#include <QtWidgets/QPushButton>
#include <QtWidgets/QTreeWidget>
#include <QtWidgets/QVBoxLayout>

namespace {

QStringList Titles() {
    return {QStringLiteral("Name"), QStringLiteral("Action"), QStringLiteral("Path")};
}

QTreeWidget* MakeTreeWidget(const Rows& inRows, QWidget* inParent) {
    auto* const tree = new QTreeWidget(inParent);
    tree->setHeaderLabels(Titles());
    tree->setUniformRowHeights(true);
    tree->setRootIsDecorated(false);
    QList<QTreeWidgetItem*> items;
    items.reserve(static_cast<qsizetype>(inRows.size()));
    for (const QStringList& row : inRows) {
        items.push_back(new QTreeWidgetItem(row));
    }
    tree->addTopLevelItems(items);
    tree->setSortingEnabled(true);
    return tree;
}

class ListModel final : public QAbstractTableModel {
public:
    ListModel(const Rows& inRows, QObject* inParent) : QAbstractTableModel(inParent), mRows(inRows) {}

    int rowCount(const QModelIndex& inParent) const override {
        return inParent.isValid() ? 0 : static_cast<int>(mRows.size());
    }
    int columnCount(const QModelIndex&) const override { return 3; }
    QVariant data(const QModelIndex& inIndex, int inRole) const override {
        return inRole == Qt::DisplayRole ? mRows[static_cast<std::size_t>(inIndex.row())][inIndex.column()]
                                         : QVariant();
    }
    QVariant headerData(int inColumn, Qt::Orientation, int inRole) const override {
        return inRole == Qt::DisplayRole ? Titles()[inColumn] : QVariant();
    }
    void sort(int inColumn, Qt::SortOrder inOrder) override {
        if (inColumn < 0) {
            return;
        }
        Q_EMIT layoutAboutToBeChanged({}, VerticalSortHint);
        std::stable_sort(mRows.begin(), mRows.end(), [&](const QStringList& inA, const QStringList& inB) {
            return inOrder == Qt::AscendingOrder ? inA[inColumn] < inB[inColumn]
                                                 : inB[inColumn] < inA[inColumn];
        });
        Q_EMIT layoutChanged({}, VerticalSortHint);
    }

private:
    Rows mRows;
};

}  // namespace

BareShareWindow::BareShareWindow(const Rows& inRows) {
    auto* const column = new QVBoxLayout(this);
    column->addWidget(MakeTreeWidget(inRows, this));
    column->addWidget(new QLabel(QStringLiteral("Comment:"), this));
    column->addWidget(new QPlainTextEdit(this));
    auto* const row = new QHBoxLayout;
    row->addStretch(1);
    row->addWidget(new QPushButton(QStringLiteral("Share"), this));
    row->addWidget(new QPushButton(QStringLiteral("Cancel"), this));
    column->addLayout(row);
}

BareTreeWidgetWindow::BareTreeWidgetWindow(const Rows& inRows) {
    auto* const column = new QVBoxLayout(this);
    column->addWidget(MakeTreeWidget(inRows, this));
}

BareModelWindow::BareModelWindow(const Rows& inRows) {
    auto* const column = new QVBoxLayout(this);
    auto* const view = new QTreeView(this);
    view->setUniformRowHeights(true);
    view->setRootIsDecorated(false);
    view->setModel(new ListModel(inRows, view));
    view->setSortingEnabled(true);
    column->addWidget(view);
}
