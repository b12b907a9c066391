// A multi-column tree as its user sees it: selection, columns, order.
#pragma once

#include <set>

#include "ostuiqt/detail/ControlWidget.h"
#include "ostuiqt/detail/TreeModel.h"

class QTreeView;

namespace ZOClientQt {
namespace detail {

class TreeWidget final : public ControlWidget {
public:
    TreeWidget(ControlHost& ioHost, const ostui::Control& inControl, QWidget* inParent);
    bool IsTall() const override { return true; }

private:
    bool HasVisibleLabel() const override { return false; }
    void UpdateContent(const ostui::Control& inControl) override;
    void ConnectHeader();
    void ShowRows();
    void ExpandRows();
    void RememberExpanded(const QModelIndex& inIndex, bool inIsExpanded);
    void ShowColumns();
    void ShowSort();
    void ShowSelection();
    int ChooseWidth(int inCell) const;
    void TellSelection();
    void TellMovedColumn(int inCell);

    const ostcore::shared_ptr<ostui::Tree> mTree;
    QTreeView* const mView;
    TreeModel* const mModel;
    /// Rows that the user has opened or shut, which stay so when rows are replaced.
    std::set<std::string> mExpanded;
    std::set<std::string> mCollapsed;
    /// While what the tree has is shown, what Qt reports is not the user's doing.
    bool mIsUpdating = false;
    bool mHasShown = false;
};

}  // namespace detail
}  // namespace ZOClientQt
