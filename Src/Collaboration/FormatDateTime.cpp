// How the library shows a time.
#include <boost/date_time/posix_time/posix_time.hpp>
#include <ctime>
#include <locale>
#include <sstream>

#include "ostcore/utility/StringConversion.h"
#include "ZOClient/CommitMetadata.h"

namespace ZOCL {

namespace {

/// Boost's own conversion refuses times before 1970.
ptime ToLocalTime(const ptime& inUTC) {
    static const ptime epoch(boost::gregorian::date(1970, 1, 1));
    const std::time_t seconds = static_cast<std::time_t>((inUTC - epoch).total_seconds());
    std::tm local{};
    if (!localtime_r(&seconds, &local)) {
        return inUTC;
    }
    try {
        return boost::posix_time::ptime_from_tm(local);
    } catch (const std::exception&) {
        return inUTC;  // beyond the calendar by less than a day
    }
}

}  // namespace

UString FormatDateTime(const ptime& inTime, const char* inFormat) {
    if (inTime.is_special() || !inFormat) {
        return UString();
    }
    std::ostringstream text;
    text.imbue(std::locale(std::locale::classic(), new boost::posix_time::time_facet(inFormat)));
    text << ToLocalTime(inTime);
    return ostcore::utility::ToUTF16(text.str());
}

}  // namespace ZOCL
