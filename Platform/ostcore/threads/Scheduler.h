// The one source of time and timers: the system's for a host, a virtual one for tests.
#pragma once

#include <cstddef>
#include <cstdint>
#include <utility>

#include "ostcore/Export.h"
#include "ostcore/threads/Clock.h"
#include "ostcore/Types.h"

namespace ostcore {
namespace threads {

/// Tells the time and runs functions later. Threads: any.
class ZOPLATFORM_EXPORT Scheduler : public Clock {
public:
    using TimerID = std::uint64_t;
    static constexpr TimerID kNoTimer = 0;

    /// Runs the function once after the delay (a negative one counts as none), on the scheduler's thread and
    /// never on the stack of this call. The function must be short and not block: whoever has work to do
    /// posts it to an executor. kNoTimer: refused, the function will not run.
    virtual TimerID Schedule(Duration inDelay, function<void()> inFunction) = 0;
    /// True: the function has not begun and never will. False: it has run, runs now, or was never known.
    virtual bool Cancel(TimerID inTimer) = 0;
};

/// Real time, with one thread of its own that starts with the first timer.
///
/// Timers run in the order of their times, those of one time in the order of their Schedule calls. The
/// destructor drops what waits, and waits for a running function unless that very function calls it.
class ZOPLATFORM_EXPORT SystemScheduler final : public Scheduler {
public:
    SystemScheduler();
    ~SystemScheduler() override;
    SystemScheduler(const SystemScheduler&) = delete;
    SystemScheduler& operator=(const SystemScheduler&) = delete;

    MonotonicTime Now() const override;
    ptime UTCNow() const override;
    TimerID Schedule(Duration inDelay, function<void()> inFunction) override;
    bool Cancel(TimerID inTimer) override;

private:
    class Core;
    shared_ptr<Core> mCore;
};

/// Time that stands still until a test moves it. Other threads may schedule while it is advanced.
class ZOPLATFORM_EXPORT VirtualScheduler final : public Scheduler {
public:
    /// Begins at 2030-01-01 00:00:00 UTC.
    VirtualScheduler();
    ~VirtualScheduler() override;
    VirtualScheduler(const VirtualScheduler&) = delete;
    VirtualScheduler& operator=(const VirtualScheduler&) = delete;

    MonotonicTime Now() const override;
    ptime UTCNow() const override;
    TimerID Schedule(Duration inDelay, function<void()> inFunction) override;
    bool Cancel(TimerID inTimer) override;

    /// Moves the time on and runs what falls due on the way, in time order, on the calling thread; each
    /// function sees the time that it asked for. What a function schedules within the span runs too.
    /// Returns how many ran. An exception of a function ends the call and reaches the caller.
    std::size_t Advance(Duration inSpan);
    /// Advances to the next timer and runs all that is due then; 0 when none waits.
    std::size_t AdvanceToNext();
    /// How far off the next timer is; none when nothing waits.
    optional<Duration> TimeToNext() const;
    std::size_t PendingCount() const;
    /// Sets the wall clock alone, as an administrator would; the monotonic time does not notice.
    void SetUTC(const ptime& inTime);

private:
    class Core;
    shared_ptr<Core> mCore;
};

/// The scheduler that everything uses which was not given another; never null.
ZOPLATFORM_EXPORT shared_ptr<Scheduler> GetGlobalScheduler();
/// Puts another in its place and returns the former; null restores the system's. Timers stay with the
/// scheduler that they were given to. For tests and their hosts, before anything starts.
ZOPLATFORM_EXPORT shared_ptr<Scheduler> SetGlobalScheduler(shared_ptr<Scheduler> inScheduler);

/// Installs a scheduler for a scope and puts the former back.
class ScopedGlobalScheduler {
public:
    explicit ScopedGlobalScheduler(shared_ptr<Scheduler> inScheduler)
        : mFormer(SetGlobalScheduler(std::move(inScheduler))) {}
    ~ScopedGlobalScheduler() { SetGlobalScheduler(mFormer); }
    ScopedGlobalScheduler(const ScopedGlobalScheduler&) = delete;
    ScopedGlobalScheduler& operator=(const ScopedGlobalScheduler&) = delete;

private:
    shared_ptr<Scheduler> mFormer;
};

}  // namespace threads
}  // namespace ostcore
