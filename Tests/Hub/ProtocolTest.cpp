// Runs the examples of the protocol's document against a real hub.
#include <sstream>

#include "HubFixture.h"

namespace zohub::test {

namespace {

struct Example {
    int line = 0;
    std::vector<std::string> request;
    std::vector<std::string> answer;
    std::vector<std::string> captures;
};

std::string WithoutMark(std::string const& inLine) {
    return inLine.size() > 2 ? inLine.substr(2) : std::string();
}

std::vector<Example> ReadExamples(std::string const& inDocument) {
    std::vector<Example> examples;
    std::istringstream lines(inDocument);
    bool isInside = false;
    int number = 0;
    for (std::string line; std::getline(lines, line);) {
        ++number;
        if (line == "```hub-example") {
            isInside = true;
            examples.push_back({number, {}, {}, {}});
        } else if (line.rfind("```", 0) == 0) {
            isInside = false;
        } else if (isInside) {
            auto& example = examples.back();
            auto& target = line[0] == '>'   ? example.request
                           : line[0] == '<' ? example.answer
                                            : example.captures;
            target.push_back(WithoutMark(line));
        }
    }
    return examples;
}

// "*" stands for any text.
bool TextMatches(std::string const& inPattern, std::string const& inText) {
    std::size_t const star = inPattern.find('*');
    if (star == std::string::npos)
        return inPattern == inText;
    if (inText.compare(0, star, inPattern, 0, star) != 0)
        return false;
    std::string const rest = inPattern.substr(star + 1);
    for (std::size_t at = star; at <= inText.size(); ++at)
        if (TextMatches(rest, inText.substr(at)))
            return true;
    return false;
}

// Everything expected is there; more may be.
bool Contains(Json const& inActual, Json const& inExpected) {
    if (inExpected.is_string())
        return inActual.is_string() &&
               TextMatches(inExpected.get<std::string>(), inActual.get<std::string>());
    if (inExpected.is_object()) {
        for (auto const& [key, value] : inExpected.items())
            if (!inActual.is_object() || !inActual.contains(key) || !Contains(inActual[key], value))
                return false;
        return true;
    }
    if (!inExpected.is_array())
        return inActual == inExpected;
    if (!inActual.is_array() || (inExpected.empty() && !inActual.empty()))
        return false;
    return std::all_of(inExpected.begin(), inExpected.end(), [&](Json const& inItem) {
        return std::any_of(inActual.begin(), inActual.end(),
                           [&](Json const& a) { return Contains(a, inItem); });
    });
}

class Conversation {
public:
    explicit Conversation(Client inClient) : mClient(std::move(inClient)) {}

    void Run(Example const& inExample) {
        SCOPED_TRACE("example at line " + std::to_string(inExample.line));
        Answer const answer = Ask(inExample.request);
        Compare(answer, inExample.answer);
        for (auto const& capture : inExample.captures)
            Capture(answer, capture);
    }

private:
    std::string Fill(std::string inText) const {
        for (auto const& [name, value] : mNames)
            for (std::size_t at; (at = inText.find("${" + name + "}")) != std::string::npos;)
                inText.replace(at, name.size() + 3, value);
        EXPECT_EQ(inText.find("${"), std::string::npos) << inText;
        return inText;
    }

    Answer Ask(std::vector<std::string> const& inLines) {
        std::string const first = Fill(inLines.at(0));
        std::size_t const space = first.find(' ');
        Client::Headers headers;
        std::size_t i = 1;
        for (; i < inLines.size() && !inLines[i].empty(); ++i) {
            std::string const line = Fill(inLines[i]);
            std::size_t const colon = line.find(": ");
            headers[line.substr(0, colon)] = line.substr(colon + 2);
        }
        std::string body;
        for (++i; i < inLines.size(); ++i)
            body += (body.empty() ? "" : "\r\n") + Fill(inLines[i]);
        return mClient.Request(first.substr(0, space), first.substr(space + 1), body, headers);
    }

    void Compare(Answer const& inAnswer, std::vector<std::string> const& inLines) {
        EXPECT_EQ(std::to_string(inAnswer.status), inLines.at(0)) << inAnswer.body;
        std::size_t i = 1;
        for (; i < inLines.size() && !inLines[i].empty(); ++i) {
            std::size_t const colon = inLines[i].find(": ");
            std::string name = inLines[i].substr(0, colon);
            std::transform(name.begin(), name.end(), name.begin(),
                           [](unsigned char c) { return std::tolower(c); });
            EXPECT_FALSE(inAnswer.Header(name).empty()) << name;
            EXPECT_TRUE(TextMatches(inLines[i].substr(colon + 2), inAnswer.Header(name)))
                << name << ": " << inAnswer.Header(name);
        }
        for (++i; i < inLines.size(); ++i) {
            EXPECT_TRUE(Contains(Json::parse(inAnswer.body), Json::parse(Fill(inLines[i]))))
                << inLines[i] << "\n is not in\n"
                << inAnswer.body;
        }
    }

    void Capture(Answer const& inAnswer, std::string const& inLine) {
        std::istringstream words(inLine);
        std::string name, kind, what, where;  // a JSON pointer to the object that has it
        words >> name >> kind >> what >> where;
        std::string value;
        if (kind == "link")
            value = LinkOf(Json::parse(inAnswer.body).at(Json::json_pointer(where)), what);
        else if (kind == "member")
            value = Json::parse(inAnswer.body).at(Json::json_pointer(where)).at(what).get<std::string>();
        else if (kind == "header")
            value = inAnswer.Header(what);
        else if (kind == "cookie")
            value = inAnswer.Header("set-cookie").substr(0, inAnswer.Header("set-cookie").find(';') + 1);
        EXPECT_FALSE(value.empty()) << inLine;
        mNames[name] = value;
    }

    Client const mClient;
    std::map<std::string, std::string> mNames;
};

}  // namespace

class ProtocolTest : public HubTest {};

TEST_F(ProtocolTest, TheExamplesOfTheDocumentAreTrue) {
    auto const examples = ReadExamples(ReadFile(ZOHUB_PROTOCOL_DOCUMENT));
    ASSERT_GE(examples.size(), 25u);
    // A fresh client: the examples sign in by themselves, and see one login besides the fixture's.
    Conversation conversation{Client(mHub.Port())};
    for (auto const& example : examples)
        conversation.Run(example);
}

TEST(ProtocolExamples, AreComparedStrictlyEnoughToFail) {
    Json const actual = Json::parse(R"({"a":[{"b":"text"},{"c":2}],"d":[1]})");
    EXPECT_TRUE(Contains(actual, Json::parse(R"({"a":[{"c":2}]})")));
    EXPECT_TRUE(Contains(actual, Json::parse(R"({"a":[{"b":"t*t"}]})")));
    for (char const* wrong : {R"({"a":[{"c":3}]})", R"({"e":1})", R"({"d":[]})", R"({"a":[{"b":"t*x"}]})"})
        EXPECT_FALSE(Contains(actual, Json::parse(wrong))) << wrong;
}

}  // namespace zohub::test
