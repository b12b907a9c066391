// Sharing: the questions before it, the table of results, the silent form, and an end at any moment.
#include <thread>

#include "FlowTest.h"

namespace ZOCL {
namespace {

class PublishFlowTest : public FlowTest {
protected:
    bool Share(bool inIsSilent = false, const char* inCommit = "c5", const char* inSession = "/s1",
               bool inNeedsSync = false, bool inHasConflicts = false) {
        completions.clear();
        return Publish::Publish(
            u"Film", HubURL(inSession), ImmutableString(inCommit), inNeedsSync, inHasConflicts,
            [this](bool inSucceeded, const ImmutableString& inCommitId) {
                completions =
                    (inSucceeded ? "yes " : "no ") + inCommitId.str() + (boxes.empty() ? "" : "told");
            },
            {}, {}, {}, {}, tracker, inIsSilent, u"Silently");
    }
    /// The window is filled in and pressed; when it stays open it is closed.
    void ExpectShare(bool inStaysOpen) {
        windows.Answer(ZOPublishDialog::kID, [inStaysOpen](ScriptedWindow& ioWindow) {
            WaitForList(ioWindow);
            ioWindow.Enter(ZOPublishDialog::kComment, "Day one");
            ioWindow.Press(ZOPublishDialog::kShareButton);
            EXPECT_EQ(ioWindow.IsClosed(), !inStaysOpen);
            EXPECT_EQ(ioWindow.Text(ZOPublishDialog::kComment), "Day one") << "a comment was lost";
            ioWindow.Dismiss();
        });
    }
    std::string completions;
};

TEST_F(PublishFlowTest, EachResultIsToldToHostAndUserInItsOwnWay) {
    const std::string error = "There was an error while sharing the production.";
    const struct {
        const char* failure;
        /// To the host, after or before the user was told.
        std::string told;
        /// How it ends.
        std::string box;
    } rows[] = {
        {"", "yes c10", ""},
        {"P204", "yes ", ""},
        {"P409", "no told",
         "A newer version of the production exists on the server. Please sync to the latest version."},
        {"P412", "no told", "were detected. Close the Share dialog to resolve these changes."},
        {"P403", "no ", error},
        {"P?", "no ", error},
        {"P!", "no ", error}};
    for (const auto& row : rows) {
        for (const bool isSilent : {false, true}) {
            SCOPED_TRACE(row.failure);
            Begin(row.failure);
            boxes.clear();
            if (!isSilent) {
                ExpectShare(!row.box.empty());
            }
            if (!isSilent && !row.box.empty()) {
                ExpectBox();
            }
            const std::size_t shown = windows.Shown().size();
            EXPECT_EQ(Share(isSilent), row.box.empty());
            EXPECT_EQ(windows.Shown().size() == shown, isSilent);
            EXPECT_EQ(completions, isSilent ? row.told.substr(0, row.told.find("told")) : row.told);
            EXPECT_THAT(LastBox(), EndsWith(isSilent ? "" : row.box));
            EXPECT_EQ(tracker->GetOutcome().wasShared, row.box.empty());
            const RecordedRequest push = Last("POST", "/s1/push");
            EXPECT_EQ(push.Field(":commitMessage"), isSilent ? "Silently" : "Day one");
            EXPECT_EQ(push.Field(":commitId") + push.Field(":resolveStrategy"), "c5NONE");
            EXPECT_THAT(Wire(), StartsWith(isSilent ? "sP" : "saoP"));
        }
    }
}

TEST_F(PublishFlowTest, WhatMustComeFirstIsAskedAndMayBeDeclined) {
    const std::string latest =
        "The latest changes to the production \"Film\" must be reconciled with your changes before sharing "
        "may continue.Get Latest ChangesCancel";
    const std::string conflicts =
        "Unresolved conflicts exist between the production on the server and your version of the "
        "production.Resolve ConflictsCancel";
    Begin();
    for (const int needs : {1, 2, 3}) {
        windows.Answer("Share \"Film\"", [&](ScriptedWindow& ioWindow) {
            EXPECT_EQ(ioWindow.Text(ostui::kMessageBoxText) + ioWindow.Text("okButton") +
                          ioWindow.Text("cancelButton"),
                      needs == 2 ? conflicts : latest);
            ioWindow.Press("cancelButton");
        });
        EXPECT_FALSE(Share(false, "c5", "/s1", needs != 2, needs >= 2));
    }
    EXPECT_EQ(Wire(), "");
    EXPECT_FALSE(tracker->GetOutcome().wasShown);
}

TEST_F(PublishFlowTest, WithoutACommitASessionOrAUserNothingIsSent) {
    Begin();
    for (const bool isSilent : {true, false}) {
        if (!isSilent) {
            ExpectShare(true);
            ExpectShare(true);
        }
        EXPECT_FALSE(Share(isSilent, ""));
        EXPECT_FALSE(Share(isSilent, "c5", "/gone"));
    }
    std::thread([this] { EXPECT_FALSE(Share(true)); }).join();
    ostui::SetBackEnd(nullptr);
    EXPECT_FALSE(Share() || Share(false, "c5", "/s1", true)) << "nobody was there to press a button";
    EXPECT_EQ(completions + Posts(), "");
}

TEST_F(PublishFlowTest, TheHostWritesFirstAndWhatItWroteIsShared) {
    Begin("P403");
    int writes = 0;
    RFL::Listener host(CurrentStation());
    host.AddHandler<ZOCommittedToPublishMessage>([&](const ZOCommittedToPublishMessage&) {
        if (++writes > 1) {
            return;
        }
        EXPECT_EQ(Posts(), "");
        On("GET /s1", JSONAnswer(SessionBody("c6"), "\"t2\""));
        Outcome refreshed;
        EXPECT_TRUE(RFL::QueryInterface<IZOCEditingSession>(server->GetProductionFromURL(HubURL("/s1")))
                        ->Refresh(Guid::CreateUnique(), refreshed.Function()));
        refreshed.Wait();
    });
    ExpectBox();
    windows.Answer(ZOPublishDialog::kID, [&](ScriptedWindow& ioWindow) {
        WaitForList(ioWindow);
        ioWindow.Press(ZOPublishDialog::kShareButton);
        EXPECT_EQ(Last("POST", "/s1/push").Field(":commitId"), "c6");
        On("POST /s1/push", SessionAnswer("c10"));
        ioWindow.Press(ZOPublishDialog::kShareButton);
        EXPECT_EQ(Last("POST", "/s1/push").Field(":commitId"), "c6") << "the next attempt forgot it";
    });
    EXPECT_TRUE(Share());
    EXPECT_EQ(writes, 2);
}

TEST_F(PublishFlowTest, AnEndAtAnyMomentLeavesNothingBehind) {
    for (const int moment : {0, 1, 2, 3, 4, 5}) {
        const char held = "aoP"[moment / 2];
        const auto isOut = [&] { return IsOut(held); };
        const bool isSignOut = moment % 2 != 0;
        const bool isShared = held == 'P' && !isSignOut;
        Begin();
        Hold(held);
        windows.Answer(ZOPublishDialog::kID, [&](ScriptedWindow& ioWindow) {
            if (held != 'P') {
                ioWindow.WaitUntil(isOut);
                return isSignOut ? SignOut() : ioWindow.Dismiss();
            }
            WaitForList(ioWindow);
            windows.Answer(kProgressWindowID, [&](ScriptedWindow& ioProgress) {
                ioProgress.WaitUntil(isOut);
                EXPECT_FALSE(ioProgress.Find(kProgressCancelButton)->isVisible);
                // Nobody can cancel a commit; the end of the session does not ask.
                isSignOut ? SignOut() : Release(SessionAnswer("c10"));
            });
            ioWindow.Press(ZOPublishDialog::kShareButton);
        });
        EXPECT_EQ(Share(), isShared);
        EXPECT_EQ(tracker->GetOutcome().result, isShared ? kResultSuccess : kResultDialogCancelled);
        EXPECT_EQ(completions, isShared ? "yes c10" : held == 'P' ? "no " : "");
        Release(ScriptedAnswer::Status(500));
        Settle();
    }
    EXPECT_THAT(boxes, IsEmpty());
}

}  // namespace
}  // namespace ZOCL
