// A gate that opens once: one thread waits before it for what another has to finish.
#pragma once

#include <cstdint>

#include "ostcore/Export.h"
#include "ostcore/threads/Mutex.h"
#include "ostcore/Types.h"

namespace ostcore {
namespace threads {

/// Closed when made; open for good after Open. Threads: any.
class ZOPLATFORM_EXPORT Gate {
public:
    static constexpr std::uint32_t kWaitForever = 0xFFFFFFFFu;

    Gate() = default;
    Gate(const Gate&) = delete;
    Gate& operator=(const Gate&) = delete;

    /// Lets everybody through, now and later. What was written before is seen behind the gate.
    void Open();
    bool IsOpen() const;

    /// Waits until the gate is open, at most so many milliseconds of real time. True: it is open.
    static bool PassThrough(Gate& inGate, std::uint32_t inMilliseconds);
    /// The same; a null gate counts as open.
    static bool PassThrough(const shared_ptr<Gate>& inGate, std::uint32_t inMilliseconds);

private:
    mutable Mutex mMutex;
    ConditionVariable mChanged;
    bool mOpen ZO_GUARDED_BY(mMutex) = false;
};

}  // namespace threads
}  // namespace ostcore
