// Each kind of control, from the user to the logic and back.
#include "WindowTest.h"

namespace {

using ostui::Control;
using ostui::ControlType;
using ostui::Dialog;
using ostui::View;
using testing::ElementsAre;

class ControlsTest : public WindowTest {
protected:
    /// A window with one control of a layout and a button that closes it.
    static View WindowOf(View inControl) {
        return MakeView(
            "ost_dialog", {{"name", "Test"}},
            {std::move(inControl), MakeView("ost_button", {{"identifier", "done"}, {"name", "Done"}})});
    }
    /// Runs a window of one control; gives what SetOnChanged told, one entry a call.
    std::vector<std::string> RunOne(View inControl, const std::function<void(QDialog&, Dialog&)>& inUser,
                                    const std::function<std::string(Dialog&)>& inState) {
        const std::string id = inControl.GetIdentifier();
        Dialog dialog("Test", WindowOf(std::move(inControl)));
        std::vector<std::string> told;
        dialog.SetHandler("done", [&] { dialog.Close(ostui::kResponseOK); });
        dialog.SetOnChanged(id, [&] { told.push_back(inState(dialog)); });
        EXPECT_EQ(Run(dialog,
                      [&](QDialog& ioWindow) {
                          inUser(ioWindow, dialog);
                          ClickButton(ioWindow, "Done");
                      }),
                  ostui::kResponseOK);
        return told;
    }
    static std::string TextOf(Dialog& inDialog) { return inDialog.GetText("it"); }
    static std::string SelectionOf(Dialog& inDialog) { return std::to_string(inDialog.GetSelection("it")); }
};

TEST_F(ControlsTest, LinesAreTypedAndSetAndKeepTheCursor) {
    for (const char* const tag : {"ost_text_edit", "ost_search_box"}) {
        const auto told = RunOne(
            MakeView(tag, {{"identifier", "it"}, {"label", "Name:"}}),
            [](QDialog& ioWindow, Dialog& ioDialog) {
                auto* const edit = FindOnly<QLineEdit>(ioWindow);
                QTest::keyClicks(edit, QStringLiteral("ac"));
                QTest::keyClick(edit, Qt::Key_Left);
                QTest::keyClicks(edit, QStringLiteral("b"));
                EXPECT_EQ(edit->cursorPosition(), 2);
                EXPECT_EQ(ioDialog.GetText("it"), "abc");
                ioDialog.SetText("it", "über <b>alles</b>");
                EXPECT_EQ(edit->text(), QString::fromUtf8("über <b>alles</b>"));
                ioDialog.SetEnabled("it", false);
                QTest::keyClicks(edit, QStringLiteral("x"));
                EXPECT_EQ(ioDialog.GetText("it"), "über <b>alles</b>");
            },
            &TextOf);
        EXPECT_THAT(told, ElementsAre("a", "ac", "abc")) << tag;
    }
}

TEST_F(ControlsTest, PasswordsAreNotShown) {
    RunOne(
        MakeView("ost_text_edit", {{"identifier", "it"}, {"label", "Password:"}, {"password", "true"}}),
        [](QDialog& ioWindow, Dialog& ioDialog) {
            auto* const edit = FindOnly<QLineEdit>(ioWindow);
            QTest::keyClicks(edit, QStringLiteral("secret"));
            EXPECT_EQ(ioDialog.GetText("it"), "secret");
            EXPECT_FALSE(edit->displayText().contains(QStringLiteral("secret")));
            edit->selectAll();
            edit->copy();
            EXPECT_NE(QGuiApplication::clipboard()->text(), QStringLiteral("secret"));
        },
        &TextOf);
}

TEST_F(ControlsTest, ManyLinesTakeEnterAndWhatIsSetIsNotChangedBySayingItBack) {
    const auto told = RunOne(
        MakeView("ost_text_edit", {{"identifier", "it"}, {"multiLine", "true"}}),
        [](QDialog& ioWindow, Dialog& ioDialog) {
            auto* const edit = FindOnly<QPlainTextEdit>(ioWindow);
            // The edit itself would make plain spaces and line ends of these.
            ioDialog.SetText("it", "a\xC2\xA0z\r\n");
            EXPECT_EQ(ioDialog.GetText("it"), "a\xC2\xA0z\r\n");
            ioDialog.SetText("it", "");
            QTest::keyClicks(edit, QStringLiteral("a"));
            QTest::keyClick(edit, Qt::Key_Return);
            QTest::keyClick(edit, Qt::Key_Tab);
            EXPECT_FALSE(edit->hasFocus());
        },
        &TextOf);
    EXPECT_THAT(told, ElementsAre("a", "a\n"));
}

TEST_F(ControlsTest, PopupsAreChosenByKeyAndTheirItemsReplaced) {
    const auto told = RunOne(
        MakeView(
            "ost_popup", {{"identifier", "it"}, {"label", "Preset:"}},
            {MakeView("ost_popup_item", {{"name", "One"}}), MakeView("ost_popup_item", {{"name", "Two"}})}),
        [](QDialog& ioWindow, Dialog& ioDialog) {
            auto* const box = FindOnly<QComboBox>(ioWindow);
            EXPECT_EQ(box->currentText(), QStringLiteral("One"));
            QTest::keyClick(box, Qt::Key_Down);
            ioDialog.SetItems("it", {"A", "B", "C"});
            EXPECT_EQ(box->currentIndex(), -1);
            EXPECT_EQ(box->count(), 3);
            ioDialog.SetSelection("it", 2);
            EXPECT_EQ(box->currentText(), QStringLiteral("C"));
        },
        &SelectionOf);
    EXPECT_THAT(told, ElementsAre("1"));
}

TEST_F(ControlsTest, RadioButtonsStandAmongOtherViewsAndExcludeEachOther) {
    const auto button = [](const char* inID, const char* inName) {
        return MakeView(
            "column", {},
            {MakeView("ost_radio_button", {{"identifier", inID}, {"name", inName}}),
             MakeView("ost_static_text", {{"identifier", std::string(inID) + "Text"}, {"name", "Why"}})});
    };
    const auto told = RunOne(
        MakeView("ost_radio_button_group", {{"identifier", "it"}},
                 {button("mine", "Mine"), button("theirs", "Theirs")}),
        [](QDialog& ioWindow, Dialog& ioDialog) {
            const auto buttons = ioWindow.findChildren<QRadioButton*>();
            ASSERT_EQ(buttons.size(), 2);
            EXPECT_FALSE(buttons[0]->isChecked() || buttons[1]->isChecked());
            ioDialog.SetSelection("it", 1);
            EXPECT_TRUE(buttons[1]->isChecked());
            Click(buttons[0]);
            EXPECT_FALSE(buttons[1]->isChecked());
            QTest::keyClick(buttons[0], Qt::Key_Down);
            EXPECT_TRUE(buttons[1]->isChecked());
            ioDialog.SetSelection("it", -1);
            EXPECT_FALSE(buttons[0]->isChecked() || buttons[1]->isChecked());
        },
        &SelectionOf);
    EXPECT_THAT(told, ElementsAre("0", "1"));
}

TEST_F(ControlsTest, CheckBoxesAndTabs) {
    const auto isChecked = [](Dialog& inDialog) {
        return std::string(inDialog.IsChecked("it") ? "on" : "off");
    };
    EXPECT_THAT(RunOne(
                    MakeView("ost_checkbox", {{"identifier", "it"}, {"name", "R&D"}}),
                    [](QDialog& ioWindow, Dialog& ioDialog) {
                        auto* const box = FindOnly<QCheckBox>(ioWindow);
                        EXPECT_EQ(box->text(), QStringLiteral("&R&&D"));
                        QTest::keyClick(box, Qt::Key_Space);
                        ioDialog.SetChecked("it", false);
                        EXPECT_FALSE(box->isChecked());
                        Click(box);
                    },
                    isChecked),
                ElementsAre("on", "on"));
    const auto page = [](const char* inID, View inContent) {
        return MakeView("ost_tab_view", {{"identifier", inID}, {"name", inID}}, {std::move(inContent)});
    };
    EXPECT_THAT(
        RunOne(
            MakeView(
                "ost_tab_container", {{"identifier", "it"}},
                {page("First", MakeView("ost_static_text", {{"identifier", "a"}, {"name", "on first"}})),
                 page("Second", MakeView("ost_checkbox", {{"identifier", "b"}, {"name", "on second"}}))}),
            [](QDialog& ioWindow, Dialog& ioDialog) {
                auto* const tabs = FindOnly<QTabWidget>(ioWindow);
                auto* const onSecond = FindOnly<QCheckBox>(ioWindow);
                EXPECT_FALSE(onSecond->isVisible());
                QTest::mouseClick(tabs->tabBar(), Qt::LeftButton, {}, tabs->tabBar()->tabRect(1).center());
                EXPECT_TRUE(onSecond->isVisible());
                ioDialog.SetVisible("Second", false);
                EXPECT_FALSE(tabs->isTabVisible(1));
            },
            &SelectionOf),
        testing::Contains("1"));
}

TEST_F(ControlsTest, ListsOfWindowsWithoutALayout) {
    Dialog dialog("Plain", "Plain");
    dialog.AddList("it", "Servers:", {"one", "two", "three"});
    dialog.AddButton("ok", "OK", 7);
    std::vector<int> told;
    dialog.SetOnChanged("it", [&] { told.push_back(dialog.GetSelection("it")); });
    EXPECT_EQ(Run(dialog,
                  [&](QDialog& ioWindow) {
                      auto* const list = FindOnly<QListWidget>(ioWindow);
                      const QRect second = list->visualItemRect(list->item(1));
                      QTest::mouseClick(list->viewport(), Qt::LeftButton, {}, second.center());
                      QTest::keyClick(list, Qt::Key_Down);
                      dialog.SetSelection("it", 0);
                      EXPECT_EQ(list->currentRow(), 0);
                      ClickButton(ioWindow, "OK");
                  }),
              7);
    EXPECT_THAT(told, ElementsAre(1, 2));
}

TEST_F(ControlsTest, ProgressRunsWithoutATotalAndReachesItsEndWithAnyTotal) {
    RunOne(
        MakeView("ost_progress_bar", {{"identifier", "it"}, {"key_total_value", "100"}}),
        [](QDialog& ioWindow, Dialog& ioDialog) {
            auto* const bar = FindOnly<QProgressBar>(ioWindow);
            EXPECT_EQ(bar->value(), 0);
            ioDialog.SetProgress("it", 4000000000u, 4000000000u);
            EXPECT_EQ(bar->value(), bar->maximum());
            ioDialog.SetProgress("it", 1, 4);
            EXPECT_EQ(bar->value() * 4, bar->maximum());
            ioDialog.SetProgress("it", 0, 0);
            EXPECT_EQ(bar->maximum(), bar->minimum());
        },
        &TextOf);
}

TEST_F(ControlsTest, AHiddenGroupTakesItsControlsAlongAndTextsAreNeverMarkup) {
    const std::string hostile = "<h1>Hi</h1>\n<img src='x'>";
    RunOne(
        MakeView(
            "ost_groupbox", {{"identifier", "box"}, {"name", "A & B"}},
            {MakeView("ost_static_text", {{"identifier", "text"}, {"name", hostile}, {"tooltip", hostile}}),
             MakeView("ost_button", {{"identifier", "in"}, {"name", "In"}})}),
        [&](QDialog& ioWindow, Dialog& ioDialog) {
            auto* const label = FindOnly<QLabel>(ioWindow);
            EXPECT_EQ(label->textFormat(), Qt::PlainText);
            EXPECT_EQ(label->text().toStdString(), hostile);
            EXPECT_FALSE(label->toolTip().contains(QStringLiteral("<img")));
            QAbstractButton* const inner = FindButton(ioWindow, QStringLiteral("In"));
            EXPECT_TRUE(inner->isVisible());
            ioDialog.SetVisible("box", false);
            EXPECT_FALSE(inner->isVisible() || label->isVisible());
            ioDialog.SetVisible("box", true);
            ioDialog.SetEnabled("box", false);
            EXPECT_TRUE(inner->isVisible() && !inner->isEnabled());
        },
        &TextOf);
}

}  // namespace
