// Dialogs as their logic and their back ends see them: made from layouts, nested, closed in the middle.
#include <thread>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "ostcore/config/ZString.h"
#include "ostcore/debug/Trace.h"
#include "ostcore/threads/MainThread.h"
#include "ostui/BackEnd.h"
#include "Views.h"
#include "ZOClientTesting/ScriptedWindows.h"

namespace ostui {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using ZOClientTesting::ScriptedWindow;
using ZOClientTesting::ScriptedWindows;
using Texts = std::vector<std::string>;

class DialogTest : public testing::Test {
protected:
    DialogTest() { ostcore::threads::SetMainThread(); }
    ~DialogTest() override { ostcore::threads::ResetMainThread(); }
};

TEST_F(DialogTest, ALayoutMakesItsControls) {
    ostcore::config::Localizer::AddText("de", "$$$/Test/Keep", "Behalten");
    ostcore::config::Localizer::SetLanguage("de");
    const View layout = MakeWindow({
        MakeView("row", "", {},
                 {MakeView("ost_static_text", "", {{"name", "plain"}, {"multiLine", "true"}}),
                  MakeView("ost_static_text", "#1", {{"name", "named"}})}),
        MakeView(
            "ost_subview", "view", {},
            {MakeView("ost_text_edit", "edit",
                      {{"label", "$$$/Test/Label=Label"}, {"setAsFocused", "true"}, {"multiLine", "true"}}),
             MakeView("ost_text_edit", "secret", {{"password", "true"}}),
             MakeView("ost_radio_button_group", "radio", {},
                      {MakeView("column", "", {},
                                {MakeView("ost_radio_button", "keep", {{"name", "$$$/Test/Keep=Keep"}}),
                                 MakeView("ost_static_text", "below", {{"name", "text"}})}),
                       MakeView("ost_radio_button", "take", {{"name", "Take"}})})}),
        MakeView("ost_popup", "popup", {},
                 {MakeView("ost_popup_item", "", {{"name", "One"}}),
                  MakeView("ost_popup_item", "two", {{"name", "Two"}})}),
        MakeView("ost_progress_bar", "bar", {{"key_start_value", "150"}, {"key_total_value", "100"}}),
        MakeView("ost_tab_container", "tabs", {},
                 {MakeView("ost_tab_view", "first", {{"name", "First"}},
                           {MakeView("ost_multi_column_tree", "tree")}),
                  MakeView("ost_tab_view", "second", {{"name", "Second"}},
                           {MakeView("ost_checkbox", "check", {{"name", "Check"}})})}),
        MakeView("ost_groupbox", "", {{"name", "Box"}},
                 {MakeView("ost_picture_button", "add", {{"image", "SP_Add_Sm"}})}),
        MakeView("ost_ok_cancel_row", "buttons", {{"okText", "Share"}, {"cancelIdentifier", "stop"}}),
    });
    const Dialog dialog("Window", layout);
    ostcore::config::Localizer::Reset();
    EXPECT_EQ(dialog.GetFocus(), "edit");
    EXPECT_EQ(dialog.GetDefaultButton(), "okButton");
    EXPECT_EQ(dialog.GetCancelButton(), "stop");
    Texts shape;
    for (const Control& control : dialog.GetControls()) {
        shape.push_back(control.group + "/" + control.id + "=" + control.text);
    }
    EXPECT_THAT(shape, ElementsAre("/#2=plain", "/#1=named",
                                   "/view=", "view/edit=", "view/secret=", "view/radio=", "radio/below=text",
                                   "/popup=", "/bar=", "/tabs=", "tabs/first=First",
                                   "first/tree=", "tabs/second=Second", "second/check=Check", "/#3=Box",
                                   "#3/add=", "/buttons=", "buttons/okButton=Share", "buttons/stop=Cancel"));
    EXPECT_EQ(dialog.GetLayout()->children[0].children[0].GetIdentifier(), "#2");
    EXPECT_TRUE(dialog.Find("#2")->isMultiLine);
    EXPECT_EQ(dialog.Find("edit")->label, "Label");
    EXPECT_EQ(dialog.Find("secret")->type, ControlType::kPasswordEdit);
    EXPECT_THAT(dialog.Find("radio")->items, ElementsAre("Behalten", "Take"));
    EXPECT_THAT(dialog.Find("radio")->itemIDs, ElementsAre("keep", "take"));
    EXPECT_EQ(dialog.GetSelection("radio"), -1);
    EXPECT_THAT(dialog.Find("popup")->items, ElementsAre("One", "Two"));
    EXPECT_EQ(dialog.GetSelection("popup"), 0);
    EXPECT_EQ(dialog.Find("bar")->value, 100u);
    EXPECT_THAT(dialog.Find("tabs")->itemIDs, ElementsAre("first", "second"));
    EXPECT_EQ(dialog.Find("add")->image, "SP_Add_Sm");
}

TEST_F(DialogTest, WhatAGroupHidesOrDisablesCannotBeUsed) {
    Dialog dialog(
        "Window",
        MakeWindow(
            {MakeView(
                 "ost_subview", "outer", {},
                 {MakeView("row", "inner", {},
                           {MakeView("ost_button", "button"), MakeView("ost_text_edit", "edit"),
                            MakeView("ost_checkbox", "check"), MakeView("ost_multi_column_tree", "tree")})}),
             MakeView("ost_tab_container", "tabs", {},
                      {MakeView("ost_tab_view", "one"), MakeView("ost_tab_view", "two")}),
             MakeView("ost_radio_button_group", "radio", {},
                      {MakeView("ost_radio_button", "left"), MakeView("ost_radio_button", "right")})}));
    int pressed = 0;
    dialog.SetHandler("button", [&] { ++pressed; });
    dialog.GetTree("tree")->SetRows({TreeRow()});
    const auto uses = [&] {
        return int{dialog.Press("button")} + int{dialog.Enter("edit", "text")} +
               int{dialog.Check("check", true)} + int{dialog.SelectRows("tree", {0})};
    };
    for (const char* const group : {"outer", "inner"}) {
        dialog.SetVisible(group, false);
        EXPECT_EQ(uses(), 0) << group;
        EXPECT_FALSE(dialog.IsShown(*dialog.Find("button")));
        dialog.SetVisible(group, true);
        dialog.SetEnabled(group, false);
        EXPECT_EQ(uses(), 0) << group;
        EXPECT_TRUE(dialog.IsShown(*dialog.Find("button")));
        dialog.SetEnabled(group, true);
    }
    EXPECT_EQ(pressed, 0);
    EXPECT_EQ(uses(), 4);
    EXPECT_EQ(pressed, 1);

    EXPECT_TRUE(dialog.IsShown(*dialog.Find("two"))) << "a page that is not chosen counts as seen";
    dialog.SetVisible("two", false);
    EXPECT_FALSE(dialog.Select("tabs", 1));
    dialog.SetEnabled("right", false);
    EXPECT_FALSE(dialog.Select("radio", 1));
    EXPECT_FALSE(dialog.Select("radio", -1)) << "a choice cannot be taken back";
    dialog.SetEnabled("right", true);
    EXPECT_TRUE(dialog.Select("radio", 1));
    dialog.Close(kResponseOK);
    EXPECT_EQ(uses(), 0) << "the dialog is closed";
}

TEST_F(DialogTest, TheSecondControlOfANameIsDisabled) {
    std::string traced;
    ostcore::debug::SetTraceLevel("ostui", ostcore::debug::kTraceLevel_Error);
    const auto former = ostcore::debug::SetTraceSink([&](const std::string& inLine) { traced += inLine; });
    Dialog dialog("Window", MakeWindow({MakeView("ost_button", "twice", {{"name", "first"}}),
                                        MakeView("ost_button", "twice", {{"name", "second"}}),
                                        MakeView("ost_ok_cancel_row", "")}));
    dialog.AddTextEdit("okButton", "label", "text");
    ostcore::debug::SetTraceSink(former);
    ostcore::debug::SetTraceLevel("ostui", ostcore::debug::kTraceLevel_Fatal);
    EXPECT_THAT(traced, HasSubstr("Window has two controls twice"));
    EXPECT_THAT(traced, HasSubstr("Window has two controls okButton"));
    const std::string second = dialog.GetLayout()->children[1].GetIdentifier();
    EXPECT_EQ(dialog.Find(second)->text, "second");
    EXPECT_FALSE(dialog.Press(second));
    dialog.SetText("twice", "changed");
    EXPECT_EQ(dialog.GetControls()[0].text, "changed");
    EXPECT_EQ(dialog.GetControls()[1].text, "second");
    EXPECT_TRUE(dialog.Press("okButton"));
    EXPECT_TRUE(dialog.IsClosed());
}

TEST_F(DialogTest, OnlyWhatTheUserChangesIsTold) {
    Dialog dialog("Window", MakeWindow({MakeView("ost_search_box", "edit"), MakeView("ost_checkbox", "check"),
                                        MakeView("ost_popup", "popup", {},
                                                 {MakeView("ost_popup_item", "a", {{"name", "A"}}),
                                                  MakeView("ost_popup_item", "b", {{"name", "B"}})})}));
    Texts told;
    for (const char* const id : {"edit", "check", "popup"}) {
        dialog.SetOnChanged(id, [&told, id] { told.push_back(id); });
    }
    dialog.SetText("edit", "logic");
    dialog.SetChecked("check", true);
    dialog.SetSelection("popup", 1);
    dialog.SetSelection("popup", 2);
    EXPECT_TRUE(dialog.Enter("edit", "logic"));
    EXPECT_TRUE(dialog.Check("check", true));
    EXPECT_TRUE(dialog.Select("popup", 1));
    EXPECT_THAT(told, IsEmpty());
    EXPECT_TRUE(dialog.Enter("edit", "user"));
    EXPECT_TRUE(dialog.Check("check", false));
    EXPECT_TRUE(dialog.Select("popup", 0));
    EXPECT_THAT(told, ElementsAre("edit", "check", "popup"));
    EXPECT_FALSE(dialog.Select("popup", 2));
    EXPECT_FALSE(dialog.Check("edit", true));
    EXPECT_FALSE(dialog.Enter("check", "text"));
    dialog.SetItems("popup", {"C"});
    EXPECT_EQ(dialog.GetSelection("popup"), -1);
    EXPECT_EQ(dialog.Find("popup")->FindItem("a"), -1) << "the layout's items are gone";
}

TEST_F(DialogTest, NestedDialogsEndInAnyOrder) {
    ScriptedWindows windows;
    Dialog outer("Outer", "");
    Dialog inner("Inner", "");
    int innerResponse = 0;
    Texts running;
    const auto note = [&] {
        std::string ids;
        for (const Dialog* const dialog : GetRunningDialogs()) {
            ids += dialog->GetID() + " ";
        }
        running.push_back(ids);
    };
    outer.AddButton("open", "Open", [&] {
        innerResponse = inner.RunModal();
        note();
    });
    outer.AddButton("ok", "OK", kResponseOK);
    inner.AddButton("closeOuter", "Close", [&] {
        outer.Close(7);
        EXPECT_FALSE(outer.Press("ok")) << "it is closed already";
        EXPECT_EQ(outer.RunModal(), kResponseNone) << "it runs still";
        note();
        inner.Close(8);
        inner.Close(9);
    });
    windows.AnswerWith("Outer", "open");
    windows.AnswerWith("Inner", "closeOuter");
    EXPECT_EQ(outer.RunModal(), 7);
    EXPECT_EQ(innerResponse, 8);
    EXPECT_THAT(running, ElementsAre("Outer Inner ", "Outer "));
    EXPECT_THAT(GetRunningDialogs(), IsEmpty());
    EXPECT_FALSE(outer.IsClosed()) << "it may run again";
    EXPECT_THAT(windows.Mismatches(), IsEmpty());
}

TEST_F(DialogTest, AHandlerGoesOnWhenItsDialogIsClosedMeanwhile) {
    ScriptedWindows windows;
    Dialog dialog("Window", "");
    Dialog question("Question", "");
    question.AddButton("yes", "Yes", kResponseOK);
    Texts done;
    dialog.AddTextEdit("edit", "Edit", "");
    dialog.AddButton("work", "Work", [&] {
        dialog.SetHandler("work", [&] { done.push_back("another"); });
        std::thread([&] { dialog.Close(5); }).join();
        done.push_back(question.RunModal() == kResponseOK ? "asked" : "not asked");
        dialog.SetText("edit", "by the logic");
    });
    windows.Answer("Window", [&](ScriptedWindow& ioWindow) {
        ioWindow.Press("work");
        EXPECT_TRUE(ioWindow.IsClosed());
        EXPECT_FALSE(dialog.Enter("edit", "by the user"));
        EXPECT_FALSE(dialog.Press("work"));
    });
    windows.AnswerWith("Question", "yes");
    EXPECT_EQ(dialog.RunModal(), 5);
    EXPECT_THAT(done, ElementsAre("asked"));
    EXPECT_EQ(dialog.GetText("edit"), "by the logic");
    EXPECT_THAT(windows.Mismatches(), IsEmpty());
}

TEST_F(DialogTest, IsToldThatItIsOpenOnceInEachRun) {
    int opened = 0;
    Dialog dialog("Window", "");
    dialog.SetOnOpened([&] { ++opened; });
    EXPECT_EQ(dialog.RunModal(), kResponseCancel) << "nobody can be asked";
    EXPECT_EQ(opened, 0);
    dialog.Close(3);
    EXPECT_EQ(dialog.RunModal(), 3);
    EXPECT_EQ(opened, 0) << "it has never been open";

    Dialog busy("Busy", "");
    busy.SetClosesByItself();
    busy.SetOnOpened([&] {
        ++opened;
        busy.Close(4);
    });
    EXPECT_EQ(busy.RunModal(), 4) << "what opening starts ends it, also unseen";
    EXPECT_EQ(opened, 1);

    ScriptedWindows windows;
    for (int run = 0; run < 2; ++run) {
        windows.Answer("Window", [&](ScriptedWindow& ioWindow) {
            dialog.TellOpened();
            ioWindow.Dismiss();
        });
        dialog.RunModal();
    }
    EXPECT_EQ(opened, 3);
    EXPECT_THAT(windows.Mismatches(), IsEmpty());
}

/// Presses a button and notes what it is told.
class Presser final : public BackEnd {
public:
    void RunModal(Dialog& ioDialog) override { ioDialog.Press("button"); }
    void OnControlChanged(Dialog&, const Control& inControl) override { told.push_back(inControl.id); }
    void OnDialogChanged(Dialog& ioDialog) override { told.push_back("title " + ioDialog.GetTitle()); }
    Texts told;
};

TEST_F(DialogTest, ABackEndIsToldWhatChangesWhileTheDialogRuns) {
    const auto presser = boost::make_shared<Presser>();
    const auto former = SetBackEnd(presser);
    shared_ptr<Tree> tree;
    {
        Dialog dialog("Window",
                      MakeWindow({MakeView("ost_button", "button"), MakeView("ost_multi_column_tree", "tree"),
                                  MakeView("row", "group", {}, {})}));
        tree = dialog.GetTree("tree");
        tree->SetRows({TreeRow()});
        dialog.SetTitle("before");
        dialog.SetHandler("button", [&] {
            dialog.SetTitle("during");
            tree->ClickColumn("none");
            tree->SetColumns({{"c", "C", 0}});
            dialog.SelectRows("tree", {0});
            dialog.SetVisible("group", false);
            throw std::runtime_error("a handler fails");
        });
        EXPECT_THROW(dialog.RunModal(), std::runtime_error);
        EXPECT_THAT(GetRunningDialogs(), IsEmpty());
        tree->SetRows({});
        EXPECT_THAT(presser->told, ElementsAre("title during", "tree", "tree", "group"));
    }
    tree->SetRows({TreeRow()});
    SetBackEnd(former);
}

}  // namespace
}  // namespace ostui
