// Tells one listener that a resource has changed on the server.
#pragma once

#include <atomic>
#include <cstdint>

#include "ostcore/threads/Mutex.h"
#include "ZOClient/Export.h"
#include "ZOClient/Types.h"

namespace ZOCL {

/// A subscription to the changes of one resource (IZOCServerResource::SubscribeToChanges). The one who
/// subscribed ends it with StopNotifications and may drop the pointer only then: a poll in flight holds one
/// of its own.
///
/// Threads: any. The function is called on a worker of the network layer, on a thread of the polls, or on the
/// thread that subscribes; never on two at a time, and with no lock held. It must not wait for the main
/// thread. What it throws is traced and ends there.
class ZOCL_EXPORT ServerResourceChangeNotifier {
public:
    using Function = function<void(const InterfaceRef<IZOCServerResource>& inResource)>;

    /// Takes the resource's present tag for known. Without inNotifyWhenUnloaded the function is called for a
    /// loaded resource only, so a failure to reach the server is no news.
    ServerResourceChangeNotifier(const InterfaceRef<IZOCServerResource>& inResource,
                                 const Function& inFunction, bool inNotifyWhenUnloaded);
    ~ServerResourceChangeNotifier();
    ServerResourceChangeNotifier(const ServerResourceChangeNotifier&) = delete;
    ServerResourceChangeNotifier& operator=(const ServerResourceChangeNotifier&) = delete;

    const InterfaceRef<IZOCServerResource>& GetResource() const noexcept { return mResource; }
    /// The tag that was told last; null for a resource that was not loaded then.
    ImmutableString GetETag() const;
    bool IsStopped() const noexcept;
    /// No call begins afterwards; one that has begun may still be under way. Once is enough.
    void StopNotifications() noexcept;
    /// Takes the tag of the resource for known and calls the function. False, and no call: stopped, a null
    /// resource, one that is not loaded (unless that is news), or no function.
    bool Notify(const InterfaceRef<IZOCServerResource>& inResource);

private:
    const InterfaceRef<IZOCServerResource> mResource;
    ostcore::threads::Mutex mMutex;
    ImmutableString mETag ZO_GUARDED_BY(mMutex);
    const Function mFunction;
    std::atomic<std::int32_t> mIsStopped{0};
    const bool mNotifyWhenUnloaded;
};

}  // namespace ZOCL
