// The text of one syslog line.
#pragma once

#include <string>
#include <string_view>

#include "ostcore/logging/SyslogLogger.h"
#include "ostcore/Types.h"

namespace ostcore {
namespace logging {

/// Who speaks; each is made to fit its header field.
struct SyslogOrigin {
    std::string hostName;
    std::string clientName;
    std::string buildNumber;
    std::string processID;
    bool isHeadless = false;
};

/// A line of RFC 5424: header, one structured element with the origin and the fields, the message in UTF-8.
/// At most 2048 bytes, which every receiver should take (section 6.1); a longer message is cut.
std::string FormatSyslogLine(const SyslogOrigin& inOrigin, const ptime& inTime, SyslogSeverity inSeverity,
                             std::string_view inMessage, const SyslogFields& inFields);

}  // namespace logging
}  // namespace ostcore
