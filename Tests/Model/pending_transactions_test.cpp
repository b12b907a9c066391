// Waiting for the transactions of others: orphans, the window, and its ways out, on the virtual clock.
#include <atomic>

#include "Frame/ProgressWindow.h"
#include "Model/ClientMetadata.h"
#include "Model/SessionConflictMessage.h"
#include "ostcore/config/ClientInfo.h"
#include "ostcore/threads/Executor.h"
#include "ostcore/threads/MainThread.h"
#include "ostcore/threads/Scheduler.h"
#include "ostnetsync/IDVConnection.h"
#include "ostui/MessageBox.h"
#include "Resources/PollingResourceMonitor.h"
#include "SessionTest.h"
#include "ZOClientTesting/ScriptedWindows.h"

namespace ZOCL {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using testing::UnorderedElementsAre;
using ZOClientTesting::ScriptedWindow;
using ZOClientTesting::ScriptedWindows;

constexpr const char* kOthersEdit =
    "{'applicationName':'Elsewhere','machineID':'m9','machineName':'studio-9','machineIP':'10.0.0.9',"
    "'transactionType':'edit'}";
constexpr const char* kOthersIngest = "{'applicationName':'Elsewhere','transactionType':'ingest'}";

class PendingTransactionsTest : public SessionTest {
protected:
    PendingTransactionsTest() { ostcore::threads::SetMainThread(); }
    ~PendingTransactionsTest() override {
        PollingResourceMonitor::CancelAllOutstandingPolls(true);
        EXPECT_TRUE(ostcore::threads::WaitForExecutors(20000));
        ostcore::threads::ResetMainThread();
        EXPECT_THAT(windows.Mismatches(), IsEmpty());
    }
    static std::string Own(const std::string& inType) {
        return "{'applicationName':'" + ostcore::config::GetClientName() + "','machineID':'" +
               ostnetsync::IDVConnection::GetIDVDeviceID() + "','transactionType':'" + inType + "'}";
    }
    /// What the hub has open on the session, by identifier; served as list and as documents.
    void Serve(const std::map<std::string, std::string>& inOpen) {
        {
            std::lock_guard<std::mutex> lock(mMutex);
            mOpen = inOpen;
            ++mTag;
        }
        On("GET /s1/transactions", [this](const RecordedRequest&) {
            std::lock_guard<std::mutex> lock(mMutex);
            std::string items;
            for (const auto& item : mOpen) {
                items += (items.empty() ? "" : ",") + ListItem(item.first, "s1", item.second);
            }
            return JSONAnswer(ListBody(items), "\"list" + std::to_string(mTag) + "\"");
        });
        for (const auto& item : inOpen) {
            const std::string id = item.first;
            On("GET /" + id, JSONAnswer(TransactionBody(id, item.second)));
            On("POST /" + id + "/rollback", [this, id](const RecordedRequest&) {
                std::lock_guard<std::mutex> lock(mMutex);
                mOpen.erase(id);
                ++mTag;
                return ScriptedAnswer::Status(204);
            });
        }
    }
    std::vector<std::string> StillOpen() {
        std::lock_guard<std::mutex> lock(mMutex);
        std::vector<std::string> open;
        for (const auto& item : mOpen) {
            open.push_back(item.first);
        }
        return open;
    }
    /// Runs one of the two forms to its end.
    int Wait(const std::vector<ImmutableString>& inIgnored = {}, bool inUnderWindow = false) {
        const auto session = MakeSession();
        const auto result = boost::make_shared<std::atomic<int>>(kNotYet);
        const auto calls = boost::make_shared<std::atomic<int>>(0);
        const auto completion = [result, calls](int inResult) {
            ++*calls;
            *result = inResult;
        };
        if (inUnderWindow) {
            session->WaitForPendingTransactions(inIgnored, completion);
        } else {
            EXPECT_TRUE(session->GetPendingTransactions(inIgnored, completion));
        }
        for (int turn = 0; *result == kNotYet && turn < 2000; ++turn) {
            ostcore::threads::WaitAndPumpMainThread(10);
        }
        EXPECT_TRUE(net->WaitUntilIdle());
        EXPECT_EQ(*calls, 1);
        return *result;
    }
    /// Lets polls pass until the condition holds.
    static bool PollUntil(ScriptedWindow& ioWindow, ostcore::threads::VirtualScheduler& ioClock,
                          const std::function<bool()>& inCondition) {
        return ioWindow.WaitUntil([&] {
            ioClock.Advance(std::chrono::milliseconds(500));
            return inCondition();
        });
    }

    static constexpr int kNotYet = 77;
    const shared_ptr<ostcore::threads::VirtualScheduler> clock =
        boost::make_shared<ostcore::threads::VirtualScheduler>();
    const ostcore::threads::ScopedGlobalScheduler scope{clock};
    ScriptedWindows windows;

private:
    std::mutex mMutex;
    std::map<std::string, std::string> mOpen;
    int mTag = 0;
};

TEST_F(PendingTransactionsTest, NobodyIsWaitedForWithoutReason) {
    Serve({});
    EXPECT_EQ(Wait(), kResultSuccess);
    Serve({{"t1", kOthersIngest}});
    EXPECT_EQ(Wait(kNoConflictTransactionTypes), kResultSuccess);
    EXPECT_EQ(Wait(kNoConflictTransactionTypes, true), kResultSuccess);
    EXPECT_THAT(StillOpen(), ElementsAre("t1"));
    for (const auto& shown : windows.Shown()) {
        EXPECT_EQ(shown.title.find("Waiting For Changes"), std::string::npos);
    }
    On("GET /s1/transactions", ScriptedAnswer::Status(500));
    EXPECT_EQ(Wait(), kResultHTTPInternalServerError);
    EXPECT_EQ(Wait({}, true), kResultHTTPInternalServerError);
    EXPECT_TRUE(Traced("Failed to load transaction list, inResult == "));
}

TEST_F(PendingTransactionsTest, WhatThisApplicationLeftOnThisMachineIsRolledBackWhateverRunItIsOf) {
    const std::string otherMachine = "{'applicationName':'" + ostcore::config::GetClientName() +
                                     "','machineID':'m9','transactionType':'ingest'}";
    Serve({{"t1", Own("edit")}, {"t2", Own("ingest")}, {"t3", otherMachine}, {"t4", kOthersIngest}});
    EXPECT_EQ(Wait(kNoConflictTransactionTypes), kResultSuccess);
    EXPECT_THAT(StillOpen(), UnorderedElementsAre("t3", "t4"));
    // One that ended between the list and the roll-back does not matter.
    Serve({{"t1", Own("edit")}, {"t2", Own("edit")}});
    On("GET /t1", ScriptedAnswer::Status(404));
    On("POST /t2/rollback", ScriptedAnswer::Status(404));
    EXPECT_EQ(Wait(), kResultSuccess);
}

TEST_F(PendingTransactionsTest, TheWindowNamesWhoIsInTheWayAndClosesWhenNobodyIs) {
    Serve({{"t1", kOthersEdit}});
    windows.Answer("Waiting For Changes", [this](ScriptedWindow& ioWindow) {
        EXPECT_EQ(ioWindow.Text(kProgressText),
                  "Waiting for changes to be saved by u1 on studio-9 (10.0.0.9).");
        EXPECT_EQ(ioWindow.Text(kProgressCancelButton), "Close Production");
        EXPECT_EQ(ioWindow.Text(kProgressSecondButton), "Discard Changes");
        const std::size_t before = CountOf("GET", "/s1/transactions");
        PollUntil(ioWindow, *clock, [&] { return CountOf("GET", "/s1/transactions") >= before + 2; });
        EXPECT_FALSE(ioWindow.IsClosed()) << "it is still open";
        Serve({});
        PollUntil(ioWindow, *clock, [&] { return ioWindow.IsClosed(); });
    });
    EXPECT_EQ(Wait(), kResultSuccess);
    EXPECT_EQ(CountOf("POST", "/t1/rollback"), 0u);
}

TEST_F(PendingTransactionsTest, CloseProductionEndsTheWaitWithAFailure) {
    Serve({{"t1", kOthersEdit}});
    windows.AnswerWith("Waiting For Changes", kProgressCancelButton);
    const int result = Wait();
    EXPECT_EQ(result, kResultDialogCancelled);
    EXPECT_LT(result, 0);
    EXPECT_THAT(StillOpen(), ElementsAre("t1"));
    const std::size_t polls = CountOf("GET", "/s1/transactions");
    clock->Advance(std::chrono::seconds(5));
    EXPECT_TRUE(ostcore::threads::WaitForExecutors(20000));
    EXPECT_EQ(CountOf("GET", "/s1/transactions"), polls) << "nobody asks any more";
}

TEST_F(PendingTransactionsTest, DiscardAsksAndNoLeavesTheWindowOpen) {
    Serve({{"t1", kOthersEdit}, {"t2", kOthersEdit}, {"t3", kOthersIngest}});
    const std::string no = ostui::GetMessageBoxButtonID(ostui::kMessageBoxNo);
    windows.AnswerWith("Orvane Meridane", no);
    windows.AnswerWith("Orvane Meridane", ostui::GetMessageBoxButtonID(ostui::kMessageBoxYes));
    windows.Answer("Waiting For Changes", [this](ScriptedWindow& ioWindow) {
        ioWindow.Press(kProgressSecondButton);
        EXPECT_FALSE(ioWindow.IsClosed());
        EXPECT_EQ(StillOpen().size(), 3u);
        const std::size_t before = CountOf("GET", "/s1/transactions");
        PollUntil(ioWindow, *clock, [&] { return CountOf("GET", "/s1/transactions") >= before + 2; });
        EXPECT_FALSE(ioWindow.IsClosed()) << "the wait goes on";
        ioWindow.Press(kProgressSecondButton);
        EXPECT_TRUE(ioWindow.IsClosed());
    });
    EXPECT_EQ(Wait(kNoConflictTransactionTypes), kResultSuccess);
    EXPECT_THAT(StillOpen(), ElementsAre("t3"));
    ASSERT_EQ(windows.Shown().size(), 3u);
    EXPECT_EQ(windows.Shown()[1].Text(ostui::kMessageBoxText),
              "Discarding the pending changes cannot be undone. Are you sure you want to continue?");
}

TEST_F(PendingTransactionsTest, WhatCannotBeDiscardedIsToldAfterAllWereTried) {
    Serve({{"t1", kOthersEdit}, {"t2", kOthersEdit}});
    On("POST /t1/rollback", ScriptedAnswer::Status(403));
    windows.AnswerWith("Waiting For Changes", kProgressSecondButton);
    windows.AnswerWith("Orvane Meridane", ostui::GetMessageBoxButtonID(ostui::kMessageBoxYes));
    EXPECT_EQ(Wait(), kResultHTTPForbidden);
    EXPECT_THAT(StillOpen(), ElementsAre("t1"));
}

TEST_F(PendingTransactionsTest, TheConflictMessageNamesApplicationAndMachineWhenTheyAreKnown) {
    const std::string ok = ostui::GetMessageBoxButtonID(ostui::kMessageBoxOK);
    CommitMetadata metadata;
    for (int round = 0; round < 2; ++round) {
        windows.AnswerWith("Orvane Meridane", ok);
        ShowSessionConflictMessage(server, u"Share", metadata, round == 0 ? u"" : u"More.");
        metadata.metadata.applicationName = "Host";
        metadata.metadata.machineName = "studio-9";
    }
    ASSERT_EQ(windows.Shown().size(), 2u);
    EXPECT_EQ(windows.Shown()[0].Text(ostui::kMessageBoxText),
              "\"Share\" could not be completed because unexpected changes to 's unshared version of the "
              "production were detected. Press OK to resolve these changes.");
    EXPECT_EQ(windows.Shown()[1].Text(ostui::kMessageBoxText),
              "\"Share\" could not be completed because unexpected changes to 's unshared version of the "
              "production occurred in Host on the machine \"studio-9\". More.");
}

}  // namespace
}  // namespace ZOCL
