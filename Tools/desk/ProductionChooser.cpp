// Lists and filters the productions.
#include "ProductionChooser.h"

#include <QtWidgets/QDialogButtonBox>
#include <QtWidgets/QHeaderView>
#include <QtWidgets/QVBoxLayout>

#include "Icons.h"
#include "Text.h"

namespace Desk {

ProductionChooser::ProductionChooser(Workspace& ioWorkspace, QWidget* inParent)
    : QDialog(inParent),
      mWorkspace(ioWorkspace),
      mSearch(new QLineEdit),
      mList(new QTreeWidget),
      mMessage(new QLabel),
      mBar(new QProgressBar),
      mOpen(new QPushButton(Text("$$$/ZODesk/Choose/Open=&Open"))),
      mRetry(new QPushButton(Text("$$$/ZODesk/Retry=Try &Again"))) {
    setObjectName(QStringLiteral("productionWindow"));
    setWindowTitle(Text("$$$/ZODesk/Choose/Title=Open Production"));
    setWindowModality(Qt::WindowModal);
    mSearch->setObjectName(QStringLiteral("search"));
    mSearch->setPlaceholderText(Text("$$$/ZODesk/Choose/Search=Search productions"));
    mSearch->setAccessibleName(mSearch->placeholderText());
    mSearch->setClearButtonEnabled(true);
    mList->setObjectName(QStringLiteral("productions"));
    mList->setHeaderLabels({Text("$$$/ZODesk/Choose/Production=Production"),
                            Text("$$$/ZODesk/Choose/Owner=Owner"),
                            Text("$$$/ZODesk/Choose/Description=Description")});
    mList->setRootIsDecorated(false);
    mList->setAccessibleName(Text("$$$/ZODesk/Choose/List=Productions"));
    mMessage->setTextFormat(Qt::PlainText);
    mMessage->setWordWrap(true);
    mBar->setRange(0, 0);
    mBar->setTextVisible(false);
    mOpen->setObjectName(QStringLiteral("open"));
    auto* const buttons = new QDialogButtonBox;
    buttons->addButton(mOpen, QDialogButtonBox::AcceptRole);
    buttons->addButton(mRetry, QDialogButtonBox::ActionRole);
    mRetry->setAutoDefault(false);
    buttons->addButton(Text("$$$/ZODesk/Cancel=Cancel"), QDialogButtonBox::RejectRole)->setAutoDefault(false);
    auto* const layout = new QVBoxLayout(this);
    layout->setContentsMargins(16, 16, 16, 16);
    layout->setSpacing(12);
    layout->addWidget(mSearch);
    layout->addWidget(mList, 1);
    layout->addWidget(mMessage);
    layout->addWidget(mBar);
    layout->addWidget(buttons);
    mOpen->setDefault(true);
    resize(560, 400);
    connect(mSearch, &QLineEdit::textChanged, this, &ProductionChooser::Filter);
    connect(mList, &QTreeWidget::itemSelectionChanged, this, &ProductionChooser::UpdateButton);
    connect(mList, &QTreeWidget::itemActivated, this, &ProductionChooser::Choose);
    connect(mRetry, &QPushButton::clicked, this, &ProductionChooser::Load);
    connect(buttons, &QDialogButtonBox::accepted, this, &ProductionChooser::Choose);
    connect(buttons, &QDialogButtonBox::rejected, this, &QDialog::reject);
    Load();
}

void ProductionChooser::Load() {
    mMessage->hide();
    mRetry->hide();
    mBar->show();
    mList->clear();
    UpdateButton();
    mWorkspace.ListProductions(
        [this](const QString& inError, const std::vector<Workspace::Entry>& inEntries) {
            ShowList(inError, inEntries);
        });
}

void ProductionChooser::ShowList(const QString& inError, const std::vector<Workspace::Entry>& inEntries) {
    mBar->hide();
    mRetry->setVisible(!inError.isEmpty());
    const QString none = Text("$$$/ZODesk/Choose/None=There is no production that you may see.");
    mMessage->setText(!inError.isEmpty() ? inError : none);
    mMessage->setVisible(!inError.isEmpty() || inEntries.empty());
    for (const Workspace::Entry& entry : inEntries) {
        auto* const row = new QTreeWidgetItem({entry.name, entry.owner, entry.description.simplified()});
        row->setIcon(0, GetIcon("SP_Production_Sm"));
        row->setData(0, Qt::UserRole, entry.id);
        mList->addTopLevelItem(row);
    }
    mList->sortItems(0, Qt::AscendingOrder);
    mList->resizeColumnToContents(0);
    Filter();
    mList->setFocus();
}

void ProductionChooser::Filter() {
    QTreeWidgetItem* first = nullptr;
    for (int index = 0; index < mList->topLevelItemCount(); ++index) {
        QTreeWidgetItem* const row = mList->topLevelItem(index);
        row->setHidden(!row->text(0).contains(mSearch->text(), Qt::CaseInsensitive));
        first = !first && !row->isHidden() ? row : first;
    }
    QTreeWidgetItem* const current = mList->currentItem();
    if (!current || current->isHidden()) {
        mList->setCurrentItem(first);
    }
    UpdateButton();
}

void ProductionChooser::UpdateButton() {
    mOpen->setEnabled(!mList->selectedItems().isEmpty());
}

void ProductionChooser::Choose() {
    const QList<QTreeWidgetItem*> chosen = mList->selectedItems();
    if (!chosen.isEmpty()) {
        const QString id = chosen.front()->data(0, Qt::UserRole).toString();
        accept();
        Q_EMIT Chosen(id);
    }
}

void ProductionChooser::done(int inResult) {
    mWorkspace.CancelListing();
    QDialog::done(inResult);
}

}  // namespace Desk
