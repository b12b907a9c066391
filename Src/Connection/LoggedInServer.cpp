// The global lock and the logged-in server. Both live until the process ends, whatever else is torn down.
#include "Connection/LoggedInServer.h"

#include "ZOClient/Library.h"

namespace ZOCL {

using ostcore::threads::RecursiveMutex;
using ostcore::threads::ScopedLock;

namespace {

InterfaceRef<IZOCDataServer>& LoggedInServer() ZO_REQUIRES(IZOCDataServer::GetLock()) {
    static InterfaceRef<IZOCDataServer>& server = *new InterfaceRef<IZOCDataServer>;
    return server;
}

}  // namespace

const RecursiveMutex& IZOCDataServer::GetLock() {
    static const RecursiveMutex& mutex = *new RecursiveMutex;
    return mutex;
}

InterfaceRef<IZOCDataServer> IZOCDataServer::GetLoggedInServerRef() {
    ScopedLock lock(GetLock(), "IZOCDataServer::GetLoggedInServerRef");
    return LoggedInServer();
}

InterfaceRef<IZOCDataServer> ExchangeLoggedInServer(const InterfaceRef<IZOCDataServer>& inServer) {
    InterfaceRef<IZOCDataServer> former = inServer;
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::ExchangeLoggedInServer");
    std::swap(former, LoggedInServer());
    lock.Unlock();
    return former;
}

bool IsLoggedIn() {
    return static_cast<bool>(IZOCDataServer::GetLoggedInServerRef());
}

}  // namespace ZOCL
