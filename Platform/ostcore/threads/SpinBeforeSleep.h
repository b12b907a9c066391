// How a mutex is taken whose holders let it go after a few instructions.
#pragma once

namespace ostcore {
namespace threads {
namespace detail {

/// Tells the processor that a thread waits for another one.
inline void PauseProcessor() noexcept {
#if defined(__x86_64__)
    __builtin_ia32_pause();
#elif defined(__aarch64__)
    __asm__ __volatile__("yield");
#endif
}

/// Locks. Tries for about a microsecond before it lets the thread sleep: to be woken takes several of them,
/// and what the locks of this library guard is done in less.
template <typename Lockable>
void LockOrSleep(Lockable& ioLockable) {
    constexpr int kTries = 64;
    for (int tries = 0; tries < kTries; ++tries) {
        if (ioLockable.try_lock()) {
            return;
        }
        PauseProcessor();
    }
    ioLockable.lock();
}

}  // namespace detail
}  // namespace threads
}  // namespace ostcore
