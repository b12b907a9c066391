// A host of the client library in a few lines, for benchmarks: it waits where a host would not, and ends the
// program at the first thing that fails.
#pragma once

#include <algorithm>
#include <condition_variable>
#include <cstdint>
#include <functional>
#include <mutex>

#include "HubProcess.h"
#include "ZOClient/IZOCDataServer.h"
#include "ZOClient/IZOCEditingSession.h"

namespace bench {

/// Ends the program when the condition does not hold.
void Demand(bool inCondition, const char* inWhat);

/// Waits for the end of one request.
class Ended {
public:
    ZOCL::RequestCompletion Completion();
    ZOCL::InterfaceRef<ZOCL::IZOCServerResource> Wait(bool inStarted, const char* inWhat);

private:
    std::mutex mMutex;
    std::condition_variable mChanged;
    bool mIsDone = false;
    int mResult = 0;
    ZOCL::InterfaceRef<ZOCL::IZOCServerResource> mResource;
};

/// Runs many requests, ten at a time; each that ends starts the next.
class Many {
public:
    using Start = std::function<bool(std::size_t inIndex, const ZOCL::RequestCompletion& inCompletion)>;

    Many(std::size_t inCount, Start inStart) : mCount(inCount), mStart(std::move(inStart)) {}
    void Run(const char* inWhat);

private:
    void StartNext();
    void OnEnded(int inResult);

    const std::size_t mCount;
    const Start mStart;
    const char* mWhat = "";
    std::mutex mMutex;
    std::condition_variable mChanged;
    std::size_t mNext = 0;
    std::size_t mDone = 0;
};

/// Of this process, by all its connections.
std::uint64_t RequestsSoFar();

template <class Interface, class Reference>
ZOCL::InterfaceRef<Interface> As(const Reference& inObject) {
    auto found = RFL::QueryInterface<Interface>(inObject);
    Demand(static_cast<bool>(found), "an object does not answer an interface that it must have");
    return found;
}

template <class Reference>
void LoadNow(const Reference& inObject, const char* inWhat) {
    Demand(As<ZOCL::IZOCServerResource>(inObject)->Load(false), inWhat);
}

ZOCL::InterfaceRef<ZOCL::IZOCDataServer> SignIn(const HubProcess& inHub, const char* inUser);
/// A new, empty one of the name "Bench".
ZOCL::InterfaceRef<ZOCL::IZOCProduction> MakeProduction(
    const ZOCL::InterfaceRef<ZOCL::IZOCDataServer>& inServer);
ZOCL::InterfaceRef<ZOCL::IZOCEditingSession> OpenSession(
    const ZOCL::InterfaceRef<ZOCL::IZOCProduction>& inProduction);
ZOCL::InterfaceRef<ZOCL::IZOCTransaction> OpenTransaction(
    const ZOCL::InterfaceRef<ZOCL::IZOCEditingSession>& inSession, const ZOCL::ImmutableString& inType);

}  // namespace bench
