// Signing in while a progress window tells the user to wait.
#pragma once

#include "ZOClient/IZOCDataServer.h"

namespace ZOCL {

/// Whether the server that is signed in to becomes the logged-in one, or only shows that the credentials
/// hold.
enum class LoginRole { kBecomeLoggedIn, kCheckOnly };

/// Null when the credentials have no user name, or neither token nor password; when the sign-in failed or was
/// cancelled; and off the main thread. An empty caption stands for the standard one.
InterfaceRef<IZOCDataServer> SignInUnderProgress(const ImmutableString& inServer, bool inSecure,
                                                 const ZOSCredentials& inCredentials,
                                                 const UString& inCaption, LoginRole inRole);

}  // namespace ZOCL
