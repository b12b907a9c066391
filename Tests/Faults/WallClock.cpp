// This program's own versions of the system's clock calls: the loader binds the libraries' calls to them.
#include "WallClock.h"

#include <sys/syscall.h>
#include <sys/time.h>
#include <time.h>
#include <unistd.h>

#include <atomic>

namespace faults {
namespace {

std::atomic<long> gOffset{0};

}  // namespace

void MoveWallClock(long inSeconds) {
    gOffset = inSeconds;
}

}  // namespace faults

extern "C" {

__attribute__((visibility("default"), no_sanitize("thread", "address"))) int clock_gettime(
    clockid_t inClock, timespec* outTime) noexcept {
    const long result = syscall(SYS_clock_gettime, inClock, outTime);
    if (result == 0 && (inClock == CLOCK_REALTIME || inClock == CLOCK_REALTIME_COARSE)) {
        outTime->tv_sec += faults::gOffset.load(std::memory_order_relaxed);
    }
    return static_cast<int>(result);
}

__attribute__((visibility("default"))) int gettimeofday(timeval* outTime, void*) noexcept {
    timespec now{};
    const int result = clock_gettime(CLOCK_REALTIME, &now);
    outTime->tv_sec = now.tv_sec;
    outTime->tv_usec = now.tv_nsec / 1000;
    return result;
}

__attribute__((visibility("default"))) time_t time(time_t* outTime) noexcept {
    timespec now{};
    clock_gettime(CLOCK_REALTIME, &now);
    if (outTime) {
        *outTime = now.tv_sec;
    }
    return now.tv_sec;
}
}
