// Content for each window.
#include "Scenes.h"

#include "ostui/MessageBox.h"

namespace {

using ostui::Dialog;
using ostui::Tree;
using ostui::TreeRow;
using ostui::View;

View Make(const std::string& inTag, std::vector<ostui::ViewParameter> inParameters,
          std::vector<View> inChildren = {}) {
    View view;
    view.tag = inTag;
    view.parameters = std::move(inParameters);
    view.children = std::move(inChildren);
    return view;
}

void FillShare(Dialog& ioDialog) {
    const auto tree = ioDialog.GetTree("assetTree");
    tree->SetColumns(
        {{"name", "Name", 0}, {"action", "Action", 0}, {"type", "Change Type", 0}, {"path", "Path", 0}});
    tree->SetRows(
        {{"1", {"Opening Titles", "Edit", "Sequence", "/Reels/Reel 1"}, "SP_Sequence_Sm", "", -1},
         {"2", {"A012_C004", "Add", "Master Clip", "/Rushes/Day 12"}, "SP_VideoColored_Sm", "", -1},
         {"3", {"A012_C004 XMP", "Edit", "Metadata", "/Rushes/Day 12"}, "SP_VideoColored_Sm", "", -1},
         {"4", {"Harbour, night", "Add", "Subclip", "/Rushes/Day 12/Selects"}, "SP_VideoSubClip_Sm", "", -1},
         {"5", {"Old Music", "Delete", "Bin", "/Sound"}, "SP_Folder_Sm", "", -1},
         {"6", {"Interviews in Spanish", "Edit", "Smart Bin", "/"}, "SP_SmartBin_Sm", "", -1},
         {"7", {"Boat composite", "Edit", "Composition", "/VFX"}, "SP_SFComp_Sm", "", -1}});
    tree->SetSort("name", true);
    ioDialog.SetText("commitMessageTextEdit",
                     "Titles re-timed after Tuesday's screening; night shots of the harbour added.");
}

void FillResolve(Dialog& ioDialog) {
    ioDialog.SetTitle("Resolve Conflicts: Harbour Film");
    const auto tree = ioDialog.GetTree("conflictTreeSubView");
    tree->SetColumns({{"name", "Name", 0}, {"path", "Path", 0}, {"type", "Conflict Type", 0}});
    tree->SetSelectionMode(Tree::SelectionMode::kMultiple);
    tree->SetRows({{"1", {"Opening Titles", "/Reels/Reel 1", "Asset"}, "SP_Sequence_Sm", "", -1},
                   {"2", {"A012_C004", "/Rushes/Day 12", "XMP Metadata"}, "SP_VideoColored_Sm", "", -1},
                   {"3", {"Boat composite", "/VFX", "Asset"}, "SP_SFComp_Sm", "", -1}});
    tree->SetSort("path", false);
    tree->Select({0, 1});
    ioDialog.SetSelection("resolveTypeRadioGroup", 0);
}

void FillHistory(Dialog& ioDialog) {
    const auto tree = ioDialog.GetTree("HistoryTree");
    tree->SetColumns(
        {{"date", "Date", 170}, {"synced", "Synced", 0}, {"user", "User", 0}, {"comment", "Comment", 0}});
    tree->SetRows({{"3", {"2026-11-24 18:02", "", "Grace", "Sound of reel 2 laid"}, "SP_Waiting_Sm", "", -1},
                   {"2", {"2026-11-24 11:40", "Yes", "Ada", "Titles re-timed"}, "SP_Compatible_Sm", "", -1},
                   {"1", {"2026-11-23 09:15", "Yes", "Ada", "First assembly"}, "SP_Compatible_Sm", "", -1}});
    tree->Select({1});
    ioDialog.SetText("detailsDate", "24 November 2026, 11:40");
    ioDialog.SetText("detailsUser", "Ada");
    ioDialog.SetText("detailsComment", "Titles re-timed after Tuesday's screening.");
}

void FillReflection(Dialog& ioDialog) {
    const auto tree = ioDialog.GetTree("progressView");
    tree->SetColumns({{"name", "Name", 260}, {"state", "State", 0}});
    std::vector<TreeRow> rows;
    for (int reel = 1; reel <= 3; ++reel) {
        const int parent = static_cast<int>(rows.size());
        rows.push_back(
            {"r" + std::to_string(reel), {"Reel " + std::to_string(reel), ""}, "SP_Folder_Sm", "", -1});
        for (int shot = 1; shot <= 4; ++shot) {
            const std::string number = std::to_string(reel) + "0" + std::to_string(shot);
            rows.push_back({number,
                            {"Shot " + number, shot == 4 ? "Waiting" : "Done"},
                            "SP_VideoColored_Sm",
                            "",
                            parent});
        }
    }
    tree->SetRows(rows);
}

void FillMessage(Dialog& ioDialog) {
    ioDialog.SetTitle("Orvane Meridane");
    ioDialog.AddStaticText(
        ostui::kMessageBoxText,
        "A newer version of the production exists on the server. Please sync to the latest version.");
    ioDialog.AddButton("yesButton", "Get Latest Changes", 1);
    ioDialog.AddButton("cancelButton", "Cancel", 2);
    ioDialog.SetDefaultButton("yesButton");
    ioDialog.SetCancelButton("cancelButton");
}

void FillGallery(Dialog& ioDialog) {
    ioDialog.SetText("password", "secret");
    ioDialog.SetChecked("notify", true);
    ioDialog.SetSelection("radio", 1);
    ioDialog.SetEnabled("locked", false);
    ioDialog.SetEnabled("off", false);
    const auto tree = ioDialog.GetTree("tree");
    tree->SetColumns({{"name", "Name", 0}, {"size", "Size", 0}});
    tree->SetRows({{"a", {"Harbour Film", ""}, "SP_Production_Sm", "", -1},
                   {"b", {"Rushes", ""}, "SP_Folder_Sm", "", 0},
                   {"c", {"A012_C004", "412 MB"}, "SP_VideoColored_Sm", "", 1},
                   {"d", {"A012_C005", "96 MB"}, "SP_VideoColored_Sm", "", 1},
                   {"e", {"Edits", ""}, "SP_Folder_Sm", "", 0}});
    tree->Select({2});
}

void ShowLoading(Dialog& ioDialog) {
    ioDialog.SetVisible("ZOPublishView", false);
    ioDialog.SetProgress("progressBar", 0, 0);
}

void FillProgress(Dialog& ioDialog) {
    ioDialog.SetText("progressStaticText", "Sharing \"Harbour Film\": 1,204 of 1,930 items");
    ioDialog.SetVisible("confirmButton", false);
    ioDialog.SetProgress("progressBar", 62, 100);
}

}  // namespace

View MakeGallery() {
    const auto radio = [](const char* inID, const char* inName) {
        return Make("ost_radio_button", {{"identifier", inID}, {"name", inName}});
    };
    return Make(
        "ost_dialog", {{"name", "Every control"}, {"canResize", "true"}, {"minWidth", "560"}},
        {Make("row", {{"horizontal", "fill"}, {"spacing", "12"}},
              {Make("ost_static_image", {{"identifier", "logo"}, {"image", "SP_MeridaneLogo_44x42"}}),
               Make("column", {{"spacing", "2"}},
                    {Make("ost_static_text",
                          {{"identifier", "head"}, {"name", "Sign in to the hub"}, {"fontSize", "18"}}),
                     Make("ost_static_text", {{"identifier", "sub"},
                                              {"name", "Everybody on the team sees what you share."}})})}),
         Make("ost_text_edit", {{"identifier", "user"}, {"label", "User:"}, {"name", "ada"}}),
         Make("ost_text_edit", {{"identifier", "password"}, {"label", "Password:"}, {"password", "true"}}),
         Make("ost_popup", {{"identifier", "server"}, {"label", "Server:"}},
              {Make("ost_popup_item", {{"name", "hub.example"}}),
               Make("ost_popup_item", {{"name", "localhost"}})}),
         Make("ost_text_edit",
              {{"identifier", "locked"}, {"label", "Locked:"}, {"name", "cannot be changed"}}),
         Make("row", {{"horizontal", "fill"}, {"spacing", "6"}},
              {Make("ost_search_box", {{"identifier", "search"}, {"label", "Search productions"}}),
               Make("ost_picture_button",
                    {{"identifier", "add"}, {"image", "SP_Add_Sm"}, {"name", "Add"}, {"showBorder", "true"}}),
               Make("ost_picture_button",
                    {{"identifier", "minus"}, {"image", "SP_Minus_Sm"}, {"name", "Remove"}})}),
         Make("ost_multi_column_tree", {{"identifier", "tree"}, {"minHeight", "170"}, {"vertical", "fill"}}),
         Make("ost_groupbox",
              {{"identifier", "box"}, {"name", "When somebody shares"}, {"horizontal", "fill"}},
              {Make("ost_checkbox", {{"identifier", "notify"}, {"name", "Tell me"}}),
               Make("ost_checkbox", {{"identifier", "sound"}, {"name", "Play a sound"}}),
               Make("ost_radio_button_group",
                    {{"identifier", "radio"}, {"placement", "row"}, {"spacing", "16"}},
                    {radio("never", "Never merge"), radio("ask", "Ask first"),
                     radio("always", "Always merge")})}),
         Make("ost_progress_bar",
              {{"identifier", "bar"}, {"key_start_value", "40"}, {"key_total_value", "100"}}),
         Make("row", {{"horizontal", "fill"}, {"spacing", "8"}},
              {Make("ost_button", {{"identifier", "other"}, {"name", "Create an account"}}),
               Make("ost_button", {{"identifier", "off"}, {"name", "Not now"}})}),
         Make("ost_ok_cancel_row", {{"okText", "Sign In"}})});
}

std::vector<Scene> GetScenes() {
    return {
        {"Gallery", "", &FillGallery},
        {"Gallery-2x", "", &FillGallery, false, 2},
        {"Gallery-rtl", "", &FillGallery, true},
        {"MessageBox", "", &FillMessage},
        {"ZOPublishDialog", "ZOPublishDialog",
         [](Dialog& ioDialog) {
             FillShare(ioDialog);
             ioDialog.SetVisible("ProgressView", false);
         }},
        {"ZOPublishDialog-loading", "ZOPublishDialog", &ShowLoading},
        {"ZOResolveDialog", "ZOResolveDialog", &FillResolve},
        {"ZOResolveDialog-rtl", "ZOResolveDialog", &FillResolve, true},
        {"ZOHistorySyncDialog", "ZOHistorySyncDialog", &FillHistory},
        {"ZOReflectionProgressDialog", "ZOReflectionProgressDialog", &FillReflection},
        {"ZOProgressDialog", "ZOProgressDialog", &FillProgress},
        {"ZOProgressDialog-running", "ZOProgressDialog",
         [](Dialog& ioDialog) {
             FillProgress(ioDialog);
             ioDialog.SetText("progressStaticText", "Waiting for data from the Meridane Collaboration Hub.");
             ioDialog.SetProgress("progressBar", 0, 0);
             ioDialog.SetText("cancelButton", "Cancelling...");
             ioDialog.SetEnabled("cancelButton", false);
         }},
        {"ZOProgressDialog-confirm", "ZOProgressDialog",
         [](Dialog& ioDialog) {
             ioDialog.SetText("progressStaticText", "All conflicts were successfully resolved.");
             ioDialog.SetProgress("progressBar", 100, 100);
             ioDialog.SetVisible("cancelButton", false);
             ioDialog.SetDefaultButton("confirmButton");
         }},
        {"ZONetworkUnavailableDialog", "ZONetworkUnavailableDialog",
         [](Dialog& ioDialog) {
             ioDialog.SetVisible("confirmButton", false);
             ioDialog.SetProgress("progressBar", 0, 0);
         }},
        {"ZOPendingTransactionDialog", "ZOPendingTransactionDialog",
         [](Dialog& ioDialog) {
             ioDialog.SetText("progressStaticText",
                              "Waiting for changes to be saved by CadenzoPro on edit-7 (9f31c2aa).");
             ioDialog.SetProgress("progressBar", 0, 0);
         }},
        {"ZOReconnectDialog", "ZOReconnectDialog",
         [](Dialog& ioDialog) {
             ioDialog.SetText(
                 "messageText",
                 "You have been signed out from the current Orvane Meridane session.\n\nPlease re-enter "
                 "the password for the user \"ada\" on the server \"hub.example\":");
             ioDialog.SetText("passwordTextEdit", "secret");
         }},
    };
}
