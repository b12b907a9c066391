// The scripted back end: what a test can do to a window, and what it is told of it.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "ostcore/threads/MainThread.h"
#include "Views.h"
#include "ZOClientTesting/ScriptedWindows.h"

namespace ostui {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using ZOClientTesting::ScriptedWindow;
using ZOClientTesting::ScriptedWindows;

class ScriptedTest : public testing::Test {
protected:
    ScriptedTest() {
        ostcore::threads::SetMainThread();
        const auto tree = dialog.GetTree("tree");
        tree->SetSelectionMode(Tree::SelectionMode::kMultiple);
        tree->SetColumns({{"name", "Name", 0}, {"type", "Type", 0}});
    }
    ~ScriptedTest() override { ostcore::threads::ResetMainThread(); }

    static std::vector<TreeRow> Rows() {
        return {{"folder", {"Day 2"}, "", "", TreeRow::kTopLevel},
                {"clip", {"b", "Clip"}, "", "", 0},
                {"bin", {"Day 1", "Bin", "not shown"}, "", "", TreeRow::kTopLevel}};
    }

    Dialog dialog{"Window",
                  MakeWindow({MakeView("ost_multi_column_tree", "tree"), MakeView("ost_checkbox", "check"),
                              MakeView("ost_radio_button_group", "radio", {},
                                       {MakeView("ost_radio_button", "mine", {{"name", "Keep"}}),
                                        MakeView("ost_radio_button", "theirs", {{"name", "Take"}})}),
                              MakeView("ost_ok_cancel_row", "")})};
    ScriptedWindows windows;
};

TEST_F(ScriptedTest, AScriptDoesWhatAUserDoes) {
    std::string opened;
    dialog.SetOnOpened([&] { dialog.GetTree("tree")->SetRows(Rows()); });
    dialog.GetTree("tree")->SetOnActivated([&](int inRow) {
        opened = dialog.GetTree("tree")->GetRows()[static_cast<std::size_t>(inRow)].id;
        dialog.SetTitle("Opened");
    });
    windows.Answer("Window", [&](ScriptedWindow& ioWindow) {
        ioWindow.SelectRows("tree", {"bin", "clip"});
        ioWindow.ClickColumn("tree", "name");
        EXPECT_THAT(ioWindow.Rows("tree"), ElementsAre("Day 1 | Bin", "Day 2 | ", "  b | Clip"));
        EXPECT_THAT(ioWindow.SelectedIDs("tree"), ElementsAre("clip", "bin"));
        ioWindow.Activate("tree", "clip");
        ioWindow.Choose("radio", "Keep");
        ioWindow.Choose("radio", "theirs");
        ioWindow.Check("check");
        dialog.GetTree("tree")->RemoveRows({"folder"});
        ioWindow.Press("okButton");
    });
    EXPECT_EQ(dialog.RunModal(), kResponseOK);
    EXPECT_EQ(dialog.GetSelection("radio"), 1);
    EXPECT_TRUE(dialog.IsChecked("check"));
    EXPECT_EQ(opened, "clip");
    EXPECT_THAT(windows.Mismatches(), IsEmpty());
    const auto& shown = windows.Shown().front();
    EXPECT_THAT(shown.trees.at("tree"), ElementsAre(ElementsAre("Day 2 | ", "  b | Clip", "Day 1 | Bin"),
                                                    ElementsAre("Day 1 | Bin", "Day 2 | ", "  b | Clip"),
                                                    ElementsAre("Day 1 | Bin")));
    EXPECT_THAT(shown.changes, ElementsAre("title: Opened", "radio: ", "radio: ", "check: "));
}

TEST_F(ScriptedTest, WhatAUserCannotDoIsAMismatch) {
    dialog.SetEnabled("theirs", false);
    dialog.SetEnabled("check", false);
    windows.Answer("Window", [&](ScriptedWindow& ioWindow) {
        ioWindow.SelectRows("tree", {"bin"});
        ioWindow.ClickColumn("tree", "unknown");
        ioWindow.Activate("tree", "bin");
        ioWindow.ClickColumn("check", "name");
        ioWindow.Choose("radio", "theirs");
        ioWindow.Choose("radio", "Neither");
        ioWindow.Check("check");
        ioWindow.Press("cancelButton");
        ioWindow.ClickColumn("tree", "name");
    });
    EXPECT_EQ(dialog.RunModal(), kResponseCancel);
    EXPECT_EQ(windows.Mismatches().size(), 8u);
    EXPECT_EQ(dialog.GetTree("tree")->GetSortColumn(), "");
}

}  // namespace
}  // namespace ostui
