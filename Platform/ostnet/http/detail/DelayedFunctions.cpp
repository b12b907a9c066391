#include "ostnet/http/detail/DelayedFunctions.h"

namespace ostnet {
namespace http {

using ostcore::threads::MutexLock;
using ostcore::threads::Scheduler;

DelayedFunctions::DelayedFunctions(Due inDue) : mDue(std::move(inDue)) {}

bool DelayedFunctions::Add(const function<void()>& inFunction, std::uint32_t inDelayMilliseconds) {
    const auto scheduler = ostcore::threads::GetGlobalScheduler();
    std::uint64_t key = 0;
    {
        MutexLock lock(mMutex);
        if (mIsClosed) {
            return false;
        }
        key = mNextKey++;
        mWaiting[key] = {inFunction, scheduler, Scheduler::kNoTimer};
    }
    const auto timer =
        scheduler->Schedule(std::chrono::milliseconds(inDelayMilliseconds), [weak = weak_from_this(), key] {
            if (const auto self = weak.lock()) {
                self->OnDue(key);
            }
        });
    MutexLock lock(mMutex);
    const auto found = mWaiting.find(key);
    if (found == mWaiting.end()) {
        return true;  // it has been taken already
    }
    if (timer == Scheduler::kNoTimer) {
        const Entry refused = std::move(found->second);
        mWaiting.erase(found);
        lock.Unlock();
        return false;
    }
    found->second.timer = timer;
    return true;
}

void DelayedFunctions::OnDue(std::uint64_t inKey) {
    MutexLock lock(mMutex);
    auto node = mWaiting.extract(inKey);
    lock.Unlock();
    if (!node.empty()) {
        mDue(std::move(node.mapped().work));
    }
}

std::vector<function<void()>> DelayedFunctions::TakeAll() {
    std::map<std::uint64_t, Entry> taken;
    {
        MutexLock lock(mMutex);
        mIsClosed = true;
        taken.swap(mWaiting);
    }
    std::vector<function<void()>> functions;
    for (auto& [key, entry] : taken) {
        entry.scheduler->Cancel(entry.timer);
        functions.push_back(std::move(entry.work));
    }
    return functions;
}

}  // namespace http
}  // namespace ostnet
