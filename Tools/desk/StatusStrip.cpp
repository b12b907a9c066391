// Puts the flags of the sandbox into words.
#include "StatusStrip.h"

#include <QtGui/QIcon>
#include <QtWidgets/QHBoxLayout>

#include "Icons.h"
#include "Text.h"

namespace Desk {

/// An icon and a text that belong together.
class StatusStrip::Item : public QWidget {
public:
    Item(const char* inObjectName, QWidget* inParent)
        : QWidget(inParent), mIcon(new QLabel), mText(new QLabel) {
        setObjectName(QLatin1String(inObjectName));
        mText->setTextFormat(Qt::PlainText);
        auto* const layout = new QHBoxLayout(this);
        layout->setContentsMargins(0, 0, 16, 0);
        layout->setSpacing(6);
        layout->addWidget(mIcon);
        layout->addWidget(mText);
        hide();
    }
    /// The text is what a screen reader says, and the icon never says anything alone.
    void Show(const char* inIcon, const QString& inText) {
        mIcon->setPixmap(GetIcon(inIcon).pixmap(QSize(16, 16), devicePixelRatioF()));
        mText->setText(inText);
        setAccessibleName(inText);
        show();
    }

private:
    QLabel* const mIcon;
    QLabel* const mText;
};

StatusStrip::StatusStrip(QWidget* inParent)
    : QWidget(inParent), mText(new QLabel), mBar(new QProgressBar), mCancel(new QToolButton) {
    auto* const layout = new QHBoxLayout(this);
    layout->setContentsMargins(12, 6, 12, 6);
    layout->setSpacing(0);
    mWork = AddItem("statusWork");
    mTeam = AddItem("statusTeam");
    mConflicts = AddItem("statusConflicts");
    mNetwork = AddItem("statusNetwork");
    layout->addStretch(1);
    mText->setObjectName(QStringLiteral("statusText"));
    mText->setTextFormat(Qt::PlainText);
    mBar->setRange(0, 0);
    mBar->setFixedWidth(110);
    mBar->setTextVisible(false);
    mBar->setAccessibleName(Text("$$$/ZODesk/Status/Progress=Progress"));
    mCancel->setObjectName(QStringLiteral("statusCancel"));
    mCancel->setText(Text("$$$/ZODesk/Cancel=Cancel"));
    mCancel->setAutoRaise(true);
    layout->addWidget(mText);
    layout->addSpacing(10);
    layout->addWidget(mBar);
    layout->addWidget(mCancel);
    connect(mCancel, &QToolButton::clicked, this, &StatusStrip::CancelPressed);
    // The window stays as it is when the button comes and goes.
    setFixedHeight(mCancel->sizeHint().height() + 12);
    ShowBusy(QString());
}

StatusStrip::Item* StatusStrip::AddItem(const char* inObjectName) {
    auto* const item = new Item(inObjectName, this);
    layout()->addWidget(item);
    return item;
}

void StatusStrip::ShowSandbox(const ZOCL::shared_ptr<ZOCL::ZOSandbox>& inSandbox) {
    if (!inSandbox) {
        mWork->hide();
        mTeam->hide();
        mConflicts->hide();
        return;
    }
    // What is uncertain is not told as if it were so.
    if (inSandbox->IsDirtyStateUncertain()) {
        mWork->Show("SP_Waiting_Sm", Text("$$$/ZODesk/Status/CheckingWork=Checking your changes..."));
    } else if (inSandbox->IsDirty()) {
        mWork->Show("SP_ArrowNext_Sm", Text("$$$/ZODesk/Status/Dirty=You have changes to share"));
    } else {
        mWork->Show("SP_Compatible_Sm", Text("$$$/ZODesk/Status/Clean=Nothing to share"));
    }
    if (inSandbox->IsSyncStateUncertain()) {
        mTeam->Show("SP_Waiting_Sm", Text("$$$/ZODesk/Status/CheckingTeam=Looking for new changes..."));
    } else if (inSandbox->IsInSync()) {
        mTeam->Show("SP_Compatible_Sm", Text("$$$/ZODesk/Status/InSync=Up to date"));
    } else {
        mTeam->Show("SP_ArrowPrevious_Sm",
                    Text("$$$/ZODesk/Status/Behind=The team has shared something newer"));
    }
    if (inSandbox->HasConflicts()) {
        mConflicts->Show("SP_IncompatibleAlert_Sm", Text("$$$/ZODesk/Status/Conflicts=Conflicts to resolve"));
    } else {
        mConflicts->hide();
    }
}

void StatusStrip::ShowNetwork(bool inIsDown) {
    if (inIsDown) {
        mNetwork->Show("SP_ServerOffline_Sm",
                       Text("$$$/ZODesk/Status/Offline=Offline: waiting for the server"));
    } else {
        mNetwork->hide();
    }
}

void StatusStrip::ShowBusy(const QString& inWhat) {
    mBar->setVisible(!inWhat.isEmpty());
    mCancel->setVisible(!inWhat.isEmpty());
    mText->setText(inWhat);
}

void StatusStrip::Tell(const QString& inText) {
    if (!mBar->isVisible()) {
        mText->setText(inText);
    }
}

}  // namespace Desk
