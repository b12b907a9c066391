// The command line against the table, and addresses as people type them.
#include <gtest/gtest.h>

#include <set>

#include "Arguments.h"
#include "Failure.h"
#include "ServerAddress.h"

namespace zo {
namespace {

Arguments Parse(const std::vector<std::string>& inWords) {
    return Arguments::Parse(inWords);
}

ExitCode Refusal(const std::vector<std::string>& inWords) {
    try {
        Parse(inWords);
    } catch (const Failure& failure) {
        EXPECT_NE(std::string(failure.what()), "");
        EXPECT_NE(failure.Hint(), "");
        return failure.Code();
    }
    return ExitCode::Ok;
}

TEST(CommandTable, IsConsistent) {
    std::set<std::string> names;
    for (const Command& command : AllCommands()) {
        SCOPED_TRACE(command.name);
        EXPECT_TRUE(names.insert(command.name).second);
        EXPECT_NE(command.run, nullptr);
        EXPECT_FALSE(command.summary.empty() || command.description.empty() || command.examples.empty());
        std::set<std::string> options;
        std::set<char> letters;
        for (const Option& option : OptionsOf(command)) {
            EXPECT_TRUE(options.insert(option.name).second) << option.name;
            EXPECT_TRUE(!option.letter || letters.insert(option.letter).second) << option.name;
            EXPECT_EQ(option.completes == Completes::Choices, !option.choices.empty()) << option.name;
            EXPECT_TRUE(option.TakesValue() || option.completes == Completes::Nothing) << option.name;
        }
        for (const Example& example : command.examples) {
            EXPECT_NE(example.commandLine.find("zo " + command.name), std::string::npos);
        }
    }
}

TEST(Arguments, TakesOptionsInEveryForm) {
    for (const auto& words :
         std::vector<std::vector<std::string>>{{"get", "clip", "-o", "x", "-f", "--json"},
                                               {"get", "-fo", "x", "--json", "clip"},
                                               {"--json", "get", "--output=x", "clip", "--force"},
                                               {"get", "-ox", "--force", "--json", "--", "clip"}}) {
        const Arguments arguments = Parse(words);
        EXPECT_EQ(arguments.GetCommand().name, "get");
        EXPECT_EQ(arguments.Value("output"), "x");
        EXPECT_TRUE(arguments.Has("force") && arguments.Has("json"));
        EXPECT_EQ(arguments.Positional(0), "clip");
    }
    EXPECT_EQ(Parse({"get", "--", "-odd-name"}).Positional(0), "-odd-name");
    EXPECT_EQ(Parse({"get", "a", "-o", "-"}).Value("output"), "-");
    EXPECT_EQ(Parse({"--server", "h", "whoami"}).Value("server"), "h");
    EXPECT_EQ(Parse({"open", "--commit", "a", "--commit", "b"}).Value("commit"), "b");
    EXPECT_EQ(Parse({"assets", "--type", "of-a-newer-hub"}).Value("type"), "of-a-newer-hub");
}

TEST(Arguments, HelpIsReachedFromEverywhere) {
    EXPECT_EQ(Parse({"--help"}).GetCommand().name, "help");
    EXPECT_EQ(Parse({"--version"}).GetCommand().name, "version");
    const Arguments asked = Parse({"get", "--help"});
    EXPECT_EQ(asked.GetCommand().name, "help");
    EXPECT_EQ(asked.Positional(0), "get");
}

TEST(Arguments, RefusesWhatTheTableDoesNotKnow) {
    for (const auto& words : std::vector<std::vector<std::string>>{{},
                                                                   {"nothing"},
                                                                   {"get", "--nothing"},
                                                                   {"get", "-z"},
                                                                   {"get", "a", "b"},
                                                                   {"get", "-o"},
                                                                   {"get", "--force=yes"},
                                                                   {"hub"},
                                                                   {"hub", "dance"},
                                                                   {"--server", "h", "help"},
                                                                   {"whoami", "--color", "blue"},
                                                                   {"whoami", "--force"}}) {
        EXPECT_EQ(Refusal(words), ExitCode::Usage) << ::testing::PrintToString(words);
    }
}

TEST(Arguments, JsonIsSeenInALineThatDoesNotParse) {
    EXPECT_TRUE(AsksForJson({"nothing", "--json"}));
    EXPECT_FALSE(AsksForJson({"get", "--", "--json"}));
}

TEST(ServerAddress, CompletesSchemeAndPort) {
    EXPECT_EQ(CompleteServerAddress("hub", Scheme::Secure), "https://hub:60137");
    EXPECT_EQ(CompleteServerAddress("hub", Scheme::Plain), "http://hub:60138");
    EXPECT_EQ(CompleteServerAddress("http://hub/", Scheme::Secure), "http://hub:60138");
    EXPECT_EQ(CompleteServerAddress("hub:80", Scheme::Secure), "https://hub:80");
    for (const char* text :
         {"", "https://", "ftp://hub", "http://user:pw@hub", "http://hub/path", "hub?x", "h b", "h\nb"}) {
        EXPECT_THROW(CompleteServerAddress(text, Scheme::Secure), Failure) << text;
    }
}

TEST(ServerAddress, OnlyThisMachineIsLoopback) {
    for (const char* server :
         {"http://127.0.0.1:1", "http://127.8.0.1:1", "http://localhost:1", "http://[::1]:1"}) {
        EXPECT_TRUE(IsLoopbackAddress(server)) << server;
    }
    for (const char* server : {"http://127.0.0.1.evil.example:1", "http://localhost.evil.example:1",
                               "http://10.0.0.1:1", "http://hub:1", "http://[::2]:1"}) {
        EXPECT_FALSE(IsLoopbackAddress(server)) << server;
    }
}

TEST(ServerAddress, UserNamesCannotReachOtherKeysOfTheRegistry) {
    EXPECT_TRUE(IsUsableUserName("ada.lovelace@example"));
    EXPECT_FALSE(IsUsableUserName("ada\\bob"));
    EXPECT_FALSE(IsUsableUserName("ada\nbob"));
    EXPECT_FALSE(IsUsableUserName(std::string("a\0b", 3)));
}

}  // namespace
}  // namespace zo
