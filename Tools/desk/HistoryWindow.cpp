// Loads and shows the pages of a history.
#include "HistoryWindow.h"

#include <QtCore/QDateTime>
#include <QtCore/QLocale>
#include <QtWidgets/QDialogButtonBox>
#include <QtWidgets/QHeaderView>
#include <QtWidgets/QScrollBar>
#include <QtWidgets/QVBoxLayout>

#include "Icons.h"
#include "Text.h"

namespace Desk {
namespace {

/// In the form and the zone of the user.
QString ToLocalText(const ZOCL::ptime& inTime) {
    if (inTime.is_special()) {
        return {};
    }
    const ZOCL::ptime epoch(boost::gregorian::date(1970, 1, 1));
    const auto time = QDateTime::fromMSecsSinceEpoch((inTime - epoch).total_milliseconds());
    return QLocale().toString(time, QLocale::ShortFormat);
}

}  // namespace

HistoryWindow::HistoryWindow(const ZOCL::InterfaceRef<ZOCL::IZOCProduction>& inProduction,
                             const QString& inName, QWidget* inParent)
    : QDialog(inParent),
      mName(inName),
      mList(new QTreeWidget),
      mDetails(new QLabel),
      mState(new QLabel),
      mBar(new QProgressBar) {
    setObjectName(QStringLiteral("historyWindow"));
    setWindowTitle(Text("$$$/ZODesk/History/Title=History of \"@0\"", {inName}));
    setAttribute(Qt::WA_DeleteOnClose);
    mList->setHeaderLabels({Text("$$$/ZODesk/History/When=When"), Text("$$$/ZODesk/History/Who=Who"),
                            Text("$$$/ZODesk/History/Comment=Comment")});
    mList->setRootIsDecorated(false);
    mList->setUniformRowHeights(true);
    mList->setAccessibleName(Text("$$$/ZODesk/History/Commits=Shared commits"));
    mDetails->setTextFormat(Qt::PlainText);
    mDetails->setWordWrap(true);
    mDetails->setTextInteractionFlags(Qt::TextSelectableByMouse | Qt::TextSelectableByKeyboard);
    mState->setTextFormat(Qt::PlainText);
    mBar->setRange(0, 0);
    mBar->setTextVisible(false);
    auto* const buttons = new QDialogButtonBox;
    buttons->addButton(Text("$$$/ZODesk/Close=Close"), QDialogButtonBox::RejectRole);
    auto* const layout = new QVBoxLayout(this);
    layout->setContentsMargins(16, 16, 16, 16);
    layout->setSpacing(12);
    layout->addWidget(mList, 1);
    layout->addWidget(mState);
    layout->addWidget(mBar);
    layout->addWidget(mDetails);
    layout->addWidget(buttons);
    connect(buttons, &QDialogButtonBox::rejected, this, &QDialog::reject);
    connect(mList, &QTreeWidget::currentItemChanged, this, &HistoryWindow::ShowDetails);
    connect(mList->verticalScrollBar(), &QScrollBar::valueChanged, this, &HistoryWindow::OnScrolled);
    resize(720, 460);
    LoadPage(inProduction->GetProductionHistory());
}

void HistoryWindow::LoadPage(const ZOCL::InterfaceRef<ZOCL::IZOCProductionHistory>& inPage) {
    mNext.Reset();
    mState->hide();
    mBar->show();
    mRequests.Load(inPage, [this, inPage](const Outcome& inOutcome) {
        mBar->hide();
        if (inOutcome.Succeeded()) {
            ShowPage(inPage);
            return;
        }
        mState->setText(DescribeResult(inOutcome.result));
        mState->show();
    });
}

void HistoryWindow::ShowPage(const ZOCL::InterfaceRef<ZOCL::IZOCProductionHistory>& inPage) {
    for (int index = 0; index < inPage->GetHistoryVersionCount(); ++index) {
        const auto version = inPage->GetHistoryVersion(index);
        ZOCL::UString date, user, title, message, revision;
        version->GetInfo(date, user, title, message, revision);
        auto* const row =
            new QTreeWidgetItem({ToLocalText(version->GetTime()), ToQt(user), ToQt(message).simplified()});
        row->setIcon(0, GetIcon("History"));
        row->setToolTip(2, ToTip(ToQt(message)));
        mVersions.push_back(version);
        mList->addTopLevelItem(row);
    }
    mList->resizeColumnToContents(0);
    mList->resizeColumnToContents(1);
    mNext = inPage->GetNextPage();
    if (mVersions.empty()) {
        mState->setText(Text("$$$/ZODesk/History/Empty=Nothing has been shared yet."));
        mState->show();
    } else if (!mList->currentItem()) {
        mList->setCurrentItem(mList->topLevelItem(0));
    }
    OnScrolled();
}

void HistoryWindow::OnScrolled() {
    const QScrollBar& bar = *mList->verticalScrollBar();
    if (mNext && bar.value() >= bar.maximum()) {
        LoadPage(ZOCL::InterfaceRef<ZOCL::IZOCProductionHistory>(mNext));
    }
}

void HistoryWindow::ShowDetails() {
    const int row = mList->indexOfTopLevelItem(mList->currentItem());
    mDetails->setText(row < 0
                          ? QString()
                          : ToQt(mVersions[static_cast<std::size_t>(row)]->GetToolTipString(FromQt(mName))));
}

}  // namespace Desk
