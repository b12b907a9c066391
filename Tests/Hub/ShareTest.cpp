// Push, pull, history and copies; and that nothing is lost or done twice when many share at the same time.
#include <atomic>
#include <mutex>
#include <set>
#include <thread>

#include "SessionFixture.h"

namespace zohub::test {

using NameMap = std::map<std::string, std::string>;
using TextList = std::vector<std::string>;

class ShareTest : public SessionTest {
protected:
    // A production with assets a and b, a session of anna's and one of ben's.
    void SetUp() override {
        mProduction = MakeSharedProduction();
        for (char const* id : {"a", "b"})
            AddAsset(mAnna, mProduction, id, "first");
        mBen = mHub.SignedIn("ben");
        mMine = MakeSession(mAnna, mProduction);
        mHis = MakeSession(mBen, mProduction);
    }

    Json Production() { return Load(mAnna, mProduction); }

    // Ben renames an asset and shares it.
    void BenShares(std::string const& inId, std::string const& inName) {
        mHis = Load(mBen, mHis);
        ASSERT_EQ(Pull(mBen, mHis, "accept-theirs").status, 200);
        RenameInSession(mBen, mHis, inId, inName);
        ASSERT_EQ(Push(mBen, mHis, "ben: " + inName).status, 200);
    }

    Json mProduction;
    Json mMine;
    Json mHis;
    Client mBen{0};
};

TEST_F(ShareTest, PushMakesOneSharedCommitOfAllThatTheSessionHas) {
    AddInSession(mAnna, mMine, "c", "third");
    Json const ready = RenameInSession(mAnna, mMine, "a", "better");
    Answer const pushed = Push(mAnna, mMine, "  the \xC3\xA4 \"share\"  ", CommitOf(ready));
    ASSERT_EQ(pushed.status, 200) << pushed.body;
    Json const session = Json::parse(pushed.body);
    Json const production = Production();
    EXPECT_EQ(CommitOf(session), CommitOf(production));
    EXPECT_EQ(session["zo:baseCommitId"], production["zo:commitId"]);
    EXPECT_EQ(pushed.Header("etag"), mAnna.Get(LinkOf(mMine, "self")).Header("etag"));
    EXPECT_EQ(Names(mBen, production), (NameMap{{"a", "better"}, {"b", "first"}, {"c", "third"}}));
    EXPECT_EQ(Titles(mBen, production)[0], "  the \xC3\xA4 \"share\"  ");
    EXPECT_EQ(Titles(mBen, production).size(), 4u);
    EXPECT_EQ(Titles(mAnna, session), Titles(mBen, production));

    Answer const again = Push(mAnna, mMine, "nothing more");
    EXPECT_EQ(again.status, 200);
    EXPECT_EQ(Json::parse(again.body), session);
    EXPECT_EQ(CommitOf(Production()), CommitOf(production));
    EXPECT_EQ(Problems(), std::vector<std::string>());
}

TEST_F(ShareTest, PushIsRefusedForAMovedSessionAndForOneThatIsBehind) {
    Json const before = mMine;
    Json const ready = RenameInSession(mAnna, mMine, "a", "better");
    BenShares("b", "his");
    Answer const moved = Push(mAnna, mMine, "x", CommitOf(before));
    EXPECT_EQ(moved.status, 412) << "asked before whether it is behind";
    EXPECT_EQ(ErrorCode(moved), "session-changed");
    Answer const behind = Push(mAnna, mMine, "x", CommitOf(ready));
    EXPECT_EQ(behind.status, 409);
    EXPECT_EQ(ErrorCode(behind), "behind");
    EXPECT_EQ(Push(mAnna, mMine, "x", "", "NONE", {{"If-Match", "\"other\""}}).status, 412);
    EXPECT_EQ(Push(mAnna, mMine, "x", "", "PERHAPS").status, 400);
    EXPECT_EQ(Push(mAnna, mMine, "\xFF").status, 400);
    EXPECT_EQ(Load(mAnna, mMine), ready);

    ASSERT_EQ(Push(mAnna, mMine, "both", "", "AUTO").status, 200);
    EXPECT_EQ(Names(mBen, mProduction), (NameMap{{"a", "better"}, {"b", "his"}}));
    BenShares("a", "his too");
    Json const clash = RenameInSession(mAnna, mMine, "a", "mine again");
    EXPECT_EQ(Push(mAnna, mMine, "x", "", "AUTO").status, 409);
    EXPECT_EQ(Load(mAnna, mMine), clash) << "a refused share changes nothing";
    EXPECT_EQ(Problems(), std::vector<std::string>());
}

TEST_F(ShareTest, ARepeatedPushIsAnsweredAgainAndDoneOnce) {
    RenameInSession(mAnna, mMine, "a", "better");
    Client::Headers const key{{"Idempotency-Key", "push-1"}};
    Answer const first = Push(mAnna, mMine, "once", "", "NONE", key);
    RenameInSession(mAnna, mMine, "a", "better still");
    Answer const again = Push(mAnna, mMine, "once", "", "NONE", key);
    EXPECT_EQ(first.status, 200);
    EXPECT_EQ(again.status, 200);
    EXPECT_EQ(again.body, first.body);
    EXPECT_EQ(CommitOf(Production()), CommitOf(Json::parse(first.body)));
}

TEST_F(ShareTest, PullWithoutOwnChangesMovesForwardWithoutACommit) {
    BenShares("a", "one");
    std::string const middle = CommitOf(Production());
    BenShares("a", "two");
    Answer const partly = Pull(mAnna, mMine, "", middle);
    ASSERT_EQ(partly.status, 200);
    EXPECT_EQ(CommitOf(Json::parse(partly.body)), middle);
    EXPECT_EQ(Json::parse(partly.body)["zo:baseCommitId"], middle);
    Json const whole = Json::parse(Pull(mAnna, mMine, "").body);
    EXPECT_EQ(CommitOf(whole), CommitOf(Production()));
    Answer const again = Pull(mAnna, mMine, "safe");
    EXPECT_EQ(again.status, 200);
    EXPECT_EQ(Json::parse(again.body), whole);
    EXPECT_EQ(Json::parse(Pull(mAnna, mMine, "", middle).body), whole) << "never backwards";
    EXPECT_EQ(Pull(mAnna, mMine, "", std::string(64, '0')).status, 400);
    EXPECT_EQ(Pull(mAnna, mMine, "somehow").status, 400);
    EXPECT_EQ(Pull(mAnna, mMine, "", "", {{"If-Match", "\"other\""}}).status, 412);
}

TEST_F(ShareTest, PullOverOwnChangesIsOneCommitThatHasBoth) {
    RenameInSession(mAnna, mMine, "a", "mine");
    BenShares("b", "his");
    Answer const pulled = Pull(mAnna, mMine, "");
    ASSERT_EQ(pulled.status, 200) << pulled.body;
    Json const session = Json::parse(pulled.body);
    EXPECT_EQ(session["zo:baseCommitId"], Production()["zo:commitId"]);
    EXPECT_NE(CommitOf(session), CommitOf(Production()));
    EXPECT_EQ(Names(mAnna, session), (NameMap{{"a", "mine"}, {"b", "his"}}));
    EXPECT_EQ(Titles(mAnna, session), (TextList{"Got the latest changes", "renamed a", "ben: his",
                                                "Added an asset", "Added an asset", "Created Film"}))
        << "own commits, then the shared line from its base";
    EXPECT_EQ(Names(mBen, mProduction), (NameMap{{"a", "first"}, {"b", "his"}}));
    ASSERT_EQ(Push(mAnna, mMine, "both").status, 200);
    EXPECT_EQ(Names(mBen, mProduction), (NameMap{{"a", "mine"}, {"b", "his"}}));
    EXPECT_EQ(Problems(), std::vector<std::string>());
}

TEST_F(ShareTest, WhatBothSidesChangedGoesByTheStrategy) {
    Json const edited = RenameInSession(mAnna, mMine, "a", "mine");
    BenShares("a", "his");
    Answer const safe = Pull(mAnna, mMine, "safe");
    EXPECT_EQ(safe.status, 409);
    EXPECT_EQ(ErrorCode(safe), "would-conflict");
    EXPECT_EQ(Load(mAnna, mMine), edited);

    ASSERT_EQ(Pull(mAnna, mMine, "interactive").status, 200);
    EXPECT_EQ(Names(mAnna, mMine)["a"], "mine");
    Answer const refused = Push(mAnna, mMine, "x");
    EXPECT_EQ(refused.status, 409);
    EXPECT_EQ(ErrorCode(refused), "conflicts-remain");
    EXPECT_EQ(Push(mAnna, mMine, "x", CommitOf(edited)).status, 412) << "asked first";
    EXPECT_EQ(Problems(), std::vector<std::string>());
    // Coming to the same name by himself settles it as well.
    RenameInSession(mAnna, mMine, "a", "his");
    EXPECT_EQ(Push(mAnna, mMine, "x").status, 200);

    for (char const* strategy : {"accept-yours", "accept-theirs"}) {
        RenameInSession(mAnna, mMine, "a", std::string("mine, ") + strategy);
        BenShares("a", std::string("his, ") + strategy);
        ASSERT_EQ(Pull(mAnna, mMine, strategy).status, 200);
        ASSERT_EQ(Push(mAnna, mMine, strategy).status, 200) << "no conflict is left";
    }
    EXPECT_EQ(Names(mBen, mProduction)["a"], "his, accept-theirs");
    EXPECT_EQ(Problems(), std::vector<std::string>());
}

TEST_F(ShareTest, HistoryIsPagedNewestFirst) {
    mHub.AddUser("zoe", "zoe-secret");
    {
        auto const transaction = mHub.Data().BeginWrite();
        auto anna = *transaction->FindUser("anna");
        anna.firstName = "Anna";
        anna.lastName = "Berg";
        transaction->PutUser(anna);
        transaction->Commit();
    }
    TextList expected{"first, to be found at the end"};
    Json const transaction = MakeTransaction(mAnna, mMine);
    AddAsset(mAnna, transaction, "x", "x");
    Commit(mAnna, transaction, "NONE", expected[0]);
    for (int i = 0; i < 6; ++i) {
        RenameInSession(mAnna, mMine, "x", "x" + std::to_string(i));
        expected.insert(expected.begin(), "renamed x");
    }
    for (char const* shared : {"Added an asset", "Added an asset", "Created Film"})
        expected.push_back(shared);
    EXPECT_EQ(Titles(mAnna, Load(mAnna, mMine)), expected);

    std::string const history = LinkOf(mMine, "/productions/production#history");
    TextList found;
    std::set<std::string> commits;
    int pages = 0;
    for (std::string href = history + "?count=3"; !href.empty(); ++pages) {
        Json const page = Json::parse(mAnna.Get(href).body);
        EXPECT_LE(page["versions"].size(), 3u);
        for (auto const& version : page["versions"]) {
            found.push_back(version["title"].get<std::string>());
            EXPECT_TRUE(commits.insert(version["commitId"].get<std::string>()).second);
            EXPECT_EQ(version["committer"]["displayName"], "Anna Berg");
            Json const old = Json::parse(mAnna.Get(LinkOf(version, "self")).body);
            EXPECT_EQ(old["zo:commitId"], version["commitId"]);
        }
        href = LinkOf(page, "next");
    }
    EXPECT_EQ(found, expected);
    EXPECT_EQ(pages, 4);
    for (char const* wrong : {"?count=0", "?count=501", "?count=x", "?count="})
        EXPECT_EQ(mAnna.Get(history + wrong).status, 400) << wrong;
    EXPECT_EQ(mAnna.Get(history + "?from=" + std::string(64, '0')).status, 404);
    EXPECT_EQ(mBen.Get(LinkOf(mProduction, "self") + "/history?from=" + CommitOf(Load(mAnna, mMine))).status,
              404);
}

TEST_F(ShareTest, ACopyOfASessionIsAProductionWithItsUnsharedState) {
    Json const transaction = MakeTransaction(mAnna, mMine);
    Json const asset = AddAsset(mAnna, transaction, "c", "unshared");
    ASSERT_EQ(mAnna
                  .SendForm("POST", LinkOf(asset, "/enclosures/enclosure#create"),
                            Form().Add(":name", "n").Add(":enclosure", "bytes"))
                  .status,
              201);
    Json const session = Commit(mAnna, transaction);
    Answer const copied = mAnna.PostJson(LinkOf(session, "/sessions/session#copy"),
                                         R"({"name":"Saved","description":"","isTemporary":false})");
    ASSERT_EQ(copied.status, 201) << copied.body;
    Json const copy = Json::parse(copied.body);
    EXPECT_EQ(copy["properties"]["name"], "Saved");
    EXPECT_TRUE(HasLink(copy, "/sessions"));
    ASSERT_EQ(mAnna.Request("DELETE", LinkOf(session, "delete")).status, 204);
    EXPECT_EQ(Names(mAnna, copy), (NameMap{{"a", "first"}, {"b", "first"}, {"c", "unshared"}}));
    Json const full = Json::parse(mAnna.Get(LinkOf(copy, "/assets#full")).body);
    for (auto const& item : full["assets"])
        for (auto const& enclosure : item["enclosures"]["enclosures"])
            EXPECT_EQ(mAnna.Get(LinkOf(enclosure, "/enclosures/enclosure")).body, "bytes");
    EXPECT_EQ(Problems(), std::vector<std::string>());
}

// Everybody commits and shares as fast as he can, some of them through a second server on the same data;
// afterwards each answered change is in the shared history, and in the tree, exactly once.
TEST_F(ShareTest, OfManyWhoShareAtOnceEachAnsweredChangeIsThereOnce) {
    constexpr std::size_t kUsers = 6;
    constexpr std::size_t kRounds = 5;
    auto const secondStorage = OpenSqliteStorage(mHub.DataPath().string());
    Hub secondHub(*secondStorage, {}, [] { return 1800000000 * kSecond; });
    Server second(
        {}, [&](Request const& inRequest) { return secondHub.Handle(inRequest); }, Hub::LaneOf);
    Client const annaThere(second.ListenPlain("127.0.0.1", 0), mAnna.Token());
    second.Start();
    std::vector<Client> const clients{mAnna, mBen, annaThere, mAnna, mBen, annaThere};
    std::mutex mutex;
    std::set<std::string> acknowledged;
    std::vector<std::thread> threads;
    for (std::size_t user = 0; user < kUsers; ++user)
        threads.emplace_back([&, user] {
            Client const& client = clients[user];
            Json const session = MakeSession(client, mProduction);
            for (std::size_t round = 0; round < kRounds; ++round) {
                std::string const name = "u" + std::to_string(user) + "-" + std::to_string(round);
                AddInSession(client, session, name, name);
                int status = 409;
                for (int attempt = 0; status == 409 && attempt < 200; ++attempt)
                    status = Push(client, session, name, "", attempt % 2 ? "AUTO" : "NONE").status;
                EXPECT_EQ(status, 200);
                std::lock_guard const lock(mutex);
                acknowledged.insert(name);
            }
        });
    for (auto& thread : threads)
        thread.join();
    ASSERT_EQ(acknowledged.size(), kUsers * kRounds);
    NameMap const names = Names(mAnna, mProduction);
    std::multiset<std::string> titles;
    for (auto const& title : Titles(mAnna, Production()))
        titles.insert(title);
    for (auto const& name : acknowledged) {
        EXPECT_EQ(names.count(name), 1u) << name;
        EXPECT_EQ(titles.count(name), 1u) << name;
    }
    EXPECT_EQ(names.size(), acknowledged.size() + 2);
    EXPECT_EQ(Problems(), std::vector<std::string>());
}

TEST_F(ShareTest, OfManyWhoCommitOneSessionAtOnceAllIngestsGetInAndOneEditDoes) {
    constexpr int kWriters = 8;
    std::vector<Json> ingests;
    std::vector<Json> edits;
    for (int i = 0; i < kWriters; ++i) {
        ingests.push_back(MakeTransaction(mAnna, mMine));
        AddAsset(mAnna, ingests.back(), "i" + std::to_string(i), "ingested");
        edits.push_back(MakeTransaction(mAnna, mMine));
        Rename(mAnna, edits.back(), "a", "by " + std::to_string(i));
    }
    std::atomic<int> edited{0};
    std::vector<std::thread> threads;
    for (int i = 0; i < kWriters; ++i) {
        threads.emplace_back([&, i] { Commit(mAnna, ingests[i], "AUTO", "i"); });
        threads.emplace_back([&, i] {
            int const status = TryCommit(mAnna, edits[i], "AUTO", "e").status;
            EXPECT_TRUE(status == 200 || status == 412) << status;
            edited += status == 200;
        });
    }
    for (auto& thread : threads)
        thread.join();
    EXPECT_EQ(edited, 1) << "the others met a name that was changed meanwhile";
    EXPECT_EQ(Names(mAnna, mMine).size(), 2u + kWriters);
    EXPECT_EQ(Titles(mAnna, mMine).size(), 3u + kWriters + 1);
    EXPECT_EQ(Problems(), std::vector<std::string>());
}

}  // namespace zohub::test
