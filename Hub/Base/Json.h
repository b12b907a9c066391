// Reading of JSON that strangers sent: bounded nesting, and a Failure with a clear text for everything wrong.
#pragma once

#include <nlohmann/json.hpp>
#include <string>
#include <string_view>

namespace zohub {

/// Keeps the order of keys, so that what a client stored goes back as it came.
using Json = nlohmann::ordered_json;

constexpr std::size_t kMaxJsonDepth = 64;

/// Parses the text; inWhat names it in the error ("the body of the request").
/// Throws Failure 400 for malformed, too deeply nested or too large numbers.
Json ParseJson(std::string_view inText, std::string const& inWhat);

/// As ParseJson, and the root is an object.
Json ParseJsonObject(std::string_view inText, std::string const& inWhat);

/// The compact text of a value.
std::string JsonText(Json const& inValue);

enum class JsonKind {
    String,
    Boolean,
    Integer,
    Object,
    Strings,
    TickTime,
    StringOrNull,
    BooleanOrNull,
    ObjectOrNull
};

/// One key of a body and the form that its value must have when it is present.
struct KeyRule {
    char const* key;
    JsonKind kind;
};

/// Throws Failure 400 at the first key whose value has the wrong form.
void CheckKeys(Json const& inObject, std::initializer_list<KeyRule> inRules, std::string const& inWhat);

/// The string under the key, or an empty one when the key is absent.
std::string StringUnder(Json const& inObject, char const* inKey);

}  // namespace zohub
