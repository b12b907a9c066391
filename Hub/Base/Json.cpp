// Reading of JSON that strangers sent.
#include "Base/Json.h"

#include "Base/Error.h"

namespace zohub {

namespace {

// Nesting is counted before the parser sees the text, so a hostile depth costs nothing.
bool IsTooDeep(std::string_view inText) {
    std::size_t depth = 0;
    bool inString = false;
    for (std::size_t i = 0; i < inText.size(); ++i) {
        char const c = inText[i];
        if (inString) {
            if (c == '\\')
                ++i;
            else if (c == '"')
                inString = false;
            continue;
        }
        if (c == '"')
            inString = true;
        else if (c == '{' || c == '[') {
            if (++depth > kMaxJsonDepth)
                return true;
        } else if ((c == '}' || c == ']') && depth > 0)
            --depth;
    }
    return false;
}

bool IsTickTime(Json const& inValue) {
    return inValue.is_object() && inValue.contains("ticks") && inValue["ticks"].is_number_integer();
}

bool AreStrings(Json const& inValue) {
    if (!inValue.is_array())
        return false;
    for (auto const& item : inValue)
        if (!item.is_string())
            return false;
    return true;
}

bool HasKind(Json const& inValue, JsonKind inKind) {
    switch (inKind) {
        case JsonKind::String:
            return inValue.is_string();
        case JsonKind::Boolean:
            return inValue.is_boolean();
        case JsonKind::Integer:
            return inValue.is_number_integer();
        case JsonKind::Object:
            return inValue.is_object();
        case JsonKind::Strings:
            return AreStrings(inValue);
        case JsonKind::TickTime:
            return IsTickTime(inValue);
        case JsonKind::StringOrNull:
            return inValue.is_string() || inValue.is_null();
        case JsonKind::BooleanOrNull:
            return inValue.is_boolean() || inValue.is_null();
        case JsonKind::ObjectOrNull:
            return inValue.is_object() || inValue.is_null();
    }
    return false;
}

char const* KindName(JsonKind inKind) {
    switch (inKind) {
        case JsonKind::String:
            return "a string";
        case JsonKind::Boolean:
            return "a boolean";
        case JsonKind::Integer:
            return "an integer";
        case JsonKind::Object:
            return "an object";
        case JsonKind::Strings:
            return "an array of strings";
        case JsonKind::TickTime:
            return "an object with an integer under \"ticks\"";
        case JsonKind::StringOrNull:
            return "a string or null";
        case JsonKind::BooleanOrNull:
            return "a boolean or null";
        case JsonKind::ObjectOrNull:
            return "an object or null";
    }
    return "";
}

}  // namespace

Json ParseJson(std::string_view inText, std::string const& inWhat) {
    if (IsTooDeep(inText))
        throw Failure(400, "json-too-deep",
                      inWhat + " is nested deeper than " + std::to_string(kMaxJsonDepth) +
                          " levels; send a flatter document.");
    try {
        return Json::parse(inText.begin(), inText.end());
    } catch (nlohmann::json::exception const& error) {
        throw Failure(400, "json-malformed",
                      inWhat + " is not well-formed JSON in UTF-8 (error " + std::to_string(error.id) + ").");
    }
}

Json ParseJsonObject(std::string_view inText, std::string const& inWhat) {
    Json value = ParseJson(inText, inWhat);
    if (!value.is_object())
        throw Failure(400, "json-not-an-object", inWhat + " must be a JSON object.");
    return value;
}

std::string JsonText(Json const& inValue) {
    return inValue.dump();
}

void CheckKeys(Json const& inObject, std::initializer_list<KeyRule> inRules, std::string const& inWhat) {
    for (auto const& rule : inRules) {
        auto const found = inObject.find(rule.key);
        if (found == inObject.end() || HasKind(*found, rule.kind))
            continue;
        throw Failure(
            400, "json-wrong-type",
            "\"" + std::string(rule.key) + "\" in " + inWhat + " must be " + KindName(rule.kind) + ".");
    }
}

std::string StringUnder(Json const& inObject, char const* inKey) {
    auto const found = inObject.find(inKey);
    return found != inObject.end() && found->is_string() ? found->get<std::string>() : std::string();
}

}  // namespace zohub
