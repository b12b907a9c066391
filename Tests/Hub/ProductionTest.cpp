// Productions, templates, copies, commits and conditional requests.
#include <atomic>
#include <future>
#include <set>
#include <thread>

#include "HubFixture.h"

namespace zohub::test {

class ProductionTest : public HubTest {};

TEST_F(ProductionTest, WhatIsCreatedIsWhatIsLoadedAndListed) {
    Answer const created =
        mAnna.PostJson("/zo/1/p", R"({"name":"Film","description":"d","isTemporary":true})");
    ASSERT_EQ(created.status, 201);
    Json const document = Json::parse(created.body);
    EXPECT_EQ(created.Header("location"), LinkOf(document, "self"));
    EXPECT_EQ(document["zo:owner"], "anna");
    EXPECT_EQ(document["created"], "2027-01-15T08:00:00.000000Z");

    Answer const loaded = mAnna.Get(LinkOf(document, "self"));
    EXPECT_EQ(loaded.body, created.body);
    EXPECT_EQ(loaded.Header("etag"), created.Header("etag"));
    EXPECT_EQ(loaded.Header("cache-control"), "no-cache");
    Json const item = Json::parse(mAnna.Get("/zo/1/p").body)["productions"][0];
    EXPECT_EQ(item["properties"]["name"], "Film");
    EXPECT_EQ(LinkOf(item, "self"), LinkOf(document, "self"));
    EXPECT_TRUE(item["zo:lastModified"].is_string());
}

TEST_F(ProductionTest, EditingNeedsTheCurrentTagAndKeepsUnknownKeys) {
    Json const first = MakeProduction(mAnna, "Film");
    std::string const edit = LinkOf(first, "edit");
    std::string const tag = mAnna.Get(edit).Header("etag");
    std::string const properties = R"({"name":"Film 2","x:own":{"deep":[1,2.5,null,"ä"]},"tags":["a","b"]})";
    Answer const changed = mAnna.PutJson(edit, properties, {{"If-Match", tag}});
    ASSERT_EQ(changed.status, 200) << changed.body;
    EXPECT_NE(changed.Header("etag"), tag);
    EXPECT_EQ(Json::parse(changed.body)["properties"].dump(), Json::parse(properties).dump());

    Answer const stale = mAnna.PutJson(edit, R"({"name":"Film 3"})", {{"If-Match", tag}});
    EXPECT_EQ(stale.status, 412);
    EXPECT_EQ(Json::parse(stale.body)["error"]["code"], "changed-meanwhile");
    EXPECT_EQ(Json::parse(mAnna.Get(edit).body)["properties"]["name"], "Film 2");
    EXPECT_EQ(mAnna.PutJson(edit, R"({"name":"Film 3"})", {{"If-Match", changed.Header("etag")}}).status,
              200);
    EXPECT_EQ(mAnna.PutJson(edit, R"({"name":"Film 4"})").status, 200);
}

TEST_F(ProductionTest, WrongPropertiesAreRefusedAndChangeNothing) {
    Json const production = MakeProduction(mAnna, "Film");
    std::string const edit = LinkOf(production, "edit");
    for (char const* body : {R"({"name":7})", R"({"name":"x","tags":"y"})", R"({"name":"x","tags":[1]})",
                             "[]", R"({"description":"no name"})", "{\"name\":\"a\\u0001b\"}",
                             "{\"name\":\"\xff\"}", R"({"name":"x","big":1e999})", R"({"name":)"}) {
        Answer const refused = mAnna.PutJson(edit, body);
        EXPECT_EQ(refused.status, 400) << body;
        EXPECT_TRUE(Json::parse(refused.body)["error"]["message"].is_string());
    }
    EXPECT_EQ(mAnna.Get(edit).body, JsonText(production));
}

TEST_F(ProductionTest, AnOldCommitStaysReadableAndPointsToTheHead) {
    Json const first = MakeProduction(mAnna, "Film");
    std::string const edit = LinkOf(first, "edit");
    ASSERT_EQ(mAnna.PutJson(edit, R"({"name":"Film 2"})").status, 200);
    std::string const id = first["zo:productionId"].get<std::string>();
    std::string const commit = first["zo:commitId"].get<std::string>();

    Json const old = Json::parse(mAnna.Get("/zo/1/p/" + id + "/at/" + commit).body);
    EXPECT_EQ(old["properties"]["name"], "Film");
    EXPECT_EQ(LinkOf(old, "latest-version"), LinkOf(first, "self"));
    EXPECT_NE(LinkOf(old, "self"), LinkOf(first, "self"));
    EXPECT_FALSE(HasLink(old, "edit"));
    EXPECT_FALSE(HasLink(old, "/assets/asset#create"));
    EXPECT_EQ(mAnna.PutJson(LinkOf(old, "self"), R"({"name":"no"})").status, 405);

    Json const head = Json::parse(mAnna.Get("/zo/1/p/" + id + "/at/HEAD").body);
    EXPECT_EQ(LinkOf(head, "self"), LinkOf(first, "self"));
    EXPECT_EQ(LinkOf(head, "latest-version"), LinkOf(first, "self"));
    EXPECT_EQ(mAnna.Get("/zo/1/p/" + id + "/at/" + std::string(64, '0')).status, 404);
}

TEST_F(ProductionTest, ACommitOfAnotherProductionIsNotReadableThroughThisOne) {
    Json const mine = MakeProduction(mAnna, "Mine");
    Json const other = MakeProduction(mHub.SignedIn("ben"), "Other");
    EXPECT_EQ(mAnna
                  .Get("/zo/1/p/" + mine["zo:productionId"].get<std::string>() + "/at/" +
                       other["zo:commitId"].get<std::string>())
                  .status,
              404);
}

TEST_F(ProductionTest, ConditionalReadsAndHeadGoByTheSameTag) {
    Json const production = MakeProduction(mAnna, "Film");
    MakeAsset(mAnna, production, kClip);
    for (std::string const& href :
         {LinkOf(production, "self"), LinkOf(production, "/assets#full"), LinkOf(production, "/assets"),
          LinkOf(production, "/enclosures"), std::string("/zo/1/p"), std::string("/zo/1/users/current")}) {
        Answer const whole = mAnna.Get(href);
        std::string const tag = whole.Header("etag");
        ASSERT_FALSE(tag.empty()) << href;
        Answer const unchanged = mAnna.Get(href, {{"If-None-Match", "\"other\", " + tag}});
        EXPECT_EQ(unchanged.status, 304) << href;
        EXPECT_EQ(unchanged.Header("etag"), tag);
        EXPECT_EQ(unchanged.body, "");
        EXPECT_EQ(mAnna.Get(href, {{"If-None-Match", "\"other\""}}).status, 200);
        Answer const head = mAnna.Request("HEAD", href);
        EXPECT_EQ(head.status, 200);
        EXPECT_EQ(head.Header("etag"), tag);
        EXPECT_EQ(head.Header("content-length"), std::to_string(whole.body.size()));
    }
}

TEST_F(ProductionTest, ACopyHasTheSameAssetsAndGoesItsOwnWay) {
    Json const source = MakeProduction(mAnna, "Film");
    Json const asset = MakeAsset(mAnna, source, kClip);
    Answer const enclosed =
        mAnna.SendForm("POST", LinkOf(asset, "/enclosures/enclosure#create"),
                       Form().Add(":name", "note").Add(":enclosure", "text", "text/plain"));
    ASSERT_EQ(enclosed.status, 201);
    Answer const copied = mAnna.PostJson(LinkOf(source, "/productions/production#copy"),
                                         R"({"name":"Film B","description":""})");
    ASSERT_EQ(copied.status, 201) << copied.body;
    Json const copy = Json::parse(copied.body);
    EXPECT_NE(copy["zo:productionId"], source["zo:productionId"]);
    Json const assets = Json::parse(mAnna.Get(LinkOf(copy, "/assets#full")).body);
    ASSERT_EQ(assets["assets"].size(), 1u);
    Json const& enclosure = assets["assets"][0]["enclosures"]["enclosures"][0];
    EXPECT_EQ(mAnna.Get(LinkOf(enclosure, "/enclosures/enclosure")).body, "text");
    EXPECT_EQ(mAnna.Request("DELETE", LinkOf(assets["assets"][0], "delete")).status, 204);
    EXPECT_EQ(mAnna.Get(LinkOf(asset, "self")).status, 200);
}

TEST_F(ProductionTest, ATemplateIsReadByAllWrittenByItsOwnerAndMadeIntoProductions) {
    std::string id;
    {
        auto const transaction = mHub.Data().BeginWrite();
        TreeRoot tree;
        tree.properties = R"({"name":"Series","description":""})";
        id = Repository(*transaction).CreateLine(kLineTemplate, tree, "made", {"ben", false}, false, 1).id;
        transaction->Commit();
    }
    Json const list = Json::parse(mAnna.Get("/zo/1/templates").body);
    ASSERT_EQ(list["productions"].size(), 1u);
    Json const document = Json::parse(mAnna.Get(LinkOf(list["productions"][0], "self")).body);
    EXPECT_FALSE(HasLink(document, "edit"));
    EXPECT_EQ(mAnna.PutJson(LinkOf(document, "self"), R"({"name":"x"})").status, 403);
    EXPECT_TRUE(HasLink(Json::parse(mHub.SignedIn("ben").Get(LinkOf(document, "self")).body), "edit"));

    Answer const made = mAnna.PostJson(LinkOf(document, "/productions/production#create-production"),
                                       R"({"name":"Episode 1","description":"","isTemporary":false})");
    ASSERT_EQ(made.status, 201);
    EXPECT_EQ(Json::parse(made.body)["zo:owner"], "anna");
    EXPECT_EQ(Json::parse(mAnna.Get("/zo/1/p").body)["productions"].size(), 1u);
    EXPECT_EQ(Json::parse(mAnna.Get("/zo/1/templates").body)["productions"].size(), 1u);
}

TEST_F(ProductionTest, ARepeatedRequestWithItsKeyIsAnsweredFromMemoryForADay) {
    std::string const body = R"({"name":"Once","description":"","isTemporary":false})";
    Answer const first = mAnna.PostJson("/zo/1/p", body, {{"Idempotency-Key", "k1"}});
    Answer const again = mAnna.PostJson("/zo/1/p", body, {{"Idempotency-Key", "k1"}});
    EXPECT_EQ(first.status, 201);
    EXPECT_EQ(again.status, 201);
    EXPECT_EQ(again.body, first.body);
    EXPECT_EQ(again.Header("location"), first.Header("location"));
    EXPECT_EQ(again.Header("etag"), first.Header("etag"));
    EXPECT_EQ(again.Header("content-type"), first.Header("content-type"));
    EXPECT_EQ(mAnna.PostJson("/zo/1/p", R"({"name":"Other"})", {{"Idempotency-Key", "k1"}}).status, 422);
    EXPECT_EQ(mHub.SignedIn("ben").PostJson("/zo/1/p", body, {{"Idempotency-Key", "k1"}}).status, 201);
    EXPECT_EQ(Json::parse(mAnna.Get("/zo/1/p").body)["productions"].size(), 1u);

    mHub.Advance(kDay + kSecond);
    Client const later = mHub.SignedIn("anna");
    EXPECT_NE(later.PostJson("/zo/1/p", body, {{"Idempotency-Key", "k1"}}).body, first.body);
}

TEST_F(ProductionTest, ARepeatedPutOrDeleteIsAnsweredFromMemoryToo) {
    Json const production = MakeProduction(mAnna, "Film");
    std::string const edit = LinkOf(production, "edit");
    Client::Headers headers{{"Idempotency-Key", "p1"}, {"If-Match", mAnna.Get(edit).Header("etag")}};
    std::string const body = R"({"name":"Film","description":"Second cut"})";
    Answer const first = mAnna.PutJson(edit, body, headers);
    EXPECT_EQ(first.status, 200);
    Answer const again = mAnna.PutJson(edit, body, headers);
    EXPECT_EQ(again.status, 200) << "the tag of before was looked at";
    EXPECT_EQ(again.body, first.body);

    Json const session =
        Json::parse(mAnna.PostJson(LinkOf(production, "/sessions"), R"({"name":"Mine"})").body);
    Client::Headers const key{{"Idempotency-Key", "d1"}};
    EXPECT_EQ(mAnna.Request("DELETE", LinkOf(session, "delete"), {}, key).status, 204);
    EXPECT_EQ(mAnna.Request("DELETE", LinkOf(session, "delete"), {}, key).status, 204);
    EXPECT_EQ(mAnna.Request("DELETE", LinkOf(session, "delete")).status, 404);
}

// The connection breaks while the first is at work, and the repeat arrives at once.
TEST_F(ProductionTest, RepeatsThatComeTogetherAreDoneOnce) {
    std::string const body = R"({"name":"Once","description":"","isTemporary":false})";
    std::vector<std::future<Answer>> answers;
    for (int i = 0; i < 8; ++i)
        answers.push_back(std::async(std::launch::async, [this, body] {
            return Client(mAnna).PostJson("/zo/1/p", body, {{"Idempotency-Key", "together"}});
        }));
    std::set<std::string> bodies;
    for (auto& answer : answers)
        bodies.insert(answer.get().body);
    EXPECT_EQ(bodies.size(), 1u);
    EXPECT_EQ(Json::parse(mAnna.Get("/zo/1/p").body)["productions"].size(), 1u);
}

TEST_F(ProductionTest, OfKeptAnswersTheOldestGo) {
    auto const transaction = mHub.Data().BeginWrite();
    for (int i = 0; i < 10; ++i)
        transaction->AddAnswer({"anna", "k" + std::to_string(i), "f", 200, "{}", "", Micros{i + 1}});
    transaction->KeepNewestAnswers(4);
    for (int i = 0; i < 10; ++i)
        EXPECT_EQ(transaction->FindAnswer("anna", "k" + std::to_string(i), 0).has_value(), i >= 6) << i;
    transaction->KeepNewestAnswers(100);
    EXPECT_TRUE(transaction->FindAnswer("anna", "k6", 0));
}

TEST_F(ProductionTest, ARefusedRequestLeavesItsKeyFree) {
    EXPECT_EQ(mAnna.PostJson("/zo/1/p", R"({"name":3})", {{"Idempotency-Key", "k2"}}).status, 400);
    EXPECT_EQ(mAnna.PostJson("/zo/1/p", R"({"name":"x"})", {{"Idempotency-Key", "k2"}}).status, 201);
}

TEST_F(ProductionTest, OfManyWhoWriteAgainstOneTagExactlyOneSucceeds) {
    Json const production = MakeProduction(mAnna, "Film");
    std::string const edit = LinkOf(production, "edit");
    std::string const tag = mAnna.Get(edit).Header("etag");
    std::atomic<int> done{0};
    std::atomic<int> refused{0};
    std::vector<std::thread> writers;
    for (int i = 0; i < 8; ++i)
        writers.emplace_back([&, i] {
            int const status =
                mAnna.PutJson(edit, "{\"name\":\"by " + std::to_string(i) + "\"}", {{"If-Match", tag}})
                    .status;
            ++(status == 200 ? done : refused);
            EXPECT_TRUE(status == 200 || status == 412) << status;
        });
    for (auto& writer : writers)
        writer.join();
    EXPECT_EQ(done, 1);
    EXPECT_EQ(refused, 7);
}

TEST_F(ProductionTest, ReadersDoNotWaitForWritersThatWait) {
    Json const production = MakeProduction(mAnna, "Film");
    std::string const self = LinkOf(production, "self");
    auto longWrite = mHub.Data().BeginWrite();
    std::vector<std::thread> writers;
    for (int i = 0; i < 6; ++i)
        writers.emplace_back([&] { EXPECT_EQ(mAnna.PutJson(self, R"({"name":"later"})").status, 200); });
    for (int i = 0; i < 20; ++i) {
        auto const begin = std::chrono::steady_clock::now();
        EXPECT_EQ(mAnna.Get(self).status, 200);
        EXPECT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds(2));
    }
    longWrite.reset();
    for (auto& writer : writers)
        writer.join();
    EXPECT_EQ(Json::parse(mAnna.Get(self).body)["properties"]["name"], "later");
}

}  // namespace zohub::test
