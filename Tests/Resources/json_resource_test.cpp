// Binding JSON bodies: types, links, canonical URLs, tags and the rules of keys.
#include <boost/date_time/posix_time/posix_time.hpp>

#include "ClientTest.h"
#include "dto/Asset.h"
#include "dto/Production.h"
#include "JSONServerResource.h"
#include "Relations.h"

namespace ZOCL {
namespace {

/// Any structure, seen from outside.
template <class T>
class Probe final : public JSONServerResource<T> {
public:
    T Body() { return this->GetBody("Probe::Body"); }
    int Installs() const { return mInstalls; }

protected:
    void PostLoadDTO() override { ++mInstalls; }

private:
    std::atomic<int> mInstalls{0};
};

class JSONResourceTest : public ClientTest {
protected:
    template <class T>
    InterfaceRef<Probe<T>> Make(const std::string& inPath = "/p") {
        InterfaceRef<Probe<T>> made(new Probe<T>);
        made->InternalInit(HubURL(inPath), server, nullptr, ResourceWritability::kReadOnly, true);
        return made;
    }
    template <class T>
    InterfaceRef<Probe<T>> LoadWith(const ScriptedAnswer& inAnswer) {
        const auto made = Make<T>();
        net->Expect("GET", HubURL("/p").str(), inAnswer);
        made->Load(true);
        return made;
    }
    static std::string LinkText(const std::string& inRelation, const std::string& inHRef,
                                const std::string& inType = "") {
        return "{'rel':'" + inRelation + "','href':'" + inHRef + "'" +
               (inType.empty() ? "" : ",'type':'" + inType + "'") + "}";
    }
};

TEST_F(JSONResourceTest, ContentTypeDecidesByteForByte) {
    struct Row {
        const char* type;
        bool loads;
    };
    for (const Row& row : {Row{"application/json", true}, Row{"application/json;charset=utf-8", true},
                           Row{"application/json; x", true}, Row{"Application/JSON", false}, Row{"", false},
                           Row{"text/json", false}, Row{"application/jso", false}}) {
        const auto resource = LoadWith<dto::Production>(ScriptedAnswer::Body("{}", row.type));
        EXPECT_EQ(resource->IsLoaded(), row.loads) << row.type;
    }
    ASSERT_EQ(Assertions().size(), 1u);
    EXPECT_THAT(Assertions()[0],
                testing::StartsWith("ZOCL::JSONServerResource<struct ZOCL::dto::Production>::"
                                    "InternalInit: Failed to load content with type \""));
    LoadWith<dto::ContainedAssets>(ScriptedAnswer::Body("{}", "text/html"));
    EXPECT_EQ(Assertions().size(), 2u);
}

TEST_F(JSONResourceTest, EmptyBodiesLoadWithDefaults) {
    ScriptedAnswer noContent = ScriptedAnswer::Status(204).With("Content-Type", "application/json");
    for (const ScriptedAnswer& answer : {ScriptedAnswer::JSON(""), noContent}) {
        const auto resource = LoadWith<dto::Production>(answer);
        EXPECT_TRUE(resource->IsLoaded());
        EXPECT_TRUE(resource->Body().Identifier().IsNull());
        EXPECT_TRUE(resource->Body().Created().is_not_a_date_time());
    }
}

TEST_F(JSONResourceTest, MalformedBodyStaysUnloadedAndCanBeLookedAt) {
    const auto resource = LoadWith<dto::Production>(JSONAnswer("{'owner':"));
    EXPECT_FALSE(resource->IsLoaded());
    EXPECT_EQ(resource->GetResponseData()->view(), "{\"owner\":");
    EXPECT_TRUE(resource->GetETag(true).IsNull());
    EXPECT_TRUE(Assertions().empty());
    EXPECT_TRUE(Traced("is not well-formed JSON"));
}

TEST_F(JSONResourceTest, WrongTypeFailsTheWholeBodyWithItsTrace) {
    Outcome outcome;
    const auto resource = Make<dto::Production>();
    net->Expect("GET", "", JSONAnswer("{'owner':7,'zo:productionId':'p'}"));
    resource->Load(Guid::CreateUnique(), outcome.Function(), true);
    EXPECT_EQ(outcome.Wait(), kResultSuccess);
    EXPECT_FALSE(resource->IsLoaded());
    EXPECT_TRUE(resource->Body().Identifier().IsNull());
    EXPECT_EQ(resource->Installs(), 1);
    EXPECT_TRUE(Traced("<ZOCL> <5> Bad any cast while parsing JSON, ex.what() == \""));
    LoadWith<dto::Production>(JSONAnswer("{'created':'yesterday'}"));
    EXPECT_TRUE(Traced("<ZOCL> <5> Std exception thrown while parsing JSON, ex.what() == \""));
}

TEST_F(JSONResourceTest, LaterSpellingOfAFieldWins) {
    const auto body = LoadWith<dto::Production>(JSONAnswer("{'owner':'second','zo:owner':'first',"
                                                           "'commitId':'c2','zo:commitId':'c1',"
                                                           "'zo:transactionId':'t','zo:productionId':'p'}"))
                          ->Body();
    EXPECT_EQ(body.Owner().view(), "second");
    EXPECT_EQ(body.CommitID().view(), "c2");
    EXPECT_EQ(body.Identifier().view(), "t");
    EXPECT_EQ(LoadWith<dto::Production>(JSONAnswer("{'zo:productionId':'p','zo:sessionId':'s'}"))
                  ->Body()
                  .Identifier()
                  .view(),
              "s");
}

TEST_F(JSONResourceTest, DatesAreReadIntoUTC) {
    const auto body =
        LoadWith<dto::Production>(JSONAnswer("{'created':'2026-03-01T10:00:00-05:00','modified':''}"))
            ->Body();
    EXPECT_EQ(boost::posix_time::to_iso_extended_string(body.Created()), "2026-03-01T15:00:00");
    EXPECT_TRUE(body.Modified().is_not_a_date_time());
}

TEST_F(JSONResourceTest, TextFormIsUnwrappedOnce) {
    const std::string inner = "{'zo:productionId':'inner'}";
    EXPECT_EQ(dto::Production::FromJSON(Quote(inner)).Identifier().view(), "inner");
    EXPECT_EQ(
        dto::Production::FromJSON(Quote("{'SerializerWrappedObject':" + inner + "}")).Identifier().view(),
        "inner");
    EXPECT_TRUE(dto::Production::FromJSON(
                    Quote("{'SerializerWrappedObject':{'SerializerWrappedObject':" + inner + "}}"))
                    .Identifier()
                    .IsNull());
    EXPECT_THROW(dto::Production::FromJSON("{"), std::runtime_error);
    EXPECT_THROW(dto::Production::FromJSON(Quote("{'owner':[]}")), boost::bad_any_cast);
}

TEST_F(JSONResourceTest, SelfIsTheURLFromThenOn) {
    const std::string self = HubURL("/canonical").str();
    const auto resource = LoadWith<dto::Production>(
        JSONAnswer("{'links':[" + LinkText("edit", "http://x/e") + "," + LinkText("self", self) + "," +
                   LinkText("latest-version", HubURL("/latest").str()) + "]}"));
    EXPECT_EQ(resource->GetHTTPURL().view(), self);
    net->Expect("GET", HubURL("/latest").str(),
                JSONAnswer("{'links':[" + LinkText("self", self) + "]}", "\"n\""));
    Outcome outcome;
    ASSERT_TRUE(resource->Refresh(Guid::CreateUnique(), outcome.Function()));
    EXPECT_EQ(outcome.Wait(), kResultSuccess);
    EXPECT_EQ(LastRequest().CountHeader("If-None-Match"), 0u) << "the cache holds nothing of this URL";
    EXPECT_EQ(resource->GetHTTPURL().view(), self);
    EXPECT_EQ(resource->GetETag(true).view(), "\"n\"");
}

TEST_F(JSONResourceTest, URLWithoutSelfStaysAndLocationMovesIt) {
    const auto resource =
        LoadWith<dto::Production>(JSONAnswer("{'links':[" + LinkText("edit", "http://x/e") + "]}"));
    EXPECT_EQ(resource->GetHTTPURL(), HubURL("/p"));
    const auto moved = LoadWith<dto::Production>(JSONAnswer("{}").With("Location", HubURL("/new").str()));
    EXPECT_EQ(moved->GetHTTPURL(), HubURL("/new"));
    InterfaceRef<Probe<dto::Production>> noURL(new Probe<dto::Production>);
    noURL->InternalDTOInit(
        ImmutableString(), server, nullptr,
        dto::Production::FromJSON(Quote("{'links':[" + LinkText("latest-version", "http://x/l") + "]}")),
        true, ResourceWritability::kReadOnly);
    EXPECT_EQ(noURL->GetHTTPURL().view(), "http://x/l");
}

TEST_F(JSONResourceTest, LinkGettersFallBackAlongTheChain) {
    const std::string url = HubURL("/p").str();
    const auto bare = LoadWith<dto::Production>(JSONAnswer("{}"));
    EXPECT_EQ(bare->GetEditLink().view(), url);
    EXPECT_EQ(bare->GetLatestVersionLink().view(), url);
    EXPECT_EQ(bare->GetDeleteLink().view(), url);
    EXPECT_TRUE(bare->GetParentLink().IsNull());
    const auto edit = LoadWith<dto::Production>(JSONAnswer("{'links':[" + LinkText("edit", "http://x/e") +
                                                           "," + LinkText("up", "http://x/u") + "]}"));
    EXPECT_EQ(edit->GetDeleteLink().view(), "http://x/e");
    EXPECT_EQ(edit->GetParentLink().view(), "http://x/u");
    const auto latest =
        LoadWith<dto::Production>(JSONAnswer("{'links':[" + LinkText("edit", "http://x/e") + "," +
                                             LinkText("latest-version", "http://x/l") + "]}"));
    EXPECT_EQ(latest->GetDeleteLink().view(), "http://x/l");
    EXPECT_EQ(latest->GetEditLink().view(), "http://x/e");
}

TEST_F(JSONResourceTest, LinksAreToldApartByType) {
    const auto resource = LoadWith<dto::Production>(
        JSONAnswer("{'links':[{'href':'http://x/0'}," + LinkText("r", "http://x/1", "a/b") + "," +
                   LinkText("r", "http://x/2", "c/d") + "," + LinkText("R", "http://x/3") + "]}"));
    EXPECT_EQ(resource->GetLink("r").href.view(), "http://x/1");
    EXPECT_EQ(resource->GetLink("r", "c/d").href.view(), "http://x/2");
    EXPECT_TRUE(resource->GetLink("r", "e/f").href.IsNull());
    EXPECT_EQ(resource->GetLinkHref("R").view(), "http://x/3");
}

TEST_F(JSONResourceTest, BodyTagCountsWhereNoHeaderCame) {
    const std::string body = "{'zo:assetId':'a','zo:etag':'body'}";
    EXPECT_EQ(LoadWith<dto::Asset>(JSONAnswer(body, "\"header\""))->GetETag(true).view(), "\"header\"");
    EXPECT_EQ(LoadWith<dto::Asset>(JSONAnswer(body, ""))->GetETag(true).view(), "body");
}

TEST_F(JSONResourceTest, FailureKeepsTheStructureAlthoughUnloaded) {
    const auto resource = LoadWith<dto::Production>(JSONAnswer("{'zo:productionId':'p'}"));
    net->Expect("GET", "", ScriptedAnswer::Body("oops", "text/plain", 500));
    Outcome outcome;
    resource->Refresh(Guid::CreateUnique(), outcome.Function());
    EXPECT_EQ(outcome.Wait(), kResultHTTPInternalServerError);
    EXPECT_FALSE(resource->IsLoaded());
    EXPECT_EQ(resource->Body().Identifier().view(), "p");
    EXPECT_TRUE(
        Traced("JSONServerResource::InternalInit(): cannot create object from unsuccessful server "
               "response. URL: \"" +
               HubURL("/p").str() +
               "\", HTTP status code: 500, CURL Error Code: 0, "
               "response data: \"oops\""));
}

TEST_F(JSONResourceTest, ReadersAndReloadsMayMeet) {
    net->SetHandler([](const RecordedRequest& inRequest) {
        return JSONAnswer("{'zo:productionId':'" + inRequest.requestID.ToString() + "','links':[" +
                              LinkText("edit", "http://x/e") + "]}",
                          inRequest.requestID.ToString());
    });
    const auto resource = Make<dto::Production>();
    std::atomic<bool> stop{false};
    std::vector<std::thread> readers;
    for (int i = 0; i < 2; ++i) {
        readers.emplace_back([&] {
            while (!stop) {
                resource->Body().Identifier();
                resource->GetEditLink();
                resource->GetETag(true);
            }
        });
    }
    for (int i = 0; i < 300; ++i) {
        bool changed = false;
        EXPECT_TRUE(resource->Refresh(changed, false));
    }
    stop = true;
    for (std::thread& reader : readers) {
        reader.join();
    }
    EXPECT_EQ(resource->Installs(), 300);
}

}  // namespace
}  // namespace ZOCL
