// What the keyboard does in a window.
#include "WindowTest.h"

namespace {

using ostui::Dialog;
using ostui::View;
using testing::ElementsAre;

class KeyboardTest : public WindowTest {
protected:
    static View MakeForm() {
        return MakeView(
            "ost_dialog", {{"name", "Form"}},
            {MakeView("row", {},
                      {MakeView("ost_text_edit", {{"identifier", "first"}, {"label", "Name:"}}),
                       MakeView("ost_button", {{"identifier", "browse"}, {"name", "Browse"}})}),
             MakeView("ost_static_text", {{"identifier", "commentLabel"}, {"name", "Comment:"}}),
             MakeView("ost_text_edit",
                      {{"identifier", "comment"}, {"multiLine", "true"}, {"setAsFocused", "true"}}),
             MakeView("ost_checkbox", {{"identifier", "check"}, {"name", "Notify"}}),
             MakeView("ost_ok_cancel_row", {{"okText", "Share"}})});
    }
    static std::string NameOf(const QWidget* inWidget) {
        const auto* const button = qobject_cast<const QAbstractButton*>(inWidget);
        return (button ? button->text().remove(QLatin1Char('&')) : inWidget->accessibleName()).toStdString();
    }
};

TEST_F(KeyboardTest, TabGoesThroughTheControlsAsTheyStandFromTheFocusedOneOn) {
    Dialog dialog("Form", MakeForm());
    std::vector<std::string> order;
    Run(dialog, [&](QDialog& ioWindow) {
        for (int i = 0; i < 6; ++i) {
            order.push_back(NameOf(ioWindow.focusWidget()));
            QTest::keyClick(ioWindow.focusWidget(), Qt::Key_Tab);
        }
        EXPECT_EQ(NameOf(ioWindow.focusWidget()), "Comment");
        dialog.Close(1);
    });
    EXPECT_THAT(order, ElementsAre("Comment", "Notify", "Share", "Cancel", "Name", "Browse"));
}

TEST_F(KeyboardTest, EnterAndEscapePressTheirButtons) {
    struct Case {
        const char* focus;
        Qt::Key key;
        Qt::KeyboardModifiers modifiers;
        int response;
    };
    const Case cases[] = {
        {"Name", Qt::Key_Return, Qt::NoModifier, ostui::kResponseOK},
        {"Name", Qt::Key_Enter, Qt::KeypadModifier, ostui::kResponseOK},
        {"Notify", Qt::Key_Return, Qt::NoModifier, ostui::kResponseOK},
        {"Cancel", Qt::Key_Return, Qt::NoModifier, ostui::kResponseCancel},
        {"Comment", Qt::Key_Return, Qt::ControlModifier, ostui::kResponseOK},
        {"Comment", Qt::Key_Escape, Qt::NoModifier, ostui::kResponseCancel},
    };
    for (const Case& one : cases) {
        Dialog dialog("Form", MakeForm());
        EXPECT_EQ(Run(dialog,
                      [&](QDialog& ioWindow) {
                          QWidget* at = ioWindow.focusWidget();
                          for (int i = 0; i < 6 && NameOf(at) != one.focus; ++i) {
                              QTest::keyClick(at, Qt::Key_Tab);
                              at = ioWindow.focusWidget();
                          }
                          ASSERT_EQ(NameOf(at), one.focus);
                          QTest::keyClick(at, one.key, one.modifiers);
                      }),
                  one.response)
            << one.focus << " " << one.key;
    }
}

TEST_F(KeyboardTest, EnterDoesNothingWhileTheDefaultButtonCannotBePressed) {
    Dialog dialog("Form", MakeForm());
    dialog.SetEnabled("okButton", false);
    Run(dialog, [&](QDialog& ioWindow) {
        auto* const edit = FindOnly<QLineEdit>(ioWindow);
        QTest::keyClick(edit, Qt::Key_Return);
        EXPECT_FALSE(dialog.IsClosed());
        dialog.SetVisible("okButton", false);
        QTest::keyClick(edit, Qt::Key_Return);
        EXPECT_FALSE(dialog.IsClosed());
        dialog.SetVisible("okButton", true);
        dialog.SetEnabled("okButton", true);
        QTest::keyClick(edit, Qt::Key_Return);
    });
}

TEST_F(KeyboardTest, LettersLeadToControlsAndFollowTextsThatChange) {
    Dialog dialog("Form", MakeForm());
    int presses = 0;
    dialog.SetHandler("browse", [&] { ++presses; });
    Run(dialog, [&](QDialog& ioWindow) {
        auto* const comment = FindOnly<QPlainTextEdit>(ioWindow);
        QTest::keyClick(&ioWindow, Qt::Key_N, Qt::AltModifier);
        EXPECT_EQ(NameOf(ioWindow.focusWidget()), "Name");
        QTest::keyClick(&ioWindow, Qt::Key_C, Qt::AltModifier);
        EXPECT_EQ(ioWindow.focusWidget(), comment);
        QTest::keyClick(&ioWindow, Qt::Key_B, Qt::AltModifier);
        // A button that is pressed by its letter is seen to go down first.
        EXPECT_TRUE(QTest::qWaitFor([&] { return presses == 1; }));
        dialog.SetText("browse", "Look");
        QTest::keyClick(&ioWindow, Qt::Key_L, Qt::AltModifier);
        EXPECT_TRUE(QTest::qWaitFor([&] { return presses == 2; }));
        dialog.Close(1);
    });
}

TEST_F(KeyboardTest, ScreenReadersHearWhatIsWhat) {
    View form = MakeForm();
    form.children.push_back(
        MakeView("ost_multi_column_tree", {{"identifier", "tree"}, {"label", "Changes"}}));
    form.children.push_back(
        MakeView("ost_picture_button",
                 {{"identifier", "add"}, {"image", "SP_Add_Sm"}, {"name", "Add"}, {"tooltip", "Adds one"}}));
    Dialog dialog("Form", form);
    Run(dialog, [&](QDialog& ioWindow) {
        EXPECT_EQ(FindOnly<QPlainTextEdit>(ioWindow)->accessibleName(), QStringLiteral("Comment"));
        EXPECT_EQ(FindOnly<QTreeView>(ioWindow)->accessibleName(), QStringLiteral("Changes"));
        const auto* const add = FindOnly<QToolButton>(ioWindow);
        EXPECT_EQ(add->accessibleName(), QStringLiteral("Add"));
        EXPECT_EQ(add->accessibleDescription(), QStringLiteral("Adds one"));
        dialog.Close(1);
    });
}

}  // namespace
