// Differences and conflicts as clients see them: what is listed, by whom it was changed, and each way to
// answer.
#include "Base/Text.h"
#include "SessionFixture.h"

namespace zohub::test {

using NameMap = std::map<std::string, std::string>;

class ConflictTest : public SessionTest {
protected:
    // A production with assets a and b, of which a has an enclosure; a session of anna's and one of ben's.
    void SetUp() override {
        mProduction = MakeSharedProduction();
        for (char const* id : {"a", "b"})
            AddAsset(mAnna, mProduction, id, "first");
        PutEnclosure(mAnna, mProduction, "a", "folder/clip;1_xmp", "first");
        mBen = mHub.SignedIn("ben");
        mMine = MakeSession(mAnna, mProduction);
        mHis = MakeSession(mBen, mProduction);
        mFirst = CommitOf(mMine);
    }

    // Makes or replaces the enclosure of an asset.
    static void PutEnclosure(Client const& inClient, Json const& inLine, std::string const& inAsset,
                             std::string const& inName, std::string const& inBytes) {
        std::string const list = LinkOf(inLine, "self") + "/a/" + inAsset + "/e";
        Json const present = Json::parse(inClient.Get(list).body);
        for (auto const& enclosure : present["enclosures"])
            if (enclosure["name"] == inName) {
                Form form;
                form.Add(":enclosure", inBytes, "text/plain");
                ASSERT_EQ(inClient.SendForm("PUT", LinkOf(enclosure, "self"), form).status, 200);
                return;
            }
        Form form;
        form.Add(":name", inName).Add(":enclosure", inBytes, "text/plain");
        ASSERT_EQ(inClient.SendForm("POST", list, form).status, 201);
    }

    using Edit = std::function<void(Json const& inTransaction)>;

    // One transaction on the session; gives the session afterwards.
    static Json Change(Client const& inClient, Json const& inSession, Edit const& inEdit) {
        Json const transaction = MakeTransaction(inClient, Load(inClient, inSession));
        inEdit(transaction);
        return Commit(inClient, transaction);
    }

    void BenShares(Edit const& inEdit) {
        ASSERT_EQ(Pull(mBen, mHis, "accept-theirs").status, 200);
        Change(mBen, mHis, inEdit);
        ASSERT_EQ(Push(mBen, mHis, "ben shares").status, 200);
    }

    static Edit Renames(Client const& inClient, std::string const& inId, std::string const& inName) {
        return [=](Json const& inTransaction) { Rename(inClient, inTransaction, inId, inName); };
    }
    static Edit Removes(Client const& inClient, std::string const& inId) {
        return [=](Json const& inTransaction) {
            ASSERT_EQ(inClient.Request("DELETE", LinkOf(inTransaction, "self") + "/a/" + inId).status, 204);
        };
    }
    static Edit Encloses(Client const& inClient, std::string const& inBytes) {
        return [=](Json const& inTransaction) {
            PutEnclosure(inClient, inTransaction, "a", "folder/clip;1_xmp", inBytes);
        };
    }
    static Edit Describes(Client const& inClient, std::string const& inText) {
        return [=](Json const& inTransaction) {
            Json const properties = {{"name", "Film"}, {"description", inText}};
            ASSERT_EQ(inClient.PutJson(LinkOf(inTransaction, "edit"), JsonText(properties)).status, 200);
        };
    }

    Json Outgoing() {
        Answer const answer = mAnna.Get(LinkOf(mMine, "/sessions/session#outgoingChanges"));
        EXPECT_EQ(answer.status, 200) << answer.body;
        return Json::parse(answer.body)["differences"];
    }

    Answer Accept(Json const& inEntry, std::string const& inSide, std::string const& inCommit) {
        std::string const link = LinkOf(inEntry, "accept-" + inSide);
        EXPECT_FALSE(link.empty()) << inEntry;
        return mAnna.PostJson(link, "{\":commitId\":" + JsonString(inCommit) + "}");
    }
    Answer Accept(Json const& inEntry, std::string const& inSide) {
        return Accept(inEntry, inSide, CommitOf(Load(mAnna, mMine)));
    }

    std::string EnclosureText(Client const& inClient, Json const& inLine) {
        Json const list = Json::parse(inClient.Get(LinkOf(inLine, "self") + "/a/a/e").body)["enclosures"];
        return inClient.Get(LinkOf(list.at(0), "/enclosures/enclosure")).body;
    }

    Json mProduction;
    Json mMine;
    Json mHis;
    std::string mFirst;
    Client mBen{0};
};

TEST_F(ConflictTest, ListsWhatEachSideChangedWithWhoDidIt) {
    BenShares(Renames(mBen, "a", "his"));
    mHub.Advance(60 * kSecond);
    BenShares([&](Json const& t) {
        Encloses(mBen, "his")(t);
        Removes(mBen, "b")(t);
        AddAsset(mBen, t, "c", "third");
    });
    Change(mAnna, mMine, Describes(mAnna, "mine"));

    Answer const incoming = mAnna.Get(LinkOf(mMine, "/sessions/session#incomingChanges"));
    Json const document = Json::parse(incoming.body);
    EXPECT_EQ(document["info"]["leftSideCommitId"], mFirst);
    EXPECT_EQ(document["info"]["rightSideCommitId"], CommitOf(Load(mAnna, mProduction)));
    Json const assets = document["differences"]["assets"];
    ASSERT_EQ(assets.size(), 3u);
    EXPECT_EQ(assets[0]["zo:name"], "his");
    EXPECT_EQ(assets[1]["zo:name"], "first");
    char const* const types[] = {"UPDATED", "REMOVED", "ADDED"};
    for (int i = 0; i < 3; ++i) {
        EXPECT_EQ(assets[i]["zo:assetId"], std::string(1, static_cast<char>('a' + i)));
        EXPECT_EQ(assets[i]["zo:differenceType"], types[i]);
        EXPECT_EQ(assets[i]["zo:committer"], "ben");
        EXPECT_EQ(assets[i]["zo:baseCommitId"], mFirst);
        EXPECT_FALSE(assets[i].contains("zo:conflictsWithContentId"));
        Answer const item = mAnna.Get(LinkOf(assets[i], "self"));
        EXPECT_EQ(item.status, 200) << item.body;
        EXPECT_EQ(Json::parse(item.body)["properties"]["name"], assets[i]["zo:name"]);
    }
    EXPECT_LT(assets[0]["zo:committed"], assets[2]["zo:committed"]);
    Json const enclosures = document["differences"]["enclosures"];
    ASSERT_EQ(enclosures.size(), 1u);
    EXPECT_EQ(enclosures[0]["zo:assetId"], "a");
    EXPECT_EQ(enclosures[0]["zo:name"], "folder/clip;1_xmp");
    EXPECT_EQ(mAnna.Get(LinkOf(enclosures[0], "self")).status, 200);
    EXPECT_EQ(LinkOf(enclosures[0], "up"), LinkOf(assets[0], "self"));
    EXPECT_FALSE(document["differences"].contains("properties"));
    EXPECT_EQ(mAnna.Get(LinkOf(document, "self"), {{"If-None-Match", incoming.Header("etag")}}).status, 304);

    Json const outgoing = Outgoing();
    EXPECT_EQ(outgoing["assets"].size() + outgoing["enclosures"].size(), 0u);
    EXPECT_EQ(outgoing["properties"]["zo:differenceType"], "UPDATED");
    EXPECT_EQ(outgoing["properties"]["zo:committer"], "anna");
    EXPECT_EQ(LinkOf(outgoing["properties"], "self"), LinkOf(mMine, "self"));
    EXPECT_EQ(mBen.Get(LinkOf(mMine, "/sessions/session#outgoingChanges")).status, 404);
    EXPECT_EQ(mBen.Get(LinkOf(mMine, "/sessions/session#incomingChanges")).status, 404);
}

TEST_F(ConflictTest, ComparesAnyTwoCommitsThatOneMaySee) {
    BenShares(Removes(mBen, "b"));
    std::string const head = CommitOf(Load(mAnna, mProduction));
    std::string const own = CommitOf(Change(mAnna, mMine, Renames(mAnna, "a", "mine")));
    auto const between = [&](Client const& inClient, Json const& inLine, std::string const& inBase,
                             std::string const& inCommit) {
        return inClient.Get(LinkOf(inLine, "self") + "/diff?base=" + inBase + "&commit=" + inCommit);
    };
    Json const forward = Json::parse(between(mBen, mProduction, mFirst, "HEAD").body)["differences"];
    ASSERT_EQ(forward["assets"].size(), 1u);
    EXPECT_EQ(forward["assets"][0]["zo:differenceType"], "REMOVED");
    Json const back = Json::parse(between(mBen, mProduction, head, mFirst).body)["differences"];
    EXPECT_EQ(back["assets"][0]["zo:differenceType"], "ADDED");
    Json const all = Json::parse(between(mBen, mProduction, "", mFirst).body);
    EXPECT_EQ(all["info"]["leftSideCommitId"], "");
    EXPECT_EQ(all["differences"]["assets"].size(), 2u);
    EXPECT_EQ(all["differences"]["enclosures"][0]["zo:differenceType"], "ADDED");
    EXPECT_EQ(all["differences"]["properties"]["zo:differenceType"], "ADDED");
    Json const mine = Json::parse(between(mAnna, mMine, mFirst, own).body)["differences"];
    EXPECT_EQ(mAnna.Get(LinkOf(mine["assets"][0], "self")).status, 200);

    EXPECT_EQ(between(mBen, mMine, mFirst, own).status, 404);
    EXPECT_EQ(between(mBen, mProduction, mFirst, own).status, 404) << "not shared yet";
    EXPECT_EQ(between(mBen, mProduction, own, "HEAD").status, 404);
    EXPECT_EQ(between(mBen, mProduction, mFirst, "nothing").status, 404);
    EXPECT_EQ(mAnna.Get(LinkOf(mProduction, "self") + "/outgoing").status, 404);
}

TEST_F(ConflictTest, EachConflictIsListedAndAnsweredByItself) {
    BenShares([&](Json const& t) {
        Rename(mBen, t, "a", "his");
        Rename(mBen, t, "b", "his");
        Encloses(mBen, "his")(t);
        Describes(mBen, "his")(t);
    });
    Change(mAnna, mMine, [&](Json const& t) {
        Rename(mAnna, t, "a", "mine");
        Rename(mAnna, t, "b", "mine");
        Encloses(mAnna, "mine")(t);
        Describes(mAnna, "mine")(t);
    });
    EXPECT_EQ(ErrorCode(Pull(mAnna, mMine, "safe")), "would-conflict");
    ASSERT_EQ(Pull(mAnna, mMine, "interactive").status, 200);
    EXPECT_EQ(Names(mAnna, mMine), (NameMap{{"a", "mine"}, {"b", "mine"}}));

    Answer const listed = mAnna.Get(LinkOf(mMine, "/sessions/session#outgoingChanges"));
    Json const outgoing = Json::parse(listed.body)["differences"];
    ASSERT_EQ(outgoing["assets"].size(), 2u);
    ASSERT_EQ(outgoing["enclosures"].size(), 1u);
    Json const theirs = Json::parse(mBen.Get(LinkOf(mProduction, "self") + "/a/a").body);
    Json const& asset = outgoing["assets"][0];
    Json const& other = outgoing["assets"][1];
    Json const& enclosure = outgoing["enclosures"][0];
    Json const& properties = outgoing["properties"];
    EXPECT_EQ(asset["zo:conflictsWithContentId"], theirs["zo:assetContentId"]);
    EXPECT_EQ(enclosure["zo:conflictsWithContentId"],
              theirs["enclosures"]["enclosures"][0]["zo:enclosureContentId"]);
    EXPECT_FALSE(properties["zo:conflictsWithContentId"].get<std::string>().empty());
    for (auto const& entry : {asset, other, enclosure, properties}) {
        EXPECT_EQ(entry["zo:baseCommitId"], mFirst);
        EXPECT_EQ(entry["zo:differenceType"], "UPDATED");
    }

    EXPECT_EQ(ErrorCode(Push(mAnna, mMine, "x")), "conflicts-remain");
    EXPECT_EQ(Accept(asset, "theirs", mFirst).status, 412);
    EXPECT_EQ(mAnna.PostJson(LinkOf(asset, "accept-theirs"), "{}", {{"If-Match", "\"old\""}}).status, 412);
    EXPECT_EQ(mBen.PostJson(LinkOf(asset, "accept-theirs"), "{}").status, 404);
    EXPECT_EQ(mAnna.PostJson(LinkOf(asset, "accept-theirs"), R"({":commitId":7})").status, 400);

    std::string head = CommitOf(Load(mAnna, mMine));
    std::vector<std::pair<Json, std::string>> const answers = {
        {asset, "theirs"}, {enclosure, "yours"}, {properties, "theirs"}, {other, "yours"}};
    for (auto const& [entry, side] : answers) {
        Answer const answer = Accept(entry, side, head);
        ASSERT_EQ(answer.status, 200) << answer.body;
        std::string const next = CommitOf(Json::parse(answer.body));
        EXPECT_NE(next, head);
        head = next;
        Answer const gone = Accept(entry, side, head);
        EXPECT_EQ(gone.status, 404) << gone.body;
    }
    EXPECT_NE(mAnna.Get(LinkOf(mMine, "/sessions/session#outgoingChanges")).Header("etag"),
              listed.Header("etag"));
    ASSERT_EQ(Push(mAnna, mMine, "resolved", head).status, 200);
    EXPECT_EQ(Names(mBen, mProduction), (NameMap{{"a", "his"}, {"b", "mine"}}));
    EXPECT_EQ(EnclosureText(mBen, mProduction), "mine");
    EXPECT_EQ(Load(mBen, mProduction)["properties"]["description"], "his");
    EXPECT_EQ(Problems(), std::vector<std::string>());
}

TEST_F(ConflictTest, ARemovedAssetAgainstAChangedOneIsOneConflictThatEitherSideCanWin) {
    BenShares([&](Json const& t) {
        Removes(mBen, "a")(t);
        Rename(mBen, t, "b", "his");
    });
    Change(mAnna, mMine, [&](Json const& t) {
        Encloses(mAnna, "mine")(t);
        Removes(mAnna, "b")(t);
    });
    ASSERT_EQ(Pull(mAnna, mMine).status, 200);
    Json const outgoing = Outgoing();
    ASSERT_EQ(outgoing["assets"].size(), 2u);
    Json const& kept = outgoing["assets"][0];
    Json const& dropped = outgoing["assets"][1];
    EXPECT_EQ(kept["zo:differenceType"], "ADDED");
    EXPECT_EQ(kept["zo:conflictsWithContentId"], "removed");
    EXPECT_EQ(dropped["zo:differenceType"], "REMOVED");
    EXPECT_EQ(Json::parse(mAnna.Get(LinkOf(dropped, "self")).body)["zo:assetContentId"],
              dropped["zo:conflictsWithContentId"]);
    ASSERT_EQ(outgoing["enclosures"].size(), 1u);
    EXPECT_FALSE(HasLink(outgoing["enclosures"][0], "accept-theirs"));
    ASSERT_EQ(Accept(kept, "theirs").status, 200);
    ASSERT_EQ(Accept(dropped, "theirs").status, 200);
    EXPECT_EQ(Names(mAnna, mMine), (NameMap{{"b", "his"}}));
    EXPECT_EQ(Outgoing()["assets"].size() + Outgoing()["enclosures"].size(), 0u);
    EXPECT_EQ(Problems(), std::vector<std::string>());
}

TEST_F(ConflictTest, AConflictStaysOverFurtherPullsAndEndsWhenTheSidesMeet) {
    BenShares(Renames(mBen, "a", "his"));
    Change(mAnna, mMine, Renames(mAnna, "a", "mine"));
    ASSERT_EQ(Pull(mAnna, mMine).status, 200);
    std::string const before = Outgoing()["assets"][0]["zo:conflictsWithContentId"].get<std::string>();

    BenShares([&](Json const& t) {
        Rename(mBen, t, "a", "his second");
        Rename(mBen, t, "b", "his");
    });
    EXPECT_EQ(ErrorCode(Pull(mAnna, mMine, "safe")), "would-conflict");
    ASSERT_EQ(Pull(mAnna, mMine).status, 200);
    Json const entry = Outgoing()["assets"][0];
    EXPECT_NE(entry["zo:conflictsWithContentId"], before);
    EXPECT_EQ(entry["zo:baseCommitId"], mFirst);
    EXPECT_EQ(Names(mAnna, mMine), (NameMap{{"a", "mine"}, {"b", "his"}}));

    // They come round to what is here.
    BenShares(Renames(mBen, "a", "mine"));
    ASSERT_EQ(Pull(mAnna, mMine).status, 200);
    EXPECT_EQ(Outgoing()["assets"].size(), 0u);

    // Or the session does: a change by hand settles a conflict as well.
    BenShares(Renames(mBen, "b", "his third"));
    Change(mAnna, mMine, Renames(mAnna, "b", "mine"));
    ASSERT_EQ(Pull(mAnna, mMine).status, 200);
    EXPECT_EQ(ErrorCode(Push(mAnna, mMine, "x")), "conflicts-remain");
    Change(mAnna, mMine, Renames(mAnna, "b", "his third"));
    EXPECT_EQ(Push(mAnna, mMine, "x").status, 200);
    EXPECT_EQ(Problems(), std::vector<std::string>());
}

TEST_F(ConflictTest, ATransactionThatSaysSoAnswersTheConflictsOfWhatItChanged) {
    BenShares([&](Json const& t) {
        Rename(mBen, t, "a", "his");
        Rename(mBen, t, "b", "his");
        Encloses(mBen, "his")(t);
        Describes(mBen, "his")(t);
    });
    Change(mAnna, mMine, [&](Json const& t) {
        Rename(mAnna, t, "a", "mine");
        Rename(mAnna, t, "b", "mine");
        Encloses(mAnna, "mine")(t);
        Describes(mAnna, "mine")(t);
    });
    ASSERT_EQ(Pull(mAnna, mMine).status, 200);
    auto const open = [&] {
        std::string list;
        Json const outgoing = Outgoing();
        for (char const* kind : {"assets", "enclosures"})
            for (auto const& entry : outgoing[kind])
                if (entry.contains("zo:conflictsWithContentId"))
                    list += std::string(1, kind[0]) + entry["zo:assetId"].get<std::string>() + " ";
        bool const isProduction =
            outgoing.contains("properties") && outgoing["properties"].contains("zo:conflictsWithContentId");
        return list + (isProduction ? "p" : "");
    };
    EXPECT_EQ(open(), "aa ab ea p");
    // Going on with the work answers nothing.
    Change(mAnna, mMine, [&](Json const& t) {
        Encloses(mAnna, "more of mine")(t);
        Rename(mAnna, t, "b", "more of mine");
    });
    EXPECT_EQ(open(), "aa ab ea p");

    auto const answering = [&](char const* inValue, Edit const& inEdit) {
        Json const body = {{"metadata", {{"answersConflicts", inValue}}}};
        Json const t = Json::parse(mAnna.PostJson(LinkOf(mMine, "/transactions"), JsonText(body)).body);
        inEdit(t);
        Commit(mAnna, t);
    };
    answering("false", Encloses(mAnna, "again"));
    EXPECT_EQ(open(), "aa ab ea p");
    // Only what was changed is answered: writing what is there already does not count.
    answering("true", [&](Json const& t) {
        Encloses(mAnna, "both")(t);
        Rename(mAnna, t, "a", "mine");
    });
    EXPECT_EQ(open(), "aa ab p");
    answering("true", [&](Json const& t) {
        Rename(mAnna, t, "a", "both");
        Rename(mAnna, t, "b", "both");
        Describes(mAnna, "both")(t);
    });
    EXPECT_EQ(open(), "");
    ASSERT_EQ(Push(mAnna, mMine, "merged").status, 200);
    EXPECT_EQ(Names(mBen, mProduction), (NameMap{{"a", "both"}, {"b", "both"}}));
    EXPECT_EQ(EnclosureText(mBen, mProduction), "both");
    EXPECT_EQ(Problems(), std::vector<std::string>());
}

TEST_F(ConflictTest, StrategiesDecideWhatBothSidesChangedAndNothingElse) {
    BenShares([&](Json const& t) {
        Rename(mBen, t, "a", "his");
        AddAsset(mBen, t, "c", "his");
    });
    for (auto const& [strategy, name] : NameMap{{"accept-yours", "mine"}, {"accept-theirs", "his"}}) {
        mMine = MakeSession(mAnna, mProduction);
        Change(mAnna, mMine, Renames(mAnna, "b", "mine"));
        BenShares(Renames(mBen, "a", "his " + strategy));
        Change(mAnna, mMine, Renames(mAnna, "a", "mine"));
        ASSERT_EQ(Pull(mAnna, mMine, strategy).status, 200);
        NameMap const names = Names(mAnna, mMine);
        EXPECT_EQ(names.at("a"), name == "his" ? "his " + strategy : "mine");
        EXPECT_EQ(names.at("b"), "mine");
        EXPECT_EQ(names.at("c"), "his");
        EXPECT_FALSE(Outgoing()["assets"].at(0).contains("zo:conflictsWithContentId"));
    }
}

TEST_F(ConflictTest, ARepeatedAnswerIsDoneOnce) {
    BenShares(Renames(mBen, "a", "his"));
    Change(mAnna, mMine, Renames(mAnna, "a", "mine"));
    ASSERT_EQ(Pull(mAnna, mMine).status, 200);
    std::string const link = LinkOf(Outgoing()["assets"][0], "accept-theirs");
    std::string const body = "{\":commitId\":" + JsonString(CommitOf(Load(mAnna, mMine))) + "}";
    Client::Headers const key{{"Idempotency-Key", "accept-1"}};
    Answer const first = mAnna.PostJson(link, body, key);
    ASSERT_EQ(first.status, 200) << first.body;
    Answer const again = mAnna.PostJson(link, body, key);
    EXPECT_EQ(again.status, 200);
    EXPECT_EQ(again.body, first.body);
    EXPECT_EQ(CommitOf(Load(mAnna, mMine)), CommitOf(Json::parse(first.body)));
}

}  // namespace zohub::test
