// Faults on purpose: what a client sees of each action, which requests a rule takes, and what a script says
// about itself when it is wrong.
#include <chrono>
#include <regex>

#include "Faults/FaultInjector.h"
#include "HubFixture.h"

namespace zohub::test {

namespace {

using std::chrono::milliseconds;

// A hub that follows a script, with one user.
class FaultyHub : public RunningHub {
public:
    explicit FaultyHub(std::string const& inScript) : RunningHub({}, inScript) {
        AddUser("anna", "anna-secret");
    }
};

// "200", "cut", or "cut after N" with what came of the answer.
std::string OutcomeOfHealth(std::uint16_t inPort) {
    RawConnection connection(inPort);
    connection.Send("GET /health?key=secret HTTP/1.1\r\nHost: h\r\n\r\n");
    try {
        Answer const answer = connection.Receive();
        return std::to_string(answer.status) + " " + answer.body;
    } catch (std::exception const&) {
        return "cut";
    }
}

std::size_t CountProductions(Client const& inClient) {
    return Json::parse(inClient.Get("/zo/1/p").body)["productions"].size();
}

std::string ErrorOf(std::string const& inScript) {
    try {
        ParseFaultScript(inScript, "my.faults");
        return "none";
    } catch (FaultScriptError const& error) {
        return error.what();
    }
}

constexpr char kProduction[] = R"({"name":"Film","description":""})";
constexpr char kHealthy[] = R"(200 {"status":"ok"})";

}  // namespace

TEST(Faults, EachActionIsSeenAsItIsDescribedAndOnce) {
    struct Case {
        char const* action;
        char const* outcome;  // a regular expression
    };
    std::vector<Case> const cases = {
        {"refuse", "cut"},
        {"delay 20ms", "200 .*ok.*"},
        {"drop-reply", "cut"},
        {"reset-in-body", "cut"},
        {"reset-in-body at 1000000", "cut"},
        {"truncate at 3", "cut"},
        {"stall 20ms at 3", "cut"},
        {"trickle 16 1ms", "200 .*ok.*"},
        {"garbage", "cut"},
        {"answer 503 retry-after Wed, 21 Oct 2037 07:28:00 GMT", "503 .*injected.*"},
        {"answer 304", "304 "},
        {"answer-after-work 500", "500 .*injected.*"},
    };
    for (auto const& c : cases) {
        FaultyHub hub(std::string("on GET path /health nth 2 do ") + c.action);
        EXPECT_EQ(OutcomeOfHealth(hub.Port()), kHealthy) << c.action;
        std::string const outcome = OutcomeOfHealth(hub.Port());
        EXPECT_TRUE(std::regex_match(outcome, std::regex(c.outcome))) << c.action << ": " << outcome;
        EXPECT_EQ(OutcomeOfHealth(hub.Port()), kHealthy) << c.action;
        EXPECT_EQ(hub.ToldFaults(),
                  std::vector<std::string>{std::string("line 1: ") + c.action + ": GET /health"});
    }
}

TEST(Faults, WhatIsCutHasAHeadAndAPartOfTheBodyAndItsConnectionEnds) {
    FaultyHub hub("on GET path /health do truncate at 3");
    RawConnection connection(hub.Port());
    connection.Send("GET /health HTTP/1.1\r\nHost: h\r\n\r\n");
    try {
        connection.Receive();
        ADD_FAILURE() << "the answer came whole";
    } catch (std::exception const&) {
    }
    EXPECT_TRUE(connection.IsClosedWithin(milliseconds(5000)));

    FaultyHub late("on GET path /health nth 1 do answer 503 retry-after 7");
    EXPECT_EQ(Client(late.Port()).Get("/health").Header("retry-after"), "7");
}

TEST(Faults, TheWorkIsDoneBehindALostAnswerAndTheKeyBringsItBack) {
    for (std::string const action : {"drop-reply", "reset-in-body", "answer-after-work 502"}) {
        FaultyHub hub("on POST rel /productions nth 1 do " + action);
        Client const anna = hub.SignedIn("anna");
        Client::Headers const key = {{"Idempotency-Key", "k1"}};
        try {
            EXPECT_EQ(anna.PostJson("/zo/1/p", kProduction, key).status, 502) << action;
        } catch (std::exception const&) {
            EXPECT_NE(action, "answer-after-work 502");
        }
        EXPECT_EQ(CountProductions(anna), 1u) << action;
        EXPECT_EQ(anna.PostJson("/zo/1/p", kProduction, key).status, 201) << action;
        EXPECT_EQ(CountProductions(anna), 1u) << action;
    }
    for (std::string const action : {"refuse", "answer 412"}) {
        FaultyHub hub("on POST rel /productions nth 1 do " + action);
        Client const anna = hub.SignedIn("anna");
        try {
            EXPECT_EQ(anna.PostJson("/zo/1/p", kProduction).status, 412) << action;
        } catch (std::exception const&) {
            EXPECT_EQ(action, "refuse");
        }
        EXPECT_EQ(CountProductions(anna), 0u) << action;
    }
}

TEST(Faults, ATokenDiesUnderALargeEnoughFormAndStaysDead) {
    FaultyHub hub("on POST anywhere parts 3 nth 1 do expire-token");
    Client const anna = hub.SignedIn("anna");
    Form two;
    two.Add(":id", "a").Add(":medialocator", "{}");
    EXPECT_EQ(anna.SendForm("POST", "/zo/1/l", two).status, 201);
    Form three = two;
    three.Add("more", "x");
    EXPECT_EQ(anna.SendForm("POST", "/zo/1/l", three).status, 401);
    EXPECT_EQ(anna.Get("/zo/1/p").status, 401);
    EXPECT_EQ(hub.SignedIn("anna").Get("/zo/1/p").status, 200);
}

TEST(Faults, RulesCountAndDrawWhatTheyAreMeantFor) {
    auto const pattern = [](std::string const& inScript, char const* inPath = "/health") {
        FaultInjector injector(ParseFaultScript(inScript, "s"), nullptr, [](std::string const&) {});
        Request request;
        request.method = "GET";
        request.target = inPath;
        request.segments = SplitPattern(inPath);
        std::string hits;
        for (int i = 0; i < 12; ++i) {
            FaultPlan const plan = injector.PlanFor(request);
            hits += plan.insteadOfWork ? std::to_string(plan.insteadOfWork->status % 10) : "-";
        }
        return hits;
    };
    EXPECT_EQ(pattern("on any anywhere nth 3 do answer 501"), "--1---------");
    EXPECT_EQ(pattern("on any anywhere first 3 do answer 501"), "111---------");
    EXPECT_EQ(pattern("on any anywhere from 10 do answer 501"), "---------111");
    EXPECT_EQ(pattern("on any anywhere every 4 do answer 501"), "---1---1---1");
    EXPECT_EQ(pattern("on any anywhere nth 2 do answer 501\non any anywhere first 3 do answer 502"),
              "212---------");
    EXPECT_EQ(pattern("on POST anywhere do answer 501"), "------------");
    EXPECT_EQ(pattern("on any anywhere chance 0% do answer 501"), "------------");
    EXPECT_EQ(pattern("on any anywhere chance 100% do answer 501"), "111111111111");
    std::string const drawn = pattern("on any anywhere chance 50% do answer 501");
    EXPECT_EQ(drawn, pattern("seed 1\non any anywhere chance 50% do answer 501"));
    EXPECT_NE(drawn, pattern("seed 2\non any anywhere chance 50% do answer 501"));
    EXPECT_NE(drawn.find('1'), std::string::npos);
    EXPECT_NE(drawn.find('-'), std::string::npos);

    auto const takes = [&](std::string const& inWhere, char const* inPath) {
        return pattern("on any " + inWhere + " do answer 501", inPath)[0] == '1';
    };
    EXPECT_TRUE(takes("path /zo/*/p/**", "/zo/1/p/x/a/y"));
    EXPECT_TRUE(takes("path /zo/*/p/**", "/zo/1/p/x"));
    EXPECT_FALSE(takes("path /zo/*/p", "/zo/1/p/x"));
    EXPECT_FALSE(takes("path /zo/*/p/x", "/zo/1/p"));
    EXPECT_TRUE(takes("rel /assets", "/zo/1/p/x/at/c/a"));
    EXPECT_FALSE(takes("rel /assets", "/zo/1/p/x/a/y"));
    EXPECT_FALSE(takes("rel /assets/asset#create", "/zo/1/p/x/a"));
    EXPECT_TRUE(takes("rel accept-theirs", "/zo/1/p/x/accept-theirs"));
}

TEST(Faults, AScriptThatIsWrongSaysWhereAndWhatBelongsThere) {
    struct Case {
        char const* script;
        char const* line;
        char const* expected;
    };
    std::vector<Case> const cases = {
        {"# good\n\non GET anywhere do refuse\nof GET", "line 4", "'on'"},
        {"on get anywhere do refuse", "line 1", "a method"},
        {"on GET", "line 1", "'anywhere', 'path' or 'rel', but the line ends"},
        {"on GET path zo do refuse", "line 1", "a path"},
        {"on GET path /a/**/b do refuse", "line 1", "a path"},
        {"on GET rel /nowhere do refuse", "line 1", "a link relation"},
        {"on GET anywhere parts 0 do refuse", "line 1", "form parts"},
        {"on GET anywhere nth 0 do refuse", "line 1", "a number from 1 on"},
        {"on GET anywhere nth -1 do refuse", "line 1", "a number from 1 on"},
        {"on GET anywhere nth 1x do refuse", "line 1", "a number from 1 on"},
        {"on GET anywhere chance 101% do refuse", "line 1", "0% to 100%"},
        {"on GET anywhere chance nan% do refuse", "line 1", "0% to 100%"},
        {"on GET anywhere chance 5 do refuse", "line 1", "0% to 100%"},
        {"on GET anywhere refuse", "line 1", "'do', but there is 'refuse'"},
        {"on GET anywhere do explode", "line 1", "an action"},
        {"on GET anywhere do delay 5", "line 1", "a time"},
        {"on GET anywhere do delay 601s", "line 1", "a time"},
        {"on GET anywhere do delay 99999999999999999999ms", "line 1", "a time"},
        {"on GET anywhere do answer 99", "line 1", "a status"},
        {"on GET anywhere do answer 503 retry-after", "line 1", "Retry-After"},
        {"on GET anywhere do trickle 0 1s", "line 1", "a number of bytes"},
        {"on GET anywhere do truncate at", "line 1", "a number of bytes, but the line ends"},
        {"on GET anywhere do refuse now", "line 1", "the end of the line, but there is 'now'"},
        {"seed x", "line 1", "a number"},
    };
    for (auto const& c : cases) {
        std::string const error = ErrorOf(c.script);
        EXPECT_NE(error.find(std::string("my.faults, ") + c.line), std::string::npos) << error;
        EXPECT_NE(error.find(c.expected), std::string::npos) << error;
    }
    EXPECT_EQ(ErrorOf("# nothing\n \t# at all\non GET rel /assets#full do refuse # why"), "none");
}

TEST(Faults, TheExamplesOfTheDocumentHold) {
    std::string const document = ReadFile(ZOHUB_FAULTS_DOCUMENT);
    std::regex const block("```hub-faults\n([^`]*)```");
    std::vector<std::string> scripts;
    for (std::sregex_iterator at(document.begin(), document.end(), block), end; at != end; ++at)
        scripts.push_back((*at)[1]);
    ASSERT_EQ(scripts.size(), 5u);
    for (auto const& script : scripts)
        EXPECT_EQ(ErrorOf(script), "none") << script;
    // The last one tells what comes of six requests.
    FaultyHub hub(scripts.back());
    std::string outcomes;
    for (int i = 0; i < 7; ++i)
        outcomes += OutcomeOfHealth(hub.Port()).substr(0, 3) + " ";
    EXPECT_EQ(outcomes, "cut cut cut cut 500 cut 200 ");
    // The second one: a hub that has fallen over, whoever asks.
    FaultyHub fallen(scripts[1]);
    outcomes.clear();
    for (int i = 0; i < 4; ++i)
        outcomes += OutcomeOfHealth(fallen.Port()).substr(0, 3) + " ";
    EXPECT_EQ(outcomes, "503 503 503 200 ");
}

}  // namespace zohub::test
