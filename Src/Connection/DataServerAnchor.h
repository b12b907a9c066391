// What holds on to a data server without keeping it alive.
#pragma once

#include "Connection/DataServer.h"
#include "ostcore/threads/Mutex.h"

namespace ZOCL {

/// The race: a notification wants the server while the last reference to it goes. The destructor waits for
/// the mutex before it lets the object vanish, so under the mutex the object can be looked at; but a count
/// that has reached 0 never rises again, so a reference is only added to a count above 0.
class DataServer::Anchor {
public:
    explicit Anchor(DataServer* inServer) : mServer(inServer) {}

    /// A reference to the server, null when it is gone or going.
    InterfaceRef<DataServer> Lock() {
        ostcore::threads::MutexLock lock(mMutex);
        if (!mServer) {
            return nullptr;
        }
        std::uint32_t count = mServer->mReferences.load(std::memory_order_relaxed);
        while (count > 0) {
            if (mServer->mReferences.compare_exchange_weak(count, count + 1, std::memory_order_relaxed)) {
                return InterfaceRef<DataServer>::Adopt(mServer);
            }
        }
        return nullptr;
    }
    void Clear() {
        ostcore::threads::MutexLock lock(mMutex);
        mServer = nullptr;
    }

private:
    ostcore::threads::Mutex mMutex;
    DataServer* mServer ZO_GUARDED_BY(mMutex);
};

}  // namespace ZOCL
