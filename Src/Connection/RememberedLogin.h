// What an accepted login leaves in the registry, for later runs and for the other processes of the user.
#pragma once

#include <string>

#include "ZOClient/Credentials.h"

namespace ZOCL {

/// After a login that the host asked for.
void RememberLogin(const ZOLoginData& inData);

/// After a new token for a login that goes on: stores it where the processes of this user look, if what is
/// stored there is this very login; a login of somebody else, or elsewhere, is left as it is.
void ShareRenewedLogin(const ZOLoginData& inData);

/// Overwrites the bytes before it lets them go.
void WipePassword(std::string& ioPassword);

}  // namespace ZOCL
