// Dates of XMP: a profile of ISO 8601 with parts left out from the right, and a zone or none.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "ostcore/Export.h"
#include "ostcore/Types.h"

namespace OrvaneXMP {

/// One of YYYY, YYYY-MM, YYYY-MM-DD, YYYY-MM-DDThh:mm, YYYY-MM-DDThh:mm:ss, YYYY-MM-DDThh:mm:ss.s (one digit
/// or more), those with a time followed by a zone or not: Z, +hh:mm or -hh:mm.
struct DateTime {
    enum class Precision : std::uint8_t { Year, Month, Day, Minute, Second, Fraction };
    enum class Zone : std::uint8_t { None, UTC, Offset };

    Precision precision = Precision::Year;
    Zone zone = Zone::None;
    /// True for a zone written with a minus, -00:00 included.
    bool isWestern = false;
    std::uint16_t year = 0;
    std::uint8_t month = 1;
    std::uint8_t day = 1;
    std::uint8_t hour = 0;
    std::uint8_t minute = 0;
    std::uint8_t second = 0;
    /// Of the zone, without its sign.
    std::uint16_t offsetMinutes = 0;
    /// The digits behind the point, as they were written; at most 32.
    std::string fraction;
};

/// None for what is not exactly one date: a day that the calendar does not have, a zone without a time, an
/// hour of 24, a leap second.
ZOPLATFORM_EXPORT ostcore::optional<DateTime> ParseDateTime(std::string_view inText);

/// The text that was parsed, character for character.
ZOPLATFORM_EXPORT std::string FormatDateTime(const DateTime& inDate);

/// Below 0, 0 or above 0 as the first is earlier than, at the same time as, or later than the second. What
/// was left out counts as its earliest value (2024 is 2024-01-01T00:00:00), and a time without a zone counts
/// as UTC, so that the answer is the same on every machine and the order is a total one.
ZOPLATFORM_EXPORT int CompareDateTime(const DateTime& inLeft, const DateTime& inRight) noexcept;

}  // namespace OrvaneXMP
