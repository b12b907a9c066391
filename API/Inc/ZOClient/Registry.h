// What the client remembers between runs, and what the processes of one user share of a login.
#pragma once

#include <vector>

#include "ZOClient/Credentials.h"
#include "ZOClient/Export.h"
#include "ZOClient/Types.h"

namespace ZOCL {

/// All operations block on the registry, for a bounded time. A failure of the registry is a false return.
/// Threads: any; processes: any number.
namespace Registry {

/// Names of two values under the base key. The second belongs to the host alone.
ZOCL_EXPORT extern const UString kRegistryHasLoggedInValue;
ZOCL_EXPORT extern const UString kRegistryFileTransferQueueValue;

/// The key under which everything is kept, ending with a backslash.
ZOCL_EXPORT const UString& GetZORegistryBaseKey();

/// Reads a text value of the base key. A missing value gives an empty text and true; false means that the
/// base key could not be opened.
ZOCL_EXPORT bool GetZORegistryValue(const UString& inName, UString& outValue);
ZOCL_EXPORT bool SetZORegistryValue(const UString& inName, const UString& inValue);

/// The last login of a user name (headless processes keep one for each), or for an empty one that of this
/// account. inSyncFirst sees to it that what other processes wrote is seen.
/// A missing token is no failure; a missing server or user name is. A token that another server gave is not
/// told: it goes to nobody but the server that it came from.
ZOCL_EXPORT bool GetLastLoginData(ZOLoginData& outData, bool inSyncFirst, const UString& inSubKey);
ZOCL_EXPORT bool StoreLoginData(const ZOLoginData& inData, const UString& inSubKey);

struct RecentServer {
    bool secure = false;
    UString server;
};
constexpr std::size_t kMaximumRecentServers = 10;

/// Newest first. The single server that earlier versions kept is taken over on the way.
ZOCL_EXPORT bool GetRecentServers(std::vector<RecentServer>& outServers);
/// Stores the first ten.
ZOCL_EXPORT bool StoreRecentServers(const std::vector<RecentServer>& inServers);

/// The token that this process stored last; null when it stored none.
ZOCL_EXPORT ImmutableString GetLatestExpectedAuthToken();
/// Forgets the stored token if it is still this one; what another process has stored since stays. The sub
/// key is that of GetLastLoginData.
ZOCL_EXPORT void ClearAuthToken(const ImmutableString& inToken, const UString& inSubKey = UString());

/// Whether a login was ever accepted for this user or, for want of a base key, on this machine. The answer
/// is kept until ResetIsZOEnabled.
ZOCL_EXPORT bool IsZOEnabled();
ZOCL_EXPORT void ResetIsZOEnabled();

}  // namespace Registry
}  // namespace ZOCL
