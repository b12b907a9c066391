// Forms of time for JSON and for tables.
#include "Json.h"

#include <boost/date_time/posix_time/posix_time_types.hpp>
#include <cstdio>

namespace zo {

Json& Json::Set(const char* inKey, const boost::posix_time::ptime& inTime) {
    return inTime.is_special() ? Set(inKey, nullptr) : Set(inKey, IsoTime(inTime));
}

std::string IsoTime(const boost::posix_time::ptime& inTime) {
    if (inTime.is_special()) {
        return {};
    }
    const auto day = inTime.date().year_month_day();
    const auto time = inTime.time_of_day();
    char text[64];
    std::snprintf(text, sizeof text, "%04d-%02d-%02dT%02d:%02d:%02dZ", static_cast<int>(day.year),
                  static_cast<int>(day.month.as_number()), static_cast<int>(day.day.as_number()),
                  static_cast<int>(time.hours()), static_cast<int>(time.minutes()),
                  static_cast<int>(time.seconds()));
    return text;
}

std::string ShortTime(const boost::posix_time::ptime& inTime) {
    const std::string iso = IsoTime(inTime);
    return iso.empty() ? "-" : iso.substr(0, 10) + " " + iso.substr(11, 5);
}

}  // namespace zo
