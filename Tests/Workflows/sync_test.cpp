// Get latest: results, the merge of metadata, the host's part, the silent form, and the whole chain to a
// share.
#include <thread>

#include "FlowTest.h"

namespace ZOCL {
namespace {

std::string Say(bool inIsDone, bool inHasConflicts, const ImmutableString& inCommitId) {
    return std::string(inIsDone ? "done " : "failed ") + (inHasConflicts ? "conflicts " : "free ") +
           inCommitId.str();
}

class SyncFlowTest : public FlowTest {
protected:
    int Sync(bool inSilent, const Publish::SyncCompletion& inHost) {
        continued.clear();
        return Publish::Sync(
            u"Film", HubURL("/s1"), HubURL("/p1"), inHost, {}, {}, {}, tracker,
            [this](bool inIsDone, bool inIsFree, const ImmutableString& inCommitId, const auto& inTracker) {
                EXPECT_EQ(inTracker, tracker);
                continued += Say(inIsDone, !inIsFree, inCommitId);
            },
            inSilent);
    }
    /// Tells what it got, and goes on at once.
    Publish::SyncCompletion Host() {
        return [this](bool inDone, bool inConflicts, const ImmutableString& inCommitId,
                      const Continuation& inContinue) {
            host = Say(inDone, inConflicts, inCommitId);
            inContinue(kResultSuccess, inCommitId);
        };
    }
    std::string host;
    std::string continued;
};

TEST_F(SyncFlowTest, EachResultIsToldAndTheChainGoesOnAsItMay) {
    const char* const error = "There was an error syncing the production.";
    const struct {
        const char* failure;
        int result;
        const char* host;
        const char* box;
        bool hasConflicts = false;
    } rows[] = {
        {"", kResultSuccess, "done free c9", ""},
        {"", kResultSuccess, "done conflicts c9", "", true},
        {"L412", kResultHTTPPreconditionFailed, "failed free c8",
         "\"Get Latest Changes\" could not be completed because unexpected changes to "},
        {"L409", kResultHTTPConflict, "failed free c8", error},
        {"L?", kResultNoHTTPResponse, "failed free c8", error},
        {"s404", kResultFailure, "failed free c8", error},
    };
    for (const auto& row : rows) {
        const std::string differences = "'assets':[" + (row.hasConflicts ? AssetConflict("a") : "") + "]";
        for (const bool isSilent : {false, true}) {
            SCOPED_TRACE(row.failure);
            const bool isAsked = row.hasConflicts && !isSilent;
            Begin(row.failure, differences);
            boxes.clear();
            if (!isSilent && *row.box) {
                ExpectBox();
            }
            if (isAsked) {
                windows.Answer(ZOResolveDialog::kID, [](ScriptedWindow& ioWindow) { ioWindow.Dismiss(); });
            }
            const std::size_t shown = windows.Shown().size();
            EXPECT_EQ(Sync(isSilent, Host()), row.result);
            EXPECT_THAT(LastBox(), StartsWith(isSilent ? "" : row.box));
            EXPECT_EQ(host, row.host);
            EXPECT_EQ(continued, isAsked ? "" : host);
            EXPECT_EQ(windows.Shown().size() > shown, !isSilent);
        }
        Begin(row.failure, differences);
        EXPECT_EQ(Sync(true, {}), row.result);
        EXPECT_EQ(continued, row.result < 0 ? "" : row.host) << "without a host it goes on by itself";
    }
    EXPECT_EQ(windows.Shown()[0].title, "Get Latest Changes");
    EXPECT_EQ(windows.Shown()[0].Text(kProgressText), "Getting latest version of \"Film\"");
}

TEST_F(SyncFlowTest, MergedMetadataIsNoConflictAndItsCommitIsWhatGoesOn) {
    for (const bool isSilent : {true, false}) {
        Begin();
        // The merge finds that somebody has settled it meanwhile, at a commit of its own.
        const auto looks = boost::make_shared<std::atomic<int>>(0);
        On("GET /s1/out", [this, looks](const RecordedRequest&) {
            if (++*looks > 1) {
                return Differences("'enclosures':[]");
            }
            On("GET /s1", JSONAnswer(SessionBody("c11"), "\"t2\""));
            return Differences("'enclosures':[" + Conflict("'zo:name':'a_xmp'", "/x") + "]");
        });
        EXPECT_EQ(Sync(isSilent, Host()), kResultSuccess);
        EXPECT_EQ(host, "done free c11");
        EXPECT_EQ(continued, host);
        EXPECT_EQ(windows.Shown().empty(), isSilent);
    }
}

TEST_F(SyncFlowTest, TheHostGoesOnWhenItLikesAndOnlyOnceUnlessTheSessionHasEnded) {
    Begin();
    Continuation later;
    const auto keep = [&](bool, bool, const ImmutableString&, const Continuation& inContinue) {
        later = inContinue;
    };
    EXPECT_EQ(Sync(false, keep), kResultSuccess);
    std::thread([&] {
        later(kResultSuccess, ImmutableString("c12"));
        later(kResultSuccess, ImmutableString("c13"));
    }).join();
    EXPECT_EQ(continued, "") << "it went on off the main thread";
    Settle();
    EXPECT_EQ(continued, "done free c12");
    EXPECT_EQ(Sync(false, keep), kResultSuccess);
    later(kResultFailure, ImmutableString());
    Begin();
    Hold('L');
    windows.Answer(kProgressWindowID, [this](ScriptedWindow& ioWindow) {
        ioWindow.WaitUntil([this] { return IsOut('L'); });
        SignOut();
    });
    EXPECT_EQ(Sync(false, Host()), kResultDialogCancelled);
    EXPECT_EQ(host, "failed free c8");
    EXPECT_EQ(continued, "");
    Release(SessionAnswer("c9"));
}

TEST_F(SyncFlowTest, AShareGetsTheLatestResolvesAndShares) {
    Begin("", "'assets':[" + AssetConflict("a") + "," + AssetConflict("b") + "]");
    ExpectBox();
    windows.Answer(ZOResolveDialog::kID, [](ScriptedWindow& ioWindow) {
        ioWindow.WaitUntil([&] { return ioWindow.Rows(ZOResolveDialog::kTree).size() == 2; });
        ioWindow.SelectRows(ZOResolveDialog::kTree, {"0"});
        ioWindow.Press(ZOResolveDialog::kResolveButton);
        ioWindow.SelectRows(ZOResolveDialog::kTree, {"1"});
        ioWindow.Choose(ZOResolveDialog::kResolveTypes, ZOResolveDialog::kAcceptYours);
        ioWindow.Press(ZOResolveDialog::kResolveButton);
    });
    ExpectBox();
    windows.Answer(ZOPublishDialog::kID, [](ScriptedWindow& ioWindow) {
        WaitForList(ioWindow);
        ioWindow.Press(ZOPublishDialog::kShareButton);
    });
    std::size_t kept = 0;
    EXPECT_TRUE(Publish::Publish(
        u"Film", HubURL("/s1"), ImmutableString("c5"), true, true, {}, Host(),
        [](bool inSucceeded, const InterfaceRef<IZOCProduction>& inHead, const ImmutableString& inCommitId,
           const Continuation& inContinue) {
            EXPECT_TRUE(inSucceeded && inHead);
            EXPECT_EQ(inCommitId.view(), "c21");
            // The host has made a copy: the session has moved on.
            inContinue(kResultSuccess, ImmutableString("c30"));
        },
        [&](const std::vector<ImmutableString>& inURLs, const Continuation& inContinue) {
            kept = inURLs.size();
            inContinue(kResultSuccess, ImmutableString("c31"));
        },
        {}, tracker, false, u""));
    EXPECT_TRUE(tracker->GetOutcome().wasShared);
    EXPECT_EQ(tracker->GetOutcome().commitId.view(), "c10");
    EXPECT_EQ(kept, 1u);
    EXPECT_EQ(Posts(), "L15P");
    EXPECT_EQ(Last("POST", "/mine/asset/b").body, Quote("{':commitId':'c30'}"));
    EXPECT_EQ(Last("POST", "/s1/push").Field(":commitId"), "c31");
    EXPECT_EQ(LastBox(), "All conflicts were successfully resolved.");
}

}  // namespace
}  // namespace ZOCL
