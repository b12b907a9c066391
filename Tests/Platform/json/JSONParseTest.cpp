// What the parser takes, what it refuses, and that it says why without quoting the input.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <stdexcept>
#include <thread>

#include "ostcore/serialization/JSON.h"

using namespace ostcore::serialization;
using ostcore::utility::RecycledMemory;
using testing::HasSubstr;
using testing::Not;

namespace {

JSONValue ParsePayload(std::string_view inText) {
    return JSONParse(ostcore::shared_ptr<RecycledMemory const>(RecycledMemory::CreateFromBytes(inText)));
}

std::string ErrorOf(std::string_view inText) {
    try {
        JSONParse(inText);
    } catch (const std::runtime_error& error) {
        return error.what();
    }
    return std::string();
}

const char* const kSample =
    R"({"zo:assetId":"a\u00e9\ud83d\ude00","list":[1,-2,3.5e2,true,false,null,"x\n"],"o":{"k":{}},"e":[]})";

}  // namespace

TEST(JSONParse, ShowsAllTypesOfAPayloadInPlace) {
    const JSONValue root = ParsePayload(kSample);
    ASSERT_TRUE(root.IsObject());
    EXPECT_EQ(root.Size(), 4u);
    EXPECT_EQ(GetVariantInObject(root, "zo:assetId").AsString(), "a\xC3\xA9\xF0\x9F\x98\x80");
    std::vector<JSONType> types;
    JSONView(root).Find("list").ForEachElement(
        [&](JSONView inElement) { types.push_back(inElement.Type()); });
    EXPECT_EQ(types, (std::vector<JSONType>{JSONType::Integer, JSONType::Integer, JSONType::Double,
                                            JSONType::Boolean, JSONType::Boolean, JSONType::Null,
                                            JSONType::String}));
    EXPECT_EQ(JSONView(root).Find("e").Size(), 0u);
    EXPECT_EQ(JSONView(root).Find("o").Find("k").Size(), 0u);
    EXPECT_FALSE(JSONView(root).Find("K").IsPresent());
}

TEST(JSONParse, ScalarsAreTexts) {
    EXPECT_EQ(JSONParse("\"only\"").AsString(), "only");
    EXPECT_EQ(JSONParse(" 7 ").AsInt64(), 7);
    EXPECT_TRUE(JSONParse("null").IsNull());
    EXPECT_TRUE(JSONParse("true").AsBool());
}

TEST(JSONParse, RefusesWhatIsNotOneWellFormedText) {
    const std::string_view malformed[] = {"",
                                          " ",
                                          "{",
                                          "}",
                                          "[",
                                          "]",
                                          "[1,]",
                                          "{\"a\":}",
                                          "{\"a\"}",
                                          "{a:1}",
                                          "{'a':1}",
                                          "[1 2]",
                                          "{\"a\":1,}",
                                          "nul",
                                          "truer",
                                          "[true,falsy]",
                                          "01",
                                          "+1",
                                          ".5",
                                          "1.",
                                          "1e",
                                          "-",
                                          "--1",
                                          "0x10",
                                          "NaN",
                                          "Infinity",
                                          "\"",
                                          "\"\\x\"",
                                          "\"\\u12\"",
                                          "\"\\u12G4\"",
                                          "\"a\nb\"",
                                          "1 1",
                                          "{} {}",
                                          "[]]",
                                          "/*c*/1",
                                          "[1]//c",
                                          "\"\\ud800\"",
                                          "\"\\ud800x\"",
                                          "\"\\ud800\\u0041\"",
                                          "\"\\udc00\"",
                                          "\"\\udfff x\"",
                                          "[\"\\ude00\\ud83d\"]",
                                          "1e999",
                                          "-1e999",
                                          "18446744073709551616",
                                          "-9223372036854775809",
                                          "\"\xFF\"",
                                          "\"\xC0\x80\"",
                                          "\"\xED\xA0\x80\"",
                                          "\"\xF5\x80\x80\x80\"",
                                          "\"\xE2\x82\"",
                                          "\xEF\xBB\xBF",
                                          "\xEF\xBB",
                                          "\xFE\xFF"};
    for (const std::string_view text : malformed) {
        EXPECT_THROW(JSONParse(text), std::runtime_error) << "text: " << text;
        EXPECT_THROW(ParsePayload(text), std::runtime_error) << "text: " << text;
    }
    EXPECT_THROW(JSONParse(std::string_view("1\0", 2)), std::runtime_error);
    EXPECT_THROW(JSONParse(std::string_view("\"a\0b\"", 5)), std::runtime_error);
    EXPECT_THROW(JSONParse(ostcore::shared_ptr<RecycledMemory const>()), std::runtime_error);
}

TEST(JSONParse, EveryCutOfATextIsAnError) {
    const std::string_view whole = kSample;
    for (std::size_t size = 0; size < whole.size(); ++size) {
        EXPECT_THROW(ParsePayload(whole.substr(0, size)), std::runtime_error) << "cut at " << size;
    }
    EXPECT_NO_THROW(ParsePayload(whole));
}

TEST(JSONParse, BoundsTheNestingWithoutUsingUpTheStack) {
    const auto nested = [](std::size_t inDepth, const char* inOpen, const char* inClose) {
        std::string text;
        for (std::size_t level = 0; level < inDepth; ++level) {
            text += inOpen;
        }
        text += "1";
        for (std::size_t level = 0; level < inDepth; ++level) {
            text += inClose;
        }
        return text;
    };
    EXPECT_NO_THROW(JSONParse(nested(kJSONMaximumDepth - 1, "[", "]")));
    EXPECT_THAT(ErrorOf(nested(kJSONMaximumDepth + 1, "[", "]")), HasSubstr("too deep"));
    EXPECT_THAT(ErrorOf(nested(100000, "[", "]")), HasSubstr("too deep"));
    EXPECT_THAT(ErrorOf(nested(100000, "{\"a\":", "}")), HasSubstr("too deep"));
    EXPECT_THROW(JSONParse(std::string(100000, '[')), std::runtime_error);
}

TEST(JSONParse, TheDeepestTextThatIsReadCanBeWritten) {
    const std::string text =
        std::string(kJSONMaximumDepth - 1, '[') + std::string(kJSONMaximumDepth - 1, ']');
    EXPECT_EQ(GetJSONUTF8String(JSONParse(text)), text);
}

TEST(JSONParse, AByteOrderMarkIsSkipped) {
    EXPECT_EQ(GetVariantInObject(ParsePayload("\xEF\xBB\xBF{\"a\":1}"), "a").AsInt64(), 1);
}

TEST(JSONParse, TheLastOfRepeatedKeysCounts) {
    const JSONValue root = JSONParse(R"({"a":1,"b":2,"a":"three"})");
    EXPECT_EQ(GetVariantInObject(root, "a").AsString(), "three");
}

TEST(JSONParse, IntegersAreExactToTheirLimits) {
    EXPECT_EQ(JSONParse("9223372036854775807").AsInt64(), INT64_MAX);
    EXPECT_EQ(JSONParse("-9223372036854775808").AsInt64(), INT64_MIN);
    EXPECT_EQ(JSONParse("18446744073709551615").AsUInt64(), UINT64_MAX);
    EXPECT_THROW(JSONParse("9223372036854775808").AsInt64(), boost::bad_any_cast);
    EXPECT_THROW(JSONParse("-1").AsUInt64(), boost::bad_any_cast);
    EXPECT_THROW(JSONParse("1.0").AsInt64(), boost::bad_any_cast);
    EXPECT_EQ(JSONView(JSONParse("2147483647")).AsInt32(), INT32_MAX);
    EXPECT_THROW(JSONView(JSONParse("2147483648")).AsInt32(), boost::bad_any_cast);
    EXPECT_THROW(JSONView(JSONParse("4294967296")).AsUInt32(), boost::bad_any_cast);
    EXPECT_EQ(JSONParse("1e-400").AsDouble(), 0.0);
}

TEST(JSONParse, ErrorsNeverQuoteThePayload) {
    const std::string error = ErrorOf(R"({"login-token":"canary-7c1","x":})");
    EXPECT_THAT(error, HasSubstr("JSON not well-formed"));
    EXPECT_THAT(error, Not(HasSubstr("canary")));
}

TEST(JSONParse, ADocumentOutlivesItsPayloadAndItsThread) {
    JSONValue inner;
    std::thread([&] {
        inner = GetVariantInObject(ParsePayload(kSample), "list");
        JSONParse("[\"the buffers of the thread are used again\"]");
    }).join();
    EXPECT_EQ(inner.Size(), 7u);
    EXPECT_EQ(GetJSONUTF8String(inner), R"([1,-2,350.0,true,false,null,"x\n"])");
}

TEST(JSONParse, LargeTextsReadLikeSmallOnes) {
    std::string text = "[";
    for (int number = 0; number < 60000; ++number) {
        text += (number ? "," : "") + ("\"item " + std::to_string(number) + "\"");
    }
    text += "]";
    ASSERT_GT(text.size(), 512u * 1024u);
    const JSONValue list = ParsePayload(text);
    int expected = 0;
    JSONView(list).ForEachElement([&](JSONView inElement) {
        ASSERT_EQ(inElement.AsString(), "item " + std::to_string(expected));
        ++expected;
    });
    EXPECT_EQ(expected, 60000);
    text.pop_back();
    EXPECT_THROW(ParsePayload(text), std::runtime_error);
}
