// Enclosures: payloads on demand, optimistic writes, creating, loading many and copying once.
#include "Model/ServerResourceWithEnclosures.h"
#include "ModelTest.h"
#include "ZOClient/IZOCEnclosure.h"

namespace ZOCL {
namespace {

std::string EnclosureText(const std::string& inName, bool inPayload = true) {
    return "{'name':'" + inName + "','zo:enclosureId':'id-" + inName + "','zo:enclosureContentId':'c-" +
           inName + "','zo:etag':'e-" + inName + "','links':[" + LinkTo(kRelation_Edit, "/put/" + inName) +
           (inPayload ? "," + LinkTo(kRelation_Enclosures_Enclosure, "/payload/" + inName) : std::string()) +
           "]}";
}

class EnclosureTest : public ModelTest {
protected:
    EnclosureTest() : ModelTest(4) {}

    static std::string ListText(const std::vector<std::string>& inNames) {
        std::string body;
        for (const std::string& name : inNames) {
            body += (body.empty() ? "" : ",") + EnclosureText(name);
        }
        return "{'enclosures':[" + body + "],'links':[" + LinkTo(kRelation_Create, "/create") + ",{'rel':'" +
               kRelation_Enclosures_Enclosure_ByContentId.str() + "','href':'" +
               HubURL("/by/{contentId}").str() + "'}]}";
    }
    InterfaceRef<Enclosures> MakeList(const std::vector<std::string>& inNames) {
        return Make<Enclosures>(ListText(inNames));
    }
    InterfaceRef<Enclosures> Unloaded() {
        return MakeAtURL<Enclosures>(HubURL("/list"), server, ResourceWritability::kWritable);
    }
};

TEST_F(EnclosureTest, SameNameGivesTheSameObject) {
    const auto list = MakeList({"x", "y"});
    const auto x = list->GetEnclosure("x");
    ASSERT_TRUE(x);
    EXPECT_EQ(list->GetEnclosure("x"), x);
    EXPECT_NE(list->GetEnclosure("y"), x);
    EXPECT_FALSE(list->GetEnclosure("X"));
    EXPECT_EQ(x->GetEnclosureID().view(), "id-x");
    EXPECT_EQ(x->GetEnclosureContentID().view(), "c-x");
    EXPECT_EQ(RFL::QueryInterface<IZOCServerResource>(x)->GetETag(true).view(), "e-x");
    EXPECT_THAT(list->GetEnclosureIDs(),
                testing::ElementsAre(ImmutableString("id-x"), ImmutableString("id-y")));
    EXPECT_EQ(Requests(), 0u);
    net->Expect("GET", "", JSONAnswer(ListText({"x"}), "\"t2\""));
    bool changed = false;
    EXPECT_TRUE(list->Refresh(changed, false));
    EXPECT_NE(list->GetEnclosure("x"), x);
    EXPECT_FALSE(list->GetEnclosure("y"));
}

TEST_F(EnclosureTest, PayloadIsFetchedOnceAndKept) {
    const auto x = MakeList({"x"})->GetEnclosure("x");
    net->Expect("GET", HubURL("/payload/x").str(), ScriptedAnswer::Body("data", "application/octet-stream"));
    EXPECT_FALSE(x->EnclosureDataIsLoaded());
    Outcome first;
    ASSERT_TRUE(x->LoadEnclosureData(Guid::CreateUnique(), first.Function()));
    EXPECT_EQ(first.Wait(), kResultSuccess);
    EXPECT_EQ(first.Resource(), RFL::QueryInterface<IZOCServerResource>(x));
    Outcome second;
    ASSERT_TRUE(x->LoadEnclosureData(Guid::CreateUnique(), second.Function()));
    EXPECT_EQ(second.Calls(), 1);
    EXPECT_EQ(second.Response(), nullptr);
    EXPECT_EQ(x->GetEnclosurePayloadAsUTF8(), "data");
    EXPECT_EQ(x->GetEnclosurePayloadAsText(), u"data");
    EXPECT_EQ(Requests(), 1u);
}

TEST_F(EnclosureTest, PayloadOfNoBytesIsHeldToo) {
    const auto x = MakeList({"x"})->GetEnclosure("x");
    net->Expect("GET", "", ScriptedAnswer::Status(204));
    Outcome outcome;
    ASSERT_TRUE(x->LoadEnclosureData(Guid::CreateUnique(), outcome.Function()));
    EXPECT_EQ(outcome.Wait(), kResultSuccess);
    EXPECT_TRUE(x->EnclosureDataIsLoaded());
    EXPECT_EQ(x->GetEnclosurePayload()->size(), 0u);
    EXPECT_EQ(Requests(), 1u);
}

TEST_F(EnclosureTest, FailedPayloadLeavesTheMetadata) {
    const auto x = MakeList({"x"})->GetEnclosure("x");
    net->Expect("GET", "", ScriptedAnswer::Status(404));
    Outcome outcome;
    ASSERT_TRUE(x->LoadEnclosureData(Guid::CreateUnique(), outcome.Function()));
    EXPECT_EQ(outcome.Wait(), kResultHTTPNotFound);
    net->Expect("GET", "", ScriptedAnswer::Status(500));
    EXPECT_EQ(x->GetEnclosurePayload(), nullptr);
    EXPECT_EQ(x->GetEnclosureName().view(), "x");
    EXPECT_TRUE(RFL::QueryInterface<IZOCServerResource>(x)->IsLoaded());
    const auto bare = Make<Enclosure>(EnclosureText("bare", false));
    EXPECT_FALSE(bare->LoadEnclosureData(Guid::CreateUnique(), RequestCompletion()));
    EXPECT_EQ(bare->GetEnclosurePayload(), nullptr);
}

TEST_F(EnclosureTest, PutIsOptimisticAndAFailureDropsIt) {
    const auto x = MakeList({"x"})->GetEnclosure("x");
    const auto writable = RFL::QueryInterface<IZOCWritableEnclosure>(x);
    net->Expect("PUT", HubURL("/put/x").str(), ScriptedAnswer::Hold());
    Outcome outcome;
    ASSERT_TRUE(writable->PutEnclosurePayload(Bytes("new"), Guid::CreateUnique(), outcome.Function()));
    EXPECT_EQ(x->GetEnclosurePayloadAsUTF8(), "new");
    EXPECT_EQ(LastRequest().Field(":enclosure"), "new");
    EXPECT_EQ(net->ReleaseHeld(ScriptedAnswer::Status(507)), 1u);
    EXPECT_LT(outcome.Wait(), 0);
    EXPECT_EQ(outcome.Resource(), RFL::QueryInterface<IZOCServerResource>(x));
    EXPECT_FALSE(x->EnclosureDataIsLoaded());
    net->Expect("PUT", "", ScriptedAnswer::FailStart());
    EXPECT_FALSE(writable->PutEnclosurePayload(Bytes("new"), Guid::CreateUnique(), RequestCompletion()));
    EXPECT_FALSE(x->EnclosureDataIsLoaded());
    net->Expect("PUT", "", ScriptedAnswer::Status(200));
    EXPECT_TRUE(writable->PutEnclosurePayload(Bytes("kept")));
    net->Expect("PUT", "", ScriptedAnswer::Status(500));
    EXPECT_FALSE(writable->PutEnclosurePayload(Bytes("lost")));
    EXPECT_EQ(x->GetEnclosurePayloadAsUTF8(), "kept");
}

TEST_F(EnclosureTest, FailureOfAnOlderPutKeepsTheNewerPayload) {
    const auto x = MakeList({"x"})->GetEnclosure("x");
    const auto writable = RFL::QueryInterface<IZOCWritableEnclosure>(x);
    const Guid older = Guid::CreateUnique();
    net->SetHandler([](const RecordedRequest&) { return ScriptedAnswer::Hold(); });
    Outcome first;
    Outcome second;
    ASSERT_TRUE(writable->PutEnclosurePayload(Bytes("older"), older, first.Function()));
    ASSERT_TRUE(writable->PutEnclosurePayload(Bytes("newer"), Guid::CreateUnique(), second.Function()));
    EXPECT_TRUE(net->Release(older, ScriptedAnswer::Status(500)));
    EXPECT_LT(first.Wait(), 0);
    EXPECT_EQ(x->GetEnclosurePayloadAsUTF8(), "newer");
    net->ReleaseHeld(ScriptedAnswer::Status(200));
    EXPECT_EQ(second.Wait(), kResultSuccess);
}

TEST_F(EnclosureTest, CreationPostsNameAndPayloadAsParts) {
    net->Expect("POST", HubURL("/create").str(), JSONAnswer(EnclosureText("n")));
    Outcome outcome;
    ASSERT_TRUE(CreateEnclosure(Guid::CreateUnique(), HubURL("/create"), server, "n", Bytes("{}"),
                                outcome.Function()));
    EXPECT_EQ(outcome.Wait(), kResultSuccess);
    EXPECT_TRUE(RFL::QueryInterface<IZOCWritableEnclosure>(outcome.Resource()));
    EXPECT_EQ(RFL::QueryInterface<IZOCEnclosure>(outcome.Resource())->GetEnclosureName().view(), "n");
    const RecordedRequest request = LastRequest();
    EXPECT_THAT(request.Header("Content-Type"), testing::StartsWith("multipart/form-data"));
    const auto namePart = request.body.find(":name");
    const auto payloadPart = request.body.find(":enclosure");
    ASSERT_NE(namePart, std::string::npos);
    ASSERT_NE(payloadPart, std::string::npos);
    EXPECT_LT(namePart, payloadPart);
    EXPECT_NE(request.body.find("\r\n\r\nn\r\n", namePart), std::string::npos);
    EXPECT_NE(request.body.find("application/json;charset=utf-8\r\n\r\n{}\r\n", payloadPart),
              std::string::npos);
    net->Expect("POST", "", ScriptedAnswer::Status(403));
    Outcome refused;
    ASSERT_TRUE(
        CreateEnclosure(Guid::CreateUnique(), HubURL("/create"), server, "n", nullptr, refused.Function()));
    EXPECT_EQ(refused.Wait(), kResultHTTPForbidden);
    EXPECT_FALSE(refused.Resource());
    EXPECT_FALSE(
        CreateEnclosure(Guid::CreateUnique(), ImmutableString(), server, "n", nullptr, RequestCompletion()));
}

TEST_F(EnclosureTest, ContentIDLeadsToAnEnclosure) {
    net->Expect("GET", HubURL("/by/c7").str(), JSONAnswer(EnclosureText("seven")));
    Outcome outcome;
    ASSERT_TRUE(MakeList({})->GetEnclosureByContentID("c7", Guid::CreateUnique(), outcome.Function()));
    EXPECT_EQ(outcome.Wait(), kResultSuccess);
    EXPECT_EQ(RFL::QueryInterface<IZOCEnclosure>(outcome.Resource())->GetEnclosureName().view(), "seven");
    EXPECT_FALSE(Unloaded()->GetEnclosureByContentID("c7", Guid::CreateUnique(), outcome.Function()));
}

TEST_F(EnclosureTest, AllAreLoadedWithOneEnd) {
    net->SetHandler([](const RecordedRequest& inRequest) {
        return inRequest.Path() == "/list" ? JSONAnswer(ListText({"a", "b", "c"}))
                                           : ScriptedAnswer::Body(inRequest.Path(), "x/y");
    });
    const auto list = Unloaded();
    const Guid id = Guid::CreateUnique();
    Outcome outcome;
    ASSERT_TRUE(LoadAllEnclosures(list, id, outcome.Function()));
    EXPECT_EQ(outcome.Wait(), kResultSuccess);
    EXPECT_EQ(outcome.ID(), id);
    EXPECT_EQ(Requests(), 4u);
    EXPECT_EQ(list->GetEnclosure("b")->GetEnclosurePayloadAsUTF8(), "/payload/b");
    Outcome empty;
    ASSERT_TRUE(LoadAllEnclosures(MakeList({}), id, empty.Function()));
    EXPECT_EQ(empty.Wait(), kResultSuccess);
    net->SetHandler([](const RecordedRequest& inRequest) {
        return ScriptedAnswer::Status(inRequest.Path() == "/payload/q" ? 403 : 200);
    });
    Outcome failed;
    ASSERT_TRUE(LoadAllEnclosures(MakeList({"p", "q"}), id, failed.Function()));
    EXPECT_EQ(failed.Wait(), kResultHTTPForbidden);
    net->SetHandler([](const RecordedRequest&) { return JSONAnswer("[]"); });
    Outcome unbound;
    ASSERT_TRUE(LoadAllEnclosures(Unloaded(), id, unbound.Function()));
    EXPECT_EQ(unbound.Wait(), kResultFailure);
    EXPECT_FALSE(LoadAllEnclosures(nullptr, id, unbound.Function()));
    EXPECT_TRUE(net->WaitUntilIdle());
    EXPECT_EQ(outcome.Calls() + empty.Calls() + failed.Calls() + unbound.Calls(), 4);
}

TEST_F(EnclosureTest, OneIsLoadedOrIsNotThere) {
    net->SetHandler([](const RecordedRequest& inRequest) {
        return inRequest.Path() == "/list" ? JSONAnswer(ListText({"a", "b"}))
                                           : ScriptedAnswer::Body("p", "x/y");
    });
    const auto list = Unloaded();
    Outcome found;
    ASSERT_TRUE(LoadSpecificEnclosure(list, "b", Guid::CreateUnique(), found.Function()));
    EXPECT_EQ(found.Wait(), kResultSuccess);
    EXPECT_EQ(found.Resource(), RFL::QueryInterface<IZOCServerResource>(list->GetEnclosure("b")));
    EXPECT_EQ(Requests(), 2u);
    Outcome missing;
    ASSERT_TRUE(LoadSpecificEnclosure(list, "z", Guid::CreateUnique(), missing.Function()));
    EXPECT_EQ(missing.Wait(), kResultSuccess);
    EXPECT_FALSE(missing.Resource());
    EXPECT_EQ(Requests(), 2u);
    net->SetHandler([](const RecordedRequest&) { return ScriptedAnswer::Status(500); });
    Outcome failed;
    ASSERT_TRUE(LoadSpecificEnclosure(Unloaded(), "b", Guid::CreateUnique(), failed.Function()));
    EXPECT_EQ(failed.Wait(), kResultHTTPInternalServerError);
}

TEST_F(EnclosureTest, CopyEndsOnceHoweverTheCopiesEnd) {
    std::vector<std::string> names;
    for (int i = 0; i < 60; ++i) {
        names.push_back("n" + std::to_string(i));
    }
    for (int round = 0; round < 20; ++round) {
        std::atomic<int> created{0};
        const bool failing = round % 2 == 1;
        net->SetHandler([&, failing](const RecordedRequest& inRequest) {
            if (inRequest.verb == "POST") {
                ++created;
                return failing && created % 7 == 0 ? ScriptedAnswer::Status(409)
                                                   : JSONAnswer(EnclosureText("n"));
            }
            return ScriptedAnswer::Body("p", "x/y");
        });
        Outcome outcome;
        ASSERT_TRUE(CopyEnclosuresIf(
            Guid::CreateUnique(), MakeList(names), MakeList({}),
            [](const ImmutableString& inName, const InterfaceRef<IZOCEnclosures>&,
               const InterfaceRef<IZOCEnclosures>&) { return inName.view() != "n5"; },
            outcome.Function()));
        EXPECT_EQ(outcome.Wait(), failing ? kResultHTTPConflict : kResultSuccess);
        ASSERT_TRUE(net->WaitUntilIdle());
        EXPECT_EQ(outcome.Calls(), 1);
        EXPECT_EQ(created.load(), 59);
        net->SetHandler(ZOClientTesting::ScriptedProcessor::Handler());
    }
}

TEST_F(EnclosureTest, CopyOfNothingAndToNowhere) {
    const auto never = [](const ImmutableString&, const InterfaceRef<IZOCEnclosures>&,
                          const InterfaceRef<IZOCEnclosures>&) { return false; };
    Outcome outcome;
    ASSERT_TRUE(
        CopyEnclosuresIf(Guid::CreateUnique(), MakeList({"a"}), MakeList({}), never, outcome.Function()));
    EXPECT_EQ(outcome.Calls(), 1);
    EXPECT_EQ(outcome.Wait(), kResultSuccess);
    const auto readOnly = Make<Enclosures>("{}", "\"t\"", ResourceWritability::kReadOnly);
    EXPECT_FALSE(CopyEnclosuresIf(Guid::CreateUnique(), MakeList({"a"}), readOnly, EnclosureCopyPredicate(),
                                  outcome.Function()));
    Outcome noFactory;
    net->SetHandler([](const RecordedRequest&) { return ScriptedAnswer::Body("p", "x/y"); });
    ASSERT_TRUE(CopyEnclosuresIf(Guid::CreateUnique(), MakeList({"a", "b"}), Make<Enclosures>("{}"),
                                 EnclosureCopyPredicate(), noFactory.Function()));
    EXPECT_EQ(noFactory.Wait(), kResultNotStarted);
}

TEST(EnclosureNamesTest, SuffixesAreFixed) {
    EXPECT_EQ(GetXMPEnclosureName("b").view(), "b_xmp");
    EXPECT_EQ(GetPreSyncHeadCommitIdEnclosureName("b").view(), "b_preSyncHeadCommitId");
    EXPECT_EQ(GetPostSyncBaseCommitIdEnclosureName("b").view(), "b_postSyncBaseCommitId");
    EXPECT_EQ(GetProductionUserDataEnclosureName("b").view(), "b_productionstate.json");
}

}  // namespace
}  // namespace ZOCL
