// The messages that the library posts on its station (GetStationID). All are delivered on the main thread.
#pragma once

#include "RFL/Messaging.h"
#include "ZOClient/IZOCDataServer.h"
#include "ZOClient/ServerFeatureReport.h"

namespace ZOCL {

/// A login was accepted and its data server has become the logged-in one.
struct ZOCL_EXPORT ZOLoginMessage : RFL::MessageImpl<ZOLoginMessage> {};

/// IZOCDataServer::Terminate has ended the session.
struct ZOCL_EXPORT ZOLogoutMessage : RFL::MessageImpl<ZOLogoutMessage> {};

/// An automatic sign-in was accepted (HandleAutoAuthentication).
struct ZOCL_EXPORT ZOInitializeConnectionMessage : RFL::MessageImpl<ZOInitializeConnectionMessage> {};

/// The connection ends without the host asking for it: the user gave up on a login that had expired, or
/// signed out from a window of the library. Delivered before the operation that posts it goes on.
struct ZOCL_EXPORT ZOTerminateConnectionMessage : RFL::MessageImpl<ZOTerminateConnectionMessage> {
    bool forced = false;
};

/// The network to the hub of a data server looks down, after several failures in a row, or is back. Requests
/// wait and are tried again meanwhile; a host can show that without a window. A failure that outlives the
/// user's wait is told again.
struct ZOCL_EXPORT ZONetworkStateMessage : RFL::MessageImpl<ZONetworkStateMessage> {
    bool isDown = false;
};

/// A connect request has ended; posted before its completion is called.
struct ZOCL_EXPORT IZOCDataServer::LoginCompleteMessage
    : RFL::MessageImpl<IZOCDataServer::LoginCompleteMessage> {
    Guid requestID;
    /// Null on failure.
    InterfaceRef<IZOCDataServer> server;
    int result = 0;
    /// The last response of the sequence; null when there was none.
    shared_ptr<ostnet::Response> response;
};

/// A new report on a server has been read.
struct ZOCL_EXPORT ServerFeatureReportUpdatedMessage : RFL::MessageImpl<ServerFeatureReportUpdatedMessage> {
    /// The server's base URL without its scheme.
    ImmutableString url;
    shared_ptr<ServerFeatureReport const> report;
};

}  // namespace ZOCL
