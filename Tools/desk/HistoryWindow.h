// The commits that the team has shared: who, when, and with what comment.
#pragma once

#include <vector>

#include <QtWidgets/QDialog>
#include <QtWidgets/QLabel>
#include <QtWidgets/QProgressBar>
#include <QtWidgets/QPushButton>
#include <QtWidgets/QTreeWidget>

#include "Requests.h"
#include "ZOClient/IZOCProductionHistory.h"

namespace Desk {

/// A history can be long: it is loaded page by page, as far as the user looks.
class HistoryWindow : public QDialog {
    Q_OBJECT
public:
    HistoryWindow(const ZOCL::InterfaceRef<ZOCL::IZOCProduction>& inProduction, const QString& inName,
                  QWidget* inParent);

private:
    void LoadPage(const ZOCL::InterfaceRef<ZOCL::IZOCProductionHistory>& inPage);
    void ShowPage(const ZOCL::InterfaceRef<ZOCL::IZOCProductionHistory>& inPage);
    void OnScrolled();
    void ShowDetails();

    const QString mName;
    QTreeWidget* mList;
    QLabel* mDetails;
    QLabel* mState;
    QProgressBar* mBar;
    /// In the order of the rows.
    std::vector<ZOCL::InterfaceRef<ZOCL::IZOCHistoryVersion>> mVersions;
    ZOCL::InterfaceRef<ZOCL::IZOCProductionHistory> mNext;
    Requests mRequests;
};

}  // namespace Desk
