// A gate that opens once.
#include "ostcore/threads/Gate.h"

#include <chrono>

namespace ostcore {
namespace threads {

void Gate::Open() {
    // Told under the lock: a waiter may destroy the gate as soon as it gets through.
    MutexLock lock(mMutex);
    mOpen = true;
    mChanged.NotifyAll();
}

bool Gate::IsOpen() const {
    MutexLock lock(mMutex);
    return mOpen;
}

bool Gate::PassThrough(Gate& inGate, std::uint32_t inMilliseconds) {
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::milliseconds(inMilliseconds);
    MutexLock lock(inGate.mMutex);
    while (!inGate.mOpen) {
        if (inMilliseconds == kWaitForever) {
            inGate.mChanged.Wait(lock);
        } else if (!inGate.mChanged.WaitUntil(lock, deadline)) {
            return inGate.mOpen;
        }
    }
    return true;
}

bool Gate::PassThrough(const shared_ptr<Gate>& inGate, std::uint32_t inMilliseconds) {
    if (!inGate) {
        return true;
    }
    const shared_ptr<Gate> held = inGate;  // the caller's reference may go while we wait
    return PassThrough(*held, inMilliseconds);
}

}  // namespace threads
}  // namespace ostcore
