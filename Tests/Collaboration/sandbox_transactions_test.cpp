// A sandbox that looks for transactions in the way of its session.
#include "SandboxTest.h"
#include "ZOClientTesting/ScriptedWindows.h"

namespace ZOCL {
namespace {

using ZOClientTesting::ScriptedWindow;
using ZOClientTesting::ScriptedWindows;

class SandboxTransactionsTest : public SandboxTest {
protected:
    static ScriptedAnswer ListAnswer(const char* inType, const char* inTag) {
        return JSONAnswer(std::string("{'transactions':[{'zo:sessionId':'s','zo:transactionId':'t1',"
                                      "'zo:owner':'anna','metadata':{'machineName':'edit-2',"
                                      "'machineIP':'10.0.0.2','transactionType':'") +
                              inType + "'}}]}",
                          inTag);
    }
    void Check() {
        sandbox->CheckForPendingTransactionConflicts(kNoConflictTransactionTypes);
        Settle();
        Settle();
    }
    ScriptedWindows windows;
};

TEST_F(SandboxTransactionsTest, AUserWhoClosesTheProductionIsHeard) {
    MakeSandbox();
    Answer("/t", ListAnswer("edit", "\"1\""));
    windows.AnswerWith("ZOPendingTransactionDialog", "cancelButton");
    Check();
    ASSERT_EQ(windows.Shown().size(), 1u);
    EXPECT_EQ(windows.Shown()[0].title, "Waiting For Changes");
    EXPECT_EQ(windows.Shown()[0].Text("progressStaticText"),
              "Waiting for changes to be saved by anna on edit-2 (10.0.0.2).");
    EXPECT_EQ(closes, 1);
    // Nothing new since: the user is left alone.
    Answer("/t", ScriptedAnswer::Status(304));
    Check();
    EXPECT_EQ(LastRequest().Header("If-None-Match"), "\"1\"");
    EXPECT_EQ(windows.Shown().size(), 1u);
    EXPECT_EQ(closes, 1);
}

TEST_F(SandboxTransactionsTest, NobodyIsAskedWhenNothingCounts) {
    MakeSandbox();
    for (const ScriptedAnswer& answer :
         {ListAnswer("ingest", "\"1\""), JSONAnswer("{'transactions':[]}", "\"2\""),
          ScriptedAnswer::Status(500), JSONAnswer("{'transactions':8}", "\"3\"")}) {
        Answer("/t", answer);
        Check();
        EXPECT_EQ(LastRequest().Path(), "/t");
    }
    EXPECT_TRUE(windows.Shown().empty());
    EXPECT_EQ(closes, 0);
}

TEST_F(SandboxTransactionsTest, OneCheckAtATime) {
    MakeSandbox();
    Answer("/t", ScriptedAnswer::Hold());
    Check();
    Check();
    EXPECT_EQ(RequestsFor("/t").size(), 1u);
    // Still running while the user is asked.
    windows.Answer("ZOPendingTransactionDialog", [this](ScriptedWindow& ioWindow) {
        sandbox->CheckForPendingTransactionConflicts({});
        ioWindow.Press("cancelButton");
    });
    net->ReleaseHeld(ListAnswer("edit", "\"1\""));
    Settle();
    Settle();
    EXPECT_EQ(closes, 1);
    EXPECT_EQ(RequestsFor("/t").size(), 1u);
    Answer("/t", ScriptedAnswer::Status(304));
    Check();
    EXPECT_EQ(RequestsFor("/t").size(), 2u);
}

TEST_F(SandboxTransactionsTest, AWaitThatEndsByItselfClosesNothing) {
    MakeSandbox();
    Answer("/t", ListAnswer("edit", "\"1\""));
    windows.Answer("ZOPendingTransactionDialog", [this](ScriptedWindow& ioWindow) {
        Answer("/t", JSONAnswer("{'transactions':[]}", "\"2\""));
        ioWindow.WaitUntil([&] { return ioWindow.IsClosed(); });
    });
    Check();
    EXPECT_EQ(windows.Shown().size(), 1u);
    EXPECT_EQ(closes, 0);
}

}  // namespace
}  // namespace ZOCL
