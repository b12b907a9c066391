// One writer at a time: zo processes of one user and state directory take turns on a session, so that none
// takes the transaction of another for one that was left behind.
#pragma once

#include "Context.h"

namespace zo {

/// Held until it goes away, and by nobody once its process has ended in whatever way. The constructor waits
/// and throws a Failure (cancelled) after an interrupt. Connected contexts only.
class WriteLock {
public:
    explicit WriteLock(Context& ioContext);
    ~WriteLock();
    WriteLock(const WriteLock&) = delete;
    WriteLock& operator=(const WriteLock&) = delete;

private:
    int mDescriptor = -1;
};

}  // namespace zo
