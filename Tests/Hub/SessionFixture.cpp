// Steps of the work in sessions and transactions.
#include "SessionFixture.h"

#include "Base/Text.h"
#include "Commands/Checker.h"

namespace zohub::test {

namespace {

std::string Clip(std::string const& inName) {
    Json const properties = {{"name", inName}, {"description", ""}, {"cdzo:assetType", "masterclip"}};
    return JsonText(properties);
}

Json Parsed(Answer const& inAnswer, int inStatus) {
    EXPECT_EQ(inAnswer.status, inStatus) << inAnswer.body;
    return Json::parse(inAnswer.body);
}

}  // namespace

std::string CommitOf(Json const& inLine) {
    return inLine.at("zo:commitId").get<std::string>();
}

std::string ErrorCode(Answer const& inAnswer) {
    return Json::parse(inAnswer.body).at("error").at("code").get<std::string>();
}

Json SessionTest::MakeSharedProduction() {
    Json const production = MakeProduction(mAnna, "Film");
    auto const transaction = mHub.Data().BeginWrite();
    transaction->Grant(production["zo:productionId"].get<std::string>(), "ben");
    transaction->Commit();
    return production;
}

Json SessionTest::MakeSession(Client const& inClient, Json const& inProduction) {
    return Parsed(
        inClient.PostJson(LinkOf(inProduction, "/sessions"), R"({"name":"work","isTemporary":false})"), 201);
}

Json SessionTest::Load(Client const& inClient, Json const& inDocument) {
    return Parsed(inClient.Get(LinkOf(inDocument, "self")), 200);
}

Json SessionTest::MakeTransaction(Client const& inClient, Json const& inSession,
                                  std::string const& inCommit) {
    Json const body = {{":commitId", inCommit},
                       {":requireHead", false},
                       {"metadata", {{"applicationName", "tests"}, {"transactionType", "edit"}}}};
    return Parsed(inClient.PostJson(LinkOf(inSession, "/transactions"), JsonText(body)), 201);
}

Answer SessionTest::TryCommit(Client const& inClient, Json const& inTransaction,
                              std::string const& inStrategy, std::string const& inMessage) {
    Json const body = {{":resolveStrategy", inStrategy}, {":commitMessage", inMessage}};
    return inClient.PostJson(LinkOf(inTransaction, "/transactions/transaction#commit"), JsonText(body));
}

Json SessionTest::Commit(Client const& inClient, Json const& inTransaction, std::string const& inStrategy,
                         std::string const& inMessage) {
    return Parsed(TryCommit(inClient, inTransaction, inStrategy, inMessage), 200);
}

Json SessionTest::AddAsset(Client const& inClient, Json const& inLine, std::string const& inId,
                           std::string const& inName) {
    return Parsed(
        inClient.PostJson(LinkOf(inLine, "/assets/asset#create"),
                          "{\"zo:assetId\":" + JsonString(inId) + ",\"properties\":" + Clip(inName) + "}"),
        201);
}

void SessionTest::Rename(Client const& inClient, Json const& inLine, std::string const& inId,
                         std::string const& inName) {
    Parsed(inClient.PutJson(LinkOf(inLine, "self") + "/a/" + inId, Clip(inName)), 200);
}

Json SessionTest::AddInSession(Client const& inClient, Json const& inSession, std::string const& inId,
                               std::string const& inName) {
    Json const transaction = MakeTransaction(inClient, inSession);
    AddAsset(inClient, transaction, inId, inName);
    return Commit(inClient, transaction, "NONE", "added " + inId);
}

Json SessionTest::RenameInSession(Client const& inClient, Json const& inSession, std::string const& inId,
                                  std::string const& inName) {
    Json const transaction = MakeTransaction(inClient, inSession);
    Rename(inClient, transaction, inId, inName);
    return Commit(inClient, transaction, "NONE", "renamed " + inId);
}

Answer SessionTest::Push(Client const& inClient, Json const& inSession, std::string const& inMessage,
                         std::string const& inCommit, std::string const& inStrategy,
                         Client::Headers const& inHeaders) {
    Form form;
    form.Add(":commitMessage", inMessage);
    if (!inCommit.empty())
        form.Add(":commitId", inCommit);
    form.Add(":resolveStrategy", inStrategy);
    return inClient.SendForm("POST", LinkOf(inSession, "/sessions/session#push"), form, inHeaders);
}

Answer SessionTest::Pull(Client const& inClient, Json const& inSession, std::string const& inStrategy,
                         std::string const& inCommit, Client::Headers const& inHeaders) {
    Form form;
    form.Add(":mergeStrategy", inStrategy);
    if (!inCommit.empty())
        form.Add(":commitId", inCommit);
    return inClient.SendForm("POST", LinkOf(inSession, "/sessions/session#pull"), form, inHeaders);
}

std::map<std::string, std::string> SessionTest::Names(Client const& inClient, Json const& inLine) {
    std::map<std::string, std::string> names;
    Json const list = Parsed(inClient.Get(LinkOf(inLine, "/assets")), 200);
    for (auto const& asset : list["assets"])
        names[asset["zo:assetId"].get<std::string>()] = asset["properties"]["name"].get<std::string>();
    return names;
}

std::vector<std::string> SessionTest::Titles(Client const& inClient, Json const& inLine) {
    std::vector<std::string> titles;
    std::string href = LinkOf(inLine, "/productions/production#history");
    while (!href.empty()) {
        Json const page = Parsed(inClient.Get(href), 200);
        for (auto const& version : page["versions"])
            titles.push_back(version["title"].get<std::string>());
        href = LinkOf(page, "next");
    }
    return titles;
}

std::vector<std::string> SessionTest::Problems() {
    return CheckStorage(mHub.Data()).problems;
}

}  // namespace zohub::test
