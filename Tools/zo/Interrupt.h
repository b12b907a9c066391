// Ctrl-C and the other requests to end: noticed on a thread of their own, acted upon by the main loop.
#pragma once

#include <atomic>
#include <thread>

namespace zo {

/// Blocks SIGINT, SIGTERM and SIGHUP in this and all later threads and waits for them on one thread. The
/// first one asks for a clean end; the second one ends the process at once with code 130. Made before any
/// other thread, on the main thread; SIGPIPE is ignored from then on.
class Interrupt {
public:
    Interrupt();
    ~Interrupt();
    Interrupt(const Interrupt&) = delete;
    Interrupt& operator=(const Interrupt&) = delete;

    bool IsRequested() const noexcept { return mRequested.load(); }
    /// Readable from the first request on, for poll().
    int Descriptor() const noexcept { return mRequestedDescriptor; }

    /// Gives a child process the signals that this process blocks back; for between fork and exec.
    static void RestoreSignals();

private:
    void Watch();

    std::atomic<bool> mRequested{false};
    int mSignalDescriptor = -1;
    int mRequestedDescriptor = -1;
    int mStopDescriptor = -1;
    std::thread mThread;
};

}  // namespace zo
