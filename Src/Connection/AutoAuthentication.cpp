// Following what another process of the same user has stored of its login.
#include "Connection/AutoAuthentication.h"

#include "Connection/DataServer.h"
#include "Connection/LoginWithProgress.h"
#include "Frame/Station.h"
#include "ostcore/config/ZString.h"
#include "ostcore/threads/MainThread.h"
#include "ostcore/threads/Mutex.h"
#include "RFL/RegistryChangeNotifier.h"
#include "ZOClient/Authentication.h"
#include "ZOClient/Messages.h"
#include "ZOClient/Registry.h"
#include "ZOClient/ServerFeatureReport.h"

namespace ZOCL {

using ostcore::threads::Mutex;
using ostcore::threads::MutexLock;

namespace {

const char kCaption[] = "$$$/Cadenzo/ZOCL/AutoAuthenticateProgressCaption=Automatically connecting to @0...";

/// Main thread only: one run at a time, and one more when something changed meanwhile.
bool gIsRunning = false;
bool gRunAgain = false;

struct Watch {
    Mutex mutex;
    bool isOn ZO_GUARDED_BY(mutex) = false;
    shared_ptr<RFL::RegistryChangeNotifier> notifier ZO_GUARDED_BY(mutex);
};

Watch& TheWatch() {
    static Watch& watch = *new Watch;
    return watch;
}

bool IsWatchOn() {
    Watch& watch = TheWatch();
    MutexLock lock(watch.mutex);
    return watch.isOn;
}

/// Whether what is stored was written by this process. It may lag behind a sign-in that is not stored yet,
/// which must not be taken for one of somebody else.
bool IsStoredByUs() {
    ZOLoginData data;
    return IZOCDataServer::GetLoggedInServerRef() && Registry::GetLastLoginData(data, true, UString()) &&
           !data.token.IsNull() && data.token == Registry::GetLatestExpectedAuthToken();
}

ZOSCredentials MakeCredentials(const ZOLoginData& inData) {
    ZOSCredentials credentials;
    credentials.username = inData.username;
    credentials.token = inData.token;
    return credentials;
}

void SignIn(const ZOLoginData& inData, const InterfaceRef<DataServer>& inPresent) {
    const UString caption = ostcore::ZString(kCaption, {inData.serverURL.str()}).AsString();
    const LoginRole role = inPresent ? LoginRole::kCheckOnly : LoginRole::kBecomeLoggedIn;
    const InterfaceRef<IZOCDataServer> accepted =
        SignInUnderProgress(inData.serverURL, inData.secure, MakeCredentials(inData), caption, role);
    if (accepted && (!inPresent || inPresent->AdoptToken(accepted->GetCredentials().token))) {
        PostLibraryMessage(ZOInitializeConnectionMessage());
    } else if (!accepted) {
        Registry::ClearAuthToken(inData.token);
    }
}

void FollowOnce() {
    ZOLoginData data;
    if (!Registry::GetLastLoginData(data, true, UString())) {
        return;
    }
    const auto present = RFL::QueryInterface<DataServer>(IZOCDataServer::GetLoggedInServerRef());
    if (!present) {
        shared_ptr<ServerFeatureReport const> report;
        GetServerFeatureReport(IZOCDataServer::MakeDataServerURL(data.serverURL, data.secure), report);
        if (!data.token.IsNull()) {
            SignIn(data, nullptr);
        }
        return;
    }
    const ZOLoginData own = present->GetLoginData();
    const bool isSameLogin =
        IZOCDataServer::MakeDataServerURL(data.serverURL, data.secure) == present->GetServerBaseURL() &&
        data.username == own.username;
    if (!isSameLogin) {
        present->ScheduleWarnings();
    } else if (!data.token.IsNull() && data.token != own.token) {
        SignIn(data, present);
    }
}

}  // namespace

void HandleAutoAuthentication() {
    if (gIsRunning) {
        gRunAgain = true;
        return;
    }
    if (!ostcore::threads::IsMainThread()) {
        return;
    }
    gIsRunning = true;
    do {
        gRunAgain = false;
        FollowOnce();
    } while (gRunAgain);
    gIsRunning = false;
}

void HandleFirstAutoAuthentication() {
    {
        Watch& watch = TheWatch();
        MutexLock lock(watch.mutex);
        if (watch.isOn) {
            return;
        }
        watch.isOn = true;
    }
    const auto onChanged = [] {
        if (IsWatchOn() && !IsStoredByUs()) {
            HandleAutoAuthentication();
        }
    };
    shared_ptr<RFL::RegistryChangeNotifier> notifier = RFL::RegistryChangeNotifier::Create(
        RFL::RegistryRoot::User, Registry::GetZORegistryBaseKey(), onChanged);
    {
        Watch& watch = TheWatch();
        MutexLock lock(watch.mutex);
        if (watch.isOn) {
            watch.notifier.swap(notifier);
        }
    }
    if (notifier) {
        // Stopped meanwhile.
        notifier->Stop();
    }
    ostcore::threads::AsyncCallFromMainThread(onChanged);
}

void StopAutoAuthentication() {
    shared_ptr<RFL::RegistryChangeNotifier> notifier;
    {
        Watch& watch = TheWatch();
        MutexLock lock(watch.mutex);
        watch.isOn = false;
        notifier.swap(watch.notifier);
    }
    if (notifier) {
        notifier->Stop();
    }
}

}  // namespace ZOCL
