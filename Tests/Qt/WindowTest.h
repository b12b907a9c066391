// Runs a dialog on the Qt back end, with a user played by a function.
#pragma once

#include <gmock/gmock.h>

#include <filesystem>
#include <functional>
#include <string>

#include <QtTest/QtTest>
#include <QtWidgets/QtWidgets>

#include "ostcore/threads/MainThread.h"
#include "ostui/BackEnd.h"
#include "ostui/Dialog.h"
#include "ZOClientQt/QtBackEnd.h"

inline ostui::View MakeView(const std::string& inTag, std::vector<ostui::ViewParameter> inParameters,
                            std::vector<ostui::View> inChildren = {}) {
    ostui::View view;
    view.tag = inTag;
    view.parameters = std::move(inParameters);
    view.children = std::move(inChildren);
    return view;
}

inline std::size_t CountThreads() {
    namespace fs = std::filesystem;
    return static_cast<std::size_t>(
        std::distance(fs::directory_iterator("/proc/self/task"), fs::directory_iterator()));
}

class WindowTest : public testing::Test {
protected:
    using User = std::function<void(QDialog& ioWindow)>;

    WindowTest() : mFormer(ostui::SetBackEnd(ZOClientQt::CreateQtBackEnd(nullptr))) {}
    ~WindowTest() override {
        ostui::SetBackEnd(mFormer);
        ostcore::threads::PumpMainThread();
        // What is only to be deleted later is gone after this.
        QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
        QStringList left;
        for (const QWidget* const widget : QApplication::topLevelWidgets()) {
            left << QLatin1String(widget->metaObject()->className()) + QLatin1Char(' ') +
                        widget->objectName();
        }
        EXPECT_TRUE(left.isEmpty()) << left.join(QLatin1String(", ")).toStdString();
        EXPECT_EQ(CountThreads(), mThreads);
    }

    /// Runs the dialog; the user acts once the window is on the screen. One that is still open afterwards is
    /// a failure. Gives the response.
    int Run(ostui::Dialog& ioDialog, const User& inUser) {
        bool hasActed = false;
        ioDialog.SetOnOpened([&] {
            auto* const window = qobject_cast<QDialog*>(QApplication::activeModalWidget());
            ASSERT_NE(window, nullptr);
            ASSERT_TRUE(QTest::qWaitForWindowActive(window));
            hasActed = true;
            inUser(*window);
            if (!ioDialog.IsClosed()) {
                ADD_FAILURE() << ioDialog.GetID() << " is still open after its user has done everything";
                ioDialog.Close(ostui::kResponseNone);
            }
        });
        const int response = ioDialog.RunModal();
        EXPECT_TRUE(hasActed);
        return response;
    }

    template <class Widget>
    static Widget* FindOnly(const QWidget& inWindow) {
        const QList<Widget*> found = inWindow.findChildren<Widget*>();
        EXPECT_EQ(found.size(), 1);
        return found.isEmpty() ? nullptr : found.front();
    }
    /// By what it reads without its mnemonic.
    static QAbstractButton* FindButton(const QWidget& inWindow, const QString& inText) {
        for (QAbstractButton* const button : inWindow.findChildren<QAbstractButton*>()) {
            QString text = button->text();
            if (text.remove(QLatin1Char('&')) == inText) {
                return button;
            }
        }
        ADD_FAILURE() << "no button " << inText.toStdString();
        return nullptr;
    }
    static void Click(QWidget* inWidget) { QTest::mouseClick(inWidget, Qt::LeftButton); }
    static void ClickButton(const QWidget& inWindow, const char* inText) {
        if (QAbstractButton* const button = FindButton(inWindow, QString::fromUtf8(inText))) {
            Click(button);
        }
    }

private:
    const std::size_t mThreads = CountThreads();
    ostcore::shared_ptr<ostui::BackEnd> mFormer;
};
