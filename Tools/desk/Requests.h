// Calls of the library that are under way: what they bring comes back to the main thread.
#pragma once

#include <functional>
#include <memory>

#include "ZOClient/IZOCDataServer.h"

namespace Desk {

/// How a call ended.
struct Outcome {
    int result = ZOCL::kResultNotStarted;
    ZOCL::InterfaceRef<ZOCL::IZOCServerResource> resource;
    ZOCL::shared_ptr<ostnet::Response> response;

    /// "Not modified" is what a refresh hopes for.
    bool Succeeded() const { return result >= 0 || result == ZOCL::kResultHTTPNotModified; }
};

/// The library completes on its own threads, whereas windows belong to the main thread. This is the bridge:
/// every call that is started here ends with its function on the main thread, never on the caller's stack.
/// After Cancel, and when this object has gone, no function is called any more; what was started still ends
/// in the library, which owns all that it needs. Main thread only.
class Requests {
public:
    using Start = std::function<bool(const ZOCL::Guid&, const ZOCL::RequestCompletion&)>;
    using Done = std::function<void(const Outcome&)>;

    Requests();
    ~Requests();
    Requests(const Requests&) = delete;
    Requests& operator=(const Requests&) = delete;

    void Run(const Start& inStart, const Done& inDone);
    /// Loads a resource, or asks for its latest state when it is loaded.
    void Refresh(const ZOCL::InterfaceRef<ZOCL::IZOCServerResource>& inResource, const Done& inDone);
    /// Loads a resource unless it is loaded. A null one ends with kResultNotStarted.
    void Load(const ZOCL::InterfaceRef<ZOCL::IZOCServerResource>& inResource, const Done& inDone);
    template <class T>
    void Load(const ZOCL::InterfaceRef<T>& inObject, const Done& inDone) {
        Load(RFL::QueryInterface<ZOCL::IZOCServerResource>(inObject), inDone);
    }
    /// Runs what blocks elsewhere. It must own all that it uses.
    void RunBlocking(const std::function<void()>& inWork, const std::function<void()>& inDone);

    bool IsIdle() const;
    void Cancel();

private:
    struct State;
    std::shared_ptr<State> mState;
};

}  // namespace Desk
