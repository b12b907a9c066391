// Posting, putting and deleting: the exact requests, the tags and the texts of failures.
#include <cstdio>
#include <fstream>

#include "ClientTest.h"
#include "ostnet/HeaderConstants.h"

namespace ZOCL {
namespace {

class WriteTest : public ClientTest {
protected:
    InterfaceRef<ServerResource> Loaded(const std::string& inTag) {
        auto resource = Plain("/thing", ResourceWritability::kWritable);
        ScriptedAnswer answer = ScriptedAnswer::Body("x", "text/plain");
        net->Expect("GET", "", inTag.empty() ? answer : std::move(answer).With("ETag", inTag));
        EXPECT_TRUE(resource->Load(true));
        net->ClearRequests();
        return resource;
    }
    const ImmutableString kText{"text/plain"};
};

TEST_F(WriteTest, PutSendsTheHeldTagAndTakesTheNewOne) {
    const auto resource = Loaded("\"one\"");
    net->Expect("PUT", HubURL("/thing").str(), ScriptedAnswer::Status(204).With("ETag", "\"two\""));
    const auto response = resource->Put(Bytes("new"), kText, false);
    ASSERT_TRUE(response);
    EXPECT_EQ(LastRequest().body, "new");
    EXPECT_EQ(LastRequest().Header("If-Match"), "\"one\"");
    EXPECT_EQ(LastRequest().Header("Content-Type"), "text/plain");
    EXPECT_EQ(net->RequestCount(), 1u);
    EXPECT_EQ(resource->GetETag(true).view(), "\"two\"");
    net->Expect("PUT", "", ScriptedAnswer::Status(200));
    resource->Put(Bytes("new"), ImmutableString(), true);
    EXPECT_EQ(LastRequest().CountHeader("If-Match"), 0u);
    EXPECT_EQ(LastRequest().CountHeader("Content-Type"), 0u);
    EXPECT_TRUE(Traced("<ZOCL.ServerResource> <5> SetETag(): empty eTag for asset"));
}

TEST_F(WriteTest, PutWithANullTagSendsNoCondition) {
    const auto resource = Loaded("");
    net->Expect("PUT", "", ScriptedAnswer::Status(200));
    resource->Put(Bytes("new"), kText, false);
    EXPECT_EQ(LastRequest().CountHeader("If-Match"), 0u);
    EXPECT_EQ(net->RequestCount(), 1u);
}

TEST_F(WriteTest, PutOfAnUnloadedResourceFetchesTheTagFirst) {
    const auto resource = Plain("/thing");
    // By a HEAD, of which the cache makes a GET.
    net->Expect("GET", HubURL("/thing").str(), ScriptedAnswer::Status(200).With("ETag", "\"h\""));
    net->Expect("PUT", HubURL("/thing").str(), ScriptedAnswer::Status(412));
    const auto response = resource->Put(Bytes("new"), kText, false);
    EXPECT_EQ(response->status, 412);
    EXPECT_EQ(LastRequest().Header("If-Match"), "\"h\"");
    EXPECT_TRUE(net->Mismatches().empty());
}

TEST_F(WriteTest, AsynchronousPutLeavesTheTagToItsCaller) {
    const auto resource = Loaded("\"one\"");
    net->Expect("PUT", "", ScriptedAnswer::Status(200).With("ETag", "\"two\""));
    Outcome outcome;
    ASSERT_TRUE(resource->Put(Bytes("new"), kText, Guid::CreateUnique(), outcome.Function(), false));
    EXPECT_EQ(outcome.Wait(), kResultSuccess);
    EXPECT_EQ(LastRequest().Header("If-Match"), "\"one\"");
    EXPECT_EQ(resource->GetETag(true).view(), "\"one\"");
    EXPECT_EQ(resource->GetResponseData()->view(), "x");
}

TEST_F(WriteTest, PutAndDeleteWithoutAnswerAssertOnce) {
    const auto resource = Loaded("\"one\"");
    for (int round = 0; round < 2; ++round) {
        net->Expect("PUT", "", ScriptedAnswer::NullResponse());
        EXPECT_EQ(resource->Put(Bytes("new"), kText, true), nullptr);
        net->Expect("DELETE", "", ScriptedAnswer::NullResponse());
        EXPECT_FALSE(resource->Delete());
    }
    EXPECT_THAT(Assertions(),
                testing::ElementsAre("response: Failed to PUT with URL: " + HubURL("/thing").str(),
                                     "response: Failed to DELETE at URL: " + HubURL("/thing").str()));
}

TEST_F(WriteTest, PostReturnsTheAnswerAndTellsOfErrors) {
    const auto resource = Plain("/things");
    net->Expect("POST", HubURL("/things").str(), ScriptedAnswer::Body("no", "text/plain", 422));
    const auto response = resource->Post(Bytes("b"), kText);
    ASSERT_TRUE(response);
    EXPECT_EQ(response->status, 422);
    EXPECT_FALSE(resource->IsLoaded());
    EXPECT_TRUE(Traced("<ZOCL.ServerResource> <5> Post(): Error 422 posting asset \"" +
                       HubURL("/things").str() + "\": (no)"));
    net->Expect("POST", "", ScriptedAnswer::Status(302));
    resource->Post(Bytes("b"), ImmutableString());
    EXPECT_EQ(LastRequest().CountHeader("Content-Type"), 0u);
    EXPECT_FALSE(Traced("Error 302"));
    net->Expect("POST", "", ScriptedAnswer::Status(302));
    resource->PostMultiPart({{ImmutableString(":a"), "b"}});
    EXPECT_TRUE(Traced("PostMultiPart(): Error 302 posting asset"));
}

TEST_F(WriteTest, LocationOfAPostMovesTheResource) {
    const auto resource = Plain("/things");
    net->Expect("POST", HubURL("/things").str(),
                ScriptedAnswer::Body("made", "text/plain", 201).With("Location", HubURL("/things/7").str()));
    Outcome outcome;
    ASSERT_TRUE(
        resource->Post(Bytes("b"), MakeContentTypeHeaders(kText), Guid::CreateUnique(), outcome.Function()));
    EXPECT_EQ(outcome.Wait(), kResultSuccess);
    EXPECT_EQ(LastRequest().Header("Content-Type"), "text/plain");
    EXPECT_EQ(resource->GetHTTPURL(), HubURL("/things/7"));
}

TEST_F(WriteTest, FormsGoAsTheyAre) {
    const auto resource = Loaded("\"one\"");
    const ostnet::http::Form form{{ImmutableString(":a"), "1"}, {ImmutableString(":b"), "2"}};
    using Fields = std::vector<std::pair<std::string, std::string>>;
    net->Expect("PUT", "", ScriptedAnswer::Status(200).With("ETag", "\"two\""));
    resource->PutMultiPart(form);
    EXPECT_TRUE(LastRequest().isForm);
    EXPECT_EQ(LastRequest().form, (Fields{{":a", "1"}, {":b", "2"}}));
    EXPECT_EQ(LastRequest().CountHeader("If-Match"), 0u);
    EXPECT_EQ(resource->GetETag(true).view(), "\"two\"");
    net->Expect("PUT", "", ScriptedAnswer::Body("full", "text/plain", 507));
    resource->PutMultiPart(form);
    EXPECT_TRUE(Traced("PutMultiPart(): Error 507 putting asset \"" + HubURL("/thing").str() + "\": (full)"));
    for (const bool post : {true, false}) {
        Outcome outcome;
        net->Expect(post ? "POST" : "PUT", "", ScriptedAnswer::Status(200));
        const Guid id = Guid::CreateUnique();
        ASSERT_TRUE(post ? resource->PostMultiPart(form, id, outcome.Function())
                         : resource->PutMultiPart(form, id, outcome.Function()));
        EXPECT_EQ(outcome.Wait(), kResultSuccess);
        EXPECT_EQ(LastRequest().form, (Fields{{":a", "1"}, {":b", "2"}}));
    }
}

TEST_F(WriteTest, FilesAreSentWhole) {
    const std::string path = testing::TempDir() + "zo_write_test_" + Guid::CreateUnique().ToString();
    const std::string bytes("a\0b\xff", 4);
    std::ofstream(path, std::ios::binary) << bytes;
    const auto resource = Loaded("\"one\"");
    net->Expect("PUT", "", ScriptedAnswer::Status(200).With("ETag", "\"two\""));
    EXPECT_TRUE(resource->PutFile(path, kText));
    EXPECT_EQ(LastRequest().body, bytes);
    EXPECT_EQ(LastRequest().Header("If-Match"), "\"one\"");
    net->Expect("POST", "", ScriptedAnswer::Status(200));
    EXPECT_TRUE(resource->PostFile(path, kText));
    EXPECT_EQ(LastRequest().body, bytes);
    std::remove(path.c_str());
    net->ClearRequests();
    EXPECT_FALSE(resource->PostFile(path, kText));
    EXPECT_FALSE(resource->PutFile(path, kText));
    EXPECT_EQ(net->RequestCount(), 0u);
}

TEST_F(WriteTest, DeleteLeavesTheObjectAndForgivesWhatIsGone) {
    const auto resource = Loaded("\"one\"");
    const auto writable = RFL::QueryInterface<IZOCWritableServerResource>(resource);
    ASSERT_TRUE(writable);
    net->Expect("DELETE", HubURL("/thing").str(), ScriptedAnswer::Status(204));
    EXPECT_TRUE(writable->Delete());
    net->Expect("DELETE", HubURL("/thing").str(), ScriptedAnswer::Status(404));
    EXPECT_FALSE(writable->Delete());
    struct Row {
        int status;
        int result;
    };
    for (const Row& row : {Row{200, kResultSuccess}, Row{404, kResultGone}, Row{409, kResultHTTPConflict}}) {
        Outcome outcome;
        net->Expect("DELETE", HubURL("/thing").str(), ScriptedAnswer::Status(row.status));
        ASSERT_TRUE(writable->Delete(Guid::CreateUnique(), outcome.Function()));
        EXPECT_EQ(outcome.Wait(), row.result);
    }
    EXPECT_TRUE(resource->IsLoaded());
}

}  // namespace
}  // namespace ZOCL
