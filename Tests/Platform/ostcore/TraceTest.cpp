// Traces: levels, the form of a line, and that no secret gets through.
#include "ostcore/debug/Trace.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <regex>
#include <string>
#include <vector>

#include "ostcore/debug/DebugDatabase.h"
#include "TestSupport.h"

namespace {

using namespace ostcore::debug;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;

class TraceTest : public testing::Test {
protected:
    void SetUp() override {
        SetTraceDatabaseFromString("");
        mFormer = SetTraceSink([this](const std::string& inLine) { mLines.push_back(inLine); });
    }
    void TearDown() override {
        SetTraceSink(mFormer);
        ReloadTraceLevels();
    }
    std::vector<std::string> mLines;
    TraceSink mFormer;
};

TEST_F(TraceTest, ALineBeginsWithThreadChannelAndLevel) {
    SetTraceLevel("ZOCL", 6);
    Trace("ZOCL", 6, "Initiate()");
    Trace("ZOCL", 7, "too detailed");
    ASSERT_EQ(mLines.size(), 1u);
    EXPECT_TRUE(std::regex_match(mLines[0], std::regex("<[0-9]+> <ZOCL> <6> Initiate\\(\\)"))) << mLines[0];
}

TEST_F(TraceTest, TextFromOutsideCannotForgeALine) {
    Trace("ZOCL", 0, "first\r\n<1> <ZOCL> <0> second\x1b[31m");
    ASSERT_EQ(mLines.size(), 1u);
    EXPECT_THAT(mLines[0], HasSubstr("first\\r\\n<1> <ZOCL> <0> second\\x1b[31m"));
}

TEST_F(TraceTest, ChannelsInheritFromTheOneAboveThem) {
    const TraceChannel channel("ZOCL.Production");
    EXPECT_TRUE(TraceEnabled(channel, 0));
    EXPECT_FALSE(TraceEnabled(channel, 1));
    EXPECT_EQ(SetTraceLevels("ZOCL:8, ZOCL.Production:5 ,broken,also:x,high:9"), 3);
    EXPECT_TRUE(TraceEnabled(channel, 5));
    EXPECT_FALSE(TraceEnabled(channel, 6));
    EXPECT_TRUE(TraceEnabled("ZOCL.ServerResource", 8));
    EXPECT_FALSE(TraceEnabled("ZOCLX", 1));
    SetTraceLevel("*", 3);
    EXPECT_TRUE(TraceEnabled("ZO.CompoundAsyncOperation", 3));
    SetTraceLevel("*", kTraceLevel_Off);
    EXPECT_FALSE(TraceEnabled("ZO.CompoundAsyncOperation", 0));
    EXPECT_TRUE(TraceEnabled(channel, 5));
}

TEST_F(TraceTest, TheTraceDatabaseTravelsAsText) {
    SetTraceLevels("ZOCL:8,ZOCL.Production:5");
    const std::string text = GetTraceDatabaseAsString();
    SetTraceDatabaseFromString("");
    EXPECT_FALSE(TraceEnabled("ZOCL", 1));
    SetTraceDatabaseFromString(text);
    EXPECT_TRUE(TraceEnabled("ZOCL", 8));
    EXPECT_FALSE(TraceEnabled("ZOCL.Production", 6));
}

TEST_F(TraceTest, TheEnvironmentGoesOverTheDebugDatabase) {
    DebugDatabase::SetOverride("ostcore.Trace", "ZOCL:2,Other:4");
    const ostcore_test::ScopedVariable variable("ZOCLIENT_TRACE", "ZOCL:7");
    ReloadTraceLevels();
    DebugDatabase::ClearOverrides();
    EXPECT_TRUE(TraceEnabled("ZOCL", 7));
    EXPECT_TRUE(TraceEnabled("Other", 4));
    EXPECT_FALSE(TraceEnabled("Other", 5));
}

TEST_F(TraceTest, ASinkThatThrowsHarmsNobody) {
    const TraceSink mine = SetTraceSink([](const std::string&) { throw std::runtime_error("of a sink"); });
    EXPECT_NO_THROW(Trace("ZOCL", 0, "text"));
    SetTraceSink(mine);
    Trace("ZOCL", 0, "again");
    EXPECT_EQ(mLines.size(), 1u);
}

TEST_F(TraceTest, StructuredErrorsListTheirFields) {
    EXPECT_EQ(StructuredText("Load failed").Add("uri", "/a").Add("httpStatusCode", 404).str(),
              "Load failed, uri: /a, httpStatusCode: 404");
}

constexpr char kCanary[] = "cAnArY-7f3e";

TEST_F(TraceTest, NoFormOfASecretGetsThrough) {
    const std::string canary = kCanary;
    const std::vector<std::string> texts{
        "Cookie: login-token=" + canary + "; Path=/",
        "cookie:x=1;login-token=" + canary,
        "Set-Cookie: login-token=" + canary + "; HttpOnly",
        "set-cookie:   other=" + canary + "; HttpOnly",
        "GET /x\r\nAuthorization: Basic " + canary + "\r\nHost: h",
        "Proxy-Authorization: Bearer " + canary,
        "Cookie: a=b;\r\n login-token-part=" + canary,
        "token is login-token=" + canary,
        "login-token = \"" + canary + "\"",
        "LOGIN-TOKEN=" + canary + ";",
        "login-token%3D x login-token=" + canary,
        "j_username=ann&j_password=" + canary + "&j_validate=true",
        "j_password=two words " + canary + "&x=1",
        "{\"j_username\":\"ann\",\"j_password\":\"" + canary + "\"}",
        "{\"j_password\" : \"quote \\\" " + canary + "\", \"x\":1}",
        "{\\\"j_password\\\":\\\"" + canary + "\\\"}",
        ", j_password: " + canary,
        "Content-Disposition: form-data; name=\"j_password\"\r\n\r\n" + canary + "\r\n--b--",
        "Content-Disposition: form-data; name=\"j_password\"\r\nContent-Type: text/plain\r\n\r\n" + canary +
            "\r\n--b--",
        "LastAuthenticationToken=" + canary,
    };
    for (const std::string& text : texts) {
        mLines.clear();
        Trace("ZOCL", 0, text);
        ASSERT_EQ(mLines.size(), 1u);
        EXPECT_THAT(mLines[0], Not(HasSubstr(canary))) << text;
        EXPECT_THAT(mLines[0], HasSubstr("[hidden]")) << text;
    }
}

TEST_F(TraceTest, WhatIsNoSecretStays) {
    EXPECT_EQ(RedactSecrets("AuthorizationProcessor::MakeRequest: the cookie was renewed"),
              "AuthorizationProcessor::MakeRequest: the cookie was renewed");
    EXPECT_EQ(RedactSecrets("Cookie: a=b\r\nHost: hub\r\n"), "Cookie: [hidden]\r\nHost: hub\r\n");
    EXPECT_EQ(RedactSecrets("j_password=a&j_validate=true"), "j_password=[hidden]&j_validate=true");
    EXPECT_EQ(RedactSecrets("login-token=a; login-token=b"), "login-token=[hidden]; login-token=[hidden]");
    EXPECT_EQ(RedactSecrets("login-token="), "login-token=");
    EXPECT_EQ(RedactSecrets(""), "");
}

}  // namespace
