// Reads, writes and compares the dates of XMP.
#include "OrvaneXMP/DateTime.h"

#include <cstddef>

namespace OrvaneXMP {

namespace {

constexpr std::size_t kLongestFraction = 32;

bool IsDigit(char inByte) noexcept {
    return inByte >= '0' && inByte <= '9';
}

/// Takes one piece after the other from the front of a text.
class Pieces {
public:
    explicit Pieces(std::string_view inText) : mRest(inText) {}

    bool AreAllTaken() const noexcept { return mRest.empty(); }
    bool Take(char inByte) noexcept {
        if (mRest.empty() || mRest.front() != inByte) {
            return false;
        }
        mRest.remove_prefix(1);
        return true;
    }
    /// Exactly so many digits, with a value between the bounds.
    template <class T>
    bool TakeNumber(std::size_t inDigits, unsigned inLowest, unsigned inHighest, T& outValue) noexcept {
        const std::string_view digits = TakeDigits(inDigits);
        unsigned value = 0;
        for (const char digit : digits) {
            value = value * 10 + static_cast<unsigned>(digit - '0');
        }
        outValue = static_cast<T>(value);
        return digits.size() == inDigits && value >= inLowest && value <= inHighest;
    }
    std::string_view TakeDigits(std::size_t inMost) noexcept {
        std::size_t size = 0;
        while (size < mRest.size() && size < inMost && IsDigit(mRest[size])) {
            ++size;
        }
        const std::string_view digits = mRest.substr(0, size);
        mRest.remove_prefix(size);
        return digits;
    }

private:
    std::string_view mRest;
};

unsigned DaysOfMonth(unsigned inYear, unsigned inMonth) noexcept {
    if (inMonth == 2) {
        const bool isLeap = (inYear % 4 == 0 && inYear % 100 != 0) || inYear % 400 == 0;
        return isLeap ? 29 : 28;
    }
    return inMonth == 4 || inMonth == 6 || inMonth == 9 || inMonth == 11 ? 30 : 31;
}

bool ReadZone(Pieces& ioPieces, DateTime& outDate) {
    if (ioPieces.AreAllTaken()) {
        return true;
    }
    if (ioPieces.Take('Z')) {
        outDate.zone = DateTime::Zone::UTC;
        return true;
    }
    outDate.zone = DateTime::Zone::Offset;
    outDate.isWestern = ioPieces.Take('-');
    unsigned hours = 0;
    unsigned minutes = 0;
    const bool isRead = (outDate.isWestern || ioPieces.Take('+')) && ioPieces.TakeNumber(2, 0, 23, hours) &&
                        ioPieces.Take(':') && ioPieces.TakeNumber(2, 0, 59, minutes);
    outDate.offsetMinutes = static_cast<std::uint16_t>(hours * 60 + minutes);
    return isRead;
}

bool ReadSeconds(Pieces& ioPieces, DateTime& outDate) {
    outDate.precision = DateTime::Precision::Second;
    if (!ioPieces.TakeNumber(2, 0, 59, outDate.second)) {
        return false;
    }
    if (!ioPieces.Take('.')) {
        return true;
    }
    outDate.precision = DateTime::Precision::Fraction;
    outDate.fraction = ioPieces.TakeDigits(kLongestFraction);
    return !outDate.fraction.empty();
}

bool ReadTime(Pieces& ioPieces, DateTime& outDate) {
    outDate.precision = DateTime::Precision::Minute;
    if (!ioPieces.TakeNumber(2, 0, 23, outDate.hour) || !ioPieces.Take(':') ||
        !ioPieces.TakeNumber(2, 0, 59, outDate.minute)) {
        return false;
    }
    return (!ioPieces.Take(':') || ReadSeconds(ioPieces, outDate)) && ReadZone(ioPieces, outDate);
}

bool ReadDay(Pieces& ioPieces, DateTime& outDate) {
    outDate.precision = DateTime::Precision::Day;
    return ioPieces.TakeNumber(2, 1, DaysOfMonth(outDate.year, outDate.month), outDate.day) &&
           (!ioPieces.Take('T') || ReadTime(ioPieces, outDate));
}

bool ReadMonth(Pieces& ioPieces, DateTime& outDate) {
    outDate.precision = DateTime::Precision::Month;
    return ioPieces.TakeNumber(2, 1, 12, outDate.month) &&
           (!ioPieces.Take('-') || ReadDay(ioPieces, outDate));
}

bool ReadYear(Pieces& ioPieces, DateTime& outDate) {
    return ioPieces.TakeNumber(4, 0, 9999, outDate.year) &&
           (!ioPieces.Take('-') || ReadMonth(ioPieces, outDate));
}

void AppendNumber(std::string& ioText, char inBefore, unsigned inValue) {
    ioText += inBefore;
    ioText += static_cast<char>('0' + inValue / 10 % 10);
    ioText += static_cast<char>('0' + inValue % 10);
}

/// Days since the first of March of the year 0, in the calendar of today.
std::int64_t DayNumber(const DateTime& inDate) noexcept {
    const std::int64_t year = inDate.year - (inDate.month <= 2 ? 1 : 0);
    const std::int64_t month = (inDate.month + 9) % 12;
    const std::int64_t leaps = (year + 4) / 4 - (year + 100) / 100 + (year + 400) / 400;
    return year * 365 + leaps + (month * 153 + 2) / 5 + inDate.day;
}

std::int64_t SecondNumber(const DateTime& inDate) noexcept {
    const std::int64_t minutes = (DayNumber(inDate) * 24 + inDate.hour) * 60 + inDate.minute;
    const std::int64_t offset = inDate.isWestern ? -std::int64_t{inDate.offsetMinutes} : inDate.offsetMinutes;
    return (minutes - offset) * 60 + inDate.second;
}

std::string_view SignificantFraction(const DateTime& inDate) noexcept {
    const std::string_view digits = inDate.fraction;
    return digits.substr(0, digits.find_last_not_of('0') + 1);
}

}  // namespace

ostcore::optional<DateTime> ParseDateTime(std::string_view inText) {
    Pieces pieces(inText);
    DateTime date;
    if (!ReadYear(pieces, date) || !pieces.AreAllTaken()) {
        return {};
    }
    return date;
}

std::string FormatDateTime(const DateTime& inDate) {
    using Precision = DateTime::Precision;
    std::string text;
    AppendNumber(text, '-', inDate.year / 100u);
    text.erase(0, 1);
    text += static_cast<char>('0' + inDate.year / 10 % 10);
    text += static_cast<char>('0' + inDate.year % 10);
    const auto append = [&](Precision inNeeded, char inBefore, unsigned inValue) {
        if (inDate.precision >= inNeeded) {
            AppendNumber(text, inBefore, inValue);
        }
    };
    append(Precision::Month, '-', inDate.month);
    append(Precision::Day, '-', inDate.day);
    append(Precision::Minute, 'T', inDate.hour);
    append(Precision::Minute, ':', inDate.minute);
    append(Precision::Second, ':', inDate.second);
    if (inDate.precision == Precision::Fraction) {
        text += "." + inDate.fraction;
    }
    if (inDate.zone == DateTime::Zone::UTC) {
        text += "Z";
    } else if (inDate.zone == DateTime::Zone::Offset) {
        AppendNumber(text, inDate.isWestern ? '-' : '+', inDate.offsetMinutes / 60u);
        AppendNumber(text, ':', inDate.offsetMinutes % 60u);
    }
    return text;
}

int CompareDateTime(const DateTime& inLeft, const DateTime& inRight) noexcept {
    const std::int64_t difference = SecondNumber(inLeft) - SecondNumber(inRight);
    if (difference != 0) {
        return difference < 0 ? -1 : 1;
    }
    const int order = SignificantFraction(inLeft).compare(SignificantFraction(inRight));
    return order == 0 ? 0 : (order < 0 ? -1 : 1);
}

}  // namespace OrvaneXMP
