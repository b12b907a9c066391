// The process-wide syslog logger, made at first use.
#include "Frame/SyslogLogger.h"

#include "HLM/HLM.h"
#include "ostcore/config/ClientInfo.h"
#include "ostcore/logging/SyslogLogger.h"
#include "ostcore/threads/Mutex.h"
#include "ZOClient/Library.h"

namespace ZOCL {

namespace {

using ostcore::logging::ISyslogLogger;

struct Holder {
    ostcore::threads::Mutex mutex;
    shared_ptr<ISyslogLogger> logger ZO_GUARDED_BY(mutex);
};

Holder& TheHolder() {
    static Holder holder;
    return holder;
}

}  // namespace

shared_ptr<ISyslogLogger> GetSyslogLogger() {
    Holder& holder = TheHolder();
    ostcore::threads::MutexLock lock(holder.mutex);
    if (!holder.logger) {
        holder.logger = ostcore::logging::CreateSyslogLogger(HLM::GetIsHeadless(),
                                                             ostcore::config::GetProcessInstanceID());
        ostcore::logging::SetStructuredLogger(holder.logger);
    }
    return holder.logger;
}

void ResetSyslogLogger() {
    Holder& holder = TheHolder();
    shared_ptr<ISyslogLogger> former;
    {
        ostcore::threads::MutexLock lock(holder.mutex);
        former.swap(holder.logger);
    }
    if (former) {
        ostcore::logging::SetStructuredLogger(nullptr);
    }
}

}  // namespace ZOCL
