// History, differences and the sandbox of a real session, over sockets.
#include <atomic>

#include "Connection/LoggedInServer.h"
#include "HubSessionTest.h"
#include "ZOClient/CommitMetadata.h"
#include "ZOClient/IZOCDifferences.h"
#include "ZOClient/IZOCProductionHistory.h"
#include "ZOClient/ZOSandbox.h"

namespace ZOCL {
namespace {

template <class T>
InterfaceRef<T> Loaded(const InterfaceRef<T>& inObject) {
    const auto resource = As<IZOCServerResource>(inObject);
    EXPECT_TRUE(resource && resource->Load(true));
    return inObject;
}

class HubCollaborationTest : public HubSessionTest {
protected:
    HubCollaborationTest() : server(Connect(hub.URL().str(), "anna")) { ExchangeLoggedInServer(server); }
    ~HubCollaborationTest() override {
        SetCurrentZOSandbox(nullptr);
        server.Reset();
        IZOCDataServer::Terminate(false);
    }

    InterfaceRef<IZOCEditingSession> OpenSession(const InterfaceRef<IZOCProduction>& inProduction,
                                                 bool inIsTemporary) {
        InterfaceRef<IZOCEditingSession> session;
        EXPECT_TRUE(inProduction->CreateEditingSession(session, u"work", u"", inIsTemporary));
        return session;
    }
    static void AddAsset(const InterfaceRef<IZOCEditingSession>& inSession, const UString& inName,
                         const UString& inMessage) {
        const auto transaction = OpenTransaction(inSession);
        Add(transaction, inName);
        EXPECT_EQ(Commit(transaction, inMessage), kResultSuccess);
    }
    static void WriteNotes(const InterfaceRef<IZOCEditingSession>& inSession, const std::string& inText) {
        const auto transaction = OpenTransaction(inSession);
        EXPECT_EQ(Write(transaction, "notes.txt", inText), kResultSuccess);
        EXPECT_EQ(Commit(transaction), kResultSuccess);
    }
    static shared_ptr<ZOSandbox> OpenSandbox(const InterfaceRef<IZOCEditingSession>& inSession) {
        return boost::make_shared<ZOSandbox>(
            RFL::QueryInterface<IZOCServerResource>(inSession)->GetHTTPURL());
    }
    /// The state after an update: in sync, dirty, conflicts.
    std::string UpdatedState(ZOSandbox& ioSandbox) {
        int changes = 0;
        RFL::Listener listener(GetStationID());
        listener.AddHandler<ZOSandboxStateChangedMessage>(
            [&changes](const ZOSandboxStateChangedMessage&) { ++changes; });
        ioSandbox.SetSyncStateUncertain(true);
        ostcore::threads::PumpMainThread();
        changes = 0;
        EXPECT_TRUE(ioSandbox.UpdateSandboxStateAsync());
        for (int i = 0; i < 100 && changes == 0; ++i) {
            ostcore::threads::WaitAndPumpMainThread(200);
        }
        EXPECT_EQ(changes, 1);
        return std::string(ioSandbox.IsInSync() ? "S" : "-") + (ioSandbox.IsDirty() ? "D" : "-") +
               (ioSandbox.HasConflicts() ? "C" : "-") + (ioSandbox.IsSyncStateUncertain() ? "?" : "");
    }
    int FindRecent(const InterfaceRef<IZOCProduction>& inProduction, const ImmutableString& inKnown,
                   CommitMetadata& outMetadata) {
        std::promise<int> ended;
        EXPECT_TRUE(FindRecentRevisionWithCommitMetadata(
            inProduction, inKnown, [&](int inResult, const InterfaceRef<IZOCHistoryVersion>& inVersion) {
                GetCommitMetadataFromHistoryVersion(inVersion, outMetadata);
                ended.set_value(inResult);
            }));
        return ended.get_future().get();
    }

    InterfaceRef<IZOCDataServer> server;
};

TEST_F(HubCollaborationTest, HistoryDifferencesAndSandboxFollowTheWork) {
    ASSERT_TRUE(server);
    const auto production = server->CreateProduction(u"Film", u"", false);
    ASSERT_TRUE(production);
    const ImmutableString first = production->GetLoadedRevision();
    const auto session = OpenSession(production, false);
    ASSERT_TRUE(session);
    const auto asProduction = RFL::QueryInterface<IZOCProduction>(session);
    const auto sandbox = OpenSandbox(session);
    EXPECT_EQ(UpdatedState(*sandbox), "S--");
    CommitMetadata metadata;
    EXPECT_EQ(FindRecent(asProduction, first, metadata), kResultAlreadyThere);

    AddAsset(session, u"Dailies", u"First bin");
    EXPECT_EQ(UpdatedState(*sandbox), "SD-");
    const auto outgoing = Loaded(session->GetOutgoingChanges());
    const auto assets = outgoing->GetAssetDifferences();
    ASSERT_EQ(assets.size(), 1u);
    EXPECT_EQ(assets[0].name.view(), "Dailies");
    EXPECT_EQ(assets[0].differenceType, kDifferenceType_Added);
    EXPECT_EQ(assets[0].committer.view(), "anna");
    EXPECT_FALSE(assets[0].committed.is_not_a_date_time());
    EXPECT_FALSE(assets[0].assetURL.empty());
    EXPECT_EQ(outgoing->GetBaseCommitID(), first);
    EXPECT_FALSE(outgoing->HasConflicts());
    EXPECT_EQ(FindRecent(asProduction, first, metadata), kResultSuccess);
    EXPECT_EQ(metadata.commitMessage, u"First bin");
    EXPECT_EQ(metadata.metadata.transactionType, kTransactionType_Edit);

    // A second line of work, which shares first.
    const auto other = OpenSession(production, true);
    ASSERT_TRUE(other);
    AddAsset(other, u"Sound", u"Second bin");
    EXPECT_EQ(Push(other, u"Sound is there"), kResultSuccess);
    EXPECT_EQ(UpdatedState(*sandbox), "-D-");
    const auto incoming = Loaded(session->GetIncomingChanges())->GetAssetDifferences();
    ASSERT_EQ(incoming.size(), 1u);
    EXPECT_EQ(incoming[0].name.view(), "Sound");
    EXPECT_EQ(Push(session, u"too late"), kResultHTTPConflict);
    EXPECT_EQ(Pull(session, kMergeStrategy_Safe), kResultSuccess);
    EXPECT_EQ(UpdatedState(*sandbox), "SD-");
    EXPECT_EQ(Push(session, u"Dailies are there"), kResultSuccess);
    EXPECT_EQ(UpdatedState(*sandbox), "S--");

    const auto history = Loaded(production->GetProductionHistory());
    ASSERT_EQ(history->GetHistoryVersionCount(), 3);
    UString date, user, title, message, revision;
    history->GetHistoryVersion(0)->GetInfo(date, user, title, message, revision);
    EXPECT_EQ(title, u"Dailies are there");
    EXPECT_FALSE(date.empty());
    EXPECT_EQ(history->GetHistoryVersion(1)->GetUserID().view(), "anna");
    EXPECT_EQ(history->GetHistoryVersion(2)->GetRevision(), first);
    EXPECT_FALSE(history->GetNextPage());
    const auto all = Loaded(GetDifferencesByCommit(server, production->GetIdentifier(), first, {}));
    EXPECT_EQ(all->GetAssetDifferences().size(), 2u);
    EXPECT_EQ(all->GetCommitID(), history->GetMostRecentRevision());
}

TEST_F(HubCollaborationTest, AConflictShowsInDifferencesAndSandboxUntilItIsDecided) {
    ASSERT_TRUE(server);
    const auto production = server->CreateProduction(u"Film", u"", false);
    ASSERT_TRUE(production);
    const auto session = OpenSession(production, false);
    const auto other = OpenSession(production, true);
    ASSERT_TRUE(session && other);
    WriteNotes(session, "mine");
    WriteNotes(other, "theirs");
    EXPECT_EQ(Push(other, u"Notes first"), kResultSuccess);
    const auto sandbox = OpenSandbox(session);
    EXPECT_EQ(Pull(session, kMergeStrategy_Safe), kResultHTTPConflict);
    EXPECT_EQ(UpdatedState(*sandbox), "-D-");
    EXPECT_EQ(Pull(session, kMergeStrategy_Interactive), kResultSuccess);
    EXPECT_EQ(UpdatedState(*sandbox), "SDC");
    const auto outgoing = Loaded(session->GetOutgoingChanges());
    EXPECT_TRUE(outgoing->HasEnclosureConflicts());
    EXPECT_FALSE(outgoing->HasAssetConflicts());
    const auto entries = outgoing->GetEnclosureDifferences();
    ASSERT_EQ(entries.size(), 1u);
    EXPECT_TRUE(entries[0].IsInConflict());
    EXPECT_TRUE(entries[0].identifier.IsNull());
    EXPECT_EQ(entries[0].name.view(), "notes.txt");
    EXPECT_FALSE(entries[0].baseCommitID.empty());
    EXPECT_FALSE(entries[0].acceptYoursURL.empty());
    ASSERT_FALSE(entries[0].acceptTheirsURL.empty());
    const std::string body = "{\":commitId\":\"" + outgoing->GetCommitID().str() + "\"}";
    EXPECT_EQ(Perform([&](const Guid& inID, const RequestCompletion& inEnd) {
                  return server->PostToURL(entries[0].acceptTheirsURL, RecycledMemory::CreateFromBytes(body),
                                           ImmutableString("application/json;charset=utf-8"), inID, inEnd);
              }).result,
              kResultSuccess);
    EXPECT_EQ(UpdatedState(*sandbox), "S--");
}

TEST_F(HubCollaborationTest, AWatchedSessionTellsOfACommitAndTheEndMayComeDuringAPoll) {
    ASSERT_TRUE(server);
    const auto production = server->CreateProduction(u"Film", u"", false);
    ASSERT_TRUE(production);
    const auto session = OpenSession(production, false);
    ASSERT_TRUE(session);
    const auto watched =
        Loaded(IZOCServerResource::Create(RFL::QueryInterface<IZOCServerResource>(session)->GetHTTPURL(),
                                          server, ResourceWritability::kReadOnly));
    struct News {
        std::promise<ImmutableString> first;
        std::atomic<bool> isTold{false};
    };
    // A call that has begun may outlast the notifier's stop.
    const auto news = boost::make_shared<News>();
    const auto notifier = watched->SubscribeToChanges(
        [news](const InterfaceRef<IZOCServerResource>& inResource) {
            if (!news->isTold.exchange(true)) {
                news->first.set_value(inResource->GetETag(true));
            }
        },
        false, 1);
    ASSERT_TRUE(notifier);
    const ImmutableString before = notifier->GetETag();
    AddAsset(session, u"Dailies", u"First bin");
    auto told = news->first.get_future();
    ASSERT_EQ(told.wait_for(std::chrono::seconds(20)), std::future_status::ready);
    EXPECT_NE(told.get(), before);
    notifier->StopNotifications();
    // Goes on until the library ends; nobody listens.
    watched->SubscribeToChanges(ServerResourceChangeNotifier::Function(), false, 1);
}

}  // namespace
}  // namespace ZOCL
