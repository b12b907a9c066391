// One subscription to a resource.
#include "ZOClient/ServerResourceChangeNotifier.h"

#include "ZOClient/IZOCServerResource.h"

namespace ZOCL {

using ostcore::threads::MutexLock;

ServerResourceChangeNotifier::ServerResourceChangeNotifier(const InterfaceRef<IZOCServerResource>& inResource,
                                                           const Function& inFunction,
                                                           bool inNotifyWhenUnloaded)
    : mResource(inResource),
      mETag(inResource ? inResource->GetETag(true) : ImmutableString()),
      mFunction(inFunction),
      mNotifyWhenUnloaded(inNotifyWhenUnloaded) {}

ServerResourceChangeNotifier::~ServerResourceChangeNotifier() = default;

ImmutableString ServerResourceChangeNotifier::GetETag() const {
    MutexLock lock(mMutex);
    return mETag;
}

bool ServerResourceChangeNotifier::IsStopped() const noexcept {
    return mIsStopped.load(std::memory_order_acquire) != 0;
}

void ServerResourceChangeNotifier::StopNotifications() noexcept {
    std::int32_t running = 0;
    mIsStopped.compare_exchange_strong(running, 1, std::memory_order_acq_rel);
}

bool ServerResourceChangeNotifier::Notify(const InterfaceRef<IZOCServerResource>& inResource) {
    if (IsStopped() || !inResource || (!mNotifyWhenUnloaded && !inResource->IsLoaded())) {
        return false;
    }
    ImmutableString tag = inResource->GetETag(true);
    {
        MutexLock lock(mMutex);
        std::swap(mETag, tag);
    }
    if (!mFunction) {
        return false;
    }
    mFunction(inResource);
    return true;
}

}  // namespace ZOCL
