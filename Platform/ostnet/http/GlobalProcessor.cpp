// The process-wide processor: made at first use, replaced by test hosts, shut down at the library's end.
#include "ostcore/threads/Mutex.h"
#include "ostnet/http/NetworkProcessor.h"

namespace ostnet {
namespace {

using ostcore::threads::Mutex;
using ostcore::threads::MutexLock;

/// Never destroyed: threads may ask for the processor until the very end of the process.
struct Global {
    Mutex mutex;
    shared_ptr<http::NetworkProcessor> network ZO_GUARDED_BY(mutex);
    shared_ptr<http::RequestProcessor> replacement ZO_GUARDED_BY(mutex);
    bool isShut ZO_GUARDED_BY(mutex) = false;

    shared_ptr<http::NetworkProcessor> TakeNetwork() {
        MutexLock lock(mutex);
        return network;
    }
};

Global& TheGlobal() {
    static auto* const sGlobal = new Global;
    return *sGlobal;
}

/// Stops the threads of a process that ends without Shutdown, before the statics are gone that they use. It
/// comes to stand after those, at the first use of the network, and so goes before them.
struct EndOfProcess {
    ~EndOfProcess() {
        if (const auto network = TheGlobal().TakeNetwork()) {
            network->Abandon();
        }
    }
};

}  // namespace

namespace http {

shared_ptr<RequestProcessor> GetGlobalRequestProcessor() {
    Global& global = TheGlobal();
    MutexLock lock(global.mutex);
    if (global.replacement) {
        return global.replacement;
    }
    if (!global.network) {
        static const EndOfProcess sEndOfProcess;
        global.network = make_shared<NetworkProcessor>(NetworkProcessor::SettingsSource(&GetNetworkSettings));
        if (global.isShut) {
            global.network->Shutdown();
        }
    }
    return global.network;
}

shared_ptr<RequestProcessor> SetGlobalRequestProcessor(shared_ptr<RequestProcessor> inProcessor) {
    Global& global = TheGlobal();
    MutexLock lock(global.mutex);
    std::swap(global.replacement, inProcessor);
    return inProcessor ? inProcessor : shared_ptr<RequestProcessor>(global.network);
}

}  // namespace http

void Shutdown() {
    Global& global = TheGlobal();
    shared_ptr<http::NetworkProcessor> network;
    {
        MutexLock lock(global.mutex);
        global.isShut = true;
        network = global.network;
    }
    if (network) {
        network->Shutdown();
    }
}

void Startup() {
    Global& global = TheGlobal();
    shared_ptr<http::NetworkProcessor> former;
    MutexLock lock(global.mutex);
    if (std::exchange(global.isShut, false)) {
        former.swap(global.network);
    }
    lock.Unlock();
}

}  // namespace ostnet
