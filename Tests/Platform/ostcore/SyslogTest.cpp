// Syslog lines as the receiver gets them.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <array>
#include <regex>
#include <string>

#include <arpa/inet.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

#include "ostcore/config/ClientInfo.h"
#include "ostcore/logging/SyslogLogger.h"
#include "ostcore/threads/Executor.h"
#include "ostcore/threads/Scheduler.h"
#include "ostcore/utility/StringConversion.h"

namespace {

using namespace ostcore::logging;
using ostcore::utility::Guid;
using testing::HasSubstr;
using testing::Not;

class Receiver {
public:
    Receiver() : mSocket(::socket(AF_INET, SOCK_DGRAM, 0)) {
        sockaddr_in address{};
        address.sin_family = AF_INET;
        address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        socklen_t size = sizeof(address);
        if (::bind(mSocket, reinterpret_cast<sockaddr*>(&address), size) != 0 ||
            ::getsockname(mSocket, reinterpret_cast<sockaddr*>(&address), &size) != 0) {
            throw std::runtime_error("no loopback socket");
        }
        mPort = ntohs(address.sin_port);
    }
    ~Receiver() { ::close(mSocket); }
    Receiver(const Receiver&) = delete;
    Receiver& operator=(const Receiver&) = delete;

    std::uint16_t Port() const { return mPort; }
    std::string Receive(int inMilliseconds = 60000) {
        pollfd waiting{mSocket, POLLIN, 0};
        if (::poll(&waiting, 1, inMilliseconds) <= 0) {
            return {};
        }
        std::array<char, 65536> buffer{};
        const ssize_t got = ::recv(mSocket, buffer.data(), buffer.size(), 0);
        return std::string(buffer.data(), static_cast<std::size_t>(std::max<ssize_t>(got, 0)));
    }

private:
    const int mSocket;
    std::uint16_t mPort = 0;
};

class SyslogTest : public testing::Test {
protected:
    const ostcore::shared_ptr<ostcore::threads::VirtualScheduler> mTime =
        boost::make_shared<ostcore::threads::VirtualScheduler>();
    const ostcore::threads::ScopedGlobalScheduler mScope{mTime};
    Receiver mReceiver;
    const ostcore::shared_ptr<ISyslogLogger> mLogger = CreateSyslogLogger(true, Guid(1, 2));
};

TEST_F(SyslogTest, ALineHasTheFormOfTheStandard) {
    mLogger->SetServer("127.0.0.1", mReceiver.Port());
    mTime->Advance(std::chrono::milliseconds(1500));
    mLogger->Log(SyslogSeverity::Error, "could not load", {{"uri", "a\"]\\b"}, {"bad name=", "x"}});
    const std::string line = mReceiver.Receive();
    const std::regex form(
        "<11>1 2030-01-01T00:00:01\\.500000Z \\S+ ZOClient 00000000-0000-0001-0000-000000000002 - "
        "\\[zoclient@32473 build=\"0\" headless=\"true\" uri=\"a\\\\\"\\\\\\]\\\\\\\\b\" bad_name_=\"x\"\\] "
        "\xEF\xBB\xBF"
        "could not load");
    EXPECT_TRUE(std::regex_match(line, form)) << line;
}

TEST_F(SyslogTest, SecretsAndControlCharactersDoNotLeave) {
    mLogger->SetServer("127.0.0.1", mReceiver.Port());
    mLogger->Log(SyslogSeverity::Notice, "line\none login-token=cAnArY",
                 {{"Cookie", "x=cAnArY"}, {"j_password", "cAnArY"}, {"safe", "1"}});
    const std::string line = mReceiver.Receive();
    EXPECT_THAT(line, Not(HasSubstr("cAnArY")));
    EXPECT_THAT(line, HasSubstr("line one login-token=[hidden]"));
    EXPECT_THAT(line, HasSubstr("safe=\"1\""));
    EXPECT_EQ(line.find('\n'), std::string::npos);
}

TEST_F(SyslogTest, LongLinesAreCutBetweenCharacters) {
    mLogger->SetServer("127.0.0.1", mReceiver.Port());
    std::string text;
    for (int i = 0; i < 3000; ++i) {
        text += "\xE2\x82\xAC";
    }
    mLogger->Log(SyslogSeverity::Debug, text, {{"huge", std::string(5000, 'y')}, {"kept", "1"}});
    const std::string line = mReceiver.Receive();
    EXPECT_LE(line.size(), 2048u);
    EXPECT_GT(line.size(), 2040u);
    EXPECT_TRUE(ostcore::utility::IsValidUTF8(line));
    EXPECT_THAT(line, HasSubstr("kept=\"1\"]"));
    EXPECT_THAT(line, Not(HasSubstr("yyy")));
}

TEST_F(SyslogTest, WithoutAServerNothingHappens) {
    mLogger->Log(SyslogSeverity::Error, "nowhere", {});
    mLogger->SetServer("127.0.0.1", mReceiver.Port());
    mLogger->SetServer("", 0);
    mLogger->Log(SyslogSeverity::Error, "switched off", {});
    mLogger->SetServer("127.0.0.1", mReceiver.Port());
    mLogger->Log(SyslogSeverity::Error, "switched on", {});
    EXPECT_THAT(mReceiver.Receive(), HasSubstr("switched on"));
}

TEST_F(SyslogTest, AHostNameIsLookedUpInTheBackground) {
    mLogger->SetServer("localhost", mReceiver.Port());
    ASSERT_TRUE(ostcore::threads::WaitForExecutors(60000));
    mLogger->Log(SyslogSeverity::Error, "found", {});
    // localhost may resolve to ::1 first, where nobody listens; the caller must not notice either way.
    mLogger->SetServer("127.0.0.1", mReceiver.Port());
    mLogger->Log(SyslogSeverity::Error, "after", {});
    std::string line = mReceiver.Receive();
    if (line.find("found") != std::string::npos) {
        line = mReceiver.Receive();
    }
    EXPECT_THAT(line, HasSubstr("after"));
}

TEST(StructuredLogger, IsTheOneThatWasSet) {
    EXPECT_FALSE(GetStructuredLogger());
    const auto logger = CreateSyslogLogger();
    SetStructuredLogger(logger);
    EXPECT_EQ(GetStructuredLogger(), logger);
    SetStructuredLogger({});
    EXPECT_FALSE(GetStructuredLogger());
}

}  // namespace
