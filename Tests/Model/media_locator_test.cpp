// Media locators: their value type, the half that stays on this machine, and storing against other clients.
#include <cstdlib>
#include <filesystem>

#include "Model/MediaLocator.h"
#include "ModelTest.h"
#include "RFL/Registry.h"

namespace ZOCL {
namespace {

const Guid kDocument(0x0123456789abcdefull, 0x8123456789abcdefull);
const Guid kState(0x1111111111111111ull, 0x2222222222222222ull);

TEST(MediaLocatorPropertiesTest, TextKeepsItsOrderAndLeavesZerosOut) {
    MediaLocatorProperties properties(u"zomedia://mp/a.mov");
    EXPECT_TRUE(properties.IsValid());
    EXPECT_FALSE(MediaLocatorProperties().IsValid());
    properties.documentID = kDocument;
    EXPECT_EQ(
        properties.AsUTF8String(),
        Quote("{'href':'zomedia://mp/a.mov','docId':'01234567-89ab-cdef-8123-456789abcdef','contentStateId':"
              "'00000000-0000-0000-0000-000000000000','displayName':'','stillSequenceParams':null,"
              "'numberedStills':null}"));
    MediaLocatorStillSequenceParams params;
    params.type = kNumberedStillSequenceType_Lexicographic;
    params.endFrame = 12;
    params.leadingZeroes = true;
    properties.stillSequenceParams = params;
    EXPECT_NE(
        properties.AsUTF8String().find(Quote("{'type':'lexicographic','endFrame':12,'leadingZeroes':true}")),
        std::string::npos);
    EXPECT_EQ(MediaLocatorProperties::CreateFromString(properties.AsString()), properties);
}

TEST(MediaLocatorPropertiesTest, OldNumberedStillsBecomeParams) {
    auto parse = [](const std::string& inText) {
        const std::string text = Quote(inText);
        return MediaLocatorProperties::CreateFromString(UString(text.begin(), text.end()));
    };
    const auto upgraded = parse("{'href':'h','numberedStills':true}");
    ASSERT_TRUE(upgraded.stillSequenceParams);
    EXPECT_EQ(upgraded.stillSequenceParams->type, kNumberedStillSequenceType_Numeric);
    EXPECT_EQ(upgraded.stillSequenceParams->startFrame, 0);
    EXPECT_FALSE(parse("{'href':'h','numberedStills':false}").stillSequenceParams);
    EXPECT_FALSE(parse("{'numberedStills':null,'stillSequenceParams':null}").stillSequenceParams);
    EXPECT_TRUE(
        parse("{'stillSequenceParams':{'type':'numeric'},'numberedStills':false}").stillSequenceParams);
    EXPECT_TRUE(parse("{'docId':'no guid'}").documentID.IsNull());
    EXPECT_THROW(parse("{'href':"), std::exception);
    EXPECT_THROW(parse("{'href':7}"), std::exception);
    EXPECT_THROW(parse("{'stillSequenceParams':{'startFrame':3000000000}}"), std::exception);
}

TEST(MediaLocatorPropertiesTest, OrderIsTotal) {
    std::vector<MediaLocatorProperties> values(7);
    values[1].href = "h";
    values[2].documentID = kDocument;
    values[3].contentStateID = kState;
    values[4].displayName = "n";
    values[5].stillSequenceParams = MediaLocatorStillSequenceParams();
    values[6].stillSequenceParams = MediaLocatorStillSequenceParams();
    values[6].stillSequenceParams->numDigits = 4;
    for (std::size_t i = 0; i < values.size(); ++i) {
        for (std::size_t j = 0; j < values.size(); ++j) {
            EXPECT_EQ(values[i] == values[j], i == j);
            EXPECT_EQ((values[i] < values[j]) + (values[j] < values[i]), i == j ? 0 : 1) << i << " " << j;
        }
    }
    EXPECT_TRUE(values[0] < values[5]);
    MediaLocatorProperties negative;
    negative.documentID = Guid(0x8000000000000000ull, 0);
    EXPECT_TRUE(negative < values[0]);
}

class MediaLocatorTest : public ModelTest {
protected:
    MediaLocatorTest() {
        mDirectory = testing::TempDir() + "zo_locator_" + Guid::CreateUnique().ToString();
        std::filesystem::create_directory(mDirectory);
        setenv("ZOCLIENT_CONFIG_HOME", mDirectory.c_str(), 1);
        RFL::CloseRegistry();
        ServiceDocument document;
        document.links.push_back({kRelation_MediaLocators, "", HubURL("/locators"), "", ""});
        document.links.push_back(
            {kRelation_MediaLocator_ByMediaLocatorId, "", HubURL("/locators/{mediaLocatorId}"), "", ""});
        RFL::QueryInterface<DataServer>(server)->TakeLinksDocument(document);
    }
    ~MediaLocatorTest() override {
        RFL::QueryInterface<DataServer>(server)->ReleaseCaches();
        RFL::CloseRegistry();
        unsetenv("ZOCLIENT_CONFIG_HOME");
        std::filesystem::remove_all(mDirectory);
    }

    InterfaceRef<IZOCMediaLocator> Locator(const char* inID = "l1") { return server->GetMediaLocator(inID); }
    /// The body that the server has for a locator.
    static ScriptedAnswer Stored(const std::string& inHRef, const std::string& inTag = "\"s\"") {
        return JSONAnswer("{'zo:mediaLocatorId':'l1','properties':{'href':'" + inHRef +
                              "'},'links':[{'rel':'self','href':'" + HubURL("/locators/l1").str() + "'}]}",
                          inTag);
    }
    std::vector<std::string> Lines() { return net->Lines(); }
    const std::string kItem = HubURL("/locators/l1").str();
    const std::string kCollection = HubURL("/locators").str();

private:
    std::string mDirectory;
};

TEST_F(MediaLocatorTest, IdentifierIsTwoGuids) {
    EXPECT_EQ(IZOCMediaLocator::CreateMediaLocatorID(kDocument, kState).view(),
              "01234567-89ab-cdef-8123-456789abcdef-11111111-1111-1111-2222-222222222222");
}

TEST_F(MediaLocatorTest, LocalLinksStayOnThisMachine) {
    const ImmutableString local("zomedia://localhost-ab/x.mov");
    const auto locator = Locator();
    EXPECT_TRUE(locator->GetMediaHRef().IsNull());
    locator->SetMediaHRef(local);
    EXPECT_EQ(locator->GetMediaHRef(), local);
    EXPECT_EQ(locator->GetForm()[1].second.find("localhost"), std::string::npos);
    locator->SetMediaHRef("zomedia://mp/x.mov");
    EXPECT_EQ(locator->GetMediaHRef().view(), "zomedia://mp/x.mov");
    // The mount point's link has put an end to the local one.
    locator->SetMediaHRef(ImmutableString());
    EXPECT_TRUE(locator->GetMediaHRef().IsNull());
    locator->SetMediaHRef("zomedia://mp/y.mov");
    locator->SetMediaHRef(local);
    EXPECT_EQ(locator->GetMediaHRef().view(), "zomedia://mp/y.mov");
    const auto other = Locator("l2");
    other->SetMediaHRef(local);
    IZOCMediaLocator::ClearLocalMediaLinkFromCache("l2");
    EXPECT_TRUE(other->GetMediaHRef().IsNull());
    const auto hostile = Locator("..\\..\\Evil");
    hostile->SetMediaHRef(local);
    EXPECT_TRUE(hostile->GetMediaHRef().IsNull());
    EXPECT_EQ(Requests(), 0u);
}

TEST_F(MediaLocatorTest, NewLocatorIsPosted) {
    const auto locator = Locator();
    locator->SetMediaHRef("zomedia://mp/new.mov");
    locator->SetDisplayName("shown");
    locator->SetDocumentIDAndContentState(kDocument, kState);
    net->Expect("GET", kItem, ScriptedAnswer::Status(404));
    net->Expect("POST", kCollection, Stored("zomedia://mp/new.mov"));
    EXPECT_TRUE(locator->Store());
    const auto form = LastRequest().form;
    ASSERT_EQ(form.size(), 2u);
    EXPECT_EQ(form[0], (std::pair<std::string, std::string>(":id", "l1")));
    EXPECT_EQ(form[1].first, ":medialocator");
    EXPECT_THAT(form[1].second, testing::HasSubstr(Quote("'displayName':'shown'")));
    EXPECT_TRUE(net->Mismatches().empty());
    EXPECT_EQ(Locator(), locator);
    EXPECT_TRUE(RFL::QueryInterface<IZOCServerResource>(locator)->IsLoaded());
}

TEST_F(MediaLocatorTest, KnownLocatorIsPutWithWhatTheHostSet) {
    const auto locator = Locator();
    locator->SetMediaHRef("zomedia://mp/mine.mov");
    net->Expect("GET", kItem, Stored("zomedia://mp/theirs.mov"));
    net->Expect("PUT", kItem, Stored("zomedia://mp/mine.mov", "\"s2\""));
    EXPECT_TRUE(locator->Store());
    EXPECT_THAT(LastRequest().Field(":medialocator"), testing::HasSubstr("mine.mov"));
    EXPECT_EQ(locator->GetMediaHRef().view(), "zomedia://mp/mine.mov");
    EXPECT_TRUE(net->Mismatches().empty());
}

TEST_F(MediaLocatorTest, AnotherClientsCreateIsASuccess) {
    net->Expect("GET", kItem, ScriptedAnswer::Status(404));
    net->Expect("POST", kCollection, ScriptedAnswer::Status(412));
    net->Expect("GET", kItem, Stored("zomedia://mp/theirs.mov"));
    EXPECT_TRUE(Locator()->Store());
    EXPECT_TRUE(net->Mismatches().empty());
}

TEST_F(MediaLocatorTest, ConflictsAreTriedOnceMore) {
    const auto locator = Locator();
    locator->SetMediaHRef("zomedia://mp/mine.mov");
    net->Expect("GET", kItem, ScriptedAnswer::Status(404));
    net->Expect("POST", kCollection, ScriptedAnswer::Status(409));
    net->Expect("GET", kItem, Stored("zomedia://mp/theirs.mov"));
    net->Expect("PUT", kItem, Stored("zomedia://mp/mine.mov", "\"s2\""));
    EXPECT_TRUE(locator->Store());
    EXPECT_THAT(LastRequest().Field(":medialocator"), testing::HasSubstr("mine.mov"));
    net->Expect("GET", kItem, Stored("zomedia://mp/theirs.mov"));
    net->Expect("PUT", kItem, ScriptedAnswer::Status(409));
    net->Expect("GET", kItem, Stored("zomedia://mp/theirs.mov"));
    net->Expect("PUT", kItem, ScriptedAnswer::Status(409));
    EXPECT_FALSE(locator->Store());
    EXPECT_TRUE(net->Mismatches().empty());
    // What the host had set is still there to be tried again.
    EXPECT_EQ(locator->GetMediaHRef().view(), "zomedia://mp/mine.mov");
    EXPECT_THAT(Assertions(),
                testing::ElementsAre("returnValue: Failed to put new media locator info to server at " +
                                     kItem + ". Server Response Code: 409"));
}

TEST_F(MediaLocatorTest, FailedPostAsserts) {
    net->SetHandler([](const RecordedRequest&) { return ScriptedAnswer::Status(500); });
    EXPECT_FALSE(Locator()->Store());
    EXPECT_THAT(Assertions(), testing::ElementsAre("stored: Could not post new media locator!"));
}

TEST_F(MediaLocatorTest, AsynchronousStoreRetriesAConflictByPut) {
    const auto locator = Locator();
    locator->SetMediaHRef("zomedia://mp/mine.mov");
    net->Expect("POST", kCollection, ScriptedAnswer::Status(409));
    net->Expect("GET", kItem, Stored("zomedia://mp/theirs.mov"));
    net->Expect("PUT", kItem, Stored("zomedia://mp/mine.mov", "\"s2\""));
    Outcome outcome;
    const Guid id = Guid::CreateUnique();
    ASSERT_TRUE(locator->Store(id, outcome.Function()));
    EXPECT_EQ(outcome.Wait(), kResultSuccess);
    EXPECT_EQ(outcome.ID(), id);
    EXPECT_TRUE(net->WaitUntilIdle());
    EXPECT_EQ(outcome.Calls(), 1);
    EXPECT_THAT(LastRequest().Field(":medialocator"), testing::HasSubstr("mine.mov"));
    EXPECT_TRUE(net->Mismatches().empty());

    net->Expect("PUT", kItem, ScriptedAnswer::Status(409));
    net->Expect("GET", kItem, Stored("zomedia://mp/theirs.mov", "\"s3\""));
    net->Expect("PUT", kItem, ScriptedAnswer::Status(409));
    Outcome refused;
    ASSERT_TRUE(locator->Store(id, refused.Function()));
    EXPECT_EQ(refused.Wait(), kResultHTTPConflict);
    net->Expect("PUT", kItem, ScriptedAnswer::Status(409));
    net->Expect("GET", kItem, ScriptedAnswer::Status(403));
    Outcome unreadable;
    ASSERT_TRUE(locator->Store(id, unreadable.Function()));
    EXPECT_EQ(unreadable.Wait(), kResultHTTPForbidden);
    EXPECT_TRUE(net->Mismatches().empty());
}

TEST_F(MediaLocatorTest, DuplicateSharesDocumentAndState) {
    const auto locator = Locator();
    locator->SetDocumentIDAndContentState(kDocument, kState);
    locator->SetMediaHRef("zomedia://mp/a.mov");
    net->SetHandler([](const RecordedRequest& inRequest) {
        return inRequest.verb == "POST"
                   ? JSONAnswer("{'zo:mediaLocatorId':'" + inRequest.Field(":id") +
                                "','properties':" + inRequest.Field(":medialocator") + "}")
                   : ScriptedAnswer::Status(404);
    });
    const auto copy = locator->Duplicate();
    ASSERT_TRUE(copy);
    EXPECT_NE(copy->GetID(), locator->GetID());
    EXPECT_THAT(copy->GetID().str(), testing::EndsWith("-" + kState.ToString()));
    EXPECT_EQ(copy->GetMediaHRef().view(), "zomedia://mp/a.mov");
    EXPECT_THAT(copy->GetForm()[1].second, testing::HasSubstr(kDocument.ToString()));
    net->SetHandler([](const RecordedRequest&) { return ScriptedAnswer::Status(500); });
    EXPECT_FALSE(locator->Duplicate());
}

}  // namespace
}  // namespace ZOCL
