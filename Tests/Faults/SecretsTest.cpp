// A canary password and token go through connecting, loading and every kind of failure; they must show
// themselves nowhere but where they belong.
#include <sys/stat.h>

#include <filesystem>
#include <fstream>
#include <iterator>

#include "Client.h"
#include "HLM/HLM.h"
#include "ZOClient/Registry.h"

namespace faults {
namespace {

std::string BytesOf(const std::filesystem::path& inFile) {
    std::ifstream file(inFile, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

/// The files of this run that hold a text, in UTF-8 or UTF-16.
std::vector<std::string> FilesWith(const std::string& inText) {
    std::string wide;
    for (const char c : inText) {
        wide += {c, '\0'};
    }
    std::vector<std::string> found;
    for (const auto& entry : std::filesystem::recursive_directory_iterator(RunDirectory())) {
        const std::string bytes = entry.is_regular_file() ? BytesOf(entry.path()) : std::string();
        if (bytes.find(inText) != std::string::npos || bytes.find(wide) != std::string::npos) {
            found.push_back(entry.path().filename().string());
        }
    }
    return found;
}

class Secrets : public FaultTest {
protected:
    void TearDown() override {
        HLM::SetIsHeadless(false);
        FaultTest::TearDown();
    }
    void ExpectNotIn(const std::string& inText, const std::string& inWhere) {
        EXPECT_EQ(inText.find(kPassword), std::string::npos) << inWhere;
        EXPECT_EQ(inText.find(kTokenValue), std::string::npos) << inWhere;
    }
};

TEST_F(Secrets, StayInTheirPlacesThroughAWholeSessionAndItsFailures) {
    BadHub hub;
    {
        const auto server = SignIn(hub);
        EXPECT_TRUE(server->GetCredentials().password.empty()) << "a password that has served is gone";
        const auto production = LoadProduction(server, hub);
        for (const Step step : kLoadSteps) {
            mClient.Load(ResourceOf(step, server, production, hub));
            for (const int status : {400, 401, 403, 404, 409, 412, 500, 503}) {
                hub.Change(step, [status](const HubAnswer& inGood) {
                    // A hub that repeats what it was sent.
                    return HubAnswer{status, inGood.headers,
                                     "You sent Cookie: login-token=" + std::string(kTokenValue) +
                                         "; and j_password=" + kPassword};
                });
                const Outcome outcome = mClient.Load(ResourceOf(step, server, production, hub));
                EXPECT_LT(outcome.result, 0);
                ASSERT_TRUE(outcome.response);
                ExpectNotIn(outcome.response->GetHeadersAsUTF8String(), "the headers for logs");
                if (status == 401) {
                    SignIn(hub);  // the one that was refused has lost its token
                    break;
                }
            }
            hub.BeGood();
        }
        server->CreateProduction(u"New", u"", false);
    }
    for (const Step step : kConnectSteps) {
        for (const int status : {302, 401, 403, 500}) {
            hub.BeGood();
            hub.Change(step, [status](const HubAnswer& inGood) {
                return HubAnswer{status, inGood.headers, inGood.headers + "j_password: " + kPassword};
            });
            mClient.Connect(hub.URL(""));
        }
        hub.Interfere(step, [](Connection& ioConnection, const ReceivedRequest&, const HubAnswer&) {
            ioConnection.Reset();
            return false;
        });
        mClient.Connect(hub.URL(""));
    }
    hub.BeGood();
    IZOCDataServer::Terminate(true);
    ExpectSecretsInTheirPlaces(hub.Requests());
    EXPECT_THAT(FilesWith(kPassword), testing::IsEmpty());
    EXPECT_THAT(FilesWith(kTokenValue), testing::IsEmpty())
        << "a host with a user keeps the token by its own choice";
}

TEST_F(Secrets, TheTokenIsKeptInOneFileOfTheUserAloneAndIsGoneAfterTheSession) {
    BadHub hub;
    const auto server = SignIn(hub);
    const ZOCL::ZOLoginData data = server->GetLoginData();
    ASSERT_TRUE(ZOCL::Registry::StoreLoginData(data, u""));
    const auto holders = FilesWith(kTokenValue);
    ASSERT_THAT(holders, testing::Not(testing::IsEmpty())) << "a search that finds nothing proves nothing";
    for (const auto& entry : std::filesystem::recursive_directory_iterator(RunDirectory())) {
        struct stat status {};
        ASSERT_EQ(stat(entry.path().c_str(), &status), 0);
        EXPECT_EQ(status.st_mode & 0777, entry.is_directory() ? 0700u : 0600u) << entry.path();
    }
    IZOCDataServer::Terminate(true);
    EXPECT_EQ(hub.CountRequests("POST", "/logout"), 1u);
    EXPECT_THAT(FilesWith(kTokenValue), testing::IsEmpty()) << "a deleted token lies in the file";
}

TEST_F(Secrets, TheTokenOfAHeadlessProcessIsGoneWhenItIsReplacedOrTakenBack) {
    HLM::SetIsHeadless(true);
    BadHub hub;
    const auto server = SignIn(hub);
    ASSERT_THAT(FilesWith(kTokenValue), testing::Not(testing::IsEmpty()));
    ZOCL::ZOLoginData data;
    ASSERT_TRUE(ZOCL::Registry::GetLastLoginData(data, true, u"ann"));
    EXPECT_EQ(data.token, server->GetCredentials().token);
    EXPECT_THAT(FilesWith(kPassword), testing::IsEmpty());
    data.token = ImmutableString();
    ASSERT_TRUE(ZOCL::Registry::StoreLoginData(data, u"ann"));
    IZOCDataServer::Terminate(true);
    EXPECT_THAT(FilesWith(kTokenValue), testing::IsEmpty());
}

TEST_F(Secrets, OfCookiesThatAreNoTokensGoNowhere) {
    BadHub hub;
    const std::string other = "other-cookie=elsewhere; Domain=other.invalid; Path=/\r\n";
    const std::string token = "login-token=" + std::string(kTokenValue) + "; Path=/";
    struct Case {
        const char* name;
        std::string lines;
        bool signsIn;
    };
    const Case cases[] = {
        {"several", "Set-Cookie: a=b\r\nSet-Cookie: " + token + "\r\nSet-Cookie: " + other, true},
        {"of another domain", "Set-Cookie: " + token + "; Domain=other.invalid\r\n", true},
        {"empty", "Set-Cookie: login-token=; Path=/\r\n", false},
        {"none", "Set-Cookie: " + other, false},
        {"a megabyte", "Set-Cookie: login-token=" + std::string(1 << 20, 'c') + "\r\n", false},
        {"just too long", "Set-Cookie: login-token=" + std::string(9000, 'c') + "\r\n", false},
        {"with a tab", "Set-Cookie: login-token=a\tb; Path=/\r\n", false},
        {"with a control character",
         "Set-Cookie: login-token=a\x01"
         "b; Path=/\r\n",
         false},
        {"with a NUL", std::string("Set-Cookie: login-token=a\0b; Path=/\r\n", 38), false},
        {"with a lone CR", "Set-Cookie: login-token=a\rX-Injected: 1; Path=/\r\n", false},
    };
    for (const Case& one : cases) {
        hub.BeGood();
        hub.Change(Step::kLogin, [&](const HubAnswer& inGood) { return inGood.WithHeaders(one.lines); });
        const Outcome outcome = mClient.Connect(hub.URL(""));
        EXPECT_EQ(static_cast<bool>(outcome.server), one.signsIn) << one.name;
    }
    // A folded one is one line of one value, or none at all.
    hub.Change(Step::kLogin, [&](const HubAnswer& inGood) {
        return inGood.WithHeaders("Set-Cookie: login-token=" + std::string(kTokenValue) +
                                  "\r\n X-Injected: 1\r\n\tmore; Path=/\r\n");
    });
    const Outcome folded = mClient.Connect(hub.URL(""));
    if (folded.server) {
        EXPECT_EQ(folded.server->GetCredentials().token.view().find_first_of("\r\n\t"),
                  std::string_view::npos);
    }
    for (const ReceivedRequest& request : hub.Requests()) {
        EXPECT_FALSE(request.Header("X-Injected"));
        EXPECT_EQ(request.head.find("other-cookie"), std::string::npos) << request.head;
        EXPECT_LE(request.CountHeaders("Cookie"), 1u);
    }
}

}  // namespace
}  // namespace faults
