// Changing and writing values: copies are independent, unknown members survive, text is always valid.
#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <thread>

#include "ostcore/serialization/JSON.h"

using namespace ostcore::serialization;

TEST(JSONTree, ObjectsKeepTheOrderOfTheirKeys) {
    JSONValue object;
    AddToObject(object, "z", 1);
    AddToObject(object, "a", "two");
    AddToObject(object, "m", JSONValue::EmptyArray());
    AddToObject(object, "z", true);
    AddToObject(object, "o", JSONValue::EmptyObject());
    AddToObject(object, "n", ostcore::optional<bool>());
    AddToObject(object, "f", ostcore::optional<bool>(false));
    EXPECT_EQ(GetJSONUTF8String(object), R"({"z":true,"a":"two","m":[],"o":{},"n":null,"f":false})");
    EXPECT_TRUE(ObjectHasProperty(object, "n"));
    EXPECT_FALSE(ObjectHasProperty(object, "x"));
    EXPECT_TRUE(GetVariantInObject(object, "x").IsNull());
    RemoveFromObject(object, "a");
    RemoveFromObject(object, "absent");
    EXPECT_FALSE(ObjectHasProperty(object, "a"));
}

TEST(JSONTree, UnknownMembersOfAReadObjectGoBackUnchanged) {
    const JSONValue root = JSONParse(
        R"({"properties":{"future":{"deep":[1,{"x":1.50}]},"name":"old","big":18446744073709551615,"other":null}})");
    JSONValue properties = GetVariantInObject(root, "properties");
    AddToObject(properties, "name", "new");
    AddToObject(properties, "tags", JSONParse(R"(["a"])"));
    EXPECT_EQ(
        GetJSONUTF8String(properties),
        R"({"future":{"deep":[1,{"x":1.5}]},"name":"new","big":18446744073709551615,"other":null,"tags":["a"]})");
    EXPECT_EQ(GetVariantInObject(GetVariantInObject(root, "properties"), "name").AsString(), "old");
}

TEST(JSONTree, AChangeIsSeenThroughOneCopyOnly) {
    JSONValue first;
    AddToObject(first, "list", JSONValue::EmptyArray());
    JSONValue second = first;
    AddToObject(second, "more", 2);
    JSONValue list = GetVariantInObject(second, "list");
    AppendToArray(list, "x");
    EXPECT_EQ(GetJSONUTF8String(first), R"({"list":[]})");
    EXPECT_EQ(GetJSONUTF8String(second), R"({"list":[],"more":2})");
    EXPECT_EQ(GetJSONUTF8String(list), R"(["x"])");
    // A value can be put into itself: what goes in is the former state.
    AppendToArray(list, list);
    EXPECT_EQ(GetJSONUTF8String(list), R"(["x",["x"]])");
}

TEST(JSONTree, CopiesOfOneTreeAreChangedOnDifferentThreads) {
    JSONValue shared;
    for (int key = 0; key < 50; ++key) {
        AddToObject(shared, "k" + std::to_string(key), key);
    }
    const std::string before = GetJSONUTF8String(shared);
    std::vector<JSONValue> copies(4, shared);
    std::vector<std::thread> threads;
    for (JSONValue& copy : copies) {
        threads.emplace_back([&copy] {
            for (int key = 0; key < 50; ++key) {
                AddToObject(copy, "k" + std::to_string(key), key + 1);
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(GetJSONUTF8String(shared), before);
    for (const JSONValue& copy : copies) {
        EXPECT_EQ(GetVariantInObject(copy, "k49").AsInt64(), 50);
    }
}

TEST(JSONTree, RepeatedKeysBecomeOneWhenTheObjectIsChanged) {
    JSONValue object = JSONParse(R"({"a":1,"b":2,"a":3})");
    AddToObject(object, "c", 4);
    EXPECT_EQ(GetJSONUTF8String(object), R"({"a":3,"b":2,"c":4})");
}

TEST(JSONTree, OnlyObjectsTakeMembersAndOnlyArraysElements) {
    JSONValue array = JSONParse("[1]");
    JSONValue text = "x";
    EXPECT_THROW(AddToObject(array, "a", 1), boost::bad_any_cast);
    EXPECT_THROW(AppendToArray(text, 1), boost::bad_any_cast);
    EXPECT_THROW(GetVariantInObject(array, "a"), boost::bad_any_cast);
    EXPECT_FALSE(ObjectHasProperty(array, "a"));
    EXPECT_EQ(GetJSONUTF8String(array), "[1]");
    EXPECT_THROW(text.AsBool(), boost::bad_any_cast);
    EXPECT_THROW(text.AsInt64(), boost::bad_any_cast);
    EXPECT_THROW(JSONValue(1).AsString(), boost::bad_any_cast);
    EXPECT_THROW(JSONValue().AsString(), boost::bad_any_cast);
}

TEST(JSONTree, WrittenTextIsAlwaysValid) {
    EXPECT_EQ(GetJSONUTF8String(std::string_view("\"\\/\b\f\n\r\t\x01\x1f\0\x7f", 12)),
              "\"\\\"\\\\/\\b\\f\\n\\r\\t\\u0001\\u001f\\u0000\x7f\"");
    EXPECT_EQ(GetJSONUTF8String("a\xFFz"), "\"a\xEF\xBF\xBDz\"");
    EXPECT_EQ(GetJSONUTF8String("\xED\xA0\x80"), "\"\xEF\xBF\xBD\xEF\xBF\xBD\xEF\xBF\xBD\"");
    EXPECT_EQ(GetJSONUTF8String(ostcore::UString{u'a', char16_t(0xD800), u'b'}),
              "\"a\xEF\xBF\xBD"
              "b\"");
    EXPECT_EQ(GetJSONUTF8String(ostcore::UString(u"\U0001F600")), "\"\xF0\x9F\x98\x80\"");
    EXPECT_EQ(GetJSONUTF8String(std::numeric_limits<double>::infinity()), "null");
    EXPECT_EQ(GetJSONUTF8String(std::nan("")), "null");
    EXPECT_EQ(GetJSONUTF8String(5.0), "5.0");
    EXPECT_EQ(GetJSONUTF8String(-0.0), "-0.0");
    EXPECT_EQ(GetJSONUTF8String(1e300), "1e+300");
    EXPECT_EQ(GetJSONUTF8String(0.1), "0.1");
    EXPECT_EQ(GetJSONUTF8String(INT64_MIN), "-9223372036854775808");
    EXPECT_EQ(GetJSONString(JSONValue("\xC3\xA9")), u"\"\u00e9\"");
}

TEST(JSONTree, NestingIsBoundedWhenWritten) {
    JSONValue value;
    for (std::size_t level = 0; level <= kJSONMaximumDepth; ++level) {
        JSONValue outer;
        AppendToArray(outer, value);
        value = outer;
    }
    EXPECT_THROW(GetJSONUTF8String(value), std::runtime_error);
}

TEST(JSONTree, OneEnvelopeIsTakenOff) {
    const JSONValue twice =
        JSONParse(R"({"SerializerWrappedObject":{"SerializerWrappedObject":{"href":"x"},"href":"y"}})");
    EXPECT_EQ(GetVariantInObject(UnwrapSerializerObject(twice), "href").AsString(), "y");
    EXPECT_EQ(UnwrapSerializerObject(JSONParse("[1]")).Size(), 1u);
    EXPECT_TRUE(UnwrapSerializerObject(JSONParse(R"({"SerializerWrappedObject":null})")).IsNull());
}
