// The result table, links and templates, versions, and the white list.
#include <set>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "Frame/Version.h"
#include "Links.h"
#include "ostnet/HeaderConstants.h"
#include "Relations.h"
#include "ZOClient/ResultCodes.h"
#include "ZOClient/ServerFeatureReport.h"

namespace ZOCL {
namespace {

int ResultOf(int inStatus) {
    return GetResultFromResponse(boost::make_shared<ostnet::Response>(inStatus), 17);
}

TEST(Results, FollowTheTableForEveryStatus) {
    EXPECT_EQ(GetResultFromResponse(nullptr, 17), 17);
    for (int status = -5; status < 1200; ++status) {
        std::uint32_t expected = 0xA00F0001u;
        const bool isSuccess = status >= 201 && status <= 206;
        const bool isFailure = (status >= 300 && status <= 307 && status != 306) ||
                               (status >= 400 && status <= 417) || (status >= 500 && status <= 505);
        if (status == -1) {
            expected = 0xA0450001u;
        } else if (status == 0) {
            expected = 0xA0450003u;
        } else if (status == 200) {
            expected = 0;
        } else if (isSuccess) {
            expected = 0x20450000u + static_cast<std::uint32_t>(status);
        } else if (isFailure) {
            expected = 0xA0450000u + static_cast<std::uint32_t>(status);
        }
        EXPECT_EQ(ResultOf(status), static_cast<int>(expected)) << status;
    }
    EXPECT_EQ(ResultOf(0x7FFFFFFF), kResultFailure);
    EXPECT_EQ(ResultOf(0x10000 + 404), kResultFailure);
}

TEST(Results, AreJudgedNarrowlyAndWidely) {
    EXPECT_FALSE(ResultSucceededOrCanceled(kResultNoHTTPResponse));
    for (const int result : {kResultDialogCancelled, kResultDialogAlternativeCancelled, kResultCancelled,
                             kResultRequestCancelled, kResultSuccess, kResultHTTPCreated}) {
        EXPECT_TRUE(ResultSucceededOrCanceled(result));
    }
    EXPECT_TRUE(LoadResultSucceeded(kResultSuccess));
    EXPECT_TRUE(LoadResultSucceeded(kResultHTTPOK));
    EXPECT_TRUE(LoadResultSucceeded(kResultHTTPNotModifiedSuccess));
    EXPECT_FALSE(LoadResultSucceeded(kResultHTTPCreated));
    EXPECT_FALSE(LoadResultSucceeded(kResultHTTPNotModified));
}

TEST(Results, HaveDistinctCodesAndNames) {
    std::set<std::uint32_t> codes;
    std::set<std::string> names;
    std::size_t count = 0;
#define ZO_COUNT_ROW(constant, code, name, meaning)            \
    ++count;                                                   \
    codes.insert(code);                                        \
    names.insert(name);                                        \
    EXPECT_STREQ(GetResultName(static_cast<int>(code)), name); \
    EXPECT_STREQ(GetResultMeaning(static_cast<int>(code)), meaning);
    ZOCL_RESULT_TABLE(ZO_COUNT_ROW)
#undef ZO_COUNT_ROW
    EXPECT_EQ(codes.size(), count);
    EXPECT_EQ(names.size(), count);
    EXPECT_STREQ(GetResultName(12345), "unknown");
}

TEST(Results, TakeTheTagOfSuccessAlone) {
    auto response = boost::make_shared<ostnet::Response>(200);
    response->headers.emplace(ImmutableString("etag"), ImmutableString("\"1\""));
    EXPECT_STREQ(GetETagFromResponse(response).c_str(), "\"1\"");
    response->status = 304;
    EXPECT_TRUE(GetETagFromResponse(response).IsNull());
    EXPECT_TRUE(GetETagFromResponse(nullptr).IsNull());
}

TEST(LinkRecords, AreReadInOrderAndFoundByRelationAndType) {
    const auto document = ostcore::serialization::JSONParse(
        "{\"links\":[{\"rel\":\"a\",\"href\":\"1\",\"type\":\"x\"},{\"href\":\"no relation\"},"
        "{\"rel\":\"a\",\"href\":\"2\",\"type\":\"y\",\"title\":\"T\",\"zo:etag\":\"e\",\"more\":1},"
        "{\"rel\":\"b\",\"href\":null}]}");
    const Links links = ReadLinks(document);
    ASSERT_EQ(links.size(), 4u);
    const ImmutableString a("a");
    EXPECT_STREQ(FindLink(links, a, ImmutableString()).href.c_str(), "1");
    EXPECT_STREQ(FindLink(links, a, ImmutableString("y")).href.c_str(), "2");
    EXPECT_STREQ(FindLink(links, a, ImmutableString("y")).eTag.c_str(), "e");
    EXPECT_TRUE(FindLink(links, a, ImmutableString("z")).href.IsNull());
    EXPECT_TRUE(FindLink(links, ImmutableString("A"), ImmutableString()).href.IsNull());
    EXPECT_TRUE(FindLink(links, ImmutableString(), ImmutableString()).href.IsNull());
    EXPECT_TRUE(FindLink(links, ImmutableString("b"), ImmutableString()).href.IsNull());
    EXPECT_TRUE(ReadLinks(ostcore::serialization::JSONParse("{}")).empty());
    for (const char* wrong :
         {"{\"links\":{}}", "{\"links\":[1]}", "{\"links\":[null]}", "{\"links\":[{\"rel\":{}}]}"}) {
        EXPECT_THROW(ReadLinks(ostcore::serialization::JSONParse(wrong)), bad_any_cast) << wrong;
    }
}

TEST(LinkRecords, TemplatesAreFilledInOnePass) {
    const ImmutableString link("http://h/{a}/{b}/{a}/{c}");
    EXPECT_STREQ(ExpandTemplate(link, {{"{a}", ImmutableString("{b}")}, {"{b}", ImmutableString()}}).c_str(),
                 "http://h/{b}//{b}/{c}");
}

TEST(LinkRecords, RelationsStandBehindTheBase) {
    EXPECT_STREQ(kRelation_System_Login.c_str(), "http://ns.meridane.example/zo/rel/system/login");
    EXPECT_STREQ(kRelation_LatestVersion.c_str(), "latest-version");
}

TEST(Versions, AreReadAndCompared) {
    Version version{7, 7};
    EXPECT_FALSE(ParseVersion("1.0", version));
    EXPECT_EQ(version, (Version{7, 7}));
    struct Row {
        const char* text;
        Version version;
    };
    for (const Row& row : {Row{"1.0.0", {1, 0}}, Row{"12.34.rest.more", {12, 34}}, Row{"x.2.", {0, 2}},
                           Row{"..", {0, 0}}, Row{"99999999999.1.0", {0, 1}}}) {
        ASSERT_TRUE(ParseVersion(row.text, version)) << row.text;
        EXPECT_EQ(version, row.version) << row.text;
    }
    EXPECT_TRUE(VersionSatisfies({2, 0}, {1, 9}));
    EXPECT_FALSE(VersionSatisfies({1, 8}, {1, 9}));
    EXPECT_TRUE(VersionSatisfies({1, 9}, {1, 9}));
    EXPECT_FALSE(VersionSatisfies({0, 99}, {1, 0}));
}

TEST(WhiteList, IsReadWholeOrNotAtAll) {
    std::set<ImmutableString> names{ImmutableString("before")};
    for (const char* wrong :
         {"", "[]", "{}", "{\"whitelist\":\"a\"}", "{\"whitelist\":[\"a\",1]}", "{\"whitelist\":null}"}) {
        EXPECT_FALSE(ParseWhitelistPayload(RecycledMemory::CreateFromBytes(wrong), names)) << wrong;
    }
    EXPECT_FALSE(ParseWhitelistPayload(nullptr, names));
    EXPECT_EQ(names.size(), 1u);
    ASSERT_TRUE(
        ParseWhitelistPayload(RecycledMemory::CreateFromBytes("{\"whitelist\":[\"a\",\"b\",\"a\"]}"), names));
    EXPECT_EQ(names, (std::set<ImmutableString>{ImmutableString("a"), ImmutableString("b")}));
}

}  // namespace
}  // namespace ZOCL
