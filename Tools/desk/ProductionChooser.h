// Lets the user choose one of the productions that the user may see.
#pragma once

#include <QtWidgets/QDialog>
#include <QtWidgets/QLabel>
#include <QtWidgets/QLineEdit>
#include <QtWidgets/QProgressBar>
#include <QtWidgets/QPushButton>
#include <QtWidgets/QTreeWidget>

#include "Workspace.h"

namespace Desk {

class ProductionChooser : public QDialog {
    Q_OBJECT
public:
    ProductionChooser(Workspace& ioWorkspace, QWidget* inParent);

    void done(int inResult) override;

Q_SIGNALS:
    void Chosen(const QString& inProductionID);

private:
    void Load();
    void ShowList(const QString& inError, const std::vector<Workspace::Entry>& inEntries);
    void Filter();
    void UpdateButton();
    void Choose();

    Workspace& mWorkspace;
    QLineEdit* mSearch;
    QTreeWidget* mList;
    QLabel* mMessage;
    QProgressBar* mBar;
    QPushButton* mOpen;
    QPushButton* mRetry;
};

}  // namespace Desk
