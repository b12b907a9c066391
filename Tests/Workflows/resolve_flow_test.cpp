// Settling conflicts: the window step by step, the host's part between steps, failures, and the way without a
// window.
#include "FlowTest.h"
#include "ZOClient/ZOSandbox.h"

namespace ZOCL {
namespace {

using Publish::ResolveType;

class ResolveFlowTest : public FlowTest {
protected:
    /// Two assets, and the production's properties.
    void BeginConflicts(const std::string& inFailure = "") {
        Begin(inFailure, "'assets':[" + AssetConflict("a") + "," + AssetConflict("b") +
                             "],'properties':" + Conflict("'zo:name':'p'", "/props"));
    }
    bool Resolve(const ScriptedWindows::Script& inScript, std::size_t inRows = 3) {
        heard.clear();
        windows.Answer(ZOResolveDialog::kID, [inScript, inRows](ScriptedWindow& ioWindow) {
            if (inRows > 0) {
                ioWindow.WaitUntil([&] { return ioWindow.Rows(ZOResolveDialog::kTree).size() == inRows; });
            }
            inScript(ioWindow);
        });
        return Publish::Resolve(
            u"Film", HubURL("/s1"), HubURL("/p1"), replaced, kept, {kAssetType_Bin}, tracker,
            [this](bool inIsDone, bool inIsFree, const ImmutableString& inCommitId, const auto&) {
                heard.push_back("next " + inCommitId.str());
                EXPECT_TRUE(inIsDone && inIsFree);
            });
    }
    bool Individually(const Texts& inIDs, ResolveType inType, const std::set<ImmutableString>& inCopyable) {
        heard.clear();
        const std::vector<ImmutableString> ids(inIDs.begin(), inIDs.end());
        return Publish::ResolveIndividualConflicts(u"Film", HubURL("/s1"), HubURL("/p1"), ids, inType,
                                                   replaced, kept, inCopyable);
    }
    static void Select(ScriptedWindow& ioWindow, const Texts& inRows, const char* inType) {
        ioWindow.SelectRows(ZOResolveDialog::kTree, inRows);
        ioWindow.Choose(ZOResolveDialog::kResolveTypes, inType);
    }
    static bool CanResolve(const ScriptedWindow& inWindow) {
        return inWindow.Find(ZOResolveDialog::kResolveButton)->isEnabled;
    }
    Texts heard;
    Continuation continuation;
    const Publish::ResolveCompletion replaced = [this](bool, const InterfaceRef<IZOCProduction>& inHead,
                                                       const ImmutableString& inCommitId,
                                                       const Continuation& inContinue) {
        heard.push_back("replaced " + inCommitId.str() + (inHead ? "" : " of nothing"));
        continuation = inContinue;
    };
    const Publish::ConflictsKeptFunction kept = [this](const std::vector<ImmutableString>& inURLs,
                                                       const Continuation& inContinue) {
        heard.push_back("kept " + std::to_string(inURLs.size()));
        continuation = inContinue;
    };
};

TEST_F(ResolveFlowTest, TheWindowOffersWhatEachSelectionAllowsAndEndsWhenNothingIsLeft) {
    BeginConflicts();
    ExpectBox();
    const auto sandbox = boost::make_shared<ZOSandbox>(HubURL("/s1"));
    SetCurrentZOSandbox(sandbox);
    EXPECT_TRUE(Resolve([&](ScriptedWindow& ioWindow) {
        EXPECT_TRUE(sandbox->IsResolveInProgress());
        EXPECT_EQ(ioWindow.Title(), "Resolve Conflicts: Film");
        EXPECT_EQ(ioWindow.Text(ZOResolveDialog::kStopButton), "Cancel");
        EXPECT_THAT(ioWindow.Rows(ZOResolveDialog::kTree),
                    ElementsAre("Alpha | / | Asset", "b |  | Asset", StartsWith("Production Settings")));
        const ostui::Control& choice = *ioWindow.Find(ZOResolveDialog::kResolveTypes);
        EXPECT_EQ(choice.selection, choice.FindItem(ZOResolveDialog::kAcceptTheirs));
        EXPECT_FALSE(CanResolve(ioWindow)) << "nothing is selected";
        // The host can copy bins, and nothing else.
        Select(ioWindow, {"0"}, ZOResolveDialog::kAcceptTheirsAndCopy);
        EXPECT_TRUE(CanResolve(ioWindow));
        ioWindow.SelectRows(ZOResolveDialog::kTree, {"0", "2"});
        EXPECT_FALSE(CanResolve(ioWindow)) << "a version would be lost";
        ioWindow.SelectRows(ZOResolveDialog::kTree, {"0"});
        ioWindow.Press(ZOResolveDialog::kResolveButton);
        EXPECT_THAT(heard, ElementsAre("replaced c21"));
        EXPECT_EQ(ioWindow.Text(ZOResolveDialog::kStopButton), "Stop Resolving");
        ioWindow.WaitUntil([&] { return !sandbox->IsDirtyStateUncertain() && sandbox->HasConflicts(); });
        Select(ioWindow, {"1", "2"}, ZOResolveDialog::kAcceptTheirs);
        EXPECT_FALSE(CanResolve(ioWindow)) << "the host has not said which commit comes next";
        continuation(kResultSuccess, ImmutableString("c30"));
        EXPECT_TRUE(CanResolve(ioWindow));
        ioWindow.Press(ZOResolveDialog::kResolveButton);
        EXPECT_TRUE(ioWindow.IsClosed());
    }));
    EXPECT_EQ(Last("POST", "/theirs/asset/a").body + Last("POST", "/theirs/asset/b").body +
                  Last("POST", "/theirs/props").body,
              Quote("{':commitId':'c9'}{':commitId':'c30'}{':commitId':'c22'}"));
    EXPECT_THAT(heard, ElementsAre("replaced c21", "replaced c23"));
    EXPECT_EQ(LastBox(), "All conflicts were successfully resolved.");
    continuation(kResultSuccess, ImmutableString());
    EXPECT_EQ(heard.back(), "next c23") << "the flow waits for its host";
    EXPECT_FALSE(sandbox->IsResolveInProgress());
    SetCurrentZOSandbox(nullptr);
}

TEST_F(ResolveFlowTest, AHostThatRefusesEndsTheChainAndNoConflictAsksNobody) {
    Begin("", "'assets':[" + AssetConflict("a") + "]");
    ExpectBox();
    EXPECT_TRUE(Resolve(
        [](ScriptedWindow& ioWindow) {
            Select(ioWindow, {"0"}, ZOResolveDialog::kAcceptYours);
            ioWindow.Press(ZOResolveDialog::kResolveButton);
        },
        1));
    continuation(kResultFailure, ImmutableString());
    EXPECT_THAT(heard, ElementsAre("kept 1"));
    // Settled elsewhere meanwhile.
    Begin();
    ExpectBox();
    EXPECT_TRUE(Resolve([](ScriptedWindow&) {}, 0));
    EXPECT_THAT(heard, ElementsAre("next c9"));
}

TEST_F(ResolveFlowTest, AfterAFailureTheWindowStaysWithWhatIsLeft) {
    const std::pair<const char*, const char*> rows[] = {
        {"2412", "\"Resolve Conflicts\" could not be completed because unexpected changes to "},
        {"2403", "Conflict resolution could not be completed."},
        {"2?", "Conflict resolution could not be completed."}};
    for (const auto& row : rows) {
        BeginConflicts(row.first);
        EXPECT_FALSE(Resolve([&](ScriptedWindow& ioWindow) {
            ioWindow.SelectRows(ZOResolveDialog::kTree, {"0", "1", "2"});
            ExpectBox();
            ioWindow.Press(ZOResolveDialog::kResolveButton);
            EXPECT_THAT(LastBox(), StartsWith(row.second));
            EXPECT_EQ(ioWindow.Rows(ZOResolveDialog::kTree).size(), 2u) << "what was settled is settled";
            EXPECT_FALSE(ioWindow.IsClosed());
            ioWindow.Press(ZOResolveDialog::kStopButton);
        }));
        EXPECT_THAT(heard, ElementsAre("replaced c21"));
        EXPECT_EQ(Posts(), "12");
    }
    EXPECT_TRUE(Traced("Conflict resolution failed, result: http-403"));
}

TEST_F(ResolveFlowTest, ACancelKeepsWhatIsDoneAndASignOutLeavesNothing) {
    for (const bool isSignOut : {false, true}) {
        BeginConflicts();
        Hold('2');
        EXPECT_FALSE(Resolve([&](ScriptedWindow& ioWindow) {
            windows.Answer(kProgressWindowID, [&](ScriptedWindow& ioProgress) {
                ioProgress.WaitUntil([this] { return IsOut('2'); });
                ioProgress.WaitUntil([&] { return ioProgress.Text(kProgressText) == "Resolving \"b\"..."; });
                EXPECT_EQ(ioProgress.Find(kProgressBar)->value, 33u);
                if (isSignOut) {
                    return SignOut();
                }
                ioProgress.Press(kProgressCancelButton);
                ioProgress.WaitUntil([&] { return ioProgress.Text(kProgressText) == "Cancelling..."; });
                EXPECT_FALSE(ioProgress.Find(kProgressCancelButton)->isEnabled);
                Release(SessionAnswer("c22"));
            });
            ioWindow.SelectRows(ZOResolveDialog::kTree, {"0", "1", "2"});
            ioWindow.Press(ZOResolveDialog::kResolveButton);
            EXPECT_EQ(ioWindow.IsClosed(), isSignOut);
            EXPECT_EQ(ioWindow.Rows(ZOResolveDialog::kTree).size(), isSignOut ? 3u : 1u);
            ioWindow.Dismiss();
        }));
        EXPECT_EQ(heard.size(), isSignOut ? 0u : 1u);
        Release(ScriptedAnswer::Status(500));
        Settle();
        EXPECT_EQ(Posts(), "12");
    }
    EXPECT_THAT(boxes, IsEmpty());
}

TEST_F(ResolveFlowTest, ConflictsAreListedAndSettledWithoutAWindow) {
    BeginConflicts();
    std::vector<Publish::ConflictItem> items;
    EXPECT_TRUE(Publish::GetCurrentConflictList(u"Film", HubURL("/s1"), {kAssetType_Bin}, items));
    ASSERT_EQ(items.size(), 3u);
    EXPECT_EQ(items[0].displayName + u"|" + items[0].path + u"|" + items[0].typeText, u"Alpha|/|Asset");
    EXPECT_EQ(items[2].displayName, u"Production Settings");
    EXPECT_THAT(items[0].resolveTypes, ElementsAre(0, 1, 2));
    EXPECT_THAT(items[2].resolveTypes, ElementsAre(0, 2));
    EXPECT_EQ(windows.Shown()[0].Text(kProgressText), "Loading conflict details for \"Film\"");

    const auto theirs = Publish::kResolveType_AcceptTheirs;
    const auto copy = Publish::kResolveType_AcceptTheirsAndCopy;
    const auto mine = Publish::kResolveType_AcceptYours;
    const std::set<ImmutableString> none, bins{kAssetType_Bin};
    const struct {
        const char* failure;
        Texts ids;
        ResolveType type;
        std::set<ImmutableString> copyable;
        bool isSettled;
        const char* posts;
        Texts heard;
    } rows[] = {{"", {"a"}, mine, none, true, "4", {"kept 1"}},
                {"", {"ProductionProperties"}, theirs, none, true, "3", {}},
                {"", {"b", "a"}, theirs, none, true, "12", {"replaced c22"}},
                {"", {"a"}, copy, none, false, "", {}},
                {"", {"a"}, copy, bins, true, "1", {"replaced c21"}},
                {"", {"unknown"}, theirs, none, false, "", {}},
                {"5404", {"b"}, mine, none, false, "5", {}},
                {"a403", {"a"}, theirs, none, false, "", {}}};
    for (const auto& row : rows) {
        BeginConflicts(row.failure);
        if (!row.isSettled && *row.posts) {
            ExpectBox();
        }
        EXPECT_EQ(Individually(row.ids, row.type, row.copyable), row.isSettled) << row.ids[0];
        EXPECT_EQ(Posts(), row.posts);
        EXPECT_EQ(heard, row.heard);
    }
    EXPECT_FALSE(Publish::GetCurrentConflictList(u"Film", HubURL("/s1"), {}, items));
    EXPECT_THAT(items, IsEmpty());
}

}  // namespace
}  // namespace ZOCL
