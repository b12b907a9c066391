// Sessions: how one is found or made, and what push and pull send.
#include "Connection/ServiceDocument.h"
#include "ostcore/threads/Gate.h"
#include "SessionTest.h"
#include "ZOClient/IZOCDifferences.h"

namespace ZOCL {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using Fields = std::vector<std::pair<std::string, std::string>>;

class EditingSessionTest : public SessionTest {
protected:
    EditingSessionTest() {
        ServiceDocument document;
        document.links.push_back({kRelation_Users_User_Current, ImmutableString(), HubURL("/me"),
                                  ImmutableString(), ImmutableString()});
        RFL::QueryInterface<DataServer>(server)->TakeLinksDocument(document);
        On("GET /me", JSONAnswer("{'zo:userId':'u1'}"));
    }
    InterfaceRef<Production> MakeProduction() {
        return Make<Production>("{'zo:productionId':'p1','links':[" + Lists("/p1") + "," +
                                LinkTo(kRelation_Sessions, "/p1/sessions") + "]}");
    }
    /// The session of one call; null when the call says that there is none.
    InterfaceRef<IZOCEditingSession> Create(bool inIsTemporary = false) {
        InterfaceRef<IZOCEditingSession> session;
        const bool isThere =
            MakeProduction()->CreateEditingSession(session, u"Mine", u"what for", inIsTemporary);
        EXPECT_EQ(isThere, bool(session));
        return session;
    }
    static std::string ItemOf(const std::string& inOwner, const std::string& inPath) {
        return "{'zo:sessionId':'x','zo:owner':'" + inOwner + "','links':[{'rel':'self','href':'" +
               HubURL(inPath).str() + "'}]}";
    }
};

TEST_F(EditingSessionTest, PushAndPullSendTheirFieldsInOrder) {
    struct Row {
        std::function<bool(IZOCEditingSession&, const Guid&, const RequestCompletion&)> start;
        const char* path;
        Fields fields;
    };
    const auto push = [](const UString& inMessage, int inStrategy, const UString& inCommit) {
        return [=](IZOCEditingSession& inSession, const Guid& inID, const RequestCompletion& inDone) {
            return inSession.Push(inID, inDone, inMessage, inStrategy, inCommit);
        };
    };
    const auto pull = [](int inStrategy, const UString& inCommit) {
        return [=](IZOCEditingSession& inSession, const Guid& inID, const RequestCompletion& inDone) {
            return inSession.Pull(inID, inDone, inStrategy, inCommit);
        };
    };
    const Row rows[] = {
        {push(u"m\u00e9", 0, u"c5"),
         "/s1/push",
         {{":commitMessage", "m\xC3\xA9"}, {":commitId", "c5"}, {":resolveStrategy", "NONE"}}},
        {push(u"", 1, u""), "/s1/push", {{":resolveStrategy", "AUTO"}}},
        {push(u"", 2, u""), "/s1/push", {{":resolveStrategy", ""}}},
        {pull(kMergeStrategy_None, u""), "/s1/pull", {{":mergeStrategy", ""}}},
        {pull(kMergeStrategy_Yours, u"c9"),
         "/s1/pull",
         {{":mergeStrategy", "accept-yours"}, {":commitId", "c9"}}},
        {pull(kMergeStrategy_Theirs, u""), "/s1/pull", {{":mergeStrategy", "accept-theirs"}}},
        {pull(kMergeStrategy_Interactive, u""), "/s1/pull", {{":mergeStrategy", "interactive"}}},
        {pull(kMergeStrategy_Safe, u""), "/s1/pull", {{":mergeStrategy", "safe"}}},
        {pull(5, u""), "/s1/pull", {{":mergeStrategy", ""}}},
    };
    const auto session = MakeSession();
    for (const Row& row : rows) {
        net->Expect("POST", HubURL(row.path).str(), JSONAnswer(SessionBody("c6")));
        Outcome outcome;
        const Guid id = Guid::CreateUnique();
        ASSERT_TRUE(row.start(*session, id, outcome.Function()));
        EXPECT_EQ(outcome.Wait(), kResultSuccess);
        EXPECT_EQ(outcome.ID(), id);
        EXPECT_EQ(LastRequest().requestID, id);
        EXPECT_TRUE(LastRequest().isForm);
        EXPECT_EQ(LastRequest().form, row.fields);
        EXPECT_EQ(LastRequest().CountHeader("If-Match"), 0u);
    }
    EXPECT_EQ(session->GetLoadedRevision().view(), "c5");
}

TEST_F(EditingSessionTest, PushTellsBehindAndChangedAndStartsNothingWithoutTheLink) {
    const auto session = MakeSession();
    for (const auto& [status, result] :
         {std::pair(409, kResultHTTPConflict), std::pair(412, kResultHTTPPreconditionFailed)}) {
        net->Expect("POST", "", ScriptedAnswer::Status(status));
        Outcome outcome;
        ASSERT_TRUE(session->Push(Guid::CreateUnique(), outcome.Function(), u"", 0, u""));
        EXPECT_EQ(outcome.Wait(), result);
    }
    Outcome never;
    const auto production = MakeProduction();
    EXPECT_FALSE(production->Push(Guid::CreateUnique(), never.Function(), u"", 0, u""));
    EXPECT_FALSE(production->Pull(Guid::CreateUnique(), never.Function(), 0, u""));
    net->Expect("GET", "", ScriptedAnswer::Status(500));
    bool changed = false;
    session->Refresh(changed, false);
    EXPECT_FALSE(session->Push(Guid::CreateUnique(), never.Function(), u"", 0, u"")) << "not loaded";
    EXPECT_EQ(never.Calls(), 0);
}

TEST_F(EditingSessionTest, TheUsersSessionIsFoundAgainAndAskedForItsLatestState) {
    On("GET /p1/sessions", JSONAnswer("{'sessions':[" + ItemOf("someone", "/other") + "," +
                                      ItemOf("u1", "/s1") + "," + ItemOf("u1", "/second") + "]}"));
    On("GET /s1", JSONAnswer(SessionBody("c5")));
    const auto session = Create();
    ASSERT_TRUE(session);
    EXPECT_EQ(RFL::QueryInterface<IZOCProduction>(session)->GetLoadedRevision().view(), "c5");
    EXPECT_TRUE(RFL::QueryInterface<IZOCProduction>(session)->IsEditingSession());
    EXPECT_TRUE(RFL::QueryInterface<IZOCWritableServerResource>(session)) << "it can be discarded";
    EXPECT_EQ(session->GetParentProductionIdentifier().view(), "p1");
    EXPECT_EQ(session->GetParentProduction()->GetIdentifier().view(), "p1");
    EXPECT_THAT(net->Lines(), ElementsAre("GET " + HubURL("/p1/sessions").str(), "GET " + HubURL("/me").str(),
                                          "GET " + HubURL("/s1").str()));
    On("GET /s1", JSONAnswer(SessionBody("c6"), "\"t2\""));
    const auto again = Create();
    EXPECT_EQ(again, session) << "the server gives out one object for a session";
    EXPECT_EQ(RFL::QueryInterface<IZOCProduction>(again)->GetLoadedRevision().view(), "c6");
    // It stands in the list and cannot be read: a second session would hide the first one's work.
    On("GET /s1", ScriptedAnswer::Status(500));
    EXPECT_FALSE(Create());
    EXPECT_EQ(CountOf("POST", "/p1/sessions"), 0u);
    EXPECT_TRUE(Traced("Failed to load the user's editing session, uri: " + HubURL("/s1").str()));
}

TEST_F(EditingSessionTest, WithoutOneOrForATemporaryOneANewSessionIsPosted) {
    On("POST /p1/sessions", JSONAnswer(SessionBody()).With("Location", HubURL("/s1").str()));
    for (const bool isTemporary : {false, true}) {
        net->ClearRequests();
        On("GET /p1/sessions", isTemporary ? JSONAnswer("{'sessions':[" + ItemOf("u1", "/s1") + "]}")
                                           : JSONAnswer("{'sessions':[]}"));
        ASSERT_TRUE(Create(isTemporary));
        EXPECT_EQ(LastRequest().body, Quote("{'name':'Mine','description':'what for','isTemporary':") +
                                          (isTemporary ? "true}" : "false}"));
        EXPECT_EQ(LastRequest().Header("Content-Type"), "application/json;charset=utf-8");
        EXPECT_EQ(Requests(), isTemporary ? 1u : 2u) << "nothing is looked for, and nothing loaded again";
    }
    // A list that cannot be read leads on to the factory, too.
    On("GET /p1/sessions", ScriptedAnswer::Status(503));
    EXPECT_TRUE(Create());
    InterfaceRef<IZOCEditingSession> none;
    EXPECT_FALSE(Make<Production>("{}")->CreateEditingSession(none, u"", u"", false));
}

TEST_F(EditingSessionTest, EveryOtherAnswerOfTheFactory) {
    struct Row {
        ScriptedAnswer answer;
        bool isThere;
        const char* trace;
    };
    const std::string url = HubURL("/elsewhere").str();
    const Row rows[] = {
        {ScriptedAnswer::Status(302).With("Location", url), true, nullptr},
        {ScriptedAnswer::Status(303).With("Location", HubURL("/gone").str()), false,
         "Failed to create production for editing session (redirected from url), uri: "
         "http://hub.test:60138/gone"},
        {ScriptedAnswer::Status(302).With("X-Mark", "seen"), false,
         "Server redirect response did not contain a Location: header, httpHeaders: X-Mark: seen"},
        {ScriptedAnswer::Body("no json", "text/plain"), false,
         "Failed to create production from response, httpStatusCode: 200, httpLibCode: 0, payload: no json"},
        {ScriptedAnswer::Body("denied", "text/plain", 403), false,
         "Failed to create editing session from factory, httpStatusCode: 403, httpLibCode: 0, payload: "
         "denied"},
        {ScriptedAnswer::NoResponse(), false,
         "Failed to create editing session from factory, httpStatusCode: 0, httpLibCode: 7"},
        {ScriptedAnswer::NullResponse(), false,
         "Failed to create editing session using factory URL; no response from server, httpStatusCode: -2, "
         "httpLibCode: 0, payload: NULL http response"},
    };
    On("GET /elsewhere", JSONAnswer(SessionBody()));
    for (const Row& row : rows) {
        On("POST /p1/sessions", row.answer);
        EXPECT_EQ(bool(Create(true)), row.isThere) << (row.trace ? row.trace : "redirect");
        EXPECT_TRUE(!row.trace || Traced(row.trace)) << row.trace;
    }
    EXPECT_THAT(Assertions(), testing::Contains(HasSubstr("no response from server")));
}

TEST_F(EditingSessionTest, AllSessionsAreLoadedAndThoseThatWentMeanwhileLeftOut) {
    On("GET /p1/sessions",
       JSONAnswer("{'sessions':[" + ItemOf("a", "/s1") + "," + ItemOf("b", "/gone") + "]}"));
    On("GET /s1", JSONAnswer(SessionBody()));
    const auto load = [this](std::vector<InterfaceRef<IZOCProduction>>& outSessions) {
        ostcore::threads::Gate gate;
        int result = 1;
        EXPECT_TRUE(GetEditingSessionList(MakeProduction(), [&](int inResult, const auto& inSessions) {
            result = inResult;
            outSessions = inSessions;
            gate.Open();
        }));
        EXPECT_TRUE(ostcore::threads::Gate::PassThrough(gate, 20000));
        return result;
    };
    std::vector<InterfaceRef<IZOCProduction>> sessions;
    EXPECT_EQ(load(sessions), kResultSuccess);
    ASSERT_EQ(sessions.size(), 1u);
    EXPECT_EQ(sessions.front()->GetIdentifier().view(), "s1");
    On("GET /gone", ScriptedAnswer::Status(500));
    EXPECT_EQ(load(sessions), kResultHTTPInternalServerError);
    EXPECT_EQ(sessions.size(), 1u);
    On("GET /p1/sessions", JSONAnswer("{'sessions':[" + ItemOf("a", "/s1") +
                                      "],'links':[{'rel':'next','href':'" + HubURL("/page2").str() + "'}]}"));
    On("GET /page2", JSONAnswer("{'sessions':[" + ItemOf("b", "/s2") + "],'links':[{'rel':'next','href':'" +
                                HubURL("/p1/sessions").str() + "'}]}"));
    On("GET /s2", JSONAnswer("{'zo:sessionId':'s2'}"));
    EXPECT_EQ(load(sessions), kResultSuccess);
    ASSERT_EQ(sessions.size(), 2u);
    EXPECT_EQ(sessions.back()->GetIdentifier().view(), "s2");
    On("GET /p1/sessions", ScriptedAnswer::Status(403));
    EXPECT_EQ(load(sessions), kResultHTTPForbidden);
    EXPECT_TRUE(sessions.empty());
    EXPECT_FALSE(GetEditingSessionList(Make<Production>("{}"), [](int, const auto&) {}));
    EXPECT_FALSE(GetEditingSessionList(nullptr, [](int, const auto&) {}));
}

TEST_F(EditingSessionTest, ChangesStandBehindTheirLinks) {
    const auto session = MakeSession();
    const auto url = [](const InterfaceRef<IZOCDifferences>& inDifferences) {
        return RFL::QueryInterface<IZOCServerResource>(inDifferences)->GetHTTPURL();
    };
    EXPECT_EQ(url(session->GetOutgoingChanges()), HubURL("/s1/out"));
    EXPECT_EQ(url(session->GetIncomingChanges()), HubURL("/s1/in"));
    EXPECT_FALSE(MakeProduction()->GetOutgoingChanges());
    EXPECT_FALSE(MakeProduction()->GetProductionHistory());
    EXPECT_EQ(Requests(), 0u);
}

}  // namespace
}  // namespace ZOCL
