// Operations that the system may tear down, as opposed to the user who stops them.
#pragma once

#include "RFL/RFLUnknown.h"

namespace ZOCL {

/// Threads: any.
class IForceAbortEnabledOperation : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f466f72636541ull, 0x626f727400000001ull};

    /// Ends the operation for this reason. It posts nothing any more: who calls this has taken over.
    virtual void ForceAbort(int inResult) = 0;
    virtual bool WasForceAborted() const = 0;
    /// The reason; kResultFailure before there is one.
    virtual int GetForceAbortResult() const = 0;
};

}  // namespace ZOCL
