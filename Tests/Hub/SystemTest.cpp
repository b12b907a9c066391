// Discovery, sign-in, expiry, sign-out, and who may see what.
#include "HubFixture.h"

namespace zohub::test {

class SystemTest : public HubTest {};

TEST_F(SystemTest, DiscoveryLeadsToTheLinksDocumentWithoutSignIn) {
    Client const stranger(mHub.Port());
    Answer const answer = stranger.Get("/content/zo/api/discovery.json");
    ASSERT_EQ(answer.status, 200);
    EXPECT_EQ(answer.Header("content-type"), "application/json;charset=utf-8");
    Json const document = Json::parse(answer.body);
    EXPECT_EQ(document["server"]["version"], "1.0.0");
    EXPECT_TRUE(document["server"]["configuration"]["renderProtocolVersions"].is_array());
    EXPECT_EQ(document["properties"]["majorVersion"], 1);
    EXPECT_EQ(document["properties"]["minorVersion"], 2);

    std::string const href = LinkOf(document, "/discovery/v1");
    EXPECT_EQ(href.find("http://127.0.0.1:" + std::to_string(mHub.Port()) + "/"), 0u);
    Json const links = Json::parse(stranger.Get(href).body);
    EXPECT_EQ(links["links"].size(), 1u);
    EXPECT_TRUE(HasLink(links, "/system/login"));

    Json const own = Json::parse(mAnna.Get(href).body);
    EXPECT_FALSE(HasLink(own, "/system/login"));
    for (char const* relation :
         {"/system/logout", "/users/user#current", "/productions", "/productions/templates",
          "/productions/production#byIdAndCommitId", "/medialocators", "/medialocator#byMediaLocatorId"})
        EXPECT_TRUE(HasLink(own, relation)) << relation;
}

TEST_F(SystemTest, HrefsNameTheHostThatTheClientUsed) {
    RawConnection connection(mHub.Port());
    connection.Send("GET /content/zo/api/discovery.json HTTP/1.1\r\nHost: hub.example:1234\r\n\r\n");
    Json const document = Json::parse(connection.Receive().body);
    EXPECT_EQ(LinkOf(document, "/discovery/v1"), "http://hub.example:1234/zo/1/links");
}

TEST_F(SystemTest, SignInTakesBothKindsOfFormAndRefusesWithoutACookie) {
    Client client(mHub.Port());
    Answer const good = client.SignIn("anna", "anna-secret");
    EXPECT_EQ(good.status, 200);
    std::string const cookie = good.Header("set-cookie");
    EXPECT_EQ(cookie.find("login-token="), 0u);
    for (char const* attribute : {"; Path=/", "; HttpOnly", "; SameSite=Strict"})
        EXPECT_NE(cookie.find(attribute), std::string::npos) << attribute;
    EXPECT_EQ(cookie.find("Secure"), std::string::npos);

    Answer const encoded =
        Client(mHub.Port())
            .Request("POST", "/zo/1/system/login", "j_username=anna&j_password=anna%2Dsecret",
                     {{"Content-Type", "application/x-www-form-urlencoded"}});
    EXPECT_EQ(encoded.status, 200);

    Client wrong(mHub.Port());
    for (auto const& [user, password] :
         {std::pair{"anna", "anna-secre"}, {"nobody", "anna-secret"}, {"anna", ""}, {"", "anna-secret"}}) {
        Answer const refused = wrong.SignIn(user, password);
        EXPECT_EQ(refused.status, 401);
        EXPECT_EQ(refused.Header("set-cookie"), "");
        EXPECT_EQ(refused.body.find(password[0] ? password : "\1"), std::string::npos);
    }
    EXPECT_EQ(wrong.PostJson("/zo/1/system/login", "{}").status, 415);
}

TEST_F(SystemTest, NeitherTokensNorPasswordsLieInTheDatabase) {
    std::string const token = mAnna.Token().substr(12, 64);
    ASSERT_EQ(token.size(), 64u);
    for (auto const& entry : std::filesystem::recursive_directory_iterator(mHub.DataPath())) {
        std::string const bytes = ReadFile(entry.path());
        EXPECT_EQ(bytes.find(token), std::string::npos) << entry.path();
        EXPECT_EQ(bytes.find("anna-secret"), std::string::npos) << entry.path();
    }
}

TEST_F(SystemTest, TokensEndByTimeAndAtSignOut) {
    EXPECT_EQ(mAnna.Get("/zo/1/users/current").status, 200);
    Client const second = mHub.SignedIn("anna");
    Json const user = Json::parse(second.Get("/zo/1/users/current").body);
    EXPECT_EQ(user["zo:userId"], "anna");
    EXPECT_EQ(user["logins"].size(), 2u);

    EXPECT_EQ(second.Request("POST", "/zo/1/system/logout").status, 204);
    EXPECT_EQ(second.Get("/zo/1/users/current").status, 401);
    EXPECT_EQ(second.Request("POST", "/zo/1/system/logout").status, 401);
    EXPECT_EQ(mAnna.Get("/zo/1/users/current").status, 200);

    mHub.Advance(3599 * kSecond);
    EXPECT_EQ(mAnna.Get("/zo/1/users/current").status, 200);
    mHub.Advance(kSecond);
    EXPECT_EQ(mAnna.Get("/zo/1/users/current").status, 401);
    Json const links = Json::parse(mAnna.Get("/zo/1/links").body);
    EXPECT_TRUE(HasLink(links, "/system/login"));
}

TEST_F(SystemTest, EveryRouteNeedsAToken) {
    Json const production = MakeProduction(mAnna, "Film");
    Client const stranger(mHub.Port());
    for (auto const& link : production["links"]) {
        std::string const href = link["href"].get<std::string>();
        if (href.find('{') == std::string::npos) {
            EXPECT_EQ(stranger.Get(href, {{"Cookie", "login-token=0123;"}}).status,
                      href.find("copy") == std::string::npos ? 401 : 405)
                << href;
        }
    }
}

TEST_F(SystemTest, AProductionIsThereForItsOwnerForThoseGrantedAndForAdministrators) {
    Json const production = MakeProduction(mAnna, "Film");
    Json const asset = MakeAsset(mAnna, production, kClip);
    std::string const self = LinkOf(production, "self");
    Client const ben = mHub.SignedIn("ben");
    EXPECT_EQ(ben.Get(self).status, 404);
    EXPECT_EQ(ben.Get(LinkOf(asset, "self")).status, 404);
    EXPECT_EQ(ben.Get(LinkOf(production, "/assets#full")).status, 404);
    EXPECT_EQ(ben.PutJson(self, R"({"name":"Mine"})").status, 404);
    EXPECT_EQ(ben.PostJson(LinkOf(production, "/assets/asset#create"), "{}").status, 404);
    EXPECT_EQ(ben.Request("DELETE", LinkOf(asset, "delete")).status, 404);
    EXPECT_EQ(Json::parse(ben.Get("/zo/1/p").body)["productions"].size(), 0u);

    auto const transaction = mHub.Data().BeginWrite();
    transaction->Grant(production["zo:productionId"].get<std::string>(), "ben");
    transaction->Commit();
    EXPECT_EQ(ben.Get(self).status, 200);
    EXPECT_EQ(Json::parse(ben.Get("/zo/1/p").body)["productions"].size(), 1u);

    mHub.AddUser("root", "root-secret", true);
    EXPECT_EQ(mHub.SignedIn("root").Get(self).status, 200);
}

TEST_F(SystemTest, OneUserDoesNotSeeAnother) {
    EXPECT_EQ(mAnna.Get("/zo/1/users/anna").status, 200);
    EXPECT_EQ(mAnna.Get("/zo/1/users/ben").status, 404);
}

}  // namespace zohub::test
