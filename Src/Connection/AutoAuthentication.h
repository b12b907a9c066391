// The watch over the logins of other processes; its start is HandleFirstAutoAuthentication.
#pragma once

namespace ZOCL {

/// No sign-in begins by itself afterwards. Main thread.
void StopAutoAuthentication();

}  // namespace ZOCL
