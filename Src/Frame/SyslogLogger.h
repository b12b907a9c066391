// The end of the process-wide syslog logger; its start is GetSyslogLogger in ZOClient/Library.h.
#pragma once

namespace ZOCL {

/// Takes the logger out of use if it was ever made. Main thread.
void ResetSyslogLogger();

}  // namespace ZOCL
