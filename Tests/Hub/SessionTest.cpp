// Sessions and transactions: who sees them, what can be written where, and how they begin and end.
#include "Base/Text.h"
#include "SessionFixture.h"

namespace zohub::test {

using NameMap = std::map<std::string, std::string>;

TEST_F(SessionTest, BeginsAtTheHeadOfItsProductionAndIsNewEachTime) {
    Json const production = MakeSharedProduction();
    Answer const created = mAnna.PostJson(LinkOf(production, "/sessions"),
                                          R"({"name":"mine","description":"d","isTemporary":false})");
    ASSERT_EQ(created.status, 201);
    Json const session = Json::parse(created.body);
    EXPECT_EQ(created.Header("location"), LinkOf(session, "self"));
    EXPECT_EQ(CommitOf(session), CommitOf(production));
    EXPECT_EQ(session["zo:baseCommitId"], production["zo:commitId"]);
    EXPECT_EQ(session["zo:parentProductionId"], production["zo:productionId"]);
    EXPECT_EQ(session["properties"], production["properties"]);
    EXPECT_EQ(LinkOf(session, "up"), LinkOf(production, "self"));
    Answer const loaded = mAnna.Get(LinkOf(session, "self"));
    EXPECT_EQ(loaded.body, created.body);
    EXPECT_EQ(loaded.Header("etag"), created.Header("etag"));

    mHub.Advance(kSecond);
    mAnna.PostJson(LinkOf(production, "/sessions"), R"({"name":"brief","isTemporary":true})");
    Json const second = MakeSession(mAnna, production);
    EXPECT_NE(second["zo:sessionId"], session["zo:sessionId"]);
    Json const list = Json::parse(mAnna.Get(LinkOf(production, "/sessions")).body);
    ASSERT_EQ(list["sessions"].size(), 2u) << "the temporary one is not listed";
    EXPECT_EQ(list["stats"]["totalResults"], 2);
    EXPECT_EQ(list["sessions"][0]["properties"], Json::parse(R"({"name":"mine","description":"d"})"));
    EXPECT_EQ(list["sessions"][0]["zo:baseCommitId"], production["zo:commitId"]);
    EXPECT_EQ(Json::parse(mAnna.Get("/zo/1/p").body)["productions"].size(), 1u);
}

TEST_F(SessionTest, DoesNotExistForAnybodyButItsOwner) {
    Json const production = MakeSharedProduction();
    Json const session = MakeSession(mAnna, production);
    Json const transaction = MakeTransaction(mAnna, session);
    Json const asset = AddAsset(mAnna, transaction, "secret", "private cut");
    ASSERT_EQ(mAnna
                  .SendForm("POST", LinkOf(asset, "/enclosures/enclosure#create"),
                            Form().Add(":name", "n").Add(":enclosure", "private bytes"))
                  .status,
              201);
    Json const committed = Commit(mAnna, transaction);
    Json const enclosure = Json::parse(
        mAnna.Get(LinkOf(committed, "/assets#full")).body)["assets"][0]["enclosures"]["enclosures"][0];
    std::string const payload = LinkOf(enclosure, "/enclosures/enclosure");
    ASSERT_EQ(mAnna.Get(payload).body, "private bytes");
    std::string const open = LinkOf(MakeTransaction(mAnna, committed), "self");

    Client const ben = mHub.SignedIn("ben");
    std::string const self = LinkOf(session, "self");
    std::string const shared = LinkOf(production, "self");
    std::string const content = payload.substr(payload.rfind('/'));
    std::string const state = Json::parse(mAnna.Get(self + "/a/secret").body)["zo:assetContentId"];
    for (std::string const& href :
         {self, self + "/a", self + "/full", self + "/a/secret", self + "/e", self + "/transactions",
          self + "/history", open, open + "/a", payload, self + "/at/" + CommitOf(production),
          shared + "/at/" + CommitOf(committed), shared + "/pe" + content, shared + "/ce" + content})
        EXPECT_EQ(ben.Get(href).status, 404) << href;
    for (std::string const& href : {self + "/transactions", open + "/commit", open + "/rollback", open + "/a",
                                    self + "/copy", shared + "/restore/" + state})
        EXPECT_EQ(ben.PostJson(href, R"({"name":"x","properties":{"cdzo:assetType":"bin"}})").status, 404)
            << href;
    EXPECT_EQ(Push(ben, session, "x").status, 404);
    EXPECT_EQ(Pull(ben, session).status, 404);
    EXPECT_EQ(ben.Request("DELETE", self).status, 404);
    EXPECT_EQ(Json::parse(ben.Get(shared + "/sessions").body)["sessions"].size(), 0u);

    mHub.AddUser("root", "root-secret", true);
    Client const root = mHub.SignedIn("root");
    Json const seen = Load(root, session);
    EXPECT_FALSE(HasLink(seen, "/sessions/session#push"));
    EXPECT_FALSE(HasLink(seen, "delete"));
    EXPECT_EQ(root.Request("DELETE", self).status, 403);
    EXPECT_EQ(root.PostJson(open + "/rollback", "{}").status, 403);
    EXPECT_EQ(Json::parse(root.Get(shared + "/sessions").body)["sessions"].size(), 1u);
}

TEST_F(SessionTest, StandsOnlyOnWhatItsOwnerMayWriteTo) {
    {
        auto const transaction = mHub.Data().BeginWrite();
        TreeRoot tree;
        tree.properties = R"({"name":"Series","description":""})";
        Repository(*transaction).CreateLine(kLineTemplate, tree, "made", {"ben", false}, false, 1);
        transaction->Commit();
    }
    Json const list = Json::parse(mAnna.Get("/zo/1/templates").body);
    Json const seen = Load(mAnna, list["productions"][0]);
    EXPECT_FALSE(HasLink(seen, "/sessions"));
    std::string const sessions = LinkOf(seen, "self") + "/sessions";
    EXPECT_FALSE(HasLink(Json::parse(mAnna.Get(sessions).body), "create"));
    EXPECT_EQ(mAnna.PostJson(sessions, "{}").status, 403);
    Client const ben = mHub.SignedIn("ben");
    Json const session = MakeSession(ben, Load(ben, seen));
    EXPECT_EQ(ben.PostJson(LinkOf(session, "self") + "/sessions", "{}").status, 404) << "not on a session";
    EXPECT_EQ(ben.PostJson(LinkOf(seen, "self") + "/transactions", "{}").status, 404);
    EXPECT_EQ(ben.PostJson(LinkOf(seen, "self") + "/commit", "{}").status, 404);
}

TEST_F(SessionTest, IsWrittenThroughATransactionAndOnlyThere) {
    Json const production = MakeSharedProduction();
    AddAsset(mAnna, production, "a", "shared");
    Json const session = MakeSession(mAnna, production);
    EXPECT_FALSE(HasLink(session, "edit"));
    EXPECT_FALSE(HasLink(session, "/assets/asset#create"));
    std::string const self = LinkOf(session, "self");
    Answer const refused = mAnna.PutJson(self + "/a/a", kClip);
    EXPECT_EQ(refused.status, 403);
    EXPECT_EQ(ErrorCode(refused), "transaction-needed");
    EXPECT_EQ(mAnna.PutJson(self, R"({"name":"x"})").status, 403);

    Json const transaction = MakeTransaction(mAnna, session);
    EXPECT_EQ(transaction["zo:sessionId"], session["zo:sessionId"]);
    EXPECT_EQ(transaction["metadata"]["applicationName"], "tests");
    EXPECT_EQ(LinkOf(transaction, "up"), self);
    Rename(mAnna, transaction, "a", "new name");
    AddAsset(mAnna, transaction, "b", "second");
    EXPECT_EQ(mAnna.PutJson(LinkOf(transaction, "edit"), R"({"name":"Film 2"})").status, 200);
    Json const assets = Json::parse(mAnna.Get(LinkOf(transaction, "/assets#full")).body);
    for (auto const& asset : assets["assets"])
        EXPECT_EQ(mAnna
                      .Request("POST", LinkOf(asset, "/renditions/rendition#create"), "bytes",
                               {{"Content-Type", "image/png"}})
                      .status,
                  201);
    EXPECT_EQ(Names(mAnna, session), (NameMap{{"a", "shared"}}));
    EXPECT_EQ(CommitOf(Load(mAnna, session)), CommitOf(session));

    std::string const message = "{\"commitMessage\":\"\xC3\xA4 \\\"quoted\\\"\\n\",\"metadata\":{}}  ";
    Json const after = Commit(mAnna, transaction, "NONE", message);
    EXPECT_NE(CommitOf(after), CommitOf(session));
    EXPECT_EQ(after["zo:baseCommitId"], session["zo:baseCommitId"]);
    EXPECT_EQ(after["properties"]["name"], "Film 2");
    EXPECT_EQ(Names(mAnna, after), (NameMap{{"a", "new name"}, {"b", "second"}}));
    Json const history = Json::parse(mAnna.Get(LinkOf(after, "/productions/production#history")).body);
    EXPECT_EQ(history["versions"][0]["title"], message);
    EXPECT_EQ(history["versions"][0]["committer"]["name"], "anna");
    EXPECT_EQ(history["versions"][1]["commitId"], session["zo:commitId"]) << "one commit for all";
    EXPECT_EQ(Names(mAnna, production), (NameMap{{"a", "shared"}}));
    EXPECT_EQ(Problems(), std::vector<std::string>());
}

TEST_F(SessionTest, NotesAreKeptBesideTheCommits) {
    Json const production = MakeSharedProduction();
    Json const session = MakeSession(mAnna, production);
    Answer const created = mAnna.SendForm("POST", LinkOf(session, "/enclosures"),
                                          Form().Add(":name", "x_head").Add(":enclosure", "first"));
    ASSERT_EQ(created.status, 201) << created.body;
    Json const note = Json::parse(created.body);
    EXPECT_EQ(mAnna
                  .SendForm("POST", LinkOf(session, "/enclosures"),
                            Form().Add(":name", "x_head").Add(":enclosure", "again"))
                  .status,
              409);
    Answer const changed = mAnna.SendForm("PUT", LinkOf(note, "edit"), Form().Add(":enclosure", "second"),
                                          {{"If-Match", created.Header("etag")}});
    EXPECT_EQ(changed.status, 200) << changed.body;
    EXPECT_EQ(mAnna.Get(LinkOf(Json::parse(changed.body), "/enclosures/enclosure")).body, "second");
    EXPECT_EQ(CommitOf(Load(mAnna, session)), CommitOf(session));

    Json const after = AddInSession(mAnna, session, "a", "one");
    ASSERT_EQ(Push(mAnna, after, "shared").status, 200);
    Json const list = Json::parse(mAnna.Get(LinkOf(session, "/enclosures")).body);
    ASSERT_EQ(list["enclosures"].size(), 1u);
    EXPECT_TRUE(HasLink(list, "create"));
    EXPECT_EQ(Json::parse(mAnna.Get(LinkOf(production, "/enclosures")).body)["enclosures"].size(), 0u);
    Json const transaction = MakeTransaction(mAnna, session);
    EXPECT_EQ(Json::parse(mAnna.Get(LinkOf(transaction, "/enclosures")).body)["enclosures"].size(), 0u);
    EXPECT_EQ(Problems(), std::vector<std::string>());
    EXPECT_EQ(mAnna.Request("DELETE", LinkOf(note, "edit")).status, 204);
    EXPECT_EQ(Json::parse(mAnna.Get(LinkOf(session, "/enclosures")).body)["enclosures"].size(), 0u);
}

TEST_F(SessionTest, ATransactionOpensAtACommitOfItsSession) {
    Json const production = MakeSharedProduction();
    Json const first = MakeSession(mAnna, production);
    Json const second = AddInSession(mAnna, first, "a", "one");
    std::string const factory = LinkOf(second, "/transactions");
    auto const open = [&](std::string const& inCommit, char const* inRequireHead) {
        return mAnna.PostJson(factory, "{\":commitId\":" + JsonString(inCommit) +
                                           ",\":requireHead\":" + inRequireHead + ",\"metadata\":{}}");
    };
    EXPECT_EQ(open(CommitOf(second), "true").status, 201);
    Answer const stale = open(CommitOf(first), "true");
    EXPECT_EQ(stale.status, 412);
    EXPECT_EQ(ErrorCode(stale), "session-changed");
    EXPECT_EQ(open(CommitOf(first), "false").status, 201);
    EXPECT_EQ(mAnna.PostJson(factory, "{}").status, 201);
    AddAsset(mAnna, production, "later", "newer than the session");
    Json const other = MakeSession(mAnna, MakeProduction(mAnna, "Other"));
    for (std::string const& wrong :
         {CommitOf(Load(mAnna, production)), CommitOf(other), std::string(64, '0')})
        EXPECT_EQ(open(wrong, "false").status, 400) << wrong;
    EXPECT_EQ(mAnna.PostJson(factory, R"({"metadata":[]})").status, 400);
    Json const list = Json::parse(mAnna.Get(factory).body);
    EXPECT_EQ(list["transactions"].size(), 3u);
    EXPECT_EQ(list["transactions"][0]["zo:sessionId"], second["zo:sessionId"]);
}

TEST_F(SessionTest, AnEndedTransactionStaysReadableAndNothingElse) {
    Json const session = MakeSession(mAnna, MakeSharedProduction());
    std::string const factory = LinkOf(session, "/transactions");
    Json const transaction = MakeTransaction(mAnna, session);
    std::string const openTag = mAnna.Get(factory).Header("etag");
    AddAsset(mAnna, transaction, "a", "one");
    Json const after = Commit(mAnna, transaction);
    Answer const ended = mAnna.Get(LinkOf(transaction, "self"));
    ASSERT_EQ(ended.status, 200);
    Json const document = Json::parse(ended.body);
    for (char const* relation : {"/transactions/transaction#commit", "/transactions/transaction#rollback",
                                 "edit", "/assets/asset#create"})
        EXPECT_FALSE(HasLink(document, relation)) << relation;
    EXPECT_EQ(CommitOf(document), CommitOf(after));
    Answer const list = mAnna.Get(factory);
    EXPECT_EQ(Json::parse(list.body)["transactions"].size(), 0u);
    EXPECT_NE(list.Header("etag"), openTag);
    EXPECT_EQ(TryCommit(mAnna, transaction).status, 409);
    EXPECT_EQ(mAnna.PostJson(LinkOf(transaction, "/transactions/transaction#rollback"), "{}").status, 409);
    EXPECT_EQ(mAnna.PutJson(LinkOf(transaction, "self") + "/a/a", kClip).status, 409);

    Json const empty = MakeTransaction(mAnna, session);
    EXPECT_EQ(CommitOf(Commit(mAnna, empty)), CommitOf(after)) << "nothing was changed";
}

TEST_F(SessionTest, ARolledBackTransactionLeavesNothing) {
    Json const session = MakeSession(mAnna, MakeSharedProduction());
    Json const transaction = MakeTransaction(mAnna, session);
    AddAsset(mAnna, transaction, "a", "one");
    std::string const rollback = LinkOf(transaction, "/transactions/transaction#rollback");
    EXPECT_EQ(mAnna.PostJson(rollback, "{}", {{"Idempotency-Key", "r1"}}).status, 204);
    EXPECT_EQ(mAnna.Get(LinkOf(transaction, "self")).status, 404);
    EXPECT_EQ(mAnna.PostJson(rollback, "{}", {{"Idempotency-Key", "r1"}}).status, 204) << "a repeat";
    EXPECT_EQ(mAnna.PostJson(rollback, "{}").status, 404);
    EXPECT_EQ(Load(mAnna, session), session);
    EXPECT_EQ(Json::parse(mAnna.Get(LinkOf(session, "/transactions")).body)["transactions"].size(), 0u);
    EXPECT_EQ(Problems(), std::vector<std::string>());
}

TEST_F(SessionTest, ACommitOnAMovedSessionIsRefusedOrRebased) {
    Json const production = MakeSharedProduction();
    for (char const* id : {"a", "b"})
        AddAsset(mAnna, production, id, "first");
    Json const session = MakeSession(mAnna, production);
    Json const editA = MakeTransaction(mAnna, session);
    Json const ingest = MakeTransaction(mAnna, session);
    Json const clash = MakeTransaction(mAnna, session);
    Rename(mAnna, editA, "a", "edited");
    AddAsset(mAnna, ingest, "c", "ingested");
    Rename(mAnna, ingest, "b", "graded");
    Rename(mAnna, clash, "a", "edited otherwise");
    Json const moved = Commit(mAnna, editA);

    Answer const refused = TryCommit(mAnna, ingest, "NONE");
    EXPECT_EQ(refused.status, 412);
    EXPECT_EQ(ErrorCode(refused), "session-changed");
    EXPECT_EQ(Load(mAnna, session), moved);
    Json const rebased = Commit(mAnna, ingest, "AUTO", "ingest");
    EXPECT_EQ(Names(mAnna, rebased), (NameMap{{"a", "edited"}, {"b", "graded"}, {"c", "ingested"}}));
    EXPECT_EQ(TryCommit(mAnna, clash, "AUTO").status, 412) << "both sides renamed the same asset";
    EXPECT_EQ(TryCommit(mAnna, clash, "SOMEHOW").status, 400);
    EXPECT_EQ(Load(mAnna, session), rebased);
    EXPECT_TRUE(HasLink(Load(mAnna, clash), "/transactions/transaction#rollback")) << "still open";
    EXPECT_EQ(Problems(), std::vector<std::string>());
}

TEST_F(SessionTest, DeletingASessionRemovesItsTransactionsAndLeavesTheRest) {
    Json const production = MakeSharedProduction();
    Json const session = MakeSession(mAnna, production);
    Json const shared = AddInSession(mAnna, session, "a", "shared");
    ASSERT_EQ(Push(mAnna, shared, "shared").status, 200);
    Json const work = AddInSession(mAnna, session, "b", "unshared");
    Json const transaction = MakeTransaction(mAnna, session);
    AddAsset(mAnna, transaction, "c", "unfinished");
    std::string const self = LinkOf(session, "delete");
    EXPECT_EQ(mAnna.Request("DELETE", self, "", {{"If-Match", "\"stale\""}}).status, 412);
    EXPECT_EQ(mAnna.Request("DELETE", LinkOf(transaction, "self")).status, 405);
    EXPECT_EQ(mAnna.Request("DELETE", LinkOf(production, "self")).status, 405);
    EXPECT_EQ(mAnna.Request("DELETE", self).status, 204);
    EXPECT_EQ(mAnna.Get(self).status, 404);
    EXPECT_EQ(mAnna.Get(LinkOf(transaction, "self")).status, 404);
    EXPECT_EQ(Names(mAnna, production), (NameMap{{"a", "shared"}}));
    EXPECT_EQ(Problems(), std::vector<std::string>());
}

}  // namespace zohub::test
