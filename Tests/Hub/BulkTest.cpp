// Bulk forms: what each part does, the order of the answers, all or nothing, and what is refused and how.
#include "Base/Digest.h"
#include "Commands/Checker.h"
#include "SessionFixture.h"

namespace zohub::test {

namespace {

constexpr char kJson[] = "application/json;charset=utf-8";
constexpr char kText[] = "text/plain";

std::string Named(std::string const& inName) {
    Json const properties = {{"name", inName}, {"description", ""}, {"cdzo:assetType", "masterclip"}};
    return JsonText(properties);
}

Form& AddEnclosure(Form& ioForm, std::string const& inPrefix, std::string const& inName,
                   std::string const& inData) {
    return ioForm.Add(inPrefix + "+name", inName, kText).Add(inPrefix + "+data", inData, kJson);
}

// Bytes that cannot be packed.
std::string Noise(std::size_t inSize, std::uint32_t inSeed) {
    std::string bytes(inSize, '\0');
    std::uint32_t state = inSeed * 2654435761u + 1;
    for (char& c : bytes) {
        state = state * 1664525u + 1013904223u;
        c = static_cast<char>(state >> 24);
    }
    return bytes;
}

struct Refusal {
    char const* what;
    char const* kind;
    Form form;
    int status;
    char const* code;
    char const* part;  // whose name the message has
};

}  // namespace

class BulkTest : public SessionTest {
protected:
    BulkTest()
        : mProduction(MakeSharedProduction()),
          mSession(MakeSession(mAnna, mProduction)),
          mTransaction(MakeTransaction(mAnna, mSession)) {}

    Answer Try(std::string const& inKind, Form const& inForm, Client::Headers const& inHeaders = {}) {
        return mAnna.SendForm(inKind == "edit" ? "PUT" : "POST", LinkOf(mTransaction, "/bulk#" + inKind),
                              inForm, inHeaders);
    }

    Json Send(std::string const& inKind, Form const& inForm) {
        Answer const answer = Try(inKind, inForm);
        EXPECT_EQ(answer.status, 200) << answer.body;
        return Json::parse(answer.body);
    }

    Json Get(std::string const& inHref) {
        Answer const answer = mAnna.Get(inHref);
        EXPECT_EQ(answer.status, 200) << answer.body;
        return Json::parse(answer.body);
    }

    Json Asset(std::string const& inId) { return Get(LinkOf(mTransaction, "self") + "/a/" + inId); }
    std::string Present() { return CommitOf(Load(mAnna, mTransaction)); }

    std::string PayloadUnder(Json const& inEnclosures, std::string const& inName) {
        for (auto const& enclosure : inEnclosures.at("enclosures"))
            if (enclosure.at("name") == inName)
                return mAnna.Get(LinkOf(enclosure, "/enclosures/enclosure")).body;
        return "there is none";
    }

    Json const mProduction;
    Json const mSession;
    Json const mTransaction;
};

TEST_F(BulkTest, IsOfferedByOpenTransactionsAndByNothingElse) {
    for (char const* relation : {"/bulk#create", "/bulk#edit", "/bulk#delete"}) {
        EXPECT_TRUE(HasLink(mTransaction, relation));
        EXPECT_FALSE(HasLink(mProduction, relation));
        EXPECT_FALSE(HasLink(mSession, relation));
        EXPECT_FALSE(HasLink(Get(LinkOf(mTransaction, "self") + "/at/" + CommitOf(mTransaction)), relation));
    }
    Form form;
    form.Add("assets+0+properties", Named("x"), kJson);
    for (Json const& other : {mProduction, mSession})
        EXPECT_EQ(mAnna.SendForm("POST", LinkOf(other, "self") + "/bulk/create", form).status, 404);
    Client const ben = mHub.SignedIn("ben");
    EXPECT_EQ(ben.SendForm("POST", LinkOf(mTransaction, "/bulk#create"), form).status, 404);
    EXPECT_EQ(Client(mHub.Port()).SendForm("POST", LinkOf(mTransaction, "/bulk#create"), form).status, 401);
    EXPECT_EQ(Try("create", form, {{"If-Match", "\"of another time\""}}).status, 412);
    EXPECT_EQ(Present(), CommitOf(mTransaction));

    Json const second = MakeTransaction(mAnna, mSession);
    Commit(mAnna, mTransaction);
    EXPECT_FALSE(HasLink(Load(mAnna, mTransaction), "/bulk#create"));
    EXPECT_EQ(ErrorCode(Try("create", form)), "transaction-ended");
    mAnna.PostJson(LinkOf(second, "/transactions/transaction#rollback"), "{}");
    EXPECT_EQ(mAnna.SendForm("POST", LinkOf(second, "/bulk#create"), form).status, 404);
}

TEST_F(BulkTest, CreatesAllThatOneFormHasAndAnswersInItsOrder) {
    AddAsset(mAnna, mTransaction, "old", "was there");
    Form form;
    form.Add("assets+0+properties", Named("first"), kJson);
    AddEnclosure(form, "assets+0+enclosure+0", "zeta", "{\"z\":1}");
    AddEnclosure(form, "assets+0+enclosure+1", "alpha", "");
    form.Add("assets+0+rendition+0+data", "picture", "image/jpeg");
    form.Add("assets+0+rendition+1+data", "film", "video/mp4");
    AddEnclosure(form, "assets+old+enclosure+0", "later", "new data of old");
    form.Add("assets+old+rendition+0+data", "old picture", "image/png");
    form.Add("assets+1+properties", Named("second"), kJson);
    AddEnclosure(form, "enclosures+0", "b_xmp", "packet b");
    AddEnclosure(form, "enclosures+1", "a_xmp", "packet a");
    Json const answer = Send("create", form);

    ASSERT_EQ(answer["assets"].size(), 3u);
    Json const& first = answer["assets"][0];
    EXPECT_EQ(first["indexId"], 0);
    EXPECT_EQ(answer["assets"][1]["assetId"], "old");
    EXPECT_EQ(answer["assets"][2]["indexId"], 1);
    EXPECT_EQ(answer["assets"][2]["enclosures"], Json::array());
    EXPECT_EQ(first["enclosures"][0]["enclosureContentId"], Sha256Hex("{\"z\":1}"));
    EXPECT_EQ(first["enclosures"][1]["enclosureContentId"], Sha256Hex(""));
    EXPECT_EQ(first["enclosures"][1]["indexId"], 1);
    EXPECT_EQ(answer["enclosures"][1]["enclosureContentId"], Sha256Hex("packet a"));

    Json const made = Asset(first["assetId"].get<std::string>());
    EXPECT_EQ(made["properties"]["name"], "first");
    EXPECT_EQ(made["enclosures"]["enclosures"][0]["zo:enclosureId"], first["enclosures"][0]["enclosureId"]);
    EXPECT_EQ(PayloadUnder(made["enclosures"], "zeta"), "{\"z\":1}");
    EXPECT_EQ(made["renditions"]["renditions"][1]["zo:renditionId"], first["renditions"][1]["renditionId"]);
    EXPECT_EQ(made["renditions"]["renditions"][1]["properties"]["zo:mimeType"], "video/mp4");
    EXPECT_EQ(PayloadUnder(Asset("old")["enclosures"], "later"), "new data of old");
    EXPECT_EQ(PayloadUnder(Get(LinkOf(mTransaction, "/enclosures")), "a_xmp"), "packet a");

    Json const session = Commit(mAnna, mTransaction);
    EXPECT_EQ(Names(mAnna, session).size(), 3u);
    EXPECT_EQ(Push(mAnna, session, "shared").status, 200);
    EXPECT_EQ(PayloadUnder(Get(LinkOf(mProduction, "/enclosures")), "b_xmp"), "packet b");
    EXPECT_EQ(Problems(), std::vector<std::string>());
}

TEST_F(BulkTest, EditsWhatIsThereAndMakesNoCommitOfNothing) {
    Form creation;
    creation.Add("assets+0+properties", Named("clip"), kJson);
    AddEnclosure(creation, "assets+0+enclosure+0", "notes", "before");
    creation.Add("assets+0+rendition+0+data", "before", "image/png");
    creation.Add("assets+1+properties", Named("other"), kJson);
    AddEnclosure(creation, "enclosures+0", "a_xmp", "before");
    Json const made = Send("create", creation);
    auto const id = [](Json const& inJson) { return inJson.get<std::string>(); };
    Json const& asset = made["assets"][0];
    std::string const clip = "assets+" + id(asset["assetId"]);
    std::string const other = id(made["assets"][1]["assetId"]);

    Form edit;
    edit.Add("assets+" + other + "+properties", R"({"name":"renamed","cdzo:assetType":"bin","x:own":[1]})",
             kJson);
    edit.Add(clip + "+enclosure+" + id(asset["enclosures"][0]["enclosureId"]) + "+data", "after", kJson);
    edit.Add(clip + "+rendition+" + id(asset["renditions"][0]["renditionId"]) + "+data", "after",
             "image/jpeg");
    edit.Add("enclosures+" + id(made["enclosures"][0]["enclosureId"]) + "+data", "after", kJson);
    Json const edited = Send("edit", edit);
    EXPECT_EQ(edited["assets"][0]["assetId"], other);
    EXPECT_EQ(edited["assets"][1]["enclosures"][0]["enclosureId"], asset["enclosures"][0]["enclosureId"]);
    EXPECT_EQ(edited["assets"][1]["enclosures"][0]["enclosureContentId"], Sha256Hex("after"));
    EXPECT_EQ(edited["assets"][1]["renditions"][0]["renditionId"], asset["renditions"][0]["renditionId"]);
    EXPECT_EQ(edited["enclosures"][0]["enclosureContentId"], Sha256Hex("after"));

    EXPECT_EQ(Asset(other)["properties"]["x:own"][0], 1);
    Json const present = Asset(id(asset["assetId"]));
    EXPECT_EQ(present["properties"]["name"], "clip");
    EXPECT_EQ(PayloadUnder(present["enclosures"], "notes"), "after");
    EXPECT_EQ(present["renditions"]["renditions"][0]["properties"]["zo:mimeType"], "image/jpeg");
    EXPECT_EQ(PayloadUnder(Get(LinkOf(mTransaction, "/enclosures")), "a_xmp"), "after");

    std::string const before = Present();
    EXPECT_EQ(Send("edit", edit), edited);
    EXPECT_EQ(Present(), before);
}

TEST_F(BulkTest, DeletesAListAndKeepsTheRest) {
    for (char const* id : {"a", "b", "c"})
        AddAsset(mAnna, mTransaction, id, id);
    Json const answer = Send("delete", Form().Add("assets+c", "", kText).Add("assets+a", "", kText));
    EXPECT_EQ(answer["assets"][0]["assetId"], "c");
    EXPECT_EQ(answer["assets"][1]["assetId"], "a");
    EXPECT_EQ(answer["assets"][1]["indexId"], 1);
    EXPECT_EQ(Names(mAnna, mTransaction), (std::map<std::string, std::string>{{"b", "b"}}));
}

TEST_F(BulkTest, SaysWhichPartIsAtFaultAndKeepsNothing) {
    AddAsset(mAnna, mTransaction, "old", "was there");
    Json const made = Send("create", Form()
                                         .Add("assets+old+enclosure+0+name", "taken", kText)
                                         .Add("assets+old+enclosure+0+data", "x", kJson));
    auto const properties = [](Form inForm = {}) {
        return inForm.Add("assets+0+properties", Named("n"), kJson);
    };
    std::string const bin = R"({"name":"no type"})";
    std::vector<Refusal> const refusals = {
        {"no parts", "create", Form(), 400, "bulk-form-empty", ""},
        {"unknown name", "create", properties().Add("assets+0+thing", "", kText), 400, "bulk-part-unknown",
         "assets+0+thing"},
        {"name of bytes", "create", properties().Add("assets+\xFF", "", kText), 400, "bulk-part-unknown",
         "part number 2"},
        {"repeated part", "create", properties(properties()), 400, "bulk-part-repeated",
         "assets+0+properties"},
        {"first index", "create", Form().Add("assets+1+properties", Named("n"), kJson), 400,
         "bulk-part-order", "assets+1+properties"},
        {"gap", "create", properties().Add("assets+2+properties", Named("n"), kJson), 400, "bulk-part-order",
         "assets+2+properties"},
        {"inner index", "create", properties().Add("assets+0+enclosure+1+name", "n", kText), 400,
         "bulk-part-order", "assets+0+enclosure+1+name"},
        {"index with a zero", "create", properties().Add("assets+0+rendition+00+data", "n", "image/png"), 400,
         "bulk-part-order", "assets+0+rendition+00+data"},
        {"parts apart", "create",
         properties()
             .Add("assets+1+properties", Named("n"), kJson)
             .Add("assets+0+rendition+0+data", "n", "image/png"),
         400, "bulk-part-order", "assets+0+rendition+0+data"},
        {"name without data", "create", properties().Add("assets+0+enclosure+0+name", "n", kText), 400,
         "bulk-data-missing", "assets+0+enclosure+0+name"},
        {"something between", "create",
         properties()
             .Add("assets+0+enclosure+0+name", "n", kText)
             .Add("assets+1+properties", Named("n"), kJson),
         400, "bulk-data-missing", "assets+0+enclosure+0+name"},
        {"data without name", "create", properties().Add("assets+0+enclosure+0+data", "n", kJson), 400,
         "bulk-name-missing", "assets+0+enclosure+0+data"},
        {"data of another", "create",
         Form().Add("enclosures+0+name", "n", kText).Add("enclosures+1+data", "n", kJson), 400,
         "bulk-name-missing", "enclosures+1+data"},
        {"no properties", "create", Form().Add("assets+0+rendition+0+data", "n", "image/png"), 400,
         "bulk-properties-missing", "assets+0+rendition+0+data"},
        {"bad properties", "create", Form().Add("assets+0+properties", bin, kJson), 400, "asset-type-missing",
         "assets+0+properties"},
        {"no JSON", "create", Form().Add("assets+0+properties", "{", kJson), 400, "json-malformed",
         "assets+0+properties"},
        {"properties as text", "create", Form().Add("assets+0+properties", Named("n"), kText), 415,
         "bulk-content-type", "assets+0+properties"},
        {"name as JSON", "create", Form().Add("enclosures+0+name", "n", kJson), 415, "bulk-content-type",
         "enclosures+0+name"},
        {"rendition without type", "create", properties().Add("assets+0+rendition+0+data", "n"), 415,
         "media-type-missing", "assets+0+rendition+0+data"},
        {"bad enclosure name", "create",
         Form().Add("enclosures+0+name", "../n", kText).Add("enclosures+0+data", "n", kJson), 400,
         "name-invalid", "enclosures+0+data"},
        {"name twice in the form", "create",
         Form()
             .Add("enclosures+0+name", "n", kText)
             .Add("enclosures+0+data", "1", kJson)
             .Add("enclosures+1+name", "n", kText)
             .Add("enclosures+1+data", "2", kJson),
         409, "enclosure-exists", "enclosures+1+data"},
        {"name that is taken", "create",
         Form()
             .Add("assets+old+enclosure+0+name", "taken", kText)
             .Add("assets+old+enclosure+0+data", "2", kJson),
         409, "enclosure-exists", "assets+old+enclosure+0+data"},
        {"unknown asset", "create", properties().Add("assets+gone+rendition+0+data", "n", "image/png"), 404,
         "bulk-asset-unknown", "assets+gone+rendition+0+data"},
        {"deletion in a creation", "create", Form().Add("assets+old", "", kText), 400, "bulk-part-misplaced",
         "assets+old"},
        {"unknown asset to edit", "edit", Form().Add("assets+gone+properties", Named("n"), kJson), 404,
         "bulk-asset-unknown", "assets+gone+properties"},
        {"unknown enclosure", "edit", Form().Add("assets+old+enclosure+0+data", "n", kJson), 404,
         "bulk-item-unknown", "assets+old+enclosure+0+data"},
        {"unknown rendition", "edit", Form().Add("assets+old+rendition+r+data", "n", "image/png"), 404,
         "bulk-item-unknown", "assets+old+rendition+r+data"},
        {"unknown production enclosure", "edit", Form().Add("enclosures+e+data", "n", kJson), 404,
         "bulk-item-unknown", "enclosures+e+data"},
        {"properties that come late", "edit",
         Form()
             .Add("assets+old+rendition+r+data", "n", "image/png")
             .Add("assets+old+properties", Named("n"), kJson),
         400, "bulk-part-order", "assets+old+properties"},
        {"name in an edit", "edit", Form().Add("enclosures+e+name", "n", kText), 400, "bulk-part-misplaced",
         "enclosures+e+name"},
        {"unknown asset to delete", "delete",
         Form().Add("assets+old", "", kText).Add("assets+gone", "", kText), 404, "bulk-asset-unknown",
         "assets+gone"},
        {"deleted twice", "delete", Form().Add("assets+old", "", kText).Add("assets+old", "", kText), 400,
         "bulk-part-repeated", "assets+old"},
        {"deletion with content", "delete", Form().Add("assets+old", "x", kText), 400, "bulk-part-not-empty",
         "assets+old"},
        {"properties in a deletion", "delete", Form().Add("assets+old+properties", Named("n"), kJson), 400,
         "bulk-part-misplaced", "assets+old+properties"}};
    std::string const before = Present();
    for (auto const& refusal : refusals) {
        SCOPED_TRACE(refusal.what);
        Answer const answer = Try(refusal.kind, refusal.form);
        EXPECT_EQ(answer.status, refusal.status) << answer.body;
        EXPECT_EQ(ErrorCode(answer), refusal.code) << answer.body;
        Json const error = Json::parse(answer.body)["error"];
        EXPECT_NE(error["message"].get<std::string>().find(refusal.part), std::string::npos) << answer.body;
    }
    Answer const noForm = mAnna.PostJson(LinkOf(mTransaction, "/bulk#create"), "{}");
    EXPECT_EQ(noForm.status, 415);
    EXPECT_EQ(Present(), before);
    EXPECT_EQ(CheckStorage(mHub.Data()).unreferenced, 0u);
}

TEST_F(BulkTest, KeepsNothingOfAFormWhoseNineHundredthAssetIsAtFault) {
    Form form;
    for (int i = 0; i < 1000; ++i) {
        std::string const asset = "assets+" + std::to_string(i);
        form.Add(asset + "+properties", Named("clip"), kJson);
        AddEnclosure(form, asset + "+enclosure+0", i == 900 ? "/absolute" : "notes", std::to_string(i));
    }
    Answer const answer = Try("create", form);
    EXPECT_EQ(answer.status, 400);
    EXPECT_NE(answer.body.find("assets+900+enclosure+0"), std::string::npos) << answer.body;
    EXPECT_EQ(Names(mAnna, mTransaction).size(), 0u);
    auto const report = CheckStorage(mHub.Data());
    EXPECT_EQ(report.contents, 0u);
    EXPECT_EQ(report.problems, std::vector<std::string>());
}

TEST_F(BulkTest, DoesARepeatedFormOnce) {
    Form form;
    form.Add("assets+0+properties", Named("once"), kJson);
    Client::Headers const key = {{"Idempotency-Key", "bulk-1"}};
    Answer const first = Try("create", form, key);
    Answer const second = Try("create", form, key);
    EXPECT_EQ(first.status, 200);
    EXPECT_EQ(second.body, first.body);
    EXPECT_EQ(Names(mAnna, mTransaction).size(), 1u);
}

TEST_F(BulkTest, TakesThirtyTwoMebibytesAndOneAssetMore) {
    Form form;
    for (int i = 0; i <= 32; ++i) {
        std::string const asset = "assets+" + std::to_string(i);
        form.Add(asset + "+properties", Named("clip"), kJson);
        AddEnclosure(form, asset + "+enclosure+0", "media", Noise(1 << 20, static_cast<std::uint32_t>(i)));
    }
    ASSERT_GT(form.Body().size(), 33u << 20);
    Json const answer = Send("create", form);
    ASSERT_EQ(answer["assets"].size(), 33u);
    Json const last = Asset(answer["assets"][32]["assetId"].get<std::string>());
    EXPECT_EQ(PayloadUnder(last["enclosures"], "media"), Noise(1 << 20, 32));

    // What is far beyond that is refused by its head alone.
    RawConnection connection(mHub.Port());
    connection.Send("POST /zo/1/p/x/bulk/create HTTP/1.1\r\nHost: h\r\nCookie: " + mAnna.Token() +
                    "\r\nContent-Type: " + Form::Type() + "\r\nContent-Length: 268435457\r\n\r\n");
    Answer const refused = connection.Receive();
    EXPECT_EQ(refused.status, 413);
    EXPECT_EQ(ErrorCode(refused), "body-too-large");
}

TEST_F(BulkTest, TakesMorePartsThanOtherForms) {
    Form form;
    for (int i = 0; i < 25000; ++i)
        form.Add("assets+gone" + std::to_string(i), "", kText);
    EXPECT_EQ(ErrorCode(Try("delete", form)), "bulk-asset-unknown");
    EXPECT_EQ(ErrorCode(mAnna.SendForm("POST", LinkOf(mTransaction, "/enclosures"), form)),
              "form-too-many-parts");
}

}  // namespace zohub::test
