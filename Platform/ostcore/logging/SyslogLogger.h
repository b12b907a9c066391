// Structured log lines to a syslog server (RFC 5424 over UDP, RFC 5426), as a favour that never costs its
// caller.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "ostcore/Export.h"
#include "ostcore/Types.h"
#include "ostcore/utility/Guid.h"

namespace ostcore {
namespace logging {

/// Severities of RFC 5424, section 6.2.1.
enum class SyslogSeverity : std::uint8_t {
    Emergency = 0,
    Alert = 1,
    Critical = 2,
    Error = 3,
    Warning = 4,
    Notice = 5,
    Informational = 6,
    Debug = 7
};

/// Name and value of each structured field.
using SyslogFields = std::vector<std::pair<std::string, std::string>>;

/// Sends log lines to a server. Never blocks, never throws, never fails its caller: without a server, or when
/// the network does not take a line at once, the line is dropped. Threads: any.
class ZOPLATFORM_EXPORT ISyslogLogger {
public:
    virtual ~ISyslogLogger();
    /// Where the lines go: an IPv4 or IPv6 address, or a host name, which is looked up in the background.
    /// An empty address switches off.
    virtual void SetServer(const std::string& inAddress, std::uint16_t inPort) = 0;
    /// Sends one line. Secrets are blanked and control characters replaced first.
    virtual void Log(SyslogSeverity inSeverity, std::string_view inMessage, const SyslogFields& inFields) = 0;
};

/// A logger that names the client, its build, whether it is headless, and the process.
ZOPLATFORM_EXPORT shared_ptr<ISyslogLogger> CreateSyslogLogger(bool inIsHeadless,
                                                               const utility::Guid& inProcessID);
/// The same for a host with windows, under this process's instance identifier.
ZOPLATFORM_EXPORT shared_ptr<ISyslogLogger> CreateSyslogLogger();

/// The logger that the whole process uses; null when none is set. Threads: any.
ZOPLATFORM_EXPORT shared_ptr<ISyslogLogger> GetStructuredLogger();
ZOPLATFORM_EXPORT void SetStructuredLogger(shared_ptr<ISyslogLogger> inLogger);

}  // namespace logging
}  // namespace ostcore
