// Dialogs on a terminal, with a user who types.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "ostcore/threads/MainThread.h"
#include "ostui/MessageBox.h"
#include "ostui/TerminalBackEnd.h"
#include "UserTerminal.h"
#include "Views.h"

namespace ostui {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using Turns = std::vector<UserTerminal::Turn>;

/// A terminal with its back end in place.
class Seat {
public:
    explicit Seat(unsigned short inColumns = 0) : terminal(inColumns) {
        mFormer = SetBackEnd(CreateTerminalBackEnd(
            {terminal.Program(), terminal.Program(), [this] { return isInterrupted; }}));
    }
    ~Seat() { SetBackEnd(mFormer); }

    /// Runs the dialog; what was on the screen.
    std::string Run(Dialog& ioDialog, const Turns& inTurns, int inResponse) {
        return terminal.Play(inTurns, [&] { EXPECT_EQ(ioDialog.RunModal(), inResponse); });
    }

    UserTerminal terminal;
    bool isInterrupted = false;

private:
    shared_ptr<BackEnd> mFormer;
};

class TerminalTest : public testing::Test {
protected:
    TerminalTest() { ostcore::threads::SetMainThread(); }
    ~TerminalTest() override { ostcore::threads::ResetMainThread(); }

    static std::vector<TreeRow> Rows() {
        return {{"b", {"Beach \u6D77\u8FBA", "/Day 10"}, "", "", TreeRow::kTopLevel},
                {"b1", {"Take 1", "/Day 10"}, "", "", 0},
                {"a", {"Attic", "/Day 2"}, "", "", TreeRow::kTopLevel},
                {"c", {"Car\tport", "/Day 3"}, "", "", TreeRow::kTopLevel}};
    }

    static void FillTree(Dialog& ioDialog, Tree::SelectionMode inMode) {
        const auto tree = ioDialog.GetTree("tree");
        tree->SetColumns({{"name", "Name", 0}, {"path", "Path", 0}});
        tree->SetRows(Rows());
        tree->SetSelectionMode(inMode);
    }

    static View ResolveWindow() {
        return MakeWindow(
            {MakeView("ost_static_text", "info", {{"name", "These conflict:"}}),
             MakeView("ost_multi_column_tree", "tree"),
             MakeView("ost_radio_button_group", "radio", {{"label", "What to do"}},
                      {MakeView("ost_radio_button", "mine", {{"name", "Keep"}}),
                       MakeView("ost_static_text", "", {{"name", "Yours is kept."}}),
                       MakeView("ost_radio_button", "theirs", {{"name", "Take"}}),
                       MakeView("ost_radio_button", "copy", {{"name", "Copy"}})}),
             MakeView("ost_popup", "preset", {{"label", "Preset:"}},
                      {MakeView("ost_popup_item", "", {{"name", "Proxy"}}),
                       MakeView("ost_popup_item", "", {{"name", "Master"}})}),
             MakeView("ost_checkbox", "again", {{"name", "Ask again"}}),
             MakeView("ost_text_edit", "name", {{"label", "Name:"}}),
             MakeView("ost_text_edit", "comment", {{"label", "Comment:"}, {"multiLine", "true"}}),
             MakeView("ost_search_box", "filter", {{"label", "Filter"}}),
             MakeView("ost_ok_cancel_row", "", {{"okText", "Resolve"}})});
    }
};

TEST_F(TerminalTest, EveryControlIsAskedForInItsOrder) {
    Dialog dialog("Window", ResolveWindow());
    FillTree(dialog, Tree::SelectionMode::kMultiple);
    dialog.GetTree("tree")->SetSort("path", true);
    dialog.SetSelection("radio", 1);
    dialog.SetText("filter", "old");
    Seat seat;
    const std::string screen = seat.Run(dialog,
                                        {{"Rows, such as 1,3-5 or all [none]: ", "1, 3-4\n"},
                                         {"Number [2]: ", "keep\n"},
                                         {"Number [1]: ", "2\n"},
                                         {"Ask again (yes/no) [no]: ", "Y\n"},
                                         {"Name: ", "Anna \u6D77\n"},
                                         {"(an empty line ends the text)\n  ", "first line\n"},
                                         {"  ", "second\n"},
                                         {"  ", "\n"},
                                         {"Filter [old]: ", "-\n"},
                                         {"> ", "\n"}},
                                        kResponseOK);
    EXPECT_THAT(screen, HasSubstr("Window\n"
                                  "These conflict:\n"
                                  "     Name        Path\n"
                                  "  1  Attic       /Day 2\n"
                                  "  2  Car port    /Day 3\n"
                                  "  3  Beach \u6D77\u8FBA  /Day 10\n"
                                  "  4    Take 1    /Day 10\n"));
    EXPECT_THAT(screen, HasSubstr("What to do\n"
                                  "  1  Keep\n"
                                  "     Yours is kept.\n"
                                  "  2  Take\n"
                                  "  3  Copy\n"));
    EXPECT_THAT(screen, HasSubstr("Preset:\n  1  Proxy\n  2  Master\n"));
    EXPECT_THAT(screen, HasSubstr("[1] Resolve (enter)  [2] Cancel  > "));
    EXPECT_THAT(dialog.GetTree("tree")->GetSelectedIDs(), ElementsAre("b", "b1", "a"));
    EXPECT_EQ(dialog.GetSelection("radio"), 0);
    EXPECT_EQ(dialog.GetSelection("preset"), 1);
    EXPECT_TRUE(dialog.IsChecked("again"));
    EXPECT_EQ(dialog.GetText("name"), "Anna \u6D77");
    EXPECT_EQ(dialog.GetText("comment"), "first line\nsecond");
    EXPECT_EQ(dialog.GetText("filter"), "");
}

TEST_F(TerminalTest, TheEnterKeyKeepsWhatIsThereAndNonsenseIsAskedAgain) {
    Dialog dialog("Window", ResolveWindow());
    FillTree(dialog, Tree::SelectionMode::kMultiple);
    dialog.SelectRows("tree", {0, 1, 3});
    dialog.SetEnabled("copy", false);
    dialog.SetChecked("again", true);
    dialog.SetText("name", "Anna");
    dialog.SetText("comment", "held\nlines");
    int changes = 0;
    dialog.GetTree("tree")->SetOnSelectionChanged([&] { ++changes; });
    for (const char* const id : {"radio", "preset", "again", "name", "comment", "filter"}) {
        dialog.SetOnChanged(id, [&] { ++changes; });
    }
    Seat seat;
    const std::string screen = seat.Run(dialog,
                                        {{"or all [1-2,4]: ", "0\n"},
                                         {"[1-2,4]: ", "1,x\n"},
                                         {"[1-2,4]: ", "3-9\n"},
                                         {"[1-2,4]: ", "4-3\n"},
                                         {"[1-2,4]: ", "\n"},
                                         {"Number: ", "3\n"},
                                         {"from 1 to 3.\nNumber: ", "99999999999\n"},
                                         {"from 1 to 3.\nNumber: ", "\n"},
                                         {"Number [1]: ", "\n"},
                                         {"[yes]: ", "perhaps\n"},
                                         {"[yes]: ", "\n"},
                                         {"Name [Anna]: ", "\n"},
                                         {"[held\nlines]\nComment: (an empty line ends the text)\n  ", "\n"},
                                         {"Filter: ", "\n"},
                                         {"> ", "7\n"},
                                         {"> ", "cancel\n"}},
                                        kResponseCancel);
    EXPECT_THAT(screen, HasSubstr("  -  Copy\n"));
    EXPECT_EQ(changes, 0);
    EXPECT_EQ(dialog.GetSelection("radio"), -1);
}

TEST_F(TerminalTest, WhatIsHiddenIsNotAskedAndWhatIsDisabledIsOnlyShown) {
    Dialog dialog("Window",
                  MakeWindow({MakeView("ost_subview", "hidden", {},
                                       {MakeView("ost_static_text", "", {{"name", "unseen text"}}),
                                        MakeView("ost_text_edit", "a", {{"label", "unseen edit"}})}),
                              MakeView("ost_groupbox", "box", {{"name", "Details"}},
                                       {MakeView("ost_text_edit", "b", {{"label", "User:"}}),
                                        MakeView("ost_checkbox", "c", {{"name", "Synced"}})}),
                              MakeView("ost_tab_container", "tabs", {},
                                       {MakeView("ost_tab_view", "page", {{"name", "Assets"}},
                                                 {MakeView("ost_multi_column_tree", "tree")})}),
                              MakeView("ost_picture_button", "next", {{"tooltip", "Next"}}),
                              MakeView("ost_cancel_row", "")}));
    FillTree(dialog, Tree::SelectionMode::kNone);
    dialog.SetVisible("hidden", false);
    dialog.SetEnabled("box", false);
    dialog.SetText("b", "anna");
    dialog.SetHandler("next", [&] { dialog.GetTree("tree")->RemoveRows({"b", "c"}); });
    Seat seat;
    const std::string screen = seat.Run(dialog, {{"> ", "next\n"}, {"> ", "2\n"}}, kResponseCancel);
    EXPECT_THAT(screen, Not(HasSubstr("unseen")));
    EXPECT_THAT(screen, HasSubstr("Details\nUser: anna\n[ ] Synced\nAssets\nName        Path\nBeach"));
    EXPECT_THAT(screen, HasSubstr("[1] Next  [2] Cancel  > next\nName   Path\nAttic  /Day 2\n[1] Next"))
        << "what has changed is shown again, and nothing else";
}

TEST_F(TerminalTest, AWindowThatIsBusyIsWaitedForAndAskedLater) {
    Dialog dialog("Window",
                  MakeWindow({MakeView("ost_subview", "progress", {},
                                       {MakeView("ost_static_text", "text", {{"name", "Loading..."}}),
                                        MakeView("ost_progress_bar", "bar")}),
                              MakeView("ost_subview", "main", {},
                                       {MakeView("ost_multi_column_tree", "tree"),
                                        MakeView("ost_text_edit", "edit", {{"label", "Comment"}})}),
                              MakeView("ost_ok_cancel_row", "")}));
    dialog.SetVisible("main", false);
    const auto show = [&] {
        dialog.SetProgress("bar", 1, 2);
        FillTree(dialog, Tree::SelectionMode::kSingle);
        dialog.SetVisible("progress", false);
        dialog.SetVisible("main", true);
    };
    dialog.SetOnOpened([&] { ostcore::threads::AsyncCallFromMainThread(show); });
    Seat seat;
    std::string screen =
        seat.Run(dialog, {{"Row [none]: ", "3\n"}, {"Comment: ", "done\n"}, {"> ", "1\n"}}, kResponseOK);
    EXPECT_THAT(screen, HasSubstr("Window\nLoading...\n"));
    EXPECT_THAT(screen, HasSubstr("50 %  [1] OK (enter)  [2] Cancel  > \r" + std::string(36, ' ') + "\r"))
        << "and gone when the wait is over";
    EXPECT_THAT(dialog.GetTree("tree")->GetSelectedIDs(), ElementsAre("a"));
    EXPECT_EQ(dialog.GetText("edit"), "done");

    // Busy again, and the user does not want to wait.
    dialog.SetOnOpened({});
    dialog.SetVisible("main", false);
    dialog.SetVisible("progress", true);
    seat.Run(dialog, {{"50 %  ", "2\n"}}, kResponseCancel);
    seat.Run(dialog, {{"50 %  ", "\x04"}}, kResponseCancel);
}

TEST_F(TerminalTest, AnEnterKeyThatPressesNoButtonLeadsBackToTheQuestions) {
    Dialog dialog("Window", MakeWindow({MakeView("ost_text_edit", "name", {{"label", "Name:"}}),
                                        MakeView("ost_ok_cancel_row", "")}));
    dialog.SetEnabled("okButton", false);
    dialog.SetOnChanged("name", [&] { dialog.SetEnabled("okButton", true); });
    Seat seat;
    const std::string screen = seat.Run(dialog,
                                        {{"Name: ", "\n"},
                                         {"[1] Cancel  (enter goes back to the questions)  > ", "7\n"},
                                         {"[1] Cancel  (enter goes back to the questions)  > ", "\n"},
                                         {"Name: ", "x\n"},
                                         {"> ", "\n"}},
                                        kResponseOK);
    EXPECT_THAT(screen, HasSubstr("\n[1] OK (enter)  [2] Cancel  > "));
    EXPECT_EQ(dialog.GetText("name"), "x");
}

TEST_F(TerminalTest, WhatChangesWhileAQuestionWaitsIsShown) {
    Dialog dialog("Window", MakeWindow({MakeView("ost_static_text", "text", {{"name", "one"}}),
                                        MakeView("ost_multi_column_tree", "tree"),
                                        MakeView("ost_text_edit", "edit", {{"label", "Edit"}}),
                                        MakeView("ost_text_edit", "more", {{"label", "More"}}),
                                        MakeView("ost_ok_cancel_row", "")}));
    dialog.SetVisible("more", false);
    FillTree(dialog, Tree::SelectionMode::kSingle);
    Seat seat;
    // The user's steps are what makes the logic move, so that they come in this order.
    const auto later = [](function<void()> inFunction) {
        ostcore::threads::AsyncCallFromMainThread(std::move(inFunction));
    };
    dialog.SetOnChanged("edit", [&] {
        later([&] {
            dialog.SetText("text", "two");
            dialog.SetText("text", "two");
            MessageBoxSettings box;
            box.message = "in between";
            RunMessageBox(box);
            later([&] { dialog.SetVisible("more", true); });
        });
    });
    dialog.GetTree("tree")->SetOnSelectionChanged([&] {
        later([&] {
            dialog.GetTree("tree")->SetOnSelectionChanged({});
            dialog.GetTree("tree")->RemoveRows({"b"});
        });
    });
    const std::string screen = seat.Run(dialog,
                                        {{"Row [none]: ", "1\n"},
                                         {"Row [none]: ", "1\n"},
                                         {"Edit: ", "typed\n"},
                                         {"in between\n[1] OK  > ", "1\n"},
                                         {"Row [1]: ", "\n"},
                                         {"Edit [typed]: ", "\n"},
                                         {"More: ", "\n"},
                                         {"> ", "1\n"}},
                                        kResponseOK);
    EXPECT_THAT(screen, HasSubstr("> \ntwo\n")) << "below the question that was open";
    EXPECT_EQ(screen.find("two\n"), screen.rfind("two\n")) << "said once";
    EXPECT_THAT(screen, HasSubstr("Edit: \r      \r")) << "what is not to be answered is taken back";
    EXPECT_THAT(dialog.GetTree("tree")->GetSelectedIDs(), ElementsAre("a"));
}

TEST_F(TerminalTest, ADialogThatClosesByItselfTakesAButtonAndShowsWhatIsNew) {
    Dialog dialog("Busy", MakeWindow({MakeView("ost_static_text", "text", {{"name", "Working"}}),
                                      MakeView("ost_multi_column_tree", "tree"),
                                      MakeView("ost_progress_bar", "bar", {{"key_total_value", "100"}}),
                                      MakeView("ost_cancel_row", "")}));
    dialog.SetClosesByItself();
    dialog.SetHandler("cancelButton", [&] {
        MessageBoxSettings box;
        box.message = "Really?";
        box.buttons = kMessageBoxYes | kMessageBoxNo;
        if (RunMessageBox(box) == kMessageBoxYes) {
            return dialog.Close(9);
        }
        FillTree(dialog, Tree::SelectionMode::kSingle);
        auto rows = Rows();
        rows.push_back({"d", {"Dock", "/Day 4"}, "", "", TreeRow::kTopLevel});
        dialog.GetTree("tree")->SetRows(rows);
        dialog.SetText("text", "Half way");
        dialog.SetProgress("bar", 50, 100);
    });
    Seat seat;
    const std::string screen = seat.Run(dialog,
                                        {{"0 %  [1] Cancel  > ", "1\n"},
                                         {"Really?\n[1] Yes  [2] No  > ", "no\n"},
                                         {"50 %  [1] Cancel  > ", "cancel\n"},
                                         {"Really?\n[1] Yes  [2] No  > ", "yes\n"}},
                                        9);
    EXPECT_THAT(screen, HasSubstr("Half way\n"));
    EXPECT_THAT(screen, HasSubstr("Dock"));
    EXPECT_EQ(screen.find("Attic"), screen.rfind("Attic")) << "a row is shown once";
}

TEST_F(TerminalTest, ForeignTextsDoNotSteerTheTerminal) {
    Dialog dialog("Window",
                  MakeWindow({MakeView("ost_static_text", "text"), MakeView("ost_multi_column_tree", "tree"),
                              MakeView("ost_text_edit", "edit"), MakeView("ost_cancel_row", "")}));
    const std::string evil =
        "a\x1b[31mb\xC2\x9B"
        "2Jc\u202Ed\xFF";
    const std::string harmless =
        "a\uFFFD[31mb\uFFFD"
        "2Jc\uFFFDd\uFFFD";
    dialog.SetText("text", evil);
    dialog.SetText("edit", evil);
    dialog.SetText("cancelButton", evil);
    dialog.SetTitle(evil);
    FillTree(dialog, Tree::SelectionMode::kNone);
    dialog.GetTree("tree")->SetRows({{evil, {evil, evil}, "", evil, TreeRow::kTopLevel}});
    Seat seat;
    const std::string screen = seat.Run(dialog, {{"]: ", "\n"}, {"> ", "1\n"}}, kResponseCancel);
    std::size_t count = 0;
    for (std::size_t at = screen.find(harmless); at != std::string::npos;
         at = screen.find(harmless, at + 1)) {
        ++count;
    }
    EXPECT_EQ(count, 6u) << screen;
    EXPECT_THAT(screen, Not(HasSubstr("\x1b")));
    EXPECT_THAT(screen, Not(HasSubstr("\xC2\x9B")));
}

TEST_F(TerminalTest, TextsAreWrappedAndTablesCutToTheWidthOfTheTerminal) {
    Dialog dialog("Window",
                  MakeWindow({MakeView("ost_static_text", "",
                                       {{"name", "These assets have\nconflicts, unforeseeably."}}),
                              MakeView("ost_multi_column_tree", "tree"),
                              MakeView("ost_static_text", "label", {{"name", "User:"}}),
                              MakeView("ost_static_text", "user", {{"name", "anna"}}),
                              MakeView("ost_static_text", "", {{"name", "Comment:"}}),
                              MakeView("ost_text_edit", "comment"), MakeView("ost_cancel_row", "")}));
    FillTree(dialog, Tree::SelectionMode::kNone);
    std::vector<TreeRow> rows = {
        {"1", {"\u6D77\u8FBA\u6D77\u8FBA\u6D77\u8FBA", "short"}, "", "", TreeRow::kTopLevel}};
    for (int i = 0; i < 501; ++i) {
        rows.push_back({"", {"n", "p"}, "", "", TreeRow::kTopLevel});
    }
    dialog.GetTree("tree")->SetRows(rows);
    Seat seat(16);
    dialog.SetOnChanged("comment", [&] { dialog.SetText("user", "ada"); });
    const std::string screen = seat.Run(dialog, {{"\nComment: ", "x\n"}, {"> ", "1\n"}}, kResponseCancel);
    EXPECT_THAT(screen, HasSubstr("Window\nThese assets\nhave\nconflicts,\nunforeseeably.\nName"));
    EXPECT_THAT(screen, HasSubstr("more\nUser: anna\nComment: x\nUser: ada\n[1]"));
    EXPECT_THAT(screen, HasSubstr("Name       Path\n\u6D77\u8FBA\u6D77\u8FBA\u2026  short\nn          p\n"));
    EXPECT_THAT(screen, HasSubstr("... and 2 more\n"));
}

TEST_F(TerminalTest, APasswordIsNotShown) {
    Dialog dialog("Sign", "");
    dialog.AddStaticText("text", "Who are you?");
    dialog.AddTextEdit("user", "User", "anna");
    dialog.AddPasswordEdit("password", "Password");
    dialog.AddButton("ok", "Sign In", kResponseOK);
    Seat seat;
    const std::string screen = seat.Run(dialog,
                                        {{"User [anna]: ", "\n"},
                                         {"Password: ",
                                          "hid\xE4"
                                          "den -\n"},
                                         {"> ", "1\n"}},
                                        kResponseOK);
    EXPECT_EQ(dialog.GetText("user"), "anna");
    EXPECT_EQ(dialog.GetText("password"),
              "hid\xE4"
              "den -")
        << "not a byte of it is changed";
    EXPECT_THAT(screen, Not(HasSubstr("hid")));
    EXPECT_THAT(screen, HasSubstr("Password: \n[1] Sign In"));
}

TEST_F(TerminalTest, TheEndOfTheInputAndAnInterruptDismiss) {
    Dialog dialog("Window", MakeWindow({MakeView("ost_text_edit", "edit", {{"label", "Edit"}}),
                                        MakeView("ost_ok_cancel_row", "")}));
    {
        Seat seat;
        seat.Run(dialog, {{"Edit: ", "\x04"}}, kResponseCancel);
        dialog.SetOnChanged("edit", [&] { seat.isInterrupted = true; });
        seat.Run(dialog, {{"Edit: ", "text\n"}}, kResponseCancel);
        const std::string screen = seat.Run(dialog, {}, kResponseCancel);
        EXPECT_THAT(screen, IsEmpty()) << "who wants to stop is asked nothing more";
    }
    Seat seat;
    seat.terminal.Type("typed ahead\n");
    seat.terminal.HangUp();
    EXPECT_EQ(dialog.RunModal(), kResponseCancel);
}

}  // namespace
}  // namespace ostui
