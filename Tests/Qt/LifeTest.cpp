// How windows begin and end.
#include <thread>

#include "WindowTest.h"

namespace {

using ostui::Dialog;

class LifeTest : public WindowTest {
protected:
    static void AddOK(Dialog& ioDialog) {
        ioDialog.AddStaticText("text", "Some words");
        ioDialog.AddButton("ok", "OK", ostui::kResponseOK);
        ioDialog.SetDefaultButton("ok");
    }
};

TEST_F(LifeTest, AnyThreadClosesItAndTheFirstCloseCounts) {
    for (int round = 0; round < 50; ++round) {
        Dialog dialog("Wait", "Wait");
        dialog.AddProgressBar("bar");
        dialog.SetClosesByItself();
        std::thread first;
        std::thread second;
        dialog.SetOnOpened([&] {
            first = std::thread([&] { dialog.Close(41); });
            second = std::thread([&] { dialog.Close(42); });
        });
        EXPECT_THAT(dialog.RunModal(), testing::AnyOf(41, 42));
        first.join();
        second.join();
    }
}

TEST_F(LifeTest, OneThatClosesByItselfIsNotLeftByEscapeNorByTheClosingBox) {
    Dialog dialog("Wait", "Wait");
    int presses = 0;
    dialog.AddButton("cancel", "Cancel", [&] { ++presses; });
    dialog.SetCancelButton("cancel");
    dialog.SetClosesByItself();
    Run(dialog, [&](QDialog& ioWindow) {
        QTest::keyClick(&ioWindow, Qt::Key_Escape);
        EXPECT_FALSE(ioWindow.close());
        EXPECT_TRUE(ioWindow.isVisible());
        EXPECT_EQ(presses, 2);
        dialog.Close(1);
    });
}

TEST_F(LifeTest, TheClosingBoxIsTheCancelButton) {
    Dialog dialog("Ask", "Ask");
    dialog.AddButton("no", "No", 17);
    dialog.SetCancelButton("no");
    EXPECT_EQ(Run(dialog, [](QDialog& ioWindow) { ioWindow.close(); }), 17);
}

TEST_F(LifeTest, AHandlerRunsDialogsOfItsOwnAndEitherMayCloseFirst) {
    for (const bool outerFirst : {false, true}) {
        Dialog outer("Outer", "Outer");
        AddOK(outer);
        int innerResponse = 0;
        outer.AddButton("more", "More", [&] {
            Dialog inner("Inner", "Inner");
            AddOK(inner);
            innerResponse = Run(inner, [&](QDialog& ioWindow) {
                EXPECT_EQ(QApplication::activeModalWidget(), &ioWindow);
                EXPECT_NE(ioWindow.parentWidget(), nullptr);
                EXPECT_EQ(ostui::GetRunningDialogs().size(), 2u);
                if (outerFirst) {
                    outer.Close(33);
                    QCoreApplication::processEvents();
                    EXPECT_TRUE(ioWindow.isVisible());
                }
                QTest::keyClick(&ioWindow, Qt::Key_Return);
            });
            outer.Close(5);
        });
        EXPECT_EQ(Run(outer, [](QDialog& ioWindow) { ClickButton(ioWindow, "More"); }), outerFirst ? 33 : 5);
        EXPECT_EQ(innerResponse, ostui::kResponseOK);
    }
}

TEST_F(LifeTest, ADialogMayRunAgainAndOneThatWasClosedBeforeIsNotShown) {
    Dialog dialog("Again", "Again");
    AddOK(dialog);
    dialog.Close(9);
    EXPECT_EQ(dialog.RunModal(), 9);
    for (int round = 0; round < 2; ++round) {
        EXPECT_EQ(Run(dialog, [](QDialog& ioWindow) { ClickButton(ioWindow, "OK"); }), ostui::kResponseOK);
    }
}

TEST_F(LifeTest, AParentThatGoesTakesTheWindowAlongAndDismissesTheDialog) {
    for (const bool fromHandler : {false, true}) {
        auto host = std::make_unique<QWidget>();
        host->show();
        const auto former = ostui::SetBackEnd(ZOClientQt::CreateQtBackEnd(host.get()));
        Dialog dialog("Orphan", "Orphan");
        dialog.AddButton("leave", "Leave", [&] { host.reset(); });
        dialog.SetOnOpened([&] {
            if (fromHandler) {
                FindOnly<QPushButton>(*QApplication::activeModalWidget())->click();
            } else {
                host.reset();
            }
        });
        EXPECT_EQ(dialog.RunModal(), ostui::kResponseCancel);
        EXPECT_EQ(host, nullptr);
        ostui::SetBackEnd(former);
    }
}

TEST_F(LifeTest, WhatAHandlerThrowsComesOutOfTheRun) {
    Dialog dialog("Throw", "Throw");
    dialog.AddButton("bad", "Bad", [] { throw std::runtime_error("no good"); });
    dialog.SetOnOpened([] { ClickButton(*QApplication::activeModalWidget(), "Bad"); });
    EXPECT_THROW(dialog.RunModal(), std::runtime_error);
    EXPECT_TRUE(ostui::GetRunningDialogs().empty());
}

TEST_F(LifeTest, TheEndOfTheApplicationDismisses) {
    Dialog dialog("Quit", "Quit");
    AddOK(dialog);
    QTimer::singleShot(0, [&] {
        dialog.SetOnOpened([] { QCoreApplication::quit(); });
        EXPECT_EQ(dialog.RunModal(), ostui::kResponseCancel);
    });
    QCoreApplication::exec();
}

TEST_F(LifeTest, AWindowComesBackWhereItWasButNeverOffTheScreen) {
    using ostui::Geometry;
    const ostui::View view = MakeView("ost_dialog", {{"canResize", "true"}, {"minWidth", "300"}},
                                      {MakeView("ost_cancel_row", {})});
    const QRect screen = QGuiApplication::primaryScreen()->availableGeometry();
    Dialog dialog("Place", view);
    dialog.SetGeometry(Geometry{40, 50, 420, 240});
    Run(dialog, [&](QDialog& ioWindow) {
        EXPECT_EQ(ioWindow.geometry().size(), QSize(420, 240));
        EXPECT_EQ(ioWindow.pos(), QPoint(40, 50));
        ioWindow.move(60, 70);
        ioWindow.resize(500, 300);
        QCoreApplication::processEvents();
        dialog.Close(1);
    });
    ASSERT_TRUE(dialog.GetGeometry());
    EXPECT_EQ(dialog.GetGeometry()->left, 60);
    EXPECT_EQ(dialog.GetGeometry()->width, 500);
    for (const Geometry& lost :
         {Geometry{9000, 9000, 400, 300}, Geometry{-5000, 10, 1, -7}, Geometry{0, 0, 90000, 90000}}) {
        dialog.SetGeometry(lost);
        Run(dialog, [&](QDialog& ioWindow) {
            EXPECT_TRUE(screen.intersects(ioWindow.frameGeometry()));
            EXPECT_GE(ioWindow.width(), 300);
            EXPECT_LE(ioWindow.width(), screen.width());
            dialog.Close(1);
        });
    }
}

TEST_F(LifeTest, TheTitleFollows) {
    Dialog dialog("Title", "One [*]");
    AddOK(dialog);
    Run(dialog, [&](QDialog& ioWindow) {
        EXPECT_EQ(ioWindow.windowTitle(), QStringLiteral("One [*][*]"));
        dialog.SetTitle("Two");
        EXPECT_EQ(ioWindow.windowTitle(), QStringLiteral("Two"));
        dialog.Close(1);
    });
}

}  // namespace
