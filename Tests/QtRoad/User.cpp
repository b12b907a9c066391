// Clicks and keys.
#include "User.h"

#include <algorithm>

#include <gtest/gtest.h>

#include <QtTest/QtTest>
#include <QtWidgets/QtWidgets>

#include "ostui/Dialog.h"
#include "ZOClientQt/QtBackEnd.h"

namespace {

constexpr int kLongestWait = 20000;

QAbstractButton* FindButton(const QDialog& inWindow, const char* inText) {
    for (QAbstractButton* const button : inWindow.findChildren<QAbstractButton*>()) {
        QString text = button->text();
        if (text.remove(QLatin1Char('&')) == QString::fromUtf8(inText)) {
            return button;
        }
    }
    return nullptr;
}

/// At its indicator: the widget of a radio button can be wider than what of it can be clicked.
void ClickButton(QAbstractButton& ioButton) {
    if (qobject_cast<QRadioButton*>(&ioButton)) {
        QTest::mouseClick(&ioButton, Qt::LeftButton, {}, QPoint(9, ioButton.height() / 2));
    } else {
        QTest::mouseClick(&ioButton, Qt::LeftButton);
    }
}

}  // namespace

User::User() : mQt(ZOClientQt::CreateQtBackEnd(nullptr)) {}

void User::Expect(const std::string& inID, Act inAct) {
    mExpected.emplace_back(inID, std::move(inAct));
}

void User::RunModal(ostui::Dialog& ioDialog) {
    mShown.push_back(ioDialog.GetID() + ": " + ioDialog.GetTitle());
    // In the dialog's own loop, unless that is over before.
    const auto runs = std::make_shared<bool>(true);
    QTimer::singleShot(0, [this, runs, &ioDialog] {
        if (*runs) {
            ComeTo(ioDialog);
        }
    });
    mQt->RunModal(ioDialog);
    *runs = false;
}

void User::ComeTo(ostui::Dialog& ioDialog) {
    const QPointer<QDialog> window = qobject_cast<QDialog*>(QApplication::activeModalWidget());
    ASSERT_TRUE(window && window->objectName().toStdString() == ioDialog.GetID());
    ASSERT_TRUE(QTest::qWaitForWindowActive(window) || !window);
    if (!window || ioDialog.IsClosed() || (first && first(ioDialog))) {
        return;
    }
    const auto found = std::find_if(mExpected.begin(), mExpected.end(), [&](const auto& inExpected) {
        return inExpected.first == ioDialog.GetID();
    });
    if (found != mExpected.end()) {
        const Act act = found->second;
        mExpected.erase(found);
        act(*window);
    }
    // The window is gone when the run is over.
    if (window && !ioDialog.IsClosed() && !ioDialog.ClosesByItself()) {
        ADD_FAILURE() << "nobody closes " << mShown.back();
        window->close();
    }
}

void User::OnControlChanged(ostui::Dialog& ioDialog, const ostui::Control& inControl) {
    mQt->OnControlChanged(ioDialog, inControl);
}

void User::OnDialogChanged(ostui::Dialog& ioDialog) {
    mQt->OnDialogChanged(ioDialog);
}

bool User::IsOver(const QDialog& inWindow) {
    for (const ostui::Dialog* const dialog : ostui::GetRunningDialogs()) {
        if (dialog->GetID() == inWindow.objectName().toStdString()) {
            return dialog->IsClosed();
        }
    }
    return true;
}

void User::Click(QDialog& ioWindow, const char* inButton) {
    const bool isThere = QTest::qWaitFor(
        [&] {
            const QAbstractButton* const button = FindButton(ioWindow, inButton);
            return button && button->isVisible() && button->isEnabled();
        },
        kLongestWait);
    ASSERT_TRUE(isThere) << "the button " << inButton << " cannot be clicked";
    ClickButton(*FindButton(ioWindow, inButton));
}

void User::ClickCell(QDialog& ioWindow, const char* inText, int inColumn) {
    auto* const view = ioWindow.findChild<QTreeView*>();
    ASSERT_NE(view, nullptr);
    const auto find = [&] {
        return view->model()->match(view->model()->index(0, 0), Qt::DisplayRole, QString::fromUtf8(inText), 1,
                                    Qt::MatchExactly | Qt::MatchRecursive);
    };
    ASSERT_TRUE(QTest::qWaitFor([&] { return !find().isEmpty(); }, kLongestWait)) << "no row " << inText;
    const QModelIndex cell = find()[0].siblingAtColumn(inColumn);
    view->scrollTo(cell);
    QTest::mouseClick(view->viewport(), Qt::LeftButton, {}, view->visualRect(cell).center());
}

void User::Type(QDialog& ioWindow, const char* inText) {
    auto* const edit = ioWindow.findChild<QPlainTextEdit*>();
    ASSERT_NE(edit, nullptr);
    ASSERT_TRUE(QTest::qWaitFor([&] { return edit->isVisible() && edit->isEnabled(); }, kLongestWait));
    QTest::mouseClick(edit->viewport(), Qt::LeftButton);
    QTest::keyClicks(edit, QString::fromUtf8(inText));
}

std::vector<std::string> User::Rows(QDialog& ioWindow, int inCount) {
    const auto* const view = ioWindow.findChild<QTreeView*>();
    std::vector<std::string> rows;
    if (!view || !QTest::qWaitFor([&] { return view->model()->rowCount() == inCount; }, kLongestWait)) {
        ADD_FAILURE() << "there are never " << inCount << " rows";
        return rows;
    }
    for (int row = 0; row < inCount; ++row) {
        rows.push_back(view->model()->index(row, 0).data().toString().toStdString());
    }
    return rows;
}
