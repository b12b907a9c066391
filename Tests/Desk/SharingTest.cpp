// The workflows, pressed in the window and carried out in the library's windows.
#include "DeskTest.h"

namespace Desk {
namespace {

using testing::HasSubstr;

class SharingTest : public DeskTest {
protected:
    void Share(const char* inComment) {
        InNextWindow([inComment](QDialog& ioWindow) {
            const auto comments = ioWindow.findChildren<QPlainTextEdit*>();
            if (comments.isEmpty() || !comments.front()->isVisible()) {
                return false;
            }
            comments.front()->setFocus();
            QTest::keyClicks(comments.front(), QString::fromUtf8(inComment));
            return Press(ioWindow, "Share");
        });
        Click(Find(Window(), "shareButton"));
        WaitForStatus("statusWork", "Nothing to share");
    }
};

TEST_F(SharingTest, SharingMakesACommitThatAllSeeAndThatHistoryShows) {
    OpenDesk();
    EXPECT_FALSE(Find(Window(), "shareButton")->isEnabled());
    EXPECT_FALSE(Find(Window(), "latestButton")->isEnabled());
    EXPECT_FALSE(Find(Window(), "resolveButton")->isEnabled());
    EditTitle("Shared title");
    QTest::keyClick(WaitForField("title"), Qt::Key_Return);
    WaitForStatus("statusWork", "You have changes to share");
    Share("Titles checked");
    EXPECT_EQ(Status("statusTeam"), QStringLiteral("Up to date"));
    SignInZo();
    EXPECT_THAT(Zo({"xmp", "get", "slate.png", "--shared"}).text, HasSubstr("Shared title"));
    EXPECT_THAT(Zo({"history", "--shared"}).text, HasSubstr("Titles checked"));

    Click(Find(Window(), "historyButton"));
    QDialog& history = *FindTop<QDialog>("historyWindow");
    auto* const list = history.findChild<QTreeWidget*>();
    WaitFor("the commits", [&] { return list->topLevelItemCount() > 1; });
    EXPECT_EQ(list->topLevelItem(0)->text(2), QStringLiteral("Titles checked"));
    EXPECT_EQ(list->topLevelItem(0)->text(1), QStringLiteral("anna"));
    EXPECT_FALSE(list->topLevelItem(0)->text(0).isEmpty());
}

TEST_F(SharingTest, WhatOthersShareIsNoticedMergedAndResolved) {
    OpenDesk();
    EditTitle("Mine");
    QTest::keyClick(WaitForField("title"), Qt::Key_Return);
    WaitForStatus("statusWork", "You have changes to share");
    SignInZo("otto");
    EditElsewhere("otto", "Slate of the second day.", "Theirs");
    ASSERT_EQ(ZoOf("otto", {"share", "-m", "Theirs"}).code, 0);

    // Other properties of one packet merge by themselves.
    WaitForStatus("statusTeam", "The team has shared something newer");
    Click(Find(Window(), "latestButton"));
    WaitForStatus("statusTeam", "Up to date");
    WaitFor("their text in the pane", [&] {
        const auto* const field = Window().findChild<QPlainTextEdit*>(QStringLiteral("description"));
        return field && field->toPlainText() == QStringLiteral("Theirs");
    });
    EXPECT_EQ(WaitForField("title")->text(), QStringLiteral("Mine"));
    EXPECT_EQ(Status("statusConflicts"), QString());

    // The same property does not: the user decides, in the library's window.
    EditElsewhere("otto", "<rdf:li xml:lang=\"x-default\">Slate</rdf:li>",
                  "<rdf:li xml:lang=\"x-default\">Otto's slate</rdf:li>");
    ASSERT_EQ(ZoOf("otto", {"share", "-m", "Otto's title"}).code, 0);
    WaitForStatus("statusTeam", "The team has shared something newer");
    InNextWindow(
        [](QDialog& ioWindow) { return FindButton(ioWindow, "Resolve") && Press(ioWindow, "Cancel"); });
    Click(Find(Window(), "latestButton"));
    WaitForStatus("statusConflicts", "Conflicts to resolve");
    EXPECT_EQ(WaitForField("title")->text(), QStringLiteral("Mine"));
    InNextWindow([](QDialog& ioWindow) {
        auto* const conflicts = ioWindow.findChild<QTreeView*>();
        if (!conflicts || !conflicts->isVisible() || conflicts->model()->rowCount() == 0) {
            return false;
        }
        QTest::mouseClick(conflicts->viewport(), Qt::LeftButton, {},
                          conflicts->visualRect(conflicts->model()->index(0, 0)).center());
        return Press(ioWindow, "Resolve");
    });
    InNextWindow([](QDialog& ioWindow) { return Press(ioWindow, "OK"); });
    Click(Find(Window(), "resolveButton"));
    WaitForStatus("statusConflicts", "");
    WaitFor("the shared title",
            [&] { return WaitForField("title")->text() == QStringLiteral("Otto's slate"); });
}

}  // namespace
}  // namespace Desk
