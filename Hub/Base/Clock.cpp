// Wall-clock time and its two text forms.
#include "Base/Clock.h"

#include <chrono>
#include <cstdio>
#include <ctime>

namespace zohub {

namespace {

std::tm ToCalendar(Micros inTime) {
    std::time_t const seconds = static_cast<std::time_t>(inTime / kSecond);
    std::tm calendar{};
    gmtime_r(&seconds, &calendar);
    return calendar;
}

}  // namespace

Clock SystemClock() {
    return [] {
        auto const now = std::chrono::system_clock::now().time_since_epoch();
        return static_cast<Micros>(std::chrono::duration_cast<std::chrono::microseconds>(now).count());
    };
}

std::string FormatTime(Micros inTime) {
    std::tm const t = ToCalendar(inTime);
    char text[64];
    std::snprintf(text, sizeof text, "%04d-%02d-%02dT%02d:%02d:%02d.%06dZ", t.tm_year + 1900, t.tm_mon + 1,
                  t.tm_mday, t.tm_hour, t.tm_min, t.tm_sec, static_cast<int>(inTime % kSecond));
    return text;
}

std::string FormatHttpTime(Micros inTime) {
    static char const* const kDays[] = {"Sun", "Mon", "Tue", "Wed", "Thu", "Fri", "Sat"};
    static char const* const kMonths[] = {"Jan", "Feb", "Mar", "Apr", "May", "Jun",
                                          "Jul", "Aug", "Sep", "Oct", "Nov", "Dec"};
    std::tm const t = ToCalendar(inTime);
    char text[64];
    std::snprintf(text, sizeof text, "%s, %02d %s %04d %02d:%02d:%02d GMT", kDays[t.tm_wday % 7], t.tm_mday,
                  kMonths[t.tm_mon % 12], t.tm_year + 1900, t.tm_hour, t.tm_min, t.tm_sec);
    return text;
}

}  // namespace zohub
