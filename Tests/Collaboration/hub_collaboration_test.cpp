// History, differences and the sandbox of a real session, over sockets.
#include <atomic>
#include <future>

#include "HubProcess.h"
#include "ostcore/threads/MainThread.h"
#include "RFL/Registry.h"
#include "ZOClient/CommitMetadata.h"
#include "ZOClient/IZOCDifferences.h"
#include "ZOClient/IZOCEditingSession.h"
#include "ZOClient/IZOCProductionHistory.h"
#include "ZOClient/Library.h"
#include "ZOClient/ZOSandbox.h"

namespace ZOCL {
namespace {

struct Ended {
    int result = kResultNotStarted;
    InterfaceRef<IZOCServerResource> resource;
};

/// Starts a request and waits for its end.
Ended WaitFor(const function<bool(const Guid&, const RequestCompletion&)>& inStart) {
    const auto ended = boost::make_shared<std::promise<Ended>>();
    const bool started =
        inStart(Guid::CreateUnique(),
                [ended](const Guid&, int inResult, const InterfaceRef<IZOCServerResource>& inResource,
                        const shared_ptr<ostnet::Response>&) {
                    ended->set_value({inResult, inResource});
                });
    EXPECT_TRUE(started);
    return started ? ended->get_future().get() : Ended();
}

template <class T>
InterfaceRef<T> Loaded(const InterfaceRef<T>& inObject) {
    const auto resource = RFL::QueryInterface<IZOCServerResource>(inObject);
    EXPECT_TRUE(resource && resource->Load(true));
    return inObject;
}

class HubCollaborationTest : public testing::Test {
protected:
    HubCollaborationTest() {
        setenv("ZOCLIENT_CONFIG_HOME", (hub.Directory() + "/config").c_str(), 1);
        setenv("ZOCLIENT_STATE_HOME", (hub.Directory() + "/state").c_str(), 1);
        RFL::CloseRegistry();
        Initialize();
        ZOSCredentials credentials;
        credentials.username = ImmutableString("anna");
        credentials.password = "annas-secret";
        std::promise<InterfaceRef<IZOCDataServer>> ended;
        Guid id;
        EXPECT_TRUE(IZOCDataServer::ConnectToServer(
            hub.URL(), credentials, id, false,
            [&ended](const Guid&, const InterfaceRef<IZOCDataServer>& inServer, int,
                     const shared_ptr<ostnet::Response>&) { ended.set_value(inServer); },
            true, true));
        server = ended.get_future().get();
    }
    ~HubCollaborationTest() override {
        SetCurrentZOSandbox(nullptr);
        server.Reset();
        IZOCDataServer::Terminate(false);
        ostcore::threads::PumpMainThread();
        Shutdown();
        RFL::CloseRegistry();
    }

    InterfaceRef<IZOCEditingSession> OpenSession(const InterfaceRef<IZOCProduction>& inProduction,
                                                 bool inIsTemporary) {
        InterfaceRef<IZOCEditingSession> session;
        EXPECT_TRUE(inProduction->CreateEditingSession(session, u"work", u"", inIsTemporary));
        return session;
    }
    using Write = function<bool(const InterfaceRef<IZOCTransaction>&, const Guid&, const RequestCompletion&)>;
    /// One request in a transaction of its own.
    void WriteAndCommit(const InterfaceRef<IZOCEditingSession>& inSession, const UString& inMessage,
                        const Write& inWrite) {
        const Ended opened = WaitFor([&](const Guid& inID, const RequestCompletion& inEnd) {
            return inSession->CreateTransaction(inID, inEnd, kTransactionType_Edit);
        });
        const auto transaction = RFL::QueryInterface<IZOCTransaction>(opened.resource);
        ASSERT_TRUE(transaction) << GetResultName(opened.result);
        EXPECT_GE(WaitFor([&](const Guid& inID, const RequestCompletion& inEnd) {
                      return inWrite(transaction, inID, inEnd);
                  }).result,
                  0);
        EXPECT_EQ(WaitFor([&](const Guid& inID, const RequestCompletion& inEnd) {
                      return transaction->Commit(inID, inEnd, inMessage);
                  }).result,
                  kResultSuccess);
    }
    void AddAsset(const InterfaceRef<IZOCEditingSession>& inSession, const UString& inName,
                  const UString& inMessage) {
        AssetBaseProperties properties;
        properties.name = inName;
        properties.assetType = kAssetType_Bin;
        WriteAndCommit(inSession, inMessage,
                       [properties](const InterfaceRef<IZOCTransaction>& inTransaction, const Guid& inID,
                                    const RequestCompletion& inEnd) {
                           return inTransaction->CreateNewAsset(inID, inEnd, properties);
                       });
    }
    void WriteNotes(const InterfaceRef<IZOCEditingSession>& inSession, const std::string& inText) {
        WriteAndCommit(inSession, u"Notes",
                       [inText](const InterfaceRef<IZOCTransaction>& inTransaction, const Guid& inID,
                                const RequestCompletion& inEnd) {
                           return inTransaction->WriteEnclosure("notes.txt", inText, inID, inEnd,
                                                                "text/plain");
                       });
    }
    int GetLatest(const InterfaceRef<IZOCEditingSession>& inSession, MergeStrategy inStrategy) {
        return WaitFor([&](const Guid& inID, const RequestCompletion& inEnd) {
                   return inSession->Pull(inID, inEnd, inStrategy, u"");
               })
            .result;
    }
    int Share(const InterfaceRef<IZOCEditingSession>& inSession, const UString& inMessage) {
        return WaitFor([&](const Guid& inID, const RequestCompletion& inEnd) {
                   return inSession->Push(inID, inEnd, inMessage, kResolveStrategy_None, u"");
               })
            .result;
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

    RunningHub hub;
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
    EXPECT_EQ(Share(other, u"Sound is there"), kResultSuccess);
    EXPECT_EQ(UpdatedState(*sandbox), "-D-");
    const auto incoming = Loaded(session->GetIncomingChanges())->GetAssetDifferences();
    ASSERT_EQ(incoming.size(), 1u);
    EXPECT_EQ(incoming[0].name.view(), "Sound");
    EXPECT_EQ(Share(session, u"too late"), kResultHTTPConflict);
    EXPECT_EQ(GetLatest(session, kMergeStrategy_Safe), kResultSuccess);
    EXPECT_EQ(UpdatedState(*sandbox), "SD-");
    EXPECT_EQ(Share(session, u"Dailies are there"), kResultSuccess);
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
    EXPECT_EQ(Share(other, u"Notes first"), kResultSuccess);
    const auto sandbox = OpenSandbox(session);
    EXPECT_EQ(GetLatest(session, kMergeStrategy_Safe), kResultHTTPConflict);
    EXPECT_EQ(UpdatedState(*sandbox), "-D-");
    EXPECT_EQ(GetLatest(session, kMergeStrategy_Interactive), kResultSuccess);
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
    EXPECT_EQ(WaitFor([&](const Guid& inID, const RequestCompletion& inEnd) {
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
