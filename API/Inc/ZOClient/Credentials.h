// Who signs in, and what is remembered of it.
#pragma once

#include <string>

#include "ZOClient/Types.h"

namespace ZOCL {

/// What a login needs. The password is cleared as soon as a token has been obtained.
struct ZOSCredentials {
    ImmutableString username;
    /// The whole text of the login cookie, "login-token=..."; null when there is none.
    ImmutableString token;
    /// UTF-8 bytes.
    std::string password;
};

/// The last login, as the registry keeps it and dialogs pass it around.
struct ZOLoginData {
    ImmutableString serverURL;
    ImmutableString username;
    ImmutableString token;
    bool secure = false;
};

}  // namespace ZOCL
