// What is compiled into the library: each layout makes a dialog that has what the code asks of it, each icon
// is a picture, and the second language is read.
#include <iterator>
#include <sstream>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "Connection/ReconnectDialog.h"
#include "Frame/LibraryModule.h"
#include "Frame/ProgressWindow.h"
#include "ostcore/config/ZString.h"
#include "ostlyra/UI_Lyra.h"
#include "ZOClient/Library.h"

namespace ZOCL {
namespace {

using ostcore::config::Localizer;
using ostcore::utility::BinaryResource;
using ostcore::utility::GetBinaryFromModule;
using ostcore::utility::GetBinaryNames;
using ostui::Control;
using ostui::ControlType;
using testing::AllOf;
using testing::Contains;
using testing::ElementsAre;
using testing::EndsWith;
using testing::HasSubstr;
using testing::IsSupersetOf;
using testing::StartsWith;

constexpr ControlType kText = ControlType::kStaticText;
constexpr ControlType kButton = ControlType::kButton;
constexpr ControlType kBar = ControlType::kProgressBar;
constexpr ControlType kTree = ControlType::kTree;
constexpr ControlType kGroup = ControlType::kGroup;

using Controls = std::vector<std::pair<std::string, ControlType>>;

struct Window {
    std::string name;
    Controls controls;
    /// The group of the first control.
    std::string group;
    /// What the enter and the escape key press before the logic has said anything.
    std::string defaultButton;
    std::string cancelButton;
};

const Controls kProgressToConfirm{{kProgressText, kText},
                                  {"progressBar", kBar},
                                  {kProgressCancelButton, kButton},
                                  {kProgressConfirmButton, kButton}};
const Controls kPending{{kProgressText, kText},
                        {"progressBar", kBar},
                        {kProgressCancelButton, kButton},
                        {kProgressSecondButton, kButton}};
const Controls kReconnect{{kReconnectMessage, kText}, {kReconnectPassword, ControlType::kPasswordEdit}};
const Controls kPublish{
    {"assetTree", kTree},     {"commentLabelText", kText},  {"commitMessageTextEdit", ControlType::kTextEdit},
    {"ProgressView", kGroup}, {"progressTitleText", kText}, {"progressBar", kBar}};
const Controls kResolve{{"infoLabelText", kText},
                        {"conflictTreeSubView", kTree},
                        {"resolveTypeRadioGroup", ControlType::kRadioGroup}};
const Controls kHistory{{"HistoryTree", kTree},    {"TabContainer", ControlType::kTabs},
                        {"detailsDate", kText},    {"detailsUser", kText},
                        {"detailsComment", kText}, {"AssetTree", kTree}};

const Window kWindows[] = {
    {"ZOProgressDialog", kProgressToConfirm, "progressView", "", ""},
    {"ZONetworkUnavailableDialog", kProgressToConfirm, "", "", ""},
    {"ZOPendingTransactionDialog", kPending, "progressView", "", ""},
    {"ZOReconnectDialog", kReconnect, "", "okButton", "cancelButton"},
    {"ZOReflectionProgressDialog", {{"progressView", kTree}}, "", "", "cancelButton"},
    {"ZOPublishDialog", kPublish, "ZOPublishView", "okButton", "cancelButton"},
    {"ZOResolveDialog", kResolve, "ZOResolveView", "okButton", "cancelButton"},
    {"ZOHistorySyncDialog", kHistory, "", "confirmButton", "cancelButton"},
};

TEST(ShippedLayouts, AreWindowsWithTheControlsThatTheCodeKnows) {
    std::vector<std::string> windows;
    for (const Window& window : kWindows) {
        SCOPED_TRACE(window.name);
        windows.push_back(window.name);
        ostlyra::UI_Lyra made(window.name, GetLibraryModule());
        ASSERT_TRUE(made.Initialize()) << made.GetLayoutError().AsText();
        const ostui::Dialog& dialog = made.GetDialog();
        for (const auto& [identifier, type] : window.controls) {
            const Control* const control = dialog.Find(identifier);
            ASSERT_NE(control, nullptr) << identifier;
            EXPECT_EQ(control->type, type) << identifier;
        }
        EXPECT_EQ(dialog.Find(window.controls.front().first)->group, window.group);
        EXPECT_EQ(dialog.GetDefaultButton(), window.defaultButton);
        EXPECT_EQ(dialog.GetCancelButton(), window.cancelButton);
        EXPECT_FALSE(dialog.GetTitle().empty());
    }
    ostlyra::UI_Lyra resolve("ZOResolveDialog", GetLibraryModule());
    ASSERT_TRUE(resolve.Initialize());
    // In the order of ResolveType.
    EXPECT_THAT(
        resolve.GetDialog().Find("resolveTypeRadioGroup")->itemIDs,
        ElementsAre("acceptTheirsRadioButton", "acceptTheirsAndCopyRadioButton", "acceptYoursRadioButton"));
    // A layout that is not listed above is a page that one of them has pulled in.
    for (const std::string& name : GetBinaryNames(GetLibraryModule(), "lyra")) {
        EXPECT_TRUE(name.find("Tab") != std::string::npos || testing::Value(windows, Contains(name))) << name;
    }
}

/// Every text of a view, and of the views in it, that is shown to users.
void ForEachText(const ostui::View& inView, const std::function<void(const std::string&)>& inFunction) {
    for (const char* const parameter : {"name", "label", "tooltip", "okText", "cancelText"}) {
        if (const std::string* const text = inView.Find(parameter)) {
            inFunction(*text);
        }
    }
    for (const ostui::View& child : inView.children) {
        ForEachText(child, inFunction);
    }
}

TEST(ShippedLanguages, ReplaceEveryTextOfTheLayouts) {
    ASSERT_THAT(GetShippedLanguages(), Contains("de"));
    EXPECT_FALSE(LoadShippedLanguage("xx"));
    EXPECT_FALSE(LoadShippedLanguage(""));
    ASSERT_TRUE(LoadShippedLanguage("de_AT"));
    Localizer::SetLanguage("de_AT");
    for (const Window& window : kWindows) {
        ostlyra::UI_Lyra made(window.name, GetLibraryModule());
        ASSERT_TRUE(made.Initialize());
        ForEachText(*made.GetDialog().GetLayout(), [&](const std::string& inText) {
            EXPECT_THAT(inText, StartsWith("$$$/")) << window.name;
            EXPECT_TRUE(Localizer::Find(inText.substr(0, inText.find('=')))) << inText;
        });
    }
    ostlyra::UI_Lyra publish("ZOPublishDialog", GetLibraryModule());
    ASSERT_TRUE(publish.Initialize());
    EXPECT_EQ(publish.GetDialog().Find("okButton")->text, "Freigeben");
    EXPECT_EQ(publish.GetDialog().Find("cancelButton")->text, "Abbrechen");
    Localizer::Reset();
}

TEST(ShippedIcons, ArePicturesOfTheSizeThatTheirNamesSay) {
    const ImageSupply supply = GetGenericButtonImageSupply();
    EXPECT_FALSE(supply("SP_None_Sm"));
    const std::vector<std::string> names = GetBinaryNames(GetLibraryModule(), "SVG");
    std::istringstream wanted(
        "SP_Add_Sm SP_Minus_Sm SP_ArrowNext_Sm SP_ArrowPrevious_Sm SP_MeridaneLogo_44x42 SP_Compatible_Sm "
        "SP_IncompatibleAlert_Sm SP_ServerOffline_Sm SP_Waiting_Sm SP_DriveButton_Sm SP_Production_Sm "
        "SP_Folder_Sm "
        "SP_SmartBin_Sm SP_Sequence_Sm SP_VideoColored_Sm SP_VideoSubClip_Sm SP_SFComp_Sm SP_Tag_Md "
        "SP_UserGroup_Sm "
        "SP_ShowUser_Sm");
    const std::vector<std::string> known{std::istream_iterator<std::string>(wanted), {}};
    EXPECT_THAT(names, IsSupersetOf(known));
    for (const std::string& name : names) {
        const BinaryResource icon = supply(name);
        const std::string size = name.find("_Md") != std::string::npos      ? "24 24"
                                 : name.find("_44x42") != std::string::npos ? "44 42"
                                                                            : "16 16";
        EXPECT_THAT(
            std::string(icon.View()),
            AllOf(StartsWith("<svg "), HasSubstr("viewBox=\"0 0 " + size + "\""), EndsWith("</svg>\n")))
            << name;
    }
}

}  // namespace
}  // namespace ZOCL
