// The host's main thread: who it is, and the queue of calls that it runs.
#pragma once

#include <cstddef>
#include <cstdint>

#include "ostcore/Export.h"
#include "ostcore/Types.h"

namespace ostcore {
namespace threads {

/// Declares the calling thread to be the main thread, unless one was declared before. True when the calling
/// thread is the main thread now. The library's initialisation calls it, so that a host need not.
ZOPLATFORM_EXPORT bool SetMainThread();
/// Takes the declaration back and drops what is queued. For tests, with no other thread at work.
ZOPLATFORM_EXPORT void ResetMainThread();
/// False on every thread while none is declared.
ZOPLATFORM_EXPORT bool IsMainThread();

/// Queues a function for the main thread and returns at once, also on the main thread itself. Functions run
/// in the order of the calls. Work queued before a main thread is declared waits for it. Threads: any.
ZOPLATFORM_EXPORT void AsyncCallFromMainThread(function<void()> inFunction);

/// Runs what is queued at this moment, and returns how many ran; what these functions queue in turn is left
/// to the next call. May be called from inside such a function: the inner call goes on in order. An exception
/// of one function is traced, and the rest runs. Main thread only; elsewhere nothing happens and 0 is
/// returned.
ZOPLATFORM_EXPORT std::size_t PumpMainThread();
/// Waits until something is queued or the time has passed (0xFFFFFFFF: for ever), then pumps.
ZOPLATFORM_EXPORT std::size_t WaitAndPumpMainThread(std::uint32_t inMilliseconds);
/// How many functions are queued. Threads: any.
ZOPLATFORM_EXPORT std::size_t MainThreadQueueSize();

/// Sets the function that is called after each AsyncCallFromMainThread, on the thread of that call and with
/// no lock held, so that the host's own loop wakes up and pumps. Called at once when work is already queued.
/// It must not block. An empty function removes it.
ZOPLATFORM_EXPORT void SetMainThreadWakeFunction(function<void()> inFunction);

}  // namespace threads
}  // namespace ostcore
