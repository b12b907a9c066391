// Whatever tree is written reads back as the same tree.
#include <gtest/gtest.h>
#include <rapidcheck.h>

#include <cmath>

#include "ostcore/serialization/JSON.h"
#include "ostcore/utility/StringConversion.h"

using namespace ostcore::serialization;

namespace {

rc::Gen<std::string> Texts() {
    return rc::gen::map(
        rc::gen::container<std::string>(rc::gen::arbitrary<char>()),
        [](const std::string& inBytes) { return ostcore::utility::ReplaceInvalidUTF8(inBytes); });
}

rc::Gen<JSONValue> Values(int inDepth) {
    const auto scalars = rc::gen::oneOf(
        rc::gen::map(rc::gen::arbitrary<bool>(), [](bool inValue) { return JSONValue(inValue); }),
        rc::gen::map(rc::gen::arbitrary<std::int64_t>(),
                     [](std::int64_t inValue) { return JSONValue(inValue); }),
        rc::gen::map(rc::gen::arbitrary<std::uint64_t>(),
                     [](std::uint64_t inValue) { return JSONValue(inValue); }),
        rc::gen::map(
            rc::gen::arbitrary<double>(),
            [](double inValue) { return std::isfinite(inValue) ? JSONValue(inValue) : JSONValue(); }),
        rc::gen::map(Texts(), [](const std::string& inText) { return JSONValue(inText); }));
    if (inDepth == 0) {
        return scalars;
    }
    const auto arrays = rc::gen::map(rc::gen::container<std::vector<JSONValue>>(Values(inDepth - 1)),
                                     [](const std::vector<JSONValue>& inElements) {
                                         JSONValue array = JSONValue::EmptyArray();
                                         for (const JSONValue& element : inElements) {
                                             AppendToArray(array, element);
                                         }
                                         return array;
                                     });
    const auto objects = rc::gen::map(rc::gen::container<std::vector<std::pair<std::string, JSONValue>>>(
                                          rc::gen::pair(Texts(), Values(inDepth - 1))),
                                      [](const std::vector<std::pair<std::string, JSONValue>>& inMembers) {
                                          JSONValue object = JSONValue::EmptyObject();
                                          for (const auto& member : inMembers) {
                                              AddToObject(object, member.first, member.second);
                                          }
                                          return object;
                                      });
    return rc::gen::oneOf(scalars, arrays, objects);
}

bool Same(JSONView inLeft, JSONView inRight) {
    if (inLeft.IsInteger() && inRight.IsInteger()) {
        const bool leftHigh = inLeft.Type() == JSONType::Unsigned && inLeft.AsUInt64() > INT64_MAX;
        const bool rightHigh = inRight.Type() == JSONType::Unsigned && inRight.AsUInt64() > INT64_MAX;
        return leftHigh == rightHigh &&
               (leftHigh ? inLeft.AsUInt64() == inRight.AsUInt64() : inLeft.AsInt64() == inRight.AsInt64());
    }
    if (inLeft.Type() != inRight.Type() ||
        ((inLeft.IsArray() || inLeft.IsObject()) && inLeft.Size() != inRight.Size())) {
        return false;
    }
    bool same = true;
    std::vector<std::pair<std::string_view, JSONView>> others;
    switch (inLeft.Type()) {
        case JSONType::Boolean:
            return inLeft.AsBool() == inRight.AsBool();
        case JSONType::Double:
            return inLeft.AsDouble() == inRight.AsDouble();
        case JSONType::String:
            return inLeft.AsString() == inRight.AsString();
        case JSONType::Array:
            inRight.ForEachElement([&](JSONView inElement) { others.emplace_back("", inElement); });
            break;
        case JSONType::Object:
            inRight.ForEachMember(
                [&](std::string_view inKey, JSONView inValue) { others.emplace_back(inKey, inValue); });
            break;
        default:
            return true;
    }
    std::size_t at = 0;
    if (inLeft.IsArray()) {
        inLeft.ForEachElement(
            [&](JSONView inElement) { same = Same(inElement, others[at++].second) && same; });
    } else {
        inLeft.ForEachMember([&](std::string_view inKey, JSONView inValue) {
            same = inKey == others[at].first && Same(inValue, others[at].second) && same;
            ++at;
        });
    }
    return same;
}

}  // namespace

TEST(JSONProperty, WhatIsWrittenReadsBackTheSame) {
    EXPECT_TRUE(rc::check("write then parse", [] {
        const JSONValue value = *rc::gen::resize(12, Values(3));
        const std::string text = GetJSONUTF8String(value);
        const JSONValue back = JSONParse(text);
        RC_ASSERT(Same(value, back));
        RC_ASSERT(GetJSONUTF8String(back) == text);
    }));
}

TEST(JSONProperty, AddingAMemberChangesNoOther) {
    EXPECT_TRUE(rc::check("copy on write", [] {
        JSONValue object = JSONValue::EmptyObject();
        for (int key = *rc::gen::inRange(0, 20); key > 0; --key) {
            AddToObject(object, *Texts(), *Values(1));
        }
        const std::string added = *Texts();
        const JSONValue parsed = JSONParse(GetJSONUTF8String(object));
        JSONValue changed = parsed;
        AddToObject(changed, added, "x");
        RC_ASSERT(GetVariantInObject(changed, added).AsString() == "x");
        JSONView(parsed).ForEachMember([&](std::string_view inKey, JSONView inValue) {
            if (inKey != added) {
                RC_ASSERT(Same(JSONView(changed).Find(inKey), inValue));
            }
        });
        RC_ASSERT(GetJSONUTF8String(parsed) == GetJSONUTF8String(object));
    }));
}
