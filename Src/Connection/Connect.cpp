// The exported ways to a data server, and the way out.
#include "Connection/ConnectSequence.h"
#include "Connection/LoggedInServer.h"
#include "Frame/Station.h"
#include "HLM/HLM.h"
#include "ostcore/debug/Trace.h"
#include "ostcore/utility/StringConversion.h"
#include "PollCancellation.h"
#include "ResourceFactory.h"
#include "ZOClient/Messages.h"
#include "ZOClient/Registry.h"

namespace ZOCL {

namespace {

using ConnectCompletion = IZOCDataServer::ConnectCompletion;

/// A bare host name gets scheme and port; whatever has a scheme is taken at its word.
ImmutableString MakeDiscoveryURL(const ImmutableString& inServer, bool inSecure) {
    const bool isBareName = !inServer.IsNull() && inServer.view().find("://") == std::string_view::npos;
    return IZOCDataServer::GetDiscoveryURL(isBareName ? IZOCDataServer::MakeDataServerURL(inServer, inSecure)
                                                      : inServer);
}

void OnLoginComplete(const ImmutableString& inServerText, const ConnectCompletion& inCompletion,
                     const Guid& inRequestID, const InterfaceRef<IZOCDataServer>& inServer, int inResult,
                     const shared_ptr<ostnet::Response>& inResponse) {
    if (!inServer && ostcore::debug::TraceEnabled("ZOCL", ostcore::debug::kTraceLevel_Lifetime)) {
        ostcore::debug::Trace("ZOCL", ostcore::debug::kTraceLevel_Lifetime,
                              "OnLoginComplete(): failed to connect to server: " + inServerText.str());
    }
    IZOCDataServer::LoginCompleteMessage message;
    message.requestID = inRequestID;
    message.server = inServer;
    message.result = inResult;
    message.response = inResponse;
    PostLibraryMessage(message);
    if (inCompletion) {
        inCompletion(inRequestID, inServer, inResult, inResponse);
    }
}

bool Connect(const DataServer::Settings& inSettings, const ImmutableString& inServerText, Guid& outRequestID,
             const ConnectCompletion& inCompletion) {
    const InterfaceRef<DataServer> server = DataServer::Create(inSettings);
    const ImmutableString text = inServerText.IsNull() ? server->GetServerBaseURL() : inServerText;
    outRequestID = Guid::CreateUnique();
    return server->Authenticate(
        [text, inCompletion](const Guid& inRequestID, const InterfaceRef<IZOCDataServer>& inServer,
                             int inResult, const shared_ptr<ostnet::Response>& inResponse) {
            OnLoginComplete(text, inCompletion, inRequestID, inServer, inResult, inResponse);
        },
        outRequestID);
}

}  // namespace

bool IZOCDataServer::ConnectToServer(const ImmutableString& inServer, const ZOSCredentials& inCredentials,
                                     Guid& outRequestID, bool inSecure, const ConnectCompletion& inCompletion,
                                     bool inKeepCredentials, bool inBecomeLoggedIn) {
    return Connect(
        {MakeDiscoveryURL(inServer, inSecure), inCredentials, inSecure, inKeepCredentials, inBecomeLoggedIn},
        inServer, outRequestID, inCompletion);
}

bool IZOCDataServer::ConnectToServerFromDiscoveryURL(const ImmutableString& inDiscoveryURL,
                                                     const ZOSCredentials& inCredentials, Guid& outRequestID,
                                                     bool inSecure, const ConnectCompletion& inCompletion,
                                                     bool inKeepCredentials, bool inBecomeLoggedIn) {
    return Connect({inDiscoveryURL, inCredentials, inSecure, inKeepCredentials, inBecomeLoggedIn},
                   ImmutableString(), outRequestID, inCompletion);
}

InterfaceRef<IZOCDataServer> IZOCDataServer::CreateDataServerRef(const ImmutableString& inServer,
                                                                 const ZOSCredentials& inCredentials,
                                                                 bool inSecure, bool inKeepCredentials,
                                                                 bool inBecomeLoggedIn) {
    return DataServer::Create(
        {MakeDiscoveryURL(inServer, inSecure), inCredentials, inSecure, inKeepCredentials, inBecomeLoggedIn});
}

bool IZOCDataServer::CreateUnauthenticatedDataServer(
    const Guid& inRequestID, const ImmutableString& inServer,
    const function<void(int inResult, InterfaceRef<IZOCDataServer> inServer)>& inCompletion, bool inSecure) {
    const DataServer::Settings settings{GetDiscoveryURL(MakeDataServerURL(inServer, inSecure)),
                                        ZOSCredentials(), inSecure, false, false};
    const auto onLoaded = [inCompletion](const Guid&, const InterfaceRef<IZOCDataServer>& inLoaded,
                                         int inResult, const shared_ptr<ostnet::Response>&) {
        inCompletion(inResult, inLoaded);
    };
    return boost::make_shared<ConnectSequence>(DataServer::Create(settings), inRequestID,
                                               ConnectSequence::Goal::kDocumentsOnly, onLoaded)
        ->Start();
}

void IZOCDataServer::CancelConnectRequest(const Guid& inRequestID) {
    if (const auto info = GetConnectRequest(inRequestID)) {
        info->TryToCancel();
    }
}

void IZOCDataServer::Terminate(bool inEndSession) {
    if (PollCancellation* const polls = GetCompositionRoot().polls) {
        polls->CancelAllOutstandingPolls();
    }
    const InterfaceRef<DataServer> server = RFL::QueryInterface<DataServer>(ExchangeLoggedInServer(nullptr));
    const ZOLoginData login = server ? server->GetLoginData() : ZOLoginData();
    if (server) {
        server->EndUse();
    }
    if (!inEndSession) {
        return;
    }
    Registry::ClearAuthToken(login.token);
    if (HLM::GetIsHeadless() && !login.username.IsNull()) {
        Registry::ClearAuthToken(login.token, ostcore::utility::ToUTF16(login.username.view()));
    }
    if (server) {
        server->SendLogout();
    }
    PostLibraryMessage(ZOLogoutMessage());
}

}  // namespace ZOCL
