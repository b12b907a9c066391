// The typed readers, and the one form of dates.
#include "ostcore/serialization/JSONReaders.h"

#include <boost/date_time/gregorian/gregorian_types.hpp>
#include <stdexcept>

namespace ostcore {
namespace serialization {

namespace {

/// The value under a key for an optional reader: absent when it is null.
JSONView FindValue(JSONView inObject, std::string_view inKey) {
    const JSONView value = inObject.Find(inKey);
    return value.IsNull() ? JSONView() : value;
}

[[noreturn]] void ThrowMalformedDate() {
    throw std::runtime_error("A date is malformed; it must be like 2016-03-31T10:00:00Z");
}

/// Reads a text of fixed form from its start to its end.
class DateScanner {
public:
    explicit DateScanner(std::string_view inText) : mText(inText) {}

    bool AtEnd() const { return mText.empty(); }
    char TakeCharacter() {
        if (mText.empty()) {
            ThrowMalformedDate();
        }
        const char character = mText.front();
        mText.remove_prefix(1);
        return character;
    }
    void Expect(char inCharacter) {
        if (TakeCharacter() != inCharacter) {
            ThrowMalformedDate();
        }
    }
    int TakeNumber(int inDigits, int inHighest) {
        int number = 0;
        for (int digit = 0; digit < inDigits; ++digit) {
            const char character = TakeCharacter();
            if (character < '0' || character > '9') {
                ThrowMalformedDate();
            }
            number = number * 10 + (character - '0');
        }
        if (number > inHighest) {
            ThrowMalformedDate();
        }
        return number;
    }
    /// The microseconds of a fraction; digits beyond the sixth are dropped.
    std::int64_t TakeFraction() {
        if (mText.empty() || mText.front() != '.') {
            return 0;
        }
        mText.remove_prefix(1);
        std::int64_t microseconds = 0;
        int digits = 0;
        for (; !mText.empty() && mText.front() >= '0' && mText.front() <= '9'; ++digits) {
            if (digits < 6) {
                microseconds = microseconds * 10 + (mText.front() - '0');
            }
            mText.remove_prefix(1);
        }
        if (digits == 0) {
            ThrowMalformedDate();
        }
        for (; digits < 6; ++digits) {
            microseconds *= 10;
        }
        return microseconds;
    }

private:
    std::string_view mText;
};

boost::posix_time::time_duration TakeZone(DateScanner& ioText) {
    namespace pt = boost::posix_time;
    if (ioText.AtEnd()) {
        return pt::time_duration();
    }
    const char sign = ioText.TakeCharacter();
    if (sign == 'Z') {
        return pt::time_duration();
    }
    if (sign != '+' && sign != '-') {
        ThrowMalformedDate();
    }
    const int hours = ioText.TakeNumber(2, 23);
    ioText.Expect(':');
    const int minutes = ioText.TakeNumber(2, 59);
    const pt::time_duration offset = pt::hours(hours) + pt::minutes(minutes);
    return sign == '-' ? offset : -offset;
}

}  // namespace

ImmutableString ReadMandatoryString(JSONView inObject, std::string_view inKey) {
    const JSONView value = inObject.Find(inKey);
    return value.IsPresent() ? value.AsInternedString() : ImmutableString();
}

bool ReadOptionalString(JSONView inObject, std::string_view inKey, ImmutableString& ioTarget) {
    const JSONView value = FindValue(inObject, inKey);
    if (!value.IsPresent()) {
        return false;
    }
    ioTarget = value.AsInternedString();
    return true;
}

bool ReadOptionalString(JSONView inObject, std::string_view inKey, std::string& ioTarget) {
    const JSONView value = FindValue(inObject, inKey);
    if (!value.IsPresent()) {
        return false;
    }
    ioTarget = value.AsString();
    return true;
}

bool ReadOptionalBoolean(JSONView inObject, std::string_view inKey, bool& ioTarget) {
    const JSONView value = FindValue(inObject, inKey);
    if (!value.IsPresent()) {
        return false;
    }
    ioTarget = value.AsBool();
    return true;
}

bool ReadOptionalBoolean(JSONView inObject, std::string_view inKey, optional<bool>& ioTarget) {
    bool value = false;
    if (!ReadOptionalBoolean(inObject, inKey, value)) {
        return false;
    }
    ioTarget = value;
    return true;
}

bool ReadOptionalInt64(JSONView inObject, std::string_view inKey, std::int64_t& ioTarget) {
    const JSONView value = FindValue(inObject, inKey);
    if (!value.IsPresent()) {
        return false;
    }
    ioTarget = value.AsInt64();
    return true;
}

bool ReadOptionalInt32(JSONView inObject, std::string_view inKey, std::int32_t& ioTarget) {
    const JSONView value = FindValue(inObject, inKey);
    if (!value.IsPresent()) {
        return false;
    }
    ioTarget = value.AsInt32();
    return true;
}

bool ReadOptionalUInt32(JSONView inObject, std::string_view inKey, std::uint32_t& ioTarget) {
    const JSONView value = FindValue(inObject, inKey);
    if (!value.IsPresent()) {
        return false;
    }
    ioTarget = value.AsUInt32();
    return true;
}

bool ReadOptionalDouble(JSONView inObject, std::string_view inKey, double& ioTarget) {
    const JSONView value = FindValue(inObject, inKey);
    if (!value.IsPresent()) {
        return false;
    }
    ioTarget = value.AsDouble();
    return true;
}

bool ReadOptionalDate(JSONView inObject, std::string_view inKey, ptime& ioTarget) {
    const JSONView value = FindValue(inObject, inKey);
    if (!value.IsPresent()) {
        return false;
    }
    ioTarget = ParseDate(value.AsString());
    return true;
}

bool ReadOptionalStringList(JSONView inObject, std::string_view inKey,
                            std::vector<ImmutableString>& ioTarget) {
    const JSONView list = ReadList(inObject, inKey);
    if (!list.IsPresent()) {
        return false;
    }
    std::vector<ImmutableString> strings;
    list.ForEachElement([&](JSONView inElement) { strings.push_back(inElement.AsInternedString()); });
    ioTarget = std::move(strings);
    return true;
}

std::int64_t ReadTicks(JSONView inObject, std::string_view inKey, std::int64_t inDefault) {
    const JSONView time = ReadObject(inObject, inKey);
    if (!time.IsPresent()) {
        return inDefault;
    }
    std::int64_t ticks = 0;
    ReadOptionalInt64(time, "ticks", ticks);
    return ticks;
}

JSONView ReadObject(JSONView inObject, std::string_view inKey) {
    const JSONView value = FindValue(inObject, inKey);
    if (value.IsPresent() && !value.IsObject()) {
        ThrowWrongJSONType();
    }
    return value;
}

JSONView ReadList(JSONView inObject, std::string_view inKey) {
    const JSONView value = FindValue(inObject, inKey);
    if (value.IsPresent() && !value.IsArray()) {
        ThrowWrongJSONType();
    }
    return value;
}

ptime ParseDate(std::string_view inText) {
    namespace pt = boost::posix_time;
    if (inText.empty()) {
        return ptime();
    }
    DateScanner text(inText);
    const int year = text.TakeNumber(4, 9999);
    text.Expect('-');
    const int month = text.TakeNumber(2, 12);
    text.Expect('-');
    const int day = text.TakeNumber(2, 31);
    text.Expect('T');
    const int hour = text.TakeNumber(2, 23);
    text.Expect(':');
    const int minute = text.TakeNumber(2, 59);
    text.Expect(':');
    const int second = text.TakeNumber(2, 59);
    const pt::time_duration time =
        pt::hours(hour) + pt::minutes(minute) + pt::seconds(second) + pt::microseconds(text.TakeFraction());
    const pt::time_duration zone = TakeZone(text);
    if (!text.AtEnd()) {
        ThrowMalformedDate();
    }
    try {
        const boost::gregorian::date date(static_cast<unsigned short>(year),
                                          static_cast<unsigned short>(month),
                                          static_cast<unsigned short>(day));
        const ptime result = ptime(date, time) + zone;
        // The zone can carry a time out of the years that dates have; nobody could read it then.
        result.date().year_month_day();
        return result;
    } catch (const std::out_of_range&) {
        ThrowMalformedDate();
    }
}

}  // namespace serialization
}  // namespace ostcore
