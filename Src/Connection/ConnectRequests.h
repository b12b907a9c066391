// The connect requests in progress, so that each can be cancelled at any time.
#pragma once

#include "ZOClient/IZOCDataServer.h"

namespace ZOCL {

/// One connect request: which HTTP request it waits at present.
class AsyncConnectRequestInfo {
public:
    explicit AsyncConnectRequestInfo(const InterfaceRef<IZOCDataServer>& inServer) : mServer(inServer) {}

    void SetCurrentRequest(const Guid& inRequestID,
                           const shared_ptr<ostnet::http::RequestProcessor>& inProcessor);
    bool IsCancelled() const;
    /// Marks the connect as cancelled and cancels the request that it waits for.
    void TryToCancel();

private:
    Guid mCurrentRequestID ZO_GUARDED_BY(IZOCDataServer::GetLock());
    shared_ptr<ostnet::http::RequestProcessor> mCurrentProcessor ZO_GUARDED_BY(IZOCDataServer::GetLock());
    bool mIsCancelled ZO_GUARDED_BY(IZOCDataServer::GetLock()) = false;
    /// Keeps the server alive for the duration.
    const InterfaceRef<IZOCDataServer> mServer;
};

shared_ptr<AsyncConnectRequestInfo> AddNewConnectRequest(const Guid& inConnectID,
                                                         const InterfaceRef<IZOCDataServer>& inServer);
/// Null when the request has ended or never was.
shared_ptr<AsyncConnectRequestInfo> GetConnectRequest(const Guid& inConnectID);
/// Takes a request out of the table. True for the one caller that ended it.
bool RemoveConnectRequest(const Guid& inConnectID);

}  // namespace ZOCL
