// What is kept of windows between runs: read from hostile text, merged into what others keep, and put back.
#include <stdlib.h>

#include <algorithm>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "Dialogs/UIProperties.h"
#include "Dialogs/ZOMultiColumnTree.h"
#include "Frame/Station.h"
#include "ostcore/threads/MainThread.h"
#include "ostcore/utility/StringConversion.h"
#include "RFL/Registry.h"
#include "ZOClient/Dialogs.h"
#include "ZOClient/Registry.h"
#include "ZOClientTesting/ScriptedWindows.h"

namespace ZOCL {
namespace {

/// JSON with ' for ".
UString Text(std::string inText) {
    std::replace(inText.begin(), inText.end(), '\'', '"');
    return ostcore::utility::ToUTF16(inText);
}

class UIPropertiesTest : public testing::Test {
protected:
    UIPropertiesTest() {
        setenv("ZOCLIENT_CONFIG_HOME", (testing::TempDir() + "zoclient-dialogs-test").c_str(), 0);
        RFL::CloseRegistry();
        Write(u"");
        ForgetUIProperties();
    }
    ~UIPropertiesTest() override { RFL::CloseRegistry(); }
    static void Write(const UString& inText) {
        EXPECT_TRUE(Registry::SetZORegistryValue(u"UIProperties", inText));
    }
    static UString Stored() {
        UString text;
        Registry::GetZORegistryValue(u"UIProperties", text);
        return text;
    }

    DialogProperties changes{ostui::Geometry{10, 20, 300, 400}, {}};
};

TEST_F(UIPropertiesTest, WhatIsForeignOrHostileCountsAsNotThereAndIsNoObstacle) {
    const std::string geometry = "{'D':{'dialogProperties':";
    const UString texts[] = {
        u"",
        u"{",
        u"[]",
        UString(3 << 20, u'x'),
        Text(geometry + "7},'E':[]}"),
        Text(geometry + "{'left':'1','top':2,'width':3,'height':4}}}"),
        Text(geometry + "{'left':1,'top':2,'width':0,'height':4},'treeProperties':{'T':[1]}}}"),
        Text(geometry + "{'left':-99999999999,'top':2,'width':3,'height':4}}}"),
        Text(geometry + "{'left':1.5,'top':18446744073709551615,'width':3}}}"),
    };
    for (const UString& text : texts) {
        Write(text);
        ForgetUIProperties();
        EXPECT_FALSE(GetDialogProperties("D").geometry);
        EXPECT_TRUE(GetDialogProperties("D").trees.empty());
        SetDialogProperties("D", changes);
        ForgetUIProperties();
        ASSERT_TRUE(GetDialogProperties("D").geometry);
        EXPECT_EQ(GetDialogProperties("D").geometry->left, 10);
    }
}

TEST_F(UIPropertiesTest, OnlyWhatHasChangedIsWrittenAndOthersKeepTheirs) {
    Write(Text("{'D':{'own':1,'dialogProperties':{'left':1,'top':2,'width':3,'height':4,'depth':5}}}"));
    EXPECT_EQ(GetDialogProperties("D").geometry->height, 4);
    // Another process writes what this one has read already.
    Write(Text("{'E':{'dialogProperties':{}},'D':{'own':2,'dialogProperties':{'depth':6}}}"));
    changes.trees["T"].columns["C"] = {90, 0};
    changes.trees["T"].sortColumnID = "C";
    SetDialogProperties("D", changes);
    EXPECT_EQ(Stored(), Text("{'E':{'dialogProperties':{}},'D':{'own':2,'dialogProperties':{'depth':6,"
                             "'left':10,'top':20,'width':300,'height':400},'treeProperties':{'T':{"
                             "'columnProperties':{'C':{'width':90,'index':0}},'sortColumnID':'C',"
                             "'isSortDirectionAscending':true}}}}"));
    Write(u"{}");
    SetDialogProperties("D", changes);
    EXPECT_EQ(Stored(), u"{}") << "nothing had changed";
}

/// A window with one tree; its user does what the test says.
class Window final : public ZODialogBaseImpl {
public:
    Window() : ZODialogBaseImpl(u"ZOResolveDialog") { Initialize(); }
    ostui::Tree& Tree() const { return *GetDialog().GetTree("conflictTreeSubView"); }

private:
    void LookUpControls() override {
        ZOMultiColumnTree(GetDialog().GetTree("conflictTreeSubView"))
            .SetColumns({"$$$/x/A=a", "$$$/x/B=b", "$$$/x/C=c"});
    }
};

TEST_F(UIPropertiesTest, AWindowComesBackAsItsUserLeftIt) {
    ostcore::threads::SetMainThread();
    RegisterStation();
    ZOClientTesting::ScriptedWindows windows;
    const auto run = [&](const function<void(ostui::Tree&)>& inAct, int inMoveTo, int inExpectedLeft) {
        Window window;
        windows.Answer("ZOResolveDialog", [&](ZOClientTesting::ScriptedWindow& ioShown) {
            const auto geometry = window.GetDialog().GetGeometry();
            EXPECT_EQ(geometry ? geometry->left : 0, inExpectedLeft);
            inAct(window.Tree());
            if (inMoveTo != 0) {
                window.GetDialog().SetGeometry({inMoveTo, 6, 700, 500});
            }
            ioShown.Dismiss();
        });
        window.RunModal();
        ForgetUIProperties();
    };
    run([](ostui::Tree&) {}, 0, 0);
    EXPECT_EQ(Stored(), u"") << "a window that nobody touched was stored";
    const auto change = [](ostui::Tree& ioTree) {
        ioTree.MoveColumn("C", 0);
        ioTree.SetColumnWidth("A", 120);
        ioTree.ClickColumn("B");
        ioTree.ClickColumn("B");
    };
    run(change, -5, 0);
    const auto compare = [](ostui::Tree& ioTree) {
        const auto& columns = ioTree.GetColumns();
        EXPECT_EQ(columns[0].id + columns[1].id + columns[2].id, "CAB");
        EXPECT_EQ(columns[1].width, 120);
        EXPECT_EQ(ioTree.GetSortColumn(), "B");
        EXPECT_FALSE(ioTree.IsSortAscending());
    };
    run(compare, 0, -5);
    // Of another version, or another hand.
    Write(
        Text("{'ZOResolveDialog':{'treeProperties':{'conflictTreeSubView':{'columnProperties':{'A':0,"
             "'B':{'index':9,'width':-1},'Z':{'index':0,'width':5}},'sortColumnID':'Z',"
             "'isSortDirectionAscending':'no'}}}}"));
    const auto compareStandard = [](ostui::Tree& ioTree) {
        EXPECT_EQ(ioTree.GetColumns()[0].id + ioTree.GetColumns()[1].id, "AB");
        EXPECT_GE(ioTree.GetColumns()[1].width, 0);
        EXPECT_EQ(ioTree.GetSortColumn(), "A");
        EXPECT_TRUE(ioTree.IsSortAscending());
    };
    run(compareStandard, 0, 0);
    EXPECT_THAT(windows.Mismatches(), testing::IsEmpty());
    ostcore::threads::ResetMainThread();
}

}  // namespace
}  // namespace ZOCL
