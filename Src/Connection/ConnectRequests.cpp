// The table of connect requests.
#include "Connection/ConnectRequests.h"

#include <map>

#include "ostcore/threads/RecursiveMutex.h"

namespace ZOCL {

using ostcore::threads::RecursiveMutex;
using ostcore::threads::ScopedLock;

namespace {

struct Table {
    RecursiveMutex mutex;
    std::map<Guid, shared_ptr<AsyncConnectRequestInfo>> requests ZO_GUARDED_BY(mutex);
};

Table& TheTable() {
    static Table& table = *new Table;
    return table;
}

}  // namespace

void AsyncConnectRequestInfo::SetCurrentRequest(
    const Guid& inRequestID, const shared_ptr<ostnet::http::RequestProcessor>& inProcessor) {
    ScopedLock lock(IZOCDataServer::GetLock(), "AsyncConnectRequestInfo::SetCurrentRequest");
    mCurrentRequestID = inRequestID;
    mCurrentProcessor = inProcessor;
}

bool AsyncConnectRequestInfo::IsCancelled() const {
    ScopedLock lock(IZOCDataServer::GetLock(), "AsyncConnectRequestInfo::IsCancelled");
    return mIsCancelled;
}

void AsyncConnectRequestInfo::TryToCancel() {
    Guid requestID;
    shared_ptr<ostnet::http::RequestProcessor> processor;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "AsyncConnectRequestInfo::TryToCancel");
        mIsCancelled = true;
        requestID = mCurrentRequestID;
        processor = mCurrentProcessor;
    }
    if (processor) {
        processor->TryToCancelRequest(requestID);
    }
}

shared_ptr<AsyncConnectRequestInfo> AddNewConnectRequest(const Guid& inConnectID,
                                                         const InterfaceRef<IZOCDataServer>& inServer) {
    auto info = boost::make_shared<AsyncConnectRequestInfo>(inServer);
    Table& table = TheTable();
    ScopedLock lock(table.mutex, "AddNewConnectRequest");
    table.requests[inConnectID] = info;
    return info;
}

shared_ptr<AsyncConnectRequestInfo> GetConnectRequest(const Guid& inConnectID) {
    Table& table = TheTable();
    ScopedLock lock(table.mutex, "GetConnectRequest");
    const auto found = table.requests.find(inConnectID);
    return found == table.requests.end() ? nullptr : found->second;
}

bool RemoveConnectRequest(const Guid& inConnectID) {
    shared_ptr<AsyncConnectRequestInfo> info;
    Table& table = TheTable();
    ScopedLock lock(table.mutex, "CompleteConnectRequest");
    const auto found = table.requests.find(inConnectID);
    if (found == table.requests.end()) {
        return false;
    }
    info.swap(found->second);
    table.requests.erase(found);
    lock.Unlock();
    return true;
}

}  // namespace ZOCL
