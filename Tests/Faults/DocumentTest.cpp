// Documents that are cut, too deep, badly encoded, or of other types than they should be, over sound HTTP.
#include <cctype>

#include "Client.h"
#include "Picture.h"

namespace faults {
namespace {

class BadDocument : public FaultTest {
protected:
    void SetUp() override {
        FaultTest::SetUp();
        mServer = SignIn(mHub);
        mProduction = LoadProduction(mServer, mHub);
        for (const Step step : kLoadSteps) {
            mEmpty[step] = PictureOf(step, Fresh(step));
            const auto resource = Fresh(step);
            EXPECT_EQ(mClient.Load(resource).result, ZOCL::kResultSuccess);
            mWhole[step] = PictureOf(step, resource);
            EXPECT_NE(mWhole[step], mEmpty[step]);
        }
    }
    void TearDown() override {
        mProduction = nullptr;
        mServer = nullptr;
        FaultTest::TearDown();
    }
    InterfaceRef<IZOCServerResource> Fresh(Step inStep) {
        return ResourceOf(inStep, mServer, mProduction, mHub);
    }
    /// Loads the body as the document of the step. Unloaded must mean that nothing of it is bound.
    bool LoadBody(Step inStep, const std::string& inBody, std::string& outPicture) {
        mHub.ChangeBody(inStep, inBody);
        const auto resource = Fresh(inStep);
        const Outcome outcome = mClient.Load(resource);
        EXPECT_EQ(outcome.result, ZOCL::kResultSuccess) << "the exchange itself is sound";
        outPicture = PictureOf(inStep, resource);
        if (!resource->IsLoaded()) {
            EXPECT_EQ(outPicture, mEmpty[inStep]) << "half bound";
            EXPECT_TRUE(resource->GetResponseData()) << "the bytes stay for a diagnosis";
        }
        return resource->IsLoaded();
    }
    /// In the middle of a login the document of a step can only end it or not.
    Outcome ConnectWithBody(Step inStep, const std::string& inBody) {
        mHub.ChangeBody(inStep, inBody);
        const Outcome outcome = mClient.Connect(mHub.URL(""));
        EXPECT_EQ(static_cast<bool>(outcome.server), outcome.result == ZOCL::kResultSuccess);
        mHub.BeGood();
        return outcome;
    }

    BadHub mHub;
    InterfaceRef<IZOCDataServer> mServer;
    InterfaceRef<IZOCProduction> mProduction;
    std::map<Step, std::string> mEmpty;
    std::map<Step, std::string> mWhole;
};

TEST_F(BadDocument, CutAtAnyByteEndsTheConnect) {
    for (const Step step : {Step::kDiscovery, Step::kLinks, Step::kSignedInLinks}) {
        const std::string body = mHub.GoodAnswer(step).body;
        for (std::size_t at = 0; at < body.size(); ++at) {
            const Outcome outcome = ConnectWithBody(step, body.substr(0, at));
            ASSERT_EQ(outcome.result, ZOCL::kResultFailure) << NameOf(step) << " cut at " << at;
        }
    }
}

TEST_F(BadDocument, CutAtAnyByteIsNeverBound) {
    for (const Step step : kLoadSteps) {
        const std::string body = mHub.GoodAnswer(step).body;
        std::string picture;
        for (std::size_t at = 1; at < body.size(); ++at) {
            ASSERT_FALSE(LoadBody(step, body.substr(0, at), picture)) << NameOf(step) << " cut at " << at;
        }
        EXPECT_TRUE(LoadBody(step, "", picture)) << "an empty body is one of default fields";
    }
}

TEST_F(BadDocument, NestedWithoutEndIsRefused) {
    constexpr std::size_t kDepth = 100000;
    std::string objects, closing;
    for (std::size_t i = 0; i < kDepth; ++i) {
        objects += R"({"properties":)";
        closing += '}';
    }
    const std::string bodies[] = {
        std::string(kDepth, '['), std::string(kDepth, '[') + std::string(kDepth, ']'), objects,
        objects + "1" + closing, R"({"stats":)" + std::string(kDepth, '[') + std::string(kDepth, ']') + "}"};
    for (const std::string& body : bodies) {
        std::string picture;
        for (const Step step : kLoadSteps) {
            EXPECT_FALSE(LoadBody(step, body, picture)) << NameOf(step) << ": " << body.substr(0, 20);
        }
        for (const Step step : {Step::kDiscovery, Step::kLinks, Step::kSignedInLinks}) {
            EXPECT_EQ(ConnectWithBody(step, body).result, ZOCL::kResultFailure) << NameOf(step);
        }
    }
}

/// Puts a value in the place of another one, wherever it stands in the document.
std::string Replaced(std::string inText, const std::string& inFrom, const std::string& inTo) {
    const auto at = inText.find(inFrom);
    EXPECT_NE(at, std::string::npos) << inFrom;
    return inText.replace(at, inFrom.size(), inTo);
}

TEST_F(BadDocument, TextThatIsNoTextHasADefinedEnd) {
    const std::pair<std::string, bool> names[] = {
        {"\"\xff\xfe\"", false},
        {"\"\xc0\xaf\"", false},
        {"\"\xed\xa0\x80\"", false},
        {"\"\xf4\x90\x80\x80\"", false},
        {"\"\xe2\x82\"", false},
        {R"("\ud800")", false},
        {R"("\udc00\ud800")", false},
        {R"("\ud800x")", false},
        {R"("\u00")", false},
        {R"("\x41")", false},
        {std::string("\"a\0b\"", 5), false},
        {"\"a\nb\"", false},
        {"'One'", false},
        {R"("a\u0000b")", true},
        {R"("\ud83d\ude00")", true},
    };
    const std::map<Step, std::string> placesOfNames{{Step::kProductions, R"("One")"},
                                                    {Step::kProduction, R"("One")"},
                                                    {Step::kAssets, R"("Clip 2")"},
                                                    {Step::kEnclosures, R"("notes")"}};
    for (const auto& [step, place] : placesOfNames) {
        for (const auto& [name, isText] : names) {
            std::string picture;
            const std::string body = Replaced(mHub.GoodAnswer(step).body, place, name);
            EXPECT_EQ(LoadBody(step, body, picture), isText) << NameOf(step) << ": " << name;
        }
    }
    for (const auto& [name, isText] : names) {
        const std::string body = Replaced(mHub.GoodAnswer(Step::kDiscovery).body, R"("Faulty")", name);
        EXPECT_EQ(ConnectWithBody(Step::kDiscovery, body).result == ZOCL::kResultSuccess, isText) << name;
    }
}

TEST_F(BadDocument, ARepeatedKeyCountsAsItsLast) {
    std::string picture;
    const std::string production = mHub.GoodAnswer(Step::kProduction).body;
    EXPECT_TRUE(LoadBody(Step::kProduction,
                         Replaced(production, R"("owner":"ann")", R"("owner":"eve","owner":"ann")"),
                         picture));
    EXPECT_EQ(picture, mWhole[Step::kProduction]);
    const std::string assets = mHub.GoodAnswer(Step::kAssets).body;
    EXPECT_TRUE(LoadBody(Step::kAssets,
                         Replaced(assets, R"("name":"Clip 1")", R"("name":"Eve","name":"Clip 1")"), picture));
    EXPECT_EQ(picture, mWhole[Step::kAssets]);
    // Whichever of the two has the wrong type, no accessor may stumble over it afterwards.
    for (const auto& [step, sound] :
         {std::pair(Step::kProduction, R"("name":"One")"), std::pair(Step::kAssets, R"("zo:assetId":"a1")"),
          std::pair(Step::kAssets, R"("name":"Clip 1")"),
          std::pair(Step::kProductions, R"("zo:owner":"ann")"),
          std::pair(Step::kEnclosures, R"("name":"notes")")}) {
        const std::string pair(sound), wrong = pair.substr(0, pair.find(':', 5) + 1) + "7";
        const std::string body = mHub.GoodAnswer(step).body;
        const bool wrongFirst = LoadBody(step, Replaced(body, pair, wrong + "," + pair), picture);
        EXPECT_TRUE(!wrongFirst || picture == mWhole[step]) << pair;
        EXPECT_FALSE(LoadBody(step, Replaced(body, pair, pair + "," + wrong), picture)) << pair;
    }
}

/// A member of one of our documents: its key and where its value stands.
struct Member {
    std::string key;
    std::size_t begin;
    std::size_t end;
};

std::size_t EndOfValue(const std::string& inText, std::size_t inAt) {
    int depth = 0;
    bool inString = false;
    for (std::size_t at = inAt; at < inText.size(); ++at) {
        const char c = inText[at];
        if (inString) {
            at += c == '\\' ? 1 : 0;
            inString = c != '"';
        } else if (c == '"') {
            inString = true;
        } else if (c == '{' || c == '[') {
            ++depth;
        } else if (depth == 0 && (c == ',' || c == '}' || c == ']')) {
            return at;
        } else if (c == '}' || c == ']') {
            --depth;
        }
    }
    return inText.size();
}

std::vector<Member> MembersOf(const std::string& inText) {
    std::vector<Member> members;
    for (std::size_t at = inText.find("\":"); at != std::string::npos; at = inText.find("\":", at + 1)) {
        const std::size_t open = inText.rfind('"', at - 1);
        members.push_back({inText.substr(open + 1, at - open - 1), at + 2, EndOfValue(inText, at + 2)});
    }
    return members;
}

/// The kinds of value as the first character tells them.
char KindOf(const std::string& inValue) {
    const char first = inValue.front();
    if (first == 't' || first == 'f') {
        return 'b';
    }
    return std::isdigit(static_cast<unsigned char>(first)) || first == '-' ? '0' : first;
}

TEST_F(BadDocument, AnyWrongTypeFailsTheWhole) {
    const std::string values[] = {R"("text")", "7",   "-1", "1e999", "123456789012345678901234567890",
                                  "true",      "[]",  "{}", "[[]]",  "[null]",
                                  "[1]",       "[{}]"};
    std::size_t tried = 0;
    for (const Step step : kLoadSteps) {
        const std::string body = mHub.GoodAnswer(step).body;
        for (const Member& member : MembersOf(body)) {
            const std::string sound = body.substr(member.begin, member.end - member.begin);
            const bool isFree = member.key == "x:unknown" || member.key == "stats" || member.key == "count";
            for (const std::string& value : values) {
                std::string bad = body, picture;
                bad.replace(member.begin, member.end - member.begin, value);
                const bool isLoaded = LoadBody(step, bad, picture);
                ++tried;
                if (!isFree && KindOf(value) != KindOf(sound)) {
                    EXPECT_FALSE(isLoaded) << NameOf(step) << ", " << member.key << ": " << value;
                }
            }
        }
    }
    EXPECT_GT(tried, 900u);
}

TEST_F(BadDocument, AnyWrongTypeLeavesTheConnectADefinedEnd) {
    const std::string values[] = {"null", R"("text")", "-1",   "1e999",  "true",
                                  "[]",   "{}",        "[[]]", "[null]", "[1]"};
    for (const Step step : {Step::kDiscovery, Step::kLinks, Step::kSignedInLinks}) {
        const std::string body = mHub.GoodAnswer(step).body;
        for (const Member& member : MembersOf(body)) {
            for (const std::string& value : values) {
                std::string bad = body;
                bad.replace(member.begin, member.end - member.begin, value);
                const Outcome outcome = ConnectWithBody(step, bad);
                if (outcome.server) {
                    EXPECT_TRUE(
                        outcome.server
                            ->GetLink(ImmutableString("http://ns.meridane.example/zo/rel/system/logout"))
                            .size() > 0)
                        << "signed in without the link that says so";
                }
            }
        }
    }
}

TEST_F(BadDocument, SaysWhyInTheTraceWithoutQuotingIt) {
    std::string picture;
    const std::string text = "text-of-the-body";
    const std::string list = mHub.GoodAnswer(Step::kProductions).body;
    EXPECT_FALSE(LoadBody(Step::kProductions, Replaced(list, R"("One")", "[\"" + text + "\"]"), picture));
    EXPECT_TRUE(WasTraced("while parsing JSON"));
    ConnectWithBody(Step::kDiscovery, R"({"server":{"name":[")" + text + R"("]}})");
    EXPECT_TRUE(WasTraced("service document cannot be read"));
    EXPECT_FALSE(WasTraced(text));
    // A production without its lists is traced with its body, as far as that holds no secret.
    const std::string echo = R"({"properties":7,"note":"login-token=)" + std::string(kTokenValue) +
                             R"(;","j_password":")" + kPassword + R"("})";
    EXPECT_FALSE(LoadBody(Step::kProduction, echo, picture));
    EXPECT_TRUE(WasTraced("[hidden]"));
}

}  // namespace
}  // namespace faults
