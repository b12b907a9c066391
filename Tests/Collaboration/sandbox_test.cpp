// What a sandbox shows, when it tells its host, and updates whose answers come in every order.
#include <algorithm>

#include "SandboxTest.h"

namespace ZOCL {
namespace {

const char* const kAsset = "{'zo:assetId':'a'}";
const char* const kConflict = "{'zo:assetId':'a','zo:conflictsWithContentId':'x'}";

TEST_F(SandboxTest, BeforeTheFirstUpdateNothingIsCertain) {
    MakeSandbox();
    EXPECT_EQ(State(), "-D-sd");
    EXPECT_FALSE(sandbox->IsResolveInProgress());
    EXPECT_EQ(sandbox->GetHTTPURL(), HubURL("/s"));
    EXPECT_TRUE(sandbox->GetEditingSession());
    EXPECT_EQ(changes, 0);
}

TEST_F(SandboxTest, WithoutServerOrSessionAllIsFalseAndNothingHappens) {
    const auto check = [this] {
        EXPECT_EQ(State(), "-----");
        sandbox->SetDirtyStateUncertain(false);
        sandbox->SetSyncStateUncertain(false);
        sandbox->SetResolveIsInProgress(true);
        sandbox->SetHasConflicts(true);
        EXPECT_FALSE(sandbox->IsResolveInProgress());
        EXPECT_EQ(State(), "-----");
        EXPECT_FALSE(sandbox->UpdateSandboxStateAsync());
        sandbox->CheckForPendingTransactionConflicts({});
        EXPECT_TRUE(sandbox->GetHTTPURL().empty());
        EXPECT_FALSE(sandbox->GetEditingSession());
    };
    sandbox = boost::make_shared<ZOSandbox>(ImmutableString());
    check();
    ExchangeLoggedInServer(nullptr);
    sandbox = boost::make_shared<ZOSandbox>(HubURL("/s"));
    check();
    Settle();
    EXPECT_EQ(changes, 0);
    EXPECT_EQ(net->RequestCount(), 0u);
}

TEST_F(SandboxTest, EachStateAndWhetherItIsNews) {
    struct Row {
        const char* base;
        const char* head;
        const char* assets;
        const char* state;
        int changes;
    };
    const Row rows[] = {
        // The first is news, although nothing but the certainty has changed.
        {"c1", "c2", kAsset, "-D---", 1},
        {"c1", "c2", kAsset, "-D---", 0},
        {"c2", "c2", kAsset, "SD---", 1},
        {"c2", "c2", "", "S----", 1},
        {"c2", "c3", "", "-----", 1},
        {"c2", "c3", kConflict, "-DC--", 1},
        // Conflicts alone are no news.
        {"c2", "c3", kAsset, "-D---", 0},
        {"c2", "c3", kConflict, "-DC--", 0},
        {"c3", "c3", "", "S----", 1},
    };
    MakeSandbox();
    for (const Row& row : rows) {
        changes = 0;
        Answer("/p", ProductionAnswer(row.head));
        Answer("/out", DifferencesAnswer(row.base, row.assets));
        Update();
        EXPECT_EQ(State(), row.state) << row.base << row.head << row.assets;
        EXPECT_EQ(changes, row.changes) << row.base << row.head << row.assets;
    }
    EXPECT_EQ(lastURL, HubURL("/s"));
}

TEST_F(SandboxTest, UncertaintyIsToldOnceAndEndsWithTheNextUpdate) {
    MakeSandbox();
    Update();
    changes = 0;
    sandbox->SetDirtyStateUncertain(true);
    sandbox->SetDirtyStateUncertain(true);
    Settle();
    EXPECT_EQ(changes, 1);
    sandbox->SetSyncStateUncertain(true);
    Settle();
    EXPECT_EQ(changes, 2);
    EXPECT_EQ(State(), "S--sd");
    Update();
    EXPECT_EQ(changes, 3);
    EXPECT_EQ(State(), "S----");
    sandbox->SetResolveIsInProgress(true);
    sandbox->SetHasConflicts(true);
    EXPECT_TRUE(sandbox->IsResolveInProgress());
    EXPECT_EQ(State(), "S-C--");
    Settle();
    EXPECT_EQ(changes, 3);
}

TEST_F(SandboxTest, NotModifiedIsNoFailureAndSaysNothingOfTheRest) {
    MakeSandbox();
    Update();
    Answer("/s", ScriptedAnswer::Status(304));
    Answer("/out", DifferencesAnswer("c1", kAsset));
    Answer("/p", ScriptedAnswer::Status(304));
    Update();
    EXPECT_EQ(State(), "SD---");
    Answer("/p", ProductionAnswer("c2"));
    Update();
    EXPECT_EQ(State(), "-D---");
    EXPECT_EQ(LastRequest().Path(), "/p");
    EXPECT_EQ(LastRequest().Header("If-None-Match"), "\"p-c1\"");
}

TEST_F(SandboxTest, AFailureLeavesAllAsItWasAndTheNextUpdateWorks) {
    MakeSandbox();
    const struct {
        const char* path;
        ScriptedAnswer bad;
    } rows[] = {{"/s", ScriptedAnswer::Status(500)},         {"/s", ScriptedAnswer::NoResponse()},
                {"/out", ScriptedAnswer::Status(503)},       {"/out", JSONAnswer("{'info':3}")},
                {"/p", ScriptedAnswer::Status(404)},         {"/p", ScriptedAnswer::NoResponse()},
                {"/out", ScriptedAnswer::FailStart()},       {"/p", ScriptedAnswer::FailStart()},
                {"/p", ScriptedAnswer::Body("x", "text/x")}, {"/s", JSONAnswer("[]", "\"sx\"")}};
    for (const auto& row : rows) {
        Answer(row.path, row.bad);
        Update();
        EXPECT_EQ(State(), "-D-sd") << row.path;
        EXPECT_EQ(changes, 0) << row.path;
        Answer("/s", SessionAnswer("\"s1\""));
        Answer("/p", ProductionAnswer("c1"));
        Answer("/out", DifferencesAnswer("c1", ""));
    }
    Answer("/s", ScriptedAnswer::FailStart());
    EXPECT_FALSE(sandbox->UpdateSandboxStateAsync());
    Answer("/s", SessionAnswer("\"s1\""));
    Update();
    EXPECT_EQ(State(), "S----");
    EXPECT_EQ(changes, 1);
}

TEST_F(SandboxTest, TheTwoAnswersMayComeInAnyOrder) {
    for (const bool isProductionFirst : {true, false}) {
        MakeSandbox();
        changes = 0;
        Answer("/out", ScriptedAnswer::Hold());
        Answer("/p", ScriptedAnswer::Hold());
        Update();
        const auto release = [&](bool inProduction) {
            const auto ids = RequestsFor(inProduction ? "/p" : "/out");
            ASSERT_EQ(ids.size(), 1u);
            net->Release(ids[0], inProduction ? ProductionAnswer("c7") : DifferencesAnswer("c7", kAsset));
            Settle();
        };
        release(isProductionFirst);
        EXPECT_EQ(State(), "-D-sd");
        EXPECT_EQ(changes, 0);
        release(!isProductionFirst);
        EXPECT_EQ(State(), "SD---");
        EXPECT_EQ(changes, 1);
        // One fails while the other is still awaited: that one is cancelled, and nothing is taken over.
        Answer("/p", ProductionAnswer("c7"));
        Answer("/out", ScriptedAnswer::Hold());
        Answer("/p", ScriptedAnswer::Hold());
        Update();
        net->Release(RequestsFor(isProductionFirst ? "/p" : "/out").back(), ScriptedAnswer::Status(500));
        Settle();
        EXPECT_EQ(net->PendingCount(), 0u);
        EXPECT_EQ(State(), "SD---");
        EXPECT_EQ(changes, 1);
    }
}

TEST_F(SandboxTest, ALateUpdateDoesNotUndoALaterOne) {
    struct Update {
        ScriptedAnswer answer;
        const char* state;
    };
    const Update updates[] = {{DifferencesAnswer("c0", ""), "-----"},
                              {DifferencesAnswer("c1", ""), "S----"},
                              {DifferencesAnswer("c1", kConflict), "SDC--"}};
    std::vector<std::size_t> order{0, 1, 2};
    do {
        MakeSandbox();
        Answer("/out", ScriptedAnswer::Hold());
        for (int i = 0; i < 3; ++i) {
            SandboxTest::Update();
            // So that the next update's reads do not join those that are out.
            ASSERT_TRUE(server->BlockingDELETE(HubURL("/written"), {}, ostnet::http::kWaitForever));
        }
        const auto ids = RequestsFor("/out");
        ASSERT_EQ(ids.size(), 3u);
        std::size_t newest = 0;
        for (const std::size_t next : order) {
            net->Release(ids[next], updates[next].answer);
            Settle();
            newest = std::max(newest, next);
            EXPECT_EQ(State(), updates[newest].state) << order[0] << order[1] << order[2];
        }
    } while (std::next_permutation(order.begin(), order.end()));
}

TEST_F(SandboxTest, ASandboxThatIsClosedMeanwhileIsNotTouched) {
    for (const char* path : {"/s", "/out"}) {
        MakeSandbox();
        const weak_ptr<ZOSandbox> weak = sandbox;
        SetCurrentZOSandbox(sandbox);
        Answer(path, ScriptedAnswer::Hold());
        ASSERT_TRUE(UpdateCurrentZOSandboxAsync());
        Settle();
        SetCurrentZOSandbox(nullptr);
        sandbox.reset();
        EXPECT_TRUE(weak.expired());
        net->ReleaseHeld(std::string(path) == "/s" ? SessionAnswer("\"s2\"") : DifferencesAnswer("c1", ""));
        Settle();
        EXPECT_EQ(changes, 0);
        Answer("/s", SessionAnswer("\"s1\""));
    }
}

TEST_F(SandboxTest, ThereIsOneCurrentSandboxOrNone) {
    EXPECT_FALSE(GetCurrentZOSandbox());
    EXPECT_FALSE(UpdateCurrentZOSandboxAsync());
    MakeSandbox();
    SetCurrentZOSandbox(sandbox);
    EXPECT_EQ(GetCurrentZOSandbox(), sandbox);
    EXPECT_TRUE(UpdateCurrentZOSandboxAsync());
    Settle();
    EXPECT_EQ(State(), "S----");
    // It holds the server, so it goes with the library.
    Initialize();
    Shutdown();
    EXPECT_FALSE(GetCurrentZOSandbox());
}

}  // namespace
}  // namespace ZOCL
