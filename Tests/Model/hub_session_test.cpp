// Sessions and transactions against a hub that runs as a process of its own: two users, one production.
#include "HubSessionTest.h"

namespace ZOCL {
namespace {

constexpr const char* kChildHub = "ZO_TEST_CHILD_HUB";
constexpr const char* kChildPipe = "ZO_TEST_CHILD_PIPE";

TEST_F(HubSessionTest, WorkGoesFromATransactionThroughTheSessionToTheTeam) {
    using testing::Contains;
    const Member anna = SignIn("anna");
    const Member ben = SignIn("ben");
    const auto session = anna.OpenSession();
    const auto bens = ben.OpenSession();
    ASSERT_TRUE(session && bens);
    EXPECT_EQ(session->GetParentProductionIdentifier(), anna.production->GetIdentifier());
    const ImmutableString base = As<IZOCProduction>(session)->GetLoadedRevision();
    EXPECT_EQ(base, anna.production->GetLoadedRevision());

    const auto transaction = OpenTransaction(session);
    Add(transaction, u"Bin of anna");
    EXPECT_EQ(Write(transaction, "notes", "first"), kResultSuccess);
    EXPECT_EQ(Write(transaction, "notes", "second"), kResultSuccess);
    EXPECT_EQ(CountOpen(session), 1u);
    EXPECT_THAT(Names(As<IZOCProduction>(session)), testing::Not(Contains(u"Bin of anna")));
    EXPECT_EQ(Commit(transaction, u"A bin"), kResultSuccess);
    EXPECT_EQ(CountOpen(session), 0u);
    const ImmutableString head = As<IZOCProduction>(session)->GetLoadedRevision();
    EXPECT_NE(head, base);
    EXPECT_THAT(Names(As<IZOCProduction>(session)), Contains(u"Bin of anna"));
    const auto outgoing = session->GetOutgoingChanges();
    ASSERT_TRUE(As<IZOCServerResource>(outgoing)->Load(true));
    EXPECT_EQ(outgoing->GetBaseCommitID(), base);
    EXPECT_EQ(outgoing->GetCommitID(), head);
    EXPECT_EQ(outgoing->GetAssetDifferences().size(), 1u);

    // The same session is found again, by another host of the same user.
    const Member elsewhere = SignIn("anna");
    EXPECT_EQ(As<IZOCProduction>(elsewhere.OpenSession())->GetIdentifier(),
              As<IZOCProduction>(session)->GetIdentifier());
    EXPECT_NE(As<IZOCProduction>(bens)->GetIdentifier(), As<IZOCProduction>(session)->GetIdentifier());

    EXPECT_EQ(Push(session, u"Wrong", ostcore::utility::ToUTF16(base.view())), kResultHTTPPreconditionFailed);
    EXPECT_EQ(Push(session, u"Share", ostcore::utility::ToUTF16(head.view())), kResultSuccess);
    EXPECT_EQ(Refresh(session), kResultSuccess);
    EXPECT_EQ(anna.production->GetMostRecentRevision(), As<IZOCProduction>(session)->GetLoadedRevision());

    const auto bensWork = OpenTransaction(bens);
    Add(bensWork, u"Bin of ben");
    EXPECT_EQ(Commit(bensWork), kResultSuccess);
    EXPECT_EQ(Push(bens, u"Too early"), kResultHTTPConflict);
    EXPECT_EQ(Pull(bens, kMergeStrategy_Interactive), kResultSuccess);
    EXPECT_EQ(Push(bens, u"Both"), kResultSuccess);
    EXPECT_EQ(Refresh(bens), kResultSuccess);
    EXPECT_THAT(Names(As<IZOCProduction>(bens)), testing::IsSupersetOf({u"Bin of anna", u"Bin of ben"}));
}

TEST_F(HubSessionTest, TheTitleOfACommitIsReadBackFromTheHistory) {
    const Member anna = SignIn("anna");
    const auto session = anna.OpenSession();
    const auto transaction = OpenTransaction(session);
    Add(transaction, u"x");
    EXPECT_EQ(Commit(transaction, u"\u00fcber \"alles\""), kResultSuccess);
    const auto history = As<IZOCProduction>(session)->GetProductionHistory();
    ASSERT_TRUE(As<IZOCServerResource>(history)->Load(true));
    ASSERT_GT(history->GetHistoryVersionCount(), 0);
    CommitMetadata metadata;
    ASSERT_TRUE(GetCommitMetadataFromHistoryVersion(history->GetHistoryVersion(0), metadata));
    EXPECT_EQ(metadata.commitMessage, u"\u00fcber \"alles\"");
    EXPECT_EQ(metadata.metadata.transactionType, kTransactionType_Edit);
    EXPECT_FALSE(metadata.metadata.machineID.empty());
}

TEST_F(HubSessionTest, WhoIsStaleIsRefusedAndAnIngestIsRebased) {
    const Member anna = SignIn("anna");
    const Member elsewhere = SignIn("anna");
    const auto session = anna.OpenSession();
    const auto stale = elsewhere.OpenSession();
    const auto first = OpenTransaction(session);
    const auto second = OpenTransaction(session);
    const auto ingest = OpenTransaction(session, kTransactionType_Ingest);
    Add(first, u"first");
    Add(second, u"second");
    Add(ingest, u"ingested");
    EXPECT_EQ(Commit(first), kResultSuccess);
    EXPECT_EQ(Commit(second), kResultHTTPPreconditionFailed);
    EXPECT_EQ(CountOpen(session), 2u) << "what could not be committed stays pending";
    EXPECT_EQ(Commit(ingest), kResultSuccess);
    EXPECT_THAT(Names(As<IZOCProduction>(session)), testing::IsSupersetOf({u"first", u"ingested"}));
    const auto rollBack = [&](const Guid& inID, const RequestCompletion& inDone) {
        return second->Rollback(inID, inDone);
    };
    EXPECT_EQ(Perform(rollBack).result, kResultSuccess);
    EXPECT_EQ(Perform(rollBack).result, kResultGone);
    EXPECT_EQ(CountOpen(session), 0u);

    EXPECT_EQ(TryToOpen(stale, kTransactionType_Edit).result, kResultHTTPPreconditionFailed);
    const auto late = OpenTransaction(stale, kTransactionType_Ingest);
    EXPECT_TRUE(late) << "an ingest may start from any commit";
    EXPECT_EQ(Refresh(stale), kResultSuccess);
    EXPECT_TRUE(OpenTransaction(stale));
}

TEST_F(HubSessionTest, AssetsAndEnclosuresAreRemovedAndPropertiesStored) {
    const Member anna = SignIn("anna");
    const auto session = anna.OpenSession();
    const auto filling = OpenTransaction(session);
    Add(filling, u"keep");
    Add(filling, u"drop");
    EXPECT_EQ(Write(filling, "notes", "text"), kResultSuccess);
    EXPECT_EQ(Commit(filling), kResultSuccess);

    As<IZOCProduction>(session)->SetName(u"Renamed");
    const Ended opened = Perform([&](const Guid& inID, const RequestCompletion& inDone) {
        return session->CreateTransactionAndStoreChanges(inID, inDone, As<IZOCProduction>(session), u"edit");
    });
    ASSERT_EQ(opened.result, kResultSuccess);
    const auto transaction = As<IZOCTransaction>(opened.resource);
    const auto contents = As<IZOCProduction>(transaction);
    ASSERT_TRUE(As<IZOCServerResource>(contents->GetAssets())->Load(true));
    EXPECT_TRUE(As<IZOCWritableServerResource>(contents->GetAssets()->GetAssetByName(u"drop"))->Delete());
    ASSERT_TRUE(As<IZOCServerResource>(contents->GetEnclosures())->Load(true));
    EXPECT_TRUE(As<IZOCWritableServerResource>(contents->GetEnclosures()->GetEnclosure("notes"))->Delete());
    EXPECT_EQ(Perform([&](const Guid& inID, const RequestCompletion& inDone) {
                  return transaction->Refresh(inID, inDone);
              }).result,
              kResultSuccess);
    EXPECT_THAT(Names(contents), testing::Not(testing::Contains(u"drop")));
    EXPECT_EQ(Commit(transaction), kResultSuccess);
    const auto committed = As<IZOCProduction>(session);
    EXPECT_EQ(committed->GetName(), u"Renamed");
    EXPECT_THAT(Names(committed),
                testing::AllOf(testing::Contains(u"keep"), testing::Not(testing::Contains(u"drop"))));
    ASSERT_TRUE(As<IZOCServerResource>(committed->GetEnclosures())->Load(true));
    EXPECT_FALSE(committed->GetEnclosures()->GetEnclosure("notes"));
}

TEST_F(HubSessionTest, ADiscardedSessionIsGoneWithItsTransactionsAndANewOneIsMade) {
    const Member anna = SignIn("anna");
    const auto session = anna.OpenSession();
    const auto transaction = OpenTransaction(session);
    const ImmutableString former = As<IZOCProduction>(session)->GetIdentifier();
    ASSERT_TRUE(As<IZOCWritableServerResource>(session)->Delete());
    EXPECT_NE(As<IZOCProduction>(anna.OpenSession())->GetIdentifier(), former);
    EXPECT_EQ(Commit(transaction), kResultHTTPNotFound);
}

TEST_F(HubSessionTest, WhatAKilledProcessLeftOpenBlocksNobody) {
    int ends[2] = {-1, -1};
    ASSERT_EQ(pipe(ends), 0);
    setenv(kChildHub, hub.URL().str().c_str(), 1);
    setenv(kChildPipe, std::to_string(ends[1]).c_str(), 1);
    const pid_t child = Spawn({"/proc/self/exe", "--gtest_also_run_disabled_tests",
                               "--gtest_filter=ChildProcess.DISABLED_OpensATransactionAndStays"},
                              STDERR_FILENO);
    close(ends[1]);
    unsetenv(kChildHub);
    unsetenv(kChildPipe);
    char opened = 0;
    EXPECT_EQ(read(ends[0], &opened, 1), 1) << "the child opened nothing";
    close(ends[0]);
    kill(child, SIGKILL);
    waitpid(child, nullptr, 0);

    const Member anna = SignIn("anna");
    const auto session = anna.OpenSession();
    EXPECT_EQ(CountOpen(session), 1u);
    std::promise<int> ended;
    ASSERT_TRUE(session->GetPendingTransactions({}, [&ended](int inResult) { ended.set_value(inResult); }));
    EXPECT_EQ(ended.get_future().get(), kResultSuccess);
    EXPECT_EQ(CountOpen(session), 0u);
}

/// Runs in a process of its own, which the test above kills.
TEST(ChildProcess, DISABLED_OpensATransactionAndStays) {
    const char* const hub = getenv(kChildHub);
    const char* const end = getenv(kChildPipe);
    ASSERT_TRUE(hub && end);
    Initialize();
    const Member anna(hub, "anna");
    const auto transaction = OpenTransaction(anna.OpenSession());
    ASSERT_TRUE(transaction);
    ASSERT_EQ(write(atoi(end), "1", 1), 1);
    for (;;) {
        pause();
    }
}

}  // namespace
}  // namespace ZOCL
