// Transactions: how one is opened, what is written in it, and its two ends.
#include "Model/TransactionList.h"
#include "ostcore/config/ClientInfo.h"
#include "ostcore/threads/Gate.h"
#include "ostcore/utility/StringConversion.h"
#include "ostnet/utility/LocalHostIPAddress.h"
#include "ostnetsync/IDVConnection.h"
#include "SessionTest.h"
#include "ZOClient/CommitMetadata.h"

namespace ZOCL {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;

constexpr const char* kEdit = "{'applicationName':'Host','transactionType':'edit','extra':'x'}";
constexpr const char* kIngest = "{'transactionType':'ingest'}";

class TransactionTest : public SessionTest {
protected:
    /// Opens one through the factory; the answer stands in the place of the list and of the creation.
    InterfaceRef<IZOCServerResource> Open(const InterfaceRef<Production>& inSession,
                                          const ImmutableString& inType, int inExpected = kResultSuccess,
                                          const optional<ExtraTransactionMetadata>& inExtra = boost::none) {
        Outcome outcome;
        const Guid id = Guid::CreateUnique();
        EXPECT_TRUE(inSession->CreateTransaction(id, outcome.Function(), inType, inExtra));
        EXPECT_EQ(outcome.Wait(), inExpected);
        EXPECT_EQ(outcome.ID(), id);
        EXPECT_EQ(outcome.Calls(), 1);
        EXPECT_EQ(bool(outcome.Resource()), inExpected >= 0);
        return outcome.Resource();
    }
    void ServeTransactions() {
        On("GET /s1/transactions", JSONAnswer(ListBody("")));
        On("POST /s1/new-transaction",
           JSONAnswer(TransactionBody("t1", kEdit)).With("Location", HubURL("/t1").str()));
    }
    InterfaceRef<Production> MakeTransaction(const std::string& inMetadata = kEdit) {
        return Make<Production>(TransactionBody("t1", inMetadata));
    }
    static std::string Metadata(const std::string& inType, const std::string& inMore = "") {
        const auto own = [](const std::string& inText) { return ",'" + inText; };
        char host[256] = "";
        gethostname(host, sizeof host - 1);
        return Quote("{'applicationName':'" + ostcore::config::GetClientName() + "'" +
                     own("applicationBuildNumber':'") + ostcore::config::GetClientBuildNumber() + "'" +
                     own("applicationInstanceID':'") + ostcore::config::GetProcessInstanceID().ToString() +
                     "'" + own("machineID':'") + ostnetsync::IDVConnection::GetIDVDeviceID() + "'" +
                     own("machineName':'") + host + "'" + own("machineIP':'") +
                     ostnet::utility::LocalHostIPAddress().str() + "'" + own("transactionType':'") + inType +
                     "'" + inMore + "}");
    }
};

TEST_F(TransactionTest, OpensAtTheLoadedCommitThroughAFactoryThatIsLoadedOnce) {
    ServeTransactions();
    const auto session = MakeSession();
    const auto transaction = RFL::QueryInterface<IZOCProduction>(Open(session, kTransactionType_Edit));
    EXPECT_TRUE(transaction->IsTransaction());
    EXPECT_EQ(transaction->GetIdentifier().view(), "t1");
    EXPECT_EQ(RFL::QueryInterface<IZOCEditingSession>(transaction)->GetParentProduction(), session);
    const std::string create = "POST " + HubURL("/s1/new-transaction").str();
    EXPECT_THAT(net->Lines(), ElementsAre("GET " + HubURL("/s1/transactions").str(), create));
    EXPECT_EQ(LastRequest().body,
              Quote("{':commitId':'c5',':requireHead':true,'metadata':") + Metadata("edit") + "}");
    EXPECT_EQ(LastRequest().Header("Content-Type"), "application/json;charset=utf-8");
    Open(session, kTransactionType_Ingest, kResultSuccess,
         ExtraTransactionMetadata{{"note", "n"}, {"machineID", "forged"}});
    EXPECT_EQ(LastRequest().body, Quote("{':commitId':'c5',':requireHead':false,'metadata':") +
                                      Metadata("ingest", ",'note':'n'") + "}");
    EXPECT_EQ(Requests(), 3u);
    for (const char* text :
         {"Load Transaction List Resource with URL ",
          "Transaction List Resource successfully loaded with URL ", "Start creating transaction body for N",
          "Finished creating transaction body for N", "Start creating transaction resource N",
          "Transaction resource creation successfully started for N", "Load Transaction resource "}) {
        EXPECT_TRUE(TracedInTime(text)) << text;
    }
}

TEST_F(TransactionTest, EveryWayInWhichNoneIsOpened) {
    const auto session = MakeSession();
    On("GET /s1/transactions", ScriptedAnswer::Status(500));
    Open(session, kTransactionType_Edit, kResultHTTPInternalServerError);
    EXPECT_TRUE(Traced("Failed to create transaction factory, RFL result == "));
    On("GET /s1/transactions", JSONAnswer("{'links':[]}"));
    Open(session, kTransactionType_Edit, kResultFailure);
    EXPECT_THAT(
        Assertions(),
        testing::Contains(HasSubstr("Failed to create server resource for transaction factory URL \"" +
                                    HubURL("/s1/transactions").str() + "\"")));
    const auto other = MakeSession();
    ServeTransactions();
    On("POST /s1/new-transaction", ScriptedAnswer::Status(412));
    Open(other, kTransactionType_Edit, kResultHTTPPreconditionFailed);
    On("POST /s1/new-transaction", ScriptedAnswer::FailStart());
    Open(other, kTransactionType_Edit, kResultNotStarted);
    EXPECT_TRUE(Traced("Failed to start creating transaction, uri: " + HubURL("/s1/new-transaction").str() +
                       ", expression: ! createTransactionPosted"));
    // An answer without a body says where the transaction is.
    On("POST /s1/new-transaction", ScriptedAnswer::Status(201).With("Location", HubURL("/t1").str()));
    On("GET /t1", JSONAnswer(TransactionBody("t1", kEdit)));
    EXPECT_EQ(Open(other, kTransactionType_Edit)->GetHTTPURL(), HubURL("/t1"));
    On("GET /t1", ScriptedAnswer::Status(503));
    Open(other, kTransactionType_Edit, kResultHTTPServiceUnavailable);
    Outcome never;
    const auto bare = Make<Production>("{'zo:sessionId':'s1'}");
    EXPECT_FALSE(
        bare->CreateTransaction(Guid::CreateUnique(), never.Function(), kTransactionType_Edit, boost::none));
    EXPECT_EQ(never.Calls(), 0);
}

TEST_F(TransactionTest, CommitSendsATitleThatIsReadBackAndRefreshesTheSession) {
    ServeTransactions();
    On("POST /t1/commit", JSONAnswer(SessionBody("c6")));
    On("GET /s1", JSONAnswer(SessionBody("c6"), "\"t2\""));
    const auto session = MakeSession();
    const auto list = session->GetOrCreateTransactionList();
    EXPECT_EQ(session->GetOrCreateTransactionList(), list);
    const auto transaction = RFL::QueryInterface<IZOCTransaction>(Open(session, kTransactionType_Edit));
    Outcome outcome;
    const Guid id = Guid::CreateUnique();
    ASSERT_TRUE(transaction->Commit(id, outcome.Function(), u"say \"\u00e9\""));
    EXPECT_EQ(outcome.Wait(), kResultSuccess);
    EXPECT_EQ(outcome.ID(), id);
    EXPECT_EQ(RFL::QueryInterface<IZOCProduction>(outcome.Resource()), session);
    EXPECT_EQ(session->GetLoadedRevision().view(), "c6")
        << "the session was refreshed before the end was told";
    const auto body = ostcore::serialization::JSONParse(std::string_view(Last("POST", "/t1/commit").body));
    EXPECT_EQ(ostcore::serialization::JSONView(body).Find(":resolveStrategy").AsString(), "NONE");
    const std::string title(ostcore::serialization::JSONView(body).Find(":commitMessage").AsString());
    EXPECT_EQ(title,
              Quote("{'commitMessage':'say \\") + Quote("'\xC3\xA9\\") + Quote("'','metadata':") +
                  Quote("{'applicationName':'Host','transactionType':'edit','extra':'x','requestID':'" +
                        id.ToString() + "'}}"));
    CommitMetadata metadata;
    ASSERT_TRUE(GetCommitMetadataFromTitle(ostcore::utility::ToUTF16(title), metadata));
    EXPECT_EQ(metadata.commitMessage, u"say \"\u00e9\"");
    EXPECT_EQ(metadata.metadata.applicationName.view(), "Host");
}

TEST_F(TransactionTest, ARefreshThatFailsAfterTheCommitLeavesTheSessionAsTheAnswerTellsIt) {
    ServeTransactions();
    On("POST /t1/commit", JSONAnswer(SessionBody("c6"), "\"t6\""));
    On("GET /s1", ScriptedAnswer::Status(503));
    const auto session = MakeSession();
    const auto transaction = RFL::QueryInterface<IZOCTransaction>(Open(session, kTransactionType_Edit));
    Outcome outcome;
    ASSERT_TRUE(transaction->Commit(Guid::CreateUnique(), outcome.Function(), u""));
    EXPECT_EQ(outcome.Wait(), kResultSuccess);
    EXPECT_EQ(session->GetLoadedRevision().view(), "c6");
    EXPECT_EQ(session->GetETag(true).view(), "\"t6\"");
}

TEST_F(TransactionTest, AnIngestIsRebasedAndAFailedCommitStaysPending) {
    const auto ingest = MakeTransaction(kIngest);
    On("POST /t1/commit", ScriptedAnswer::Status(412));
    Outcome outcome;
    ASSERT_TRUE(ingest->Commit(Guid::CreateUnique(), outcome.Function(), u""));
    EXPECT_EQ(outcome.Wait(), kResultHTTPPreconditionFailed);
    EXPECT_THAT(LastRequest().body, HasSubstr(Quote("':resolveStrategy':'AUTO'")));
    EXPECT_EQ(Requests(), 1u);
    EXPECT_TRUE(ingest->IsTransaction());
    EXPECT_FALSE(MakeSession()->Commit(Guid::CreateUnique(), RequestCompletion(), u""));
}

TEST_F(TransactionTest, WhoHoldsNoSessionGetsTheOneThatTheAnswerTells) {
    const auto transaction = MakeTransaction();
    On("POST /t1/commit", JSONAnswer(SessionBody("c6")));
    Outcome outcome;
    ASSERT_TRUE(transaction->Commit(Guid::CreateUnique(), outcome.Function(), u""));
    EXPECT_EQ(outcome.Wait(), kResultSuccess);
    const auto session = RFL::QueryInterface<IZOCProduction>(outcome.Resource());
    ASSERT_TRUE(session);
    EXPECT_TRUE(session->IsEditingSession());
    EXPECT_EQ(session->GetLoadedRevision().view(), "c6");
    EXPECT_EQ(Requests(), 1u);
    On("POST /t1/commit", ScriptedAnswer::Status(204));
    Outcome bare;
    ASSERT_TRUE(transaction->Commit(Guid::CreateUnique(), bare.Function(), u""));
    EXPECT_EQ(bare.Wait(), kResultSuccess);
    EXPECT_FALSE(bare.Resource());
}

TEST_F(TransactionTest, RollbackDropsWhatIsHeldAndOneThatIsGoneIsNoFailure) {
    for (const auto& [status, result] :
         {std::pair(204, kResultSuccess), std::pair(404, kResultGone), std::pair(409, kResultHTTPConflict)}) {
        const auto transaction = MakeTransaction();
        On("POST /t1/rollback", ScriptedAnswer::Status(status));
        Outcome outcome;
        ASSERT_TRUE(transaction->Rollback(Guid::CreateUnique(), outcome.Function()));
        EXPECT_EQ(outcome.Wait(), result);
        EXPECT_EQ(LastRequest().body, "{}");
        EXPECT_EQ(bool(transaction->GetAssets()), result < 0);
    }
    EXPECT_FALSE(MakeSession()->Rollback(Guid::CreateUnique(), RequestCompletion()));
}

TEST_F(TransactionTest, NewAssetsAreFoundBeforeTheListIsLoadedAgain) {
    const auto transaction = MakeTransaction();
    On("GET /t1/assets", JSONAnswer("{'assets':[]}"));
    ASSERT_TRUE(RFL::QueryInterface<IZOCServerResource>(transaction->GetAssets())->Load(true));
    On("POST /t1/new-asset", JSONAnswer("{'zo:assetId':'a1','properties':{'name':'clip'}}"));
    AssetBaseProperties properties;
    properties.name = u"clip";
    properties.assetType = kAssetType_MasterClip;
    Outcome plain;
    ASSERT_TRUE(transaction->CreateNewAsset(Guid::CreateUnique(), plain.Function(), properties));
    EXPECT_EQ(plain.Wait(), kResultSuccess);
    EXPECT_THAT(LastRequest().body, HasSubstr(Quote("'cdzo:assetType':'masterclip'")));
    EXPECT_TRUE(RFL::QueryInterface<IZOCWritableServerResource>(
        transaction->GetAssets()->GetAssetByIdentifier("a1")));
    On("POST /t1/new-asset", JSONAnswer("{'zo:assetId':'a2','properties':{'name':'part'}}"));
    SubClip part;
    part.startBoundary = ostmediatypes::TickTime(10);
    part.endBoundary = ostmediatypes::TickTime(20);
    Outcome sub;
    ASSERT_TRUE(transaction->CreateNewAsset(Guid::CreateUnique(), sub.Function(), properties, part));
    EXPECT_EQ(sub.Wait(), kResultSuccess);
    EXPECT_THAT(LastRequest().body,
                HasSubstr(Quote("'subClip':{'mStartBoundary':{'ticks':10},'mEndBoundary':{'ticks':20}")));
    EXPECT_TRUE(transaction->GetAssets()->GetAssetByIdentifier("a2"));
    EXPECT_FALSE(MakeSession()->CreateNewAsset(Guid::CreateUnique(), RequestCompletion(), properties, part));
}

TEST_F(TransactionTest, AnEnclosureIsWrittenOverTheOneOfItsNameOrAsANewOne) {
    const auto transaction = MakeTransaction();
    On("GET /t1/enclosures",
       JSONAnswer("{'enclosures':[{'name':'old','links':[{'rel':'edit','href':'" + HubURL("/e/old").str() +
                  "'}]}],'links':[{'rel':'create','href':'" + HubURL("/e").str() + "'}]}"));
    On("PUT /e/old", ScriptedAnswer::Status(200));
    On("POST /e",
       JSONAnswer("{'name':'new','links':[{'rel':'edit','href':'" + HubURL("/e/new").str() + "'}]}"));
    On("PUT /e/new", ScriptedAnswer::Status(200));
    const auto write = [&](const char* inName, const std::string& inText) {
        Outcome outcome;
        EXPECT_TRUE(transaction->WriteEnclosure(inName, inText, Guid::CreateUnique(), outcome.Function(),
                                                "text/x-mark"));
        EXPECT_EQ(outcome.Wait(), kResultSuccess);
        const auto enclosure = RFL::QueryInterface<IZOCEnclosure>(outcome.Resource());
        EXPECT_EQ(enclosure->GetEnclosureName().view(), inName);
        return LastRequest();
    };
    for (const char* line : {"PUT /e/old", "POST /e", "PUT /e/new"}) {
        const std::string name = std::string_view(line) == "PUT /e/old" ? "old" : "new";
        const RecordedRequest request = write(name.c_str(), line);
        EXPECT_EQ(request.verb + " " + request.Path(), line);
        EXPECT_THAT(request.Header("Content-Type"), HasSubstr("multipart/form-data"));
        EXPECT_THAT(request.body, HasSubstr("\":enclosure\""));
        EXPECT_THAT(request.body, HasSubstr("text/x-mark\r\n\r\n" + std::string(line) + "\r\n"));
    }
    EXPECT_EQ(CountOf("GET", "/t1/enclosures"), 1u);
    Outcome never;
    EXPECT_FALSE(transaction->WriteEnclosure("", "x", Guid::CreateUnique(), never.Function(), ""));
    EXPECT_FALSE(transaction->WriteEnclosure("old", "x", Guid::CreateUnique(), never.Function(), "a\r\nb"));
}

TEST_F(TransactionTest, RefreshBringsTheAssetListAlong) {
    const auto transaction = MakeTransaction();
    On("GET /t1", ScriptedAnswer::Status(304));
    On("GET /t1/assets", JSONAnswer("{'assets':[{'zo:assetId':'a1'}]}"));
    const auto refresh = [&] {
        Outcome outcome;
        EXPECT_TRUE(transaction->Refresh(Guid::CreateUnique(), outcome.Function()));
        const int result = outcome.Wait();
        EXPECT_EQ(RFL::QueryInterface<IZOCProduction>(outcome.Resource()), transaction);
        return result;
    };
    EXPECT_EQ(refresh(), kResultSuccess);
    EXPECT_TRUE(transaction->GetAssets()->GetAssetByIdentifier("a1"));
    On("GET /t1/assets", ScriptedAnswer::Status(403));
    EXPECT_EQ(refresh(), kResultHTTPForbidden);
    On("GET /t1", ScriptedAnswer::Status(404));
    EXPECT_EQ(refresh(), kResultHTTPNotFound);
    EXPECT_EQ(CountOf("GET", "/t1/assets"), 2u);
}

TEST_F(TransactionTest, ChangedNameAndDescriptionGoIntoATransactionAndAreKeptWhenThatFails) {
    ServeTransactions();
    On("PUT /t1", ScriptedAnswer::Status(500));
    On("POST /t1/rollback", ScriptedAnswer::Status(204));
    const auto session = MakeSession();
    const auto store = [&] {
        Outcome outcome;
        EXPECT_TRUE(session->CreateTransactionAndStoreChanges(Guid::CreateUnique(), outcome.Function(),
                                                              session, u""));
        const int result = outcome.Wait();
        EXPECT_EQ(bool(RFL::QueryInterface<IZOCTransaction>(outcome.Resource())), result >= 0);
        return result;
    };
    EXPECT_EQ(store(), kResultSuccess);
    EXPECT_EQ(CountOf("PUT", "/t1"), 0u) << "nothing was changed";
    session->SetName(u"N");
    EXPECT_EQ(store(), kResultSuccess);
    EXPECT_EQ(CountOf("PUT", "/t1"), 0u) << "the same name is no change";
    session->SetName(u"New");
    EXPECT_EQ(store(), kResultHTTPInternalServerError);
    EXPECT_EQ(CountOf("POST", "/t1/rollback"), 1u) << "nobody is blocked by what is of no use";
    net->Expect("GET", "", JSONAnswer(SessionBody("c6"), "\"t2\""));
    bool changed = false;
    EXPECT_TRUE(session->Refresh(changed, false));
    EXPECT_EQ(session->GetName(), u"New") << "a refresh does not lose it";
    On("PUT /t1", ScriptedAnswer::Status(200).With("ETag", "\"t9\""));
    EXPECT_EQ(store(), kResultSuccess);
    EXPECT_EQ(Last("PUT", "/t1").body, Quote("{'name':'New','kept':1,'description':'D'}"));
    EXPECT_EQ(store(), kResultSuccess);
    EXPECT_EQ(CountOf("PUT", "/t1"), 2u) << "stored once";
}

TEST_F(TransactionTest, TheListTellsWhoIsPendingOnThisSession) {
    const auto session = MakeSession();
    On("GET /s1/transactions",
       JSONAnswer(
           ListBody(ListItem("t1", "s1",
                             "{'transactionType':'edit','machineName':'m','machineIP':'ip',"
                             "'applicationInstanceID':'6f1b2c3d-0000-4000-8000-000000000001'}") +
                    "," + ListItem("t2", "s1", kIngest) + "," + ListItem("t3", "other", kEdit) + "," +
                    ListItem("t4", "s1", "{'transactionType':'edit','applicationInstanceID':'none'}"))));
    const auto list = session->GetOrCreateTransactionList();
    EXPECT_TRUE(list->GetAllItems().empty());
    ASSERT_TRUE(RFL::QueryInterface<IZOCServerResource>(list)->Load(true));
    const auto all = list->GetAllItems();
    ASSERT_EQ(all.size(), 4u);
    EXPECT_EQ(all[0].identifier.view(), "t1");
    EXPECT_EQ(all[0].owner.view(), "u1");
    EXPECT_EQ(all[0].baseCommit.view(), "c5");
    EXPECT_EQ(all[0].metadata.machineName.view(), "m");
    EXPECT_EQ(all[0].metadata.machineIP.view(), "ip");
    EXPECT_FALSE(all[0].metadata.applicationInstanceID.IsNull());
    EXPECT_TRUE(all[1].metadata.applicationInstanceID.IsNull());
    EXPECT_TRUE(all[3].metadata.applicationInstanceID.IsNull());
    EXPECT_EQ(list->GetTransactionURL(all[0]), HubURL("/t1"));
    EXPECT_EQ(list->GetPendingItems({}).size(), 3u);
    EXPECT_EQ(list->GetPendingItems(kNoConflictTransactionTypes).size(), 2u);
    EXPECT_FALSE(Make<Production>("{}")->GetOrCreateTransactionList());
}

}  // namespace
}  // namespace ZOCL
