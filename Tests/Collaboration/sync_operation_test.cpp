// Getting the latest over the scripted network: the order of the requests, what each failure stops and what
// it does not, and a cancel between any two of them.
#include "Collaboration/ZOSyncOperation.h"
#include "OperationTest.h"

namespace ZOCL {
namespace {

class SyncTest : public OperationTest {
protected:
    SyncTest() {
        const auto production =
            JSONAnswer("{'zo:productionId':'p1','zo:commitId':'c8','links':[" + Lists("/p1") + "," +
                       LinkTo("latest-version", "/p1/latest") + "]}");
        requests = {
            {'s', {"GET /s1", SessionAnswer("c5")}},
            {'p', {"GET /p1", production}},
            {'l', {"GET /p1/latest", production}},
            {'e', {"GET /s1/enclosures", Enclosures("", "\"t1\"")}},
            {'n', {"POST /s1/note", JSONAnswer("{'name':'n'}")}},
            {'N', {"PUT /s1/pre", JSONAnswer("{'name':'n'}")}},
            {'P', {"POST /s1/pull", SessionAnswer("c9")}},
            {'o', {"GET /s1/out", Differences("'enclosures':[" + Conflict("'zo:name':'a_xmp'", "/x") + "]")}},
            {'h', {"GET /h", ForeignHistory()}}};
    }
    static ScriptedAnswer Enclosures(const std::string& inItems, const char* inTag) {
        return JSONAnswer("{'enclosures':[" + inItems + "],'links':[" + LinkTo("create", "/s1/note") + "]}",
                          inTag);
    }
    InterfaceRef<ZOSyncOperation> Make() {
        return operation = InterfaceRef<ZOSyncOperation>(new ZOSyncOperation(HubURL("/s1"), HubURL("/p1")));
    }
    /// Pulled, changes, conflicts, conflicts of enclosures, a foreign commit: a letter for each; the commit.
    static std::string State(const ZOSyncOperation& inSync) {
        return std::string(inSync.PullSucceeded() ? "P" : "") + (inSync.HasChanges() ? "D" : "") +
               (inSync.HasConflicts() ? "C" : "") + (inSync.HasEnclosureConflicts() ? "E" : "") +
               (inSync.HasRecentCommitMetadata() ? "H" : "") + " " + inSync.GetCommitId().str();
    }
    InterfaceRef<ZOSyncOperation> operation;
};

TEST_F(SyncTest, TheRequestsFollowOneAnotherAndFailuresStopWhatTheyMust) {
    RunEach(
        {
            {"", kResultSuccess, "splenPon", "PDCE c9"},
            // A record that cannot be written is no reason to stop.
            {"n403", kResultSuccess, "splenPon", "PDCE c9"},
            {"e403", kResultSuccess, "splePoe", "PDCE c9"},
            // Neither is a failure to look at the outcome.
            {"o403", kResultSuccess, "splenPo", "P c9"},
            {"o!", kResultSuccess, "splenPo", "P c9"},
            {"P[", kResultSuccess, "splenPon", "PDCE "},
            {"P409", kResultHTTPConflict, "splenP", " c8"},
            {"P!", kResultFailure, "splenP", " c8"},
            {"P412", kResultHTTPPreconditionFailed, "splenPh", "H c8"},
            {"P412 h404", kResultHTTPPreconditionFailed, "splenPh", " c8"},
            // Without a head, or a session, there is nothing to merge and nothing to note.
            {"l404", kResultFailure, "spl", " "},
            {"p404", kResultFailure, "sp", " "},
            {"s404", kResultFailure, "spl", " c8"},
        },
        [this] { return Make(); }, State);
    ExchangeLoggedInServer(nullptr);
    EXPECT_EQ(Run(Make()), kResultFailure);
}

TEST_F(SyncTest, TheNotesSayWhatWasMergedAndTheDifferencesWhatCameOut) {
    using testing::HasSubstr;
    Begin();
    Run(Make());
    const auto sent = net->Requests();
    ASSERT_EQ(Wire(), "splenPon");
    EXPECT_THAT(sent[4].body, HasSubstr("\r\n\r\np1_preSyncHeadCommitId\r\n"));
    EXPECT_THAT(sent[4].body, HasSubstr("\r\n\r\nc8\r\n"));
    EXPECT_EQ(sent[5].Field(":mergeStrategy") + sent[5].Field(":commitId"), "interactivec8");
    EXPECT_THAT(sent[7].body, HasSubstr("\r\n\r\np1_postSyncBaseCommitId\r\n"));
    // Another host has written the note meanwhile, and the head is asked for again.
    On("GET /s1/enclosures",
       Enclosures("{'name':'p1_preSyncHeadCommitId','links':[" + LinkTo("edit", "/s1/pre") + "]}", "\"t2\""));
    On("GET /s1/out", Differences("'properties':" + Conflict("'zo:name':'p'", "/x")));
    net->ClearRequests();
    EXPECT_EQ(Run(Make()), kResultSuccess);
    EXPECT_EQ(Wire(), "leNPon");
    EXPECT_EQ(State(*operation), "PDC c9");
}

TEST_F(SyncTest, ACancelIsSeenBetweenTwoRequests) {
    const std::pair<char, const char*> rows[] = {{'p', "spl"},   {'l', "spl"},    {'e', "sple"},
                                                 {'n', "splen"}, {'P', "splenP"}, {'o', "splenPon"}};
    for (const auto& row : rows) {
        Begin();
        Stop(Make(), row.first, kResultCancelled);
        EXPECT_EQ(Wire(), row.second) << row.first;
        EXPECT_EQ(operation->PullSucceeded(), row.first == 'P' || row.first == 'o');
    }
    Make()->Abort();
    EXPECT_FALSE(operation->Start());
    Begin();
    Stop(Make(), 'P', kResultHTTPUnauthorized, true);
    EXPECT_EQ(Wire(), "splenP");
}

}  // namespace
}  // namespace ZOCL
