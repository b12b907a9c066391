// A host of the client library that waits for each call's end and counts all of them.
#pragma once

#include <condition_variable>
#include <functional>
#include <memory>
#include <mutex>

#include "ZOClient/IZOCDataServer.h"
#include "ZOClient/IZOCServerResource.h"

namespace campaign {

using ZOCL::Guid;
using ZOCL::ImmutableString;
using ZOCL::InterfaceRef;
using ZOCL::IZOCDataServer;
using ZOCL::IZOCServerResource;

/// How a call ended.
struct Ended {
    int result = ZOCL::kResultNotStarted;
    InterfaceRef<IZOCServerResource> resource;

    bool Succeeded() const { return result >= 0; }
};

struct CallCounts {
    unsigned long started = 0;
    unsigned long ended = 0;
    unsigned long endedAgain = 0;
};

class Host {
public:
    Host();
    /// Signs out of the library, not of the hub, and ends it.
    ~Host();
    Host(const Host&) = delete;
    Host& operator=(const Host&) = delete;

    int Connect(const std::string& inServer, const std::string& inUser, const std::string& inPassword);
    const InterfaceRef<IZOCDataServer>& Server() const { return mServer; }

    using Start = std::function<bool(const Guid&, const ZOCL::RequestCompletion&)>;
    /// Starts a call and runs the main thread until it has ended.
    Ended Run(const Start& inStart);
    CallCounts Counts() const;
    /// Whether the library has asked for the end of the process.
    bool WasEnded() const;

private:
    struct Calls;
    const std::shared_ptr<Calls> mCalls;
    InterfaceRef<IZOCDataServer> mServer;
};

}  // namespace campaign
