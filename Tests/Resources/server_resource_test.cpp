// Loading and refreshing: what goes over the wire, and the states that answers lead to.
#include "ClientTest.h"
#include "ostnet/HeaderConstants.h"

namespace ZOCL {
namespace {

class ServerResourceTest : public ClientTest {
protected:
    InterfaceRef<ServerResource> Loaded(const std::string& inTag = "\"one\"") {
        auto resource = Plain("/thing");
        net->Expect("GET", HubURL("/thing").str(),
                    ScriptedAnswer::Body("first", "text/plain").With("ETag", inTag));
        EXPECT_TRUE(resource->Load(true));
        net->ClearRequests();
        return resource;
    }
};

TEST_F(ServerResourceTest, LoadSendsOneGetAndHoldsTheAnswer) {
    const auto resource = Plain("/thing");
    net->Expect("GET", HubURL("/thing").str(), ScriptedAnswer::Body("bytes", "text/x").With("ETag", "\"a\""));
    Outcome outcome;
    const Guid id = Guid::CreateUnique();
    ASSERT_TRUE(resource->Load(id, outcome.Function(), true));
    EXPECT_EQ(outcome.Wait(), kResultSuccess);
    EXPECT_EQ(outcome.ID(), id);
    EXPECT_EQ(outcome.Resource(), InterfaceRef<IZOCServerResource>(resource));
    EXPECT_NE(outcome.Thread(), std::this_thread::get_id());
    EXPECT_TRUE(resource->IsLoaded());
    EXPECT_EQ(resource->GetETag(true).view(), "\"a\"");
    EXPECT_EQ(resource->GetResponseData()->view(), "bytes");
    EXPECT_EQ(net->RequestCount(), 1u);
    EXPECT_EQ(LastRequest().CountHeader("If-None-Match"), 0u);
    EXPECT_TRUE(Traced("<ZOCL> <8> ServerResource::Load(): Beginning async load of server resource " +
                       HubURL("/thing").str() + ", inRequestID == " + id.ToString()));
    EXPECT_TRUE(Traced("ServerResource::AsyncOperationHelper(): request " + id.ToString() +
                       " completed with result 0"));
}

TEST_F(ServerResourceTest, LoadedResourceCompletesOnTheCallersStackAndSendsNothing) {
    const auto resource = Loaded();
    Outcome outcome;
    ASSERT_TRUE(resource->Load(Guid::CreateUnique(), outcome.Function(), true));
    EXPECT_EQ(outcome.Calls(), 1);
    EXPECT_EQ(outcome.Wait(), kResultSuccess);
    EXPECT_EQ(outcome.Response(), nullptr);
    EXPECT_EQ(outcome.Thread(), std::this_thread::get_id());
    EXPECT_TRUE(resource->Load(Guid::CreateUnique(), RequestCompletion(), true));
    EXPECT_TRUE(resource->LoadBlocking(true));
    EXPECT_EQ(net->RequestCount(), 0u);
}

TEST_F(ServerResourceTest, NotModifiedLeavesTheResourceAndReachesTheCallerAsFailure) {
    const auto resource = Loaded("\"one\"");
    const auto data = resource->GetResponseData();
    net->Expect("GET", HubURL("/thing").str(), ScriptedAnswer::Status(304));
    Outcome outcome;
    ASSERT_TRUE(resource->Refresh(Guid::CreateUnique(), outcome.Function()));
    EXPECT_EQ(outcome.Wait(), kResultHTTPNotModified);
    EXPECT_EQ(LastRequest().Header("If-None-Match"), "\"one\"");
    EXPECT_TRUE(resource->IsLoaded());
    EXPECT_EQ(resource->GetETag(true).view(), "\"one\"");
    EXPECT_EQ(resource->GetResponseData(), data);
}

TEST_F(ServerResourceTest, SameTagIsNotInstalledAgain) {
    const auto resource = Loaded("\"one\"");
    net->Expect("GET", HubURL("/thing").str(),
                ScriptedAnswer::Body("second", "text/plain").With("ETag", "\"one\""));
    Outcome outcome;
    ASSERT_TRUE(resource->Refresh(Guid::CreateUnique(), outcome.Function()));
    EXPECT_EQ(outcome.Wait(), kResultSuccess);
    EXPECT_EQ(resource->GetResponseData()->view(), "first");
}

TEST_F(ServerResourceTest, FailedRefreshUnloads) {
    for (const ScriptedAnswer& answer :
         {ScriptedAnswer::Status(500), ScriptedAnswer::NoResponse(), ScriptedAnswer::NullResponse()}) {
        const auto resource = Loaded();
        net->Expect("GET", HubURL("/thing").str(), answer);
        Outcome outcome;
        ASSERT_TRUE(resource->Refresh(Guid::CreateUnique(), outcome.Function()));
        EXPECT_LT(outcome.Wait(), 0);
        EXPECT_FALSE(resource->IsLoaded());
        EXPECT_TRUE(resource->IsValid());
        EXPECT_TRUE(resource->GetETag(true).IsNull());
        EXPECT_EQ(resource->GetHTTPURL(), HubURL("/thing"));
    }
}

TEST_F(ServerResourceTest, ResultsFollowTheStatus) {
    struct Row {
        ScriptedAnswer answer;
        int plain;
        int missingAsEmpty;
    };
    const Row rows[] = {
        {ScriptedAnswer::Status(404), kResultHTTPNotFound, kResultGone},
        {ScriptedAnswer::Status(403), kResultHTTPForbidden, kResultHTTPForbidden},
        {ScriptedAnswer::Status(418), kResultFailure, kResultFailure},
        {ScriptedAnswer::NullResponse(), kResultNoResponseObject, kResultNoResponseObject},
        {ScriptedAnswer::NoResponse(), kResultNoHTTPResponse, kResultNoHTTPResponse},
        {ScriptedAnswer::Status(201), kResultSuccess, kResultSuccess},
    };
    for (const Row& row : rows) {
        Outcome plain;
        Outcome lenient;
        net->Expect("GET", "", row.answer);
        ASSERT_TRUE(Plain("/a")->Load(Guid::CreateUnique(), plain.Function(), true));
        EXPECT_EQ(plain.Wait(), row.plain);
        net->Expect("GET", "", row.answer);
        ASSERT_TRUE(Plain("/a")->LoadTreatingMissingAsEmpty(Guid::CreateUnique(), lenient.Function(), true));
        EXPECT_EQ(lenient.Wait(), row.missingAsEmpty);
        EXPECT_EQ(lenient.Resource()->IsLoaded(), row.answer.status == 201);
    }
}

TEST_F(ServerResourceTest, TagOfAnUnloadedResourceCostsAReadOnlyWhenAllowed) {
    const auto resource = Plain("/thing");
    EXPECT_TRUE(resource->GetETag(true).IsNull());
    EXPECT_EQ(net->RequestCount(), 0u);
    // A HEAD; the cache makes a GET of it.
    net->Expect("GET", HubURL("/thing").str(), ScriptedAnswer::Status(200).With("ETag", "\"h\""));
    EXPECT_EQ(resource->GetETag(false).view(), "\"h\"");
    EXPECT_EQ(net->RequestCount(), 1u);
    EXPECT_FALSE(resource->IsLoaded());
}

TEST_F(ServerResourceTest, BlockingRefreshAsksForTheWholeBody) {
    const auto resource = Loaded("\"one\"");
    bool changed = true;
    net->Expect("GET", "", ScriptedAnswer::Status(304));
    EXPECT_TRUE(resource->Refresh(changed, false));
    EXPECT_FALSE(changed);
    EXPECT_EQ(LastRequest().Header("If-None-Match"), "\"one\"") << "the cache asks, and has the whole body";
    net->Expect("GET", "", ScriptedAnswer::Status(204));
    EXPECT_TRUE(resource->Refresh(changed, false));
    EXPECT_FALSE(changed);
    EXPECT_EQ(resource->GetResponseData()->view(), "first");
    net->Expect("GET", "", ScriptedAnswer::Body("second", "text/plain").With("ETag", "\"two\""));
    EXPECT_TRUE(resource->Refresh(changed, false));
    EXPECT_TRUE(changed);
    EXPECT_EQ(resource->GetResponseData()->view(), "second");
    net->Expect("GET", "", ScriptedAnswer::NullResponse());
    EXPECT_FALSE(resource->Refresh(changed, false));
    EXPECT_FALSE(changed);
    EXPECT_TRUE(resource->IsLoaded());
}

TEST_F(ServerResourceTest, BlockingLoadTellsOfSilence) {
    const auto resource = Plain("/thing");
    net->Expect("GET", "", ScriptedAnswer::FailStart());
    EXPECT_FALSE(resource->Load(true));
    EXPECT_TRUE(Traced("ServerResource::Load(): Failed to load resource (No response from server) at url: " +
                       HubURL("/thing").str()));
}

TEST_F(ServerResourceTest, WhatDoesNotStartDoesNotComplete) {
    Outcome outcome;
    net->Expect("GET", "", ScriptedAnswer::FailStart());
    EXPECT_FALSE(Plain("/thing")->Load(Guid::CreateUnique(), outcome.Function(), true));
    EXPECT_TRUE(net->WaitUntilIdle());
    EXPECT_EQ(outcome.Calls(), 0);
}

TEST_F(ServerResourceTest, WithoutServerOperationsThrow) {
    server.Reset();
    const InterfaceRef<ServerResource> resource(new ServerResource);
    EXPECT_FALSE(resource->IsValid());
    bool changed = false;
    const Guid id = Guid::CreateUnique();
    EXPECT_THROW(resource->Load(id, RequestCompletion(), true), RFL::NullInterfaceException);
    EXPECT_THROW(resource->Refresh(id, RequestCompletion()), RFL::NullInterfaceException);
    EXPECT_THROW(resource->Refresh(changed, false), RFL::NullInterfaceException);
    EXPECT_THROW(resource->TryToCancelRequest(id), RFL::NullInterfaceException);
    EXPECT_THROW(resource->Delete(), RFL::NullInterfaceException);
    EXPECT_FALSE(resource->Load(true));
}

TEST_F(ServerResourceTest, CancelEndsTheRequestOnceAndTheRequestKeepsTheResource) {
    Outcome outcome;
    const Guid id = Guid::CreateUnique();
    net->Expect("GET", "", ScriptedAnswer::Hold());
    {
        const auto resource = Plain("/thing");
        ASSERT_TRUE(resource->Load(id, outcome.Function(), true));
        EXPECT_TRUE(resource->TryToCancelRequest(id));
    }
    EXPECT_EQ(outcome.Wait(), kResultRequestCancelled);
    EXPECT_TRUE(net->WaitUntilIdle());
    EXPECT_EQ(outcome.Calls(), 1);
    EXPECT_FALSE(outcome.Resource()->IsLoaded());
}

TEST_F(ServerResourceTest, ReleasesItsObjectWithTheLastRequest) {
    class Watched final : public ServerResource {
    public:
        explicit Watched(std::atomic<int>& ioAlive) : mAlive(ioAlive) { ++mAlive; }
        ~Watched() override { --mAlive; }

    private:
        std::atomic<int>& mAlive;
    };
    std::atomic<int> alive{0};
    net->Expect("GET", "", ScriptedAnswer::Hold());
    {
        InterfaceRef<ServerResource> resource(new Watched(alive));
        resource->InternalInit(HubURL("/w"), server, nullptr, ResourceWritability::kReadOnly, true);
        resource->LoadInBackground(true);
    }
    EXPECT_EQ(alive.load(), 1);
    EXPECT_EQ(net->ReleaseHeld(ScriptedAnswer::Body("x", "a/b")), 1u);
    EXPECT_TRUE(net->WaitUntilIdle());
    EXPECT_EQ(alive.load(), 0);
}

TEST_F(ServerResourceTest, InterfacesAreAnsweredAsTheWritableFlagSays) {
    const auto readOnly = Plain("/thing", ResourceWritability::kReadOnly);
    void* found = readOnly.GetUnchecked();
    EXPECT_EQ(readOnly->QueryInterface(IZOCWritableServerResource::kInterfaceID, &found),
              kResultInterfaceNotSupported);
    EXPECT_EQ(found, nullptr);
    readOnly->InitFromResponse(nullptr, ResourceWritability::kKeep);
    EXPECT_FALSE(RFL::QueryInterface<IZOCWritableServerResource>(readOnly));
    readOnly->InitFromResponse(nullptr, ResourceWritability::kWritable);
    EXPECT_TRUE(RFL::QueryInterface<IZOCWritableServerResource>(readOnly));
    EXPECT_TRUE(RFL::QueryInterface<RFL::RFLUnknown>(readOnly));
    EXPECT_EQ(RFL::QueryInterface<ServerResource>(readOnly), readOnly);
}

TEST_F(ServerResourceTest, RefusedTypeAssertsOnceAndStaysUnloaded) {
    class Picky final : public ServerResource {
    public:
        bool canLoadType(const ImmutableString& inType) override { return inType.view() == "a/b"; }
    };
    for (int round = 0; round < 3; ++round) {
        const InterfaceRef<ServerResource> resource(new Picky);
        resource->InternalInit(HubURL("/p"), server, nullptr, ResourceWritability::kReadOnly, true);
        net->Expect("GET", "", ScriptedAnswer::Body("x", "c/d"));
        Outcome outcome;
        resource->Load(Guid::CreateUnique(), outcome.Function(), true);
        // The status says success: whoever loads must look at IsLoaded.
        EXPECT_EQ(outcome.Wait(), kResultSuccess);
        EXPECT_FALSE(resource->IsLoaded());
    }
    EXPECT_THAT(Assertions(),
                testing::ElementsAre("canLoadType: Failed to load content with type \"c/d\" for "
                                     "resource \"" +
                                     HubURL("/p").str() + "\""));
}

TEST_F(ServerResourceTest, LoadsRefreshesAndReadsMayMeetOnManyThreads) {
    net->SetHandler([](const RecordedRequest& inRequest) {
        return inRequest.Header("If-None-Match").empty()
                   ? ScriptedAnswer::Body("x", "text/plain").With("ETag", "\"e\"")
                   : ScriptedAnswer::Status(inRequest.requestID.Low() % 3 == 0 ? 500 : 304);
    });
    const auto resource = Plain("/thing");
    std::atomic<int> completed{0};
    std::atomic<int> started{0};
    const RequestCompletion count = [&](const Guid&, int, const InterfaceRef<IZOCServerResource>&,
                                        const shared_ptr<ostnet::Response>&) { ++completed; };
    std::vector<std::thread> threads;
    for (int t = 0; t < 4; ++t) {
        threads.emplace_back([&] {
            for (int i = 0; i < 200; ++i) {
                started += resource->Load(Guid::CreateUnique(), count, true);
                started += resource->Refresh(Guid::CreateUnique(), count);
                resource->GetETag(true);
                resource->GetResponseData();
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_TRUE(net->WaitUntilIdle());
    EXPECT_EQ(started.load(), 1600);
    EXPECT_EQ(completed.load(), 1600);
}

}  // namespace
}  // namespace ZOCL
