// One JSON object as zo writes it: the schema version and the type first, then what the verb has to say.
#pragma once

#include <boost/date_time/posix_time/ptime.hpp>
#include <string>

#include "ostcore/serialization/JSON.h"

namespace zo {

/// The version of what --json writes. Keys and types are only ever added to it.
constexpr int kJsonSchema = 1;

class Json {
public:
    explicit Json(const char* inType) : Json() {
        Set("schema", kJsonSchema);
        Set("type", inType);
    }
    /// An object inside another one.
    static Json Part() { return Json(); }

    template <class T>
    Json& Set(const char* inKey, const T& inValue) {
        ostcore::serialization::AddToObject(mValue, inKey, ostcore::serialization::JSONValue(inValue));
        return *this;
    }
    Json& Set(const char* inKey, const Json& inValue) { return Set(inKey, inValue.mValue); }
    /// ISO 8601 in UTC, null for not-a-date-time.
    Json& Set(const char* inKey, const boost::posix_time::ptime& inTime);
    /// An array of anything that makes a JSON value.
    template <class Range>
    Json& SetList(const char* inKey, const Range& inRange) {
        auto list = ostcore::serialization::JSONValue::EmptyArray();
        for (const auto& element : inRange) {
            ostcore::serialization::AppendToArray(list, Value(element));
        }
        return Set(inKey, list);
    }

    std::string Text() const { return ostcore::serialization::GetJSONUTF8String(mValue); }

private:
    Json() : mValue(ostcore::serialization::JSONValue::EmptyObject()) {}
    static const ostcore::serialization::JSONValue& Value(const Json& inJson) { return inJson.mValue; }
    template <class T>
    static ostcore::serialization::JSONValue Value(const T& inValue) {
        return ostcore::serialization::JSONValue(inValue);
    }

    ostcore::serialization::JSONValue mValue;
};

/// "2026-11-24T17:52:59Z", empty for not-a-date-time.
std::string IsoTime(const boost::posix_time::ptime& inTime);
/// "2026-11-24 17:52", for tables, in UTC; "-" for not-a-date-time.
std::string ShortTime(const boost::posix_time::ptime& inTime);

}  // namespace zo
