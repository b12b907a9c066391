// Sign-ins that the library makes by itself or with the user's help. All of it runs on the main thread.
#pragma once

#include "ZOClient/Credentials.h"
#include "ZOClient/Export.h"
#include "ZOClient/Types.h"

namespace ZOCL {

/// Signs in under a progress window with a cancel button; the server becomes the logged-in one. The caption
/// may be empty. Null when the user name is empty, or both token and password are; when the server did not
/// accept them or the user cancelled; and off the main thread, where nothing is done.
ZOCL_EXPORT InterfaceRef<IZOCDataServer> LoginToServerWithProgressDialog(const ImmutableString& inServer,
                                                                         bool inSecure,
                                                                         const ZOSCredentials& inCredentials,
                                                                         const UString& inCaption);

/// Takes over what another process of this user has stored of its login: signs in when nobody is signed in
/// here; takes a new token of the same user and server for the present login, whose waiting requests then go
/// on; and treats the present login as lost when the other process has signed in as somebody else or
/// elsewhere. Posts ZOInitializeConnectionMessage when a token was accepted; a token that was not is
/// forgotten. A call while one is at work is made up for when that one ends. Main thread only.
ZOCL_EXPORT void HandleAutoAuthentication();

/// Calls HandleAutoAuthentication soon, and from then on whenever another process stores a login, until
/// Shutdown. Further calls have no effect. Threads: any.
ZOCL_EXPORT void HandleFirstAutoAuthentication();

/// After a sign-in: whether it may go on. When the user is signed in more than once, a window lists the
/// logins and lets the user continue or sign out; signing out posts ZOTerminateConnectionMessage and gives
/// false. Also false when nobody is signed in or the user cannot be loaded. True at once, without a window,
/// when the debug database says so ("ZOClient.ShouldSuppressUI"). Main thread only.
ZOCL_EXPORT bool HandleMultipleLogins();

}  // namespace ZOCL
