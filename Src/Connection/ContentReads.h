// The requests that wait for the content cache, so that they can be cancelled.
#pragma once

#include <unordered_map>

#include "ostcore/threads/Mutex.h"
#include "ZOClient/Types.h"

namespace ZOCL {

/// Threads: any.
class ContentReads {
public:
    void Begin(const Guid& inRequestID) {
        ostcore::threads::MutexLock lock(mMutex);
        mReads.emplace(inRequestID, false);
    }
    /// False when no such request waits for the cache.
    bool Cancel(const Guid& inRequestID) {
        ostcore::threads::MutexLock lock(mMutex);
        const auto found = mReads.find(inRequestID);
        if (found == mReads.end()) {
            return false;
        }
        found->second = true;
        return true;
    }
    /// True when it was cancelled since it began.
    bool End(const Guid& inRequestID) {
        ostcore::threads::MutexLock lock(mMutex);
        const auto found = mReads.find(inRequestID);
        const bool isCancelled = found != mReads.end() && found->second;
        if (found != mReads.end()) {
            mReads.erase(found);
        }
        return isCancelled;
    }

private:
    ostcore::threads::Mutex mMutex;
    std::unordered_map<Guid, bool> mReads ZO_GUARDED_BY(mMutex);
};

}  // namespace ZOCL
