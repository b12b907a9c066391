// Lays the page out.
#include "MessagePage.h"

#include <QtWidgets/QPushButton>
#include <QtWidgets/QVBoxLayout>

#include "Icons.h"

namespace Desk {

MessagePage::MessagePage(QWidget* inParent)
    : QWidget(inParent),
      mIcon(new QLabel),
      mTitle(new QLabel),
      mText(new QLabel),
      mBar(new QProgressBar),
      mButtons(new QHBoxLayout) {
    QFont font = mTitle->font();
    font.setPointSizeF(font.pointSizeF() * 1.4);
    font.setBold(true);
    mTitle->setFont(font);
    mTitle->setObjectName(QStringLiteral("messageTitle"));
    mText->setObjectName(QStringLiteral("messageText"));
    for (QLabel* const label : {mTitle, mText}) {
        label->setTextFormat(Qt::PlainText);
        label->setAlignment(Qt::AlignCenter);
        label->setWordWrap(true);
        label->setMinimumWidth(420);
    }
    mBar->setRange(0, 0);
    mBar->setTextVisible(false);
    mBar->setFixedWidth(240);
    mButtons->setSpacing(10);
    auto* const layout = new QVBoxLayout(this);
    layout->setSpacing(14);
    layout->addStretch(2);
    for (QWidget* const widget : {static_cast<QWidget*>(mIcon), static_cast<QWidget*>(mTitle),
                                  static_cast<QWidget*>(mText), static_cast<QWidget*>(mBar)}) {
        layout->addWidget(widget, 0, Qt::AlignHCenter);
    }
    layout->addLayout(mButtons);
    layout->setAlignment(mButtons, Qt::AlignHCenter);
    layout->addStretch(3);
}

void MessagePage::Show(const char* inIcon, const QString& inTitle, const QString& inText, Bar inBar,
                       const std::vector<Button>& inButtons) {
    mIcon->setPixmap(GetIcon(inIcon).pixmap(QSize(48, 48), devicePixelRatioF()));
    mTitle->setText(inTitle);
    mText->setText(inText);
    mText->setVisible(!inText.isEmpty());
    mBar->setVisible(inBar == Bar::kRunning);
    while (QLayoutItem* const item = mButtons->takeAt(0)) {
        // One of them may be what led here.
        item->widget()->hide();
        item->widget()->deleteLater();
        delete item;
    }
    for (const Button& button : inButtons) {
        auto* const widget = new QPushButton(button.text);
        connect(widget, &QPushButton::clicked, this, button.action);
        mButtons->addWidget(widget);
    }
}

}  // namespace Desk
