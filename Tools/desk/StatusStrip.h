// The line at the foot of the window: how the user's work stands to what the team shares.
#pragma once

#include <QtWidgets/QLabel>
#include <QtWidgets/QProgressBar>
#include <QtWidgets/QToolButton>
#include <QtWidgets/QWidget>

#include "ZOClient/ZOSandbox.h"

namespace Desk {

class StatusStrip : public QWidget {
    Q_OBJECT
public:
    explicit StatusStrip(QWidget* inParent = nullptr);

    /// Null: nothing is open.
    void ShowSandbox(const ZOCL::shared_ptr<ZOCL::ZOSandbox>& inSandbox);
    void ShowNetwork(bool inIsDown);
    /// What is being loaded, with a bar and a way to stop it; empty when nothing is.
    void ShowBusy(const QString& inWhat);
    /// A short word, until something else is to be said.
    void Tell(const QString& inText);

Q_SIGNALS:
    void CancelPressed();

private:
    class Item;
    Item* AddItem(const char* inObjectName);

    Item* mWork;
    Item* mTeam;
    Item* mConflicts;
    Item* mNetwork;
    QLabel* mText;
    QProgressBar* mBar;
    QToolButton* mCancel;
};

}  // namespace Desk
