// The sign-in as an operation, and the window around it.
#include "Connection/LoginWithProgress.h"

#include "Connection/ServerURLs.h"
#include "Frame/BatchOperationBase.h"
#include "Frame/ProgressWindow.h"
#include "ostcore/config/ZString.h"
#include "ostcore/debug/Trace.h"
#include "ostcore/threads/MainThread.h"
#include "ostcore/threads/Mutex.h"
#include "ostcore/utility/StringConversion.h"
#include "ZOClient/Authentication.h"

namespace ZOCL {

using ostcore::threads::Mutex;
using ostcore::threads::MutexLock;

namespace {

const char kTitle[] = "$$$/ZOCL/ZOLoginProgressDialog/ZOLoginProgressDialogTitle=Orvane Meridane Sign In";
const char kCaption[] = "$$$/ZOCL/ZOLoginProgressCaption=Connecting to @0...";

void TraceFailure(const char* inText, const ImmutableString& inServer) {
    if (ostcore::debug::TraceEnabled("ZOCL", ostcore::debug::kTraceLevel_Error)) {
        ostcore::debug::Trace("ZOCL", ostcore::debug::kTraceLevel_Error, inText + inServer.str());
    }
}

/// One connect. Its completion holds it, so that it outlives the window.
class ZOLoginOperation final : public BatchOperationBase {
public:
    ZOLoginOperation(const ImmutableString& inServer, bool inSecure, const ZOSCredentials& inCredentials,
                     LoginRole inRole)
        : mServerText(inServer), mSecure(inSecure), mCredentials(inCredentials), mRole(inRole) {}

    UString GetDescription() override { return u"ZOC LoginOperation"; }

    bool Start() override {
        const auto onConnected = [self = InterfaceRef<ZOLoginOperation>(this)](
                                     const Guid&, const InterfaceRef<IZOCDataServer>& inServer, int inResult,
                                     const shared_ptr<ostnet::Response>&) {
            self->OnConnected(inServer, inResult);
        };
        Guid request;
        const bool started =
            IZOCDataServer::ConnectToServer(mServerText, mCredentials, request, mSecure, onConnected, false,
                                            mRole == LoginRole::kBecomeLoggedIn);
        if (!started) {
            TraceFailure("ZOLoginOperation failed to start connection to server: ", mServerText);
            return false;
        }
        MutexLock lock(mMutex);
        mRequest = request;
        return true;
    }

    void Abort() override {
        Guid request;
        {
            MutexLock lock(mMutex);
            request = mRequest;
        }
        IZOCDataServer::CancelConnectRequest(request);
    }

    InterfaceRef<IZOCDataServer> TakeServer() {
        MutexLock lock(mMutex);
        return std::move(mServer);
    }

private:
    void OnConnected(const InterfaceRef<IZOCDataServer>& inServer, int inResult) {
        if (!inServer) {
            TraceFailure("ZOLoginOperation failed to connect to server: ", mServerText);
        }
        {
            MutexLock lock(mMutex);
            mServer = inServer;
        }
        Finish(inResult);
    }

    const ImmutableString mServerText;
    const bool mSecure;
    const ZOSCredentials mCredentials;
    const LoginRole mRole;
    Mutex mMutex;
    Guid mRequest ZO_GUARDED_BY(mMutex);
    InterfaceRef<IZOCDataServer> mServer ZO_GUARDED_BY(mMutex);
};

}  // namespace

InterfaceRef<IZOCDataServer> SignInUnderProgress(const ImmutableString& inServer, bool inSecure,
                                                 const ZOSCredentials& inCredentials,
                                                 const UString& inCaption, LoginRole inRole) {
    const bool hasProof = !inCredentials.token.IsNull() || !inCredentials.password.empty();
    if (inCredentials.username.IsNull() || !hasProof) {
        return nullptr;
    }
    const InterfaceRef<ZOLoginOperation> operation(
        new ZOLoginOperation(inServer, inSecure, inCredentials, inRole));
    ProgressWindowSettings settings;
    settings.title = ostcore::ZString(kTitle).AsUTF8();
    settings.caption =
        inCaption.empty() ? ostcore::ZString(kCaption, {std::string(WithoutScheme(inServer.view()))}).AsUTF8()
                          : ostcore::utility::ToUTF8(inCaption);
    RunProgressWindow(operation, settings);
    return operation->TakeServer();
}

InterfaceRef<IZOCDataServer> LoginToServerWithProgressDialog(const ImmutableString& inServer, bool inSecure,
                                                             const ZOSCredentials& inCredentials,
                                                             const UString& inCaption) {
    return SignInUnderProgress(inServer, inSecure, inCredentials, inCaption, LoginRole::kBecomeLoggedIn);
}

}  // namespace ZOCL
