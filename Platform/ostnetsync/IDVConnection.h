// Which machine this is.
#pragma once

#include <string>

#include "ostcore/Export.h"

namespace ostnetsync {

class ZOPLATFORM_EXPORT IDVConnection {
public:
    /// The identifier of this machine and user: a GUID as text, made once and kept in the state directory,
    /// so that it is the same in every process and run. When it can be neither read nor kept there, it is
    /// that of this process. Read once per process. Threads: any.
    static std::string GetIDVDeviceID();
};

}  // namespace ostnetsync
