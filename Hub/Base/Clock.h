// Wall-clock time as microseconds since 1970 in UTC; a parameter everywhere, so that tests can set it.
#pragma once

#include <cstdint>
#include <functional>
#include <string>

namespace zohub {

using Micros = std::int64_t;
using Clock = std::function<Micros()>;

constexpr Micros kSecond = 1000000;
constexpr Micros kDay = 86400 * kSecond;

Clock SystemClock();

/// "2026-11-24T17:32:51.000123Z", the form in which dates travel.
std::string FormatTime(Micros inTime);

/// "Tue, 24 Nov 2026 17:32:51 GMT", the form of HTTP headers.
std::string FormatHttpTime(Micros inTime);

}  // namespace zohub
