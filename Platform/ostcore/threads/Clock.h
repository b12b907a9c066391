// The two times of the house: the monotonic one for deadlines, the wall's for what people and protocols read.
#pragma once

#include <chrono>

#include "ostcore/Export.h"
#include "ostcore/Types.h"

namespace ostcore {
namespace threads {

using Duration = std::chrono::steady_clock::duration;
using MonotonicTime = std::chrono::steady_clock::time_point;

/// Tells the time. Threads: any.
class ZOPLATFORM_EXPORT Clock {
public:
    virtual ~Clock();
    /// Never goes back, knows nothing of the wall clock; deadlines and ages are measured with it.
    virtual MonotonicTime Now() const = 0;
    /// The date and time in UTC, with microseconds; it can jump.
    virtual ptime UTCNow() const = 0;
};

}  // namespace threads
}  // namespace ostcore
