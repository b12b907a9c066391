// The client's state between runs, in the registry.
#include "ZOClient/Registry.h"

#include "ostcore/threads/RecursiveMutex.h"
#include "ostcore/utility/StringConversion.h"
#include "RFL/Registry.h"

namespace ZOCL {
namespace Registry {

using ostcore::threads::RecursiveMutex;
using ostcore::threads::ScopedLock;
using ostcore::utility::ToUTF16;
using ostcore::utility::ToUTF8;
using RFL::RegistryAccess;
using RFL::RegistryKey;
using RFL::RegistryRoot;

const UString kRegistryHasLoggedInValue = u"HasLoggedIn";
const UString kRegistryFileTransferQueueValue = u"FileTransferQueue";

namespace {

const UString kLastServer = u"LastServer";
const UString kLastServerSecure = u"LastServerSecureConnection";
const UString kLastUsername = u"LastUsername";
const UString kLastToken = u"LastAuthenticationToken";
/// The server that gave the token. Written with it in one transaction, since the list of servers is not.
const UString kLastTokenServer = u"LastAuthenticationServer";
const UString kRecentServers = u"RecentServers";
const UString kRecentServer = u"RecentServer";
const UString kServer = u"Server";
const UString kSecure = u"Secure";
const UString kTrue = u"true";

UString KeyOfVersion(int inMajor, int inMinor) {
    return u"Software\\Orvane\\" + UString(u"Orvane Meridane") + u"\\" + ToUTF16(std::to_string(inMajor)) +
           u"." + ToUTF16(std::to_string(inMinor)) + u"\\";
}

bool Succeeded(int inResult) {
    return inResult >= 0;
}

/// What this process knows without asking the registry.
struct Memory {
    RecursiveMutex mutex;
    bool isZOEnabled ZO_GUARDED_BY(mutex) = false;
    bool isZOEnabledValid ZO_GUARDED_BY(mutex) = false;
    ImmutableString latestExpectedAuthToken ZO_GUARDED_BY(mutex);
};

Memory& TheMemory() {
    static Memory memory;
    return memory;
}

void CopyText(const RegistryKey& inFrom, RegistryKey& ioTo, const UString& inName) {
    UString text;
    if (Succeeded(inFrom.GetStringValue(inName, text))) {
        ioTo.SetStringValue(inName, text);
    }
}

void MigrateFromPreviousVersion() {
    RegistryKey previous;
    RegistryKey base;
    if (!Succeeded(
            RegistryKey::Open(RegistryRoot::User, KeyOfVersion(1, 5), RegistryAccess::Read, previous)) ||
        !Succeeded(RegistryKey::Create(RegistryRoot::User, GetZORegistryBaseKey(), base))) {
        return;
    }
    CopyText(previous, base, kRegistryHasLoggedInValue);
    CopyText(previous, base, kLastServer);
    std::uint32_t secure = 0;
    if (Succeeded(previous.GetUInt32Value(kLastServerSecure, secure))) {
        base.SetUInt32Value(kLastServerSecure, secure);
    }
    CopyText(previous, base, kLastUsername);
}

bool OpenForIsEnabled(RegistryKey& outKey) {
    const UString& path = GetZORegistryBaseKey();
    int result = RegistryKey::Open(RegistryRoot::User, path, RegistryAccess::Read, outKey);
    if (result == RFL::kResultRegistryMissing) {
        MigrateFromPreviousVersion();
        result = RegistryKey::Open(RegistryRoot::User, path, RegistryAccess::Read, outKey);
    }
    return Succeeded(result) ||
           Succeeded(RegistryKey::Open(RegistryRoot::Machine, path, RegistryAccess::Read, outKey));
}

UString RecentServerName(std::size_t inIndex) {
    return kRecentServer + ToUTF16(std::to_string(inIndex));
}

/// False when a subkey is there and cannot be opened.
bool ReadRecentServers(const RegistryKey& inKey, std::vector<RecentServer>& outServers) {
    for (std::size_t i = 0; i < kMaximumRecentServers; ++i) {
        RegistryKey entry;
        const int opened = inKey.OpenSubKey(RecentServerName(i), RegistryAccess::Read, entry);
        if (opened == RFL::kResultRegistryMissing) {
            continue;
        }
        if (!Succeeded(opened)) {
            return false;
        }
        RecentServer server;
        if (Succeeded(entry.GetStringValue(kServer, server.server)) && !server.server.empty()) {
            entry.GetBooleanValue(kSecure, server.secure);
            outServers.push_back(std::move(server));
        }
    }
    return true;
}

bool StoreRecentServersUnder(RegistryKey& ioParent, const std::vector<RecentServer>& inServers) {
    RegistryKey key;
    if (!Succeeded(ioParent.CreateSubKey(kRecentServers, key))) {
        return false;
    }
    const std::size_t count = std::min(inServers.size(), kMaximumRecentServers);
    for (std::size_t i = 0; i < count; ++i) {
        RegistryKey entry;
        if (!Succeeded(key.CreateSubKey(RecentServerName(i), entry)) ||
            !Succeeded(entry.SetStringValue(kServer, inServers[i].server)) ||
            !Succeeded(entry.SetBooleanValue(kSecure, inServers[i].secure))) {
            return false;
        }
    }
    return true;
}

/// Takes over the single server that earlier versions kept under the base key itself.
bool TakeOverLastServer(std::vector<RecentServer>& ioServers) {
    RegistryKey base;
    bool baseIsNew = false;
    if (!Succeeded(RegistryKey::Create(RegistryRoot::User, GetZORegistryBaseKey(), base, &baseIsNew))) {
        return false;
    }
    RecentServer server;
    if (!Succeeded(base.GetStringValue(kLastServer, server.server)) || server.server.empty()) {
        return true;
    }
    std::uint32_t secure = 0;
    base.GetUInt32Value(kLastServerSecure, secure);
    server.secure = secure != 0;
    ioServers.push_back(std::move(server));
    if (baseIsNew || !StoreRecentServersUnder(base, ioServers)) {
        return true;
    }
    base.DeleteValue(kLastServer);
    base.DeleteValue(kLastServerSecure);
    return true;
}

UString TokenServerText(const ZOLoginData& inData) {
    return (inData.secure ? u"https://" : u"http://") + ToUTF16(inData.serverURL.view());
}

/// User name and token as they were stored together; another process may store between two reads.
struct StoredLogin {
    bool hasUsername = false;
    UString username;
    UString token;
    UString tokenServer;

    friend bool operator==(const StoredLogin&, const StoredLogin&) = default;
};

StoredLogin ReadStoredLoginOnce(const RegistryKey& inKey) {
    StoredLogin login;
    login.hasUsername = Succeeded(inKey.GetStringValue(kLastUsername, login.username));
    inKey.GetStringValue(kLastToken, login.token);
    inKey.GetStringValue(kLastTokenServer, login.tokenServer);
    return login;
}

StoredLogin ReadStoredLogin(const RegistryKey& inKey) {
    constexpr int kAttempts = 20;
    StoredLogin login = ReadStoredLoginOnce(inKey);
    for (int attempt = 0; attempt < kAttempts; ++attempt) {
        StoredLogin again = ReadStoredLoginOnce(inKey);
        if (again == login) {
            return login;
        }
        login = std::move(again);
    }
    login.token.clear();
    return login;
}

UString PathOfSubKey(const UString& inSubKey) {
    return GetZORegistryBaseKey() + inSubKey;
}

bool GetNewestServer(const RegistryKey& inKey, const UString& inSubKey, ZOLoginData& outData) {
    std::vector<RecentServer> servers;
    RegistryKey own;
    if (!inSubKey.empty() && Succeeded(inKey.OpenSubKey(kRecentServers, RegistryAccess::Read, own))) {
        ReadRecentServers(own, servers);
    }
    if (servers.empty() && (!GetRecentServers(servers) || servers.empty())) {
        return false;
    }
    outData.serverURL = ImmutableString(ToUTF8(servers.front().server));
    outData.secure = servers.front().secure;
    return true;
}

bool PutServerFirst(RegistryKey& ioParent, const UString& inServer, bool inSecure) {
    RegistryKey key;
    std::vector<RecentServer> former;
    if (Succeeded(ioParent.OpenSubKey(kRecentServers, RegistryAccess::Read, key)) &&
        !ReadRecentServers(key, former)) {
        return false;
    }
    std::vector<RecentServer> servers{{inSecure, inServer}};
    for (RecentServer& server : former) {
        if (server.server != inServer) {
            servers.push_back(std::move(server));
        }
    }
    return StoreRecentServersUnder(ioParent, servers);
}

}  // namespace

const UString& GetZORegistryBaseKey() {
    static const UString key = KeyOfVersion(2, 0);
    return key;
}

bool GetZORegistryValue(const UString& inName, UString& outValue) {
    RegistryKey key;
    if (!Succeeded(
            RegistryKey::Open(RegistryRoot::User, GetZORegistryBaseKey(), RegistryAccess::Read, key))) {
        return false;
    }
    outValue.clear();
    key.GetStringValue(inName, outValue);
    return true;
}

bool SetZORegistryValue(const UString& inName, const UString& inValue) {
    RegistryKey key;
    return Succeeded(RegistryKey::Create(RegistryRoot::User, GetZORegistryBaseKey(), key)) &&
           Succeeded(key.SetStringValue(inName, inValue));
}

bool GetLastLoginData(ZOLoginData& outData, bool inSyncFirst, const UString& inSubKey) {
    RegistryKey key;
    bool isNew = false;
    if (!Succeeded(RegistryKey::Create(RegistryRoot::User, PathOfSubKey(inSubKey), key, &isNew))) {
        return false;
    }
    if (inSyncFirst) {
        key.SyncAppPrefs();
    }
    if (!GetNewestServer(key, inSubKey, outData) || isNew) {
        return false;
    }
    const StoredLogin login = ReadStoredLogin(key);
    if (!login.hasUsername) {
        return false;
    }
    outData.username = ImmutableString(ToUTF8(login.username));
    // A token without a server is from an earlier version, which kept one server.
    const bool isOfThisServer = login.tokenServer.empty() || login.tokenServer == TokenServerText(outData);
    outData.token = isOfThisServer ? ImmutableString(ToUTF8(login.token)) : ImmutableString();
    return true;
}

bool StoreLoginData(const ZOLoginData& inData, const UString& inSubKey) {
    RegistryKey base;
    RegistryKey key;
    if (!Succeeded(RegistryKey::Create(RegistryRoot::User, GetZORegistryBaseKey(), base)) ||
        !Succeeded(RegistryKey::Create(RegistryRoot::User, PathOfSubKey(inSubKey), key))) {
        return false;
    }
    const UString server = ToUTF16(inData.serverURL.view());
    if (!PutServerFirst(base, server, inData.secure) ||
        (!inSubKey.empty() && !PutServerFirst(key, server, inData.secure))) {
        return false;
    }
    if (!Succeeded(key.Apply({RFL::RegistryChange::SetString(kLastUsername, ToUTF16(inData.username.view())),
                              RFL::RegistryChange::SetString(kLastToken, ToUTF16(inData.token.view())),
                              RFL::RegistryChange::SetString(kLastTokenServer, TokenServerText(inData))}))) {
        return false;
    }
    // The former token must not stay behind in the files.
    key.EraseOldData();
    Memory& memory = TheMemory();
    ScopedLock lock(memory.mutex, "ZOCL::Registry::StoreLoginData");
    memory.latestExpectedAuthToken = inData.token;
    return true;
}

bool GetRecentServers(std::vector<RecentServer>& outServers) {
    outServers.clear();
    RegistryKey key;
    bool isNew = false;
    if (!Succeeded(
            RegistryKey::Create(RegistryRoot::User, GetZORegistryBaseKey() + kRecentServers, key, &isNew)) ||
        !ReadRecentServers(key, outServers)) {
        return false;
    }
    return !(isNew || outServers.empty()) || TakeOverLastServer(outServers);
}

bool StoreRecentServers(const std::vector<RecentServer>& inServers) {
    RegistryKey base;
    return Succeeded(RegistryKey::Create(RegistryRoot::User, GetZORegistryBaseKey(), base)) &&
           StoreRecentServersUnder(base, inServers);
}

ImmutableString GetLatestExpectedAuthToken() {
    Memory& memory = TheMemory();
    ScopedLock lock(memory.mutex, "ZOCL::Registry::GetLatestExpectedAuthToken");
    return memory.latestExpectedAuthToken;
}

void ClearAuthToken(const ImmutableString& inToken, const UString& inSubKey) {
    RegistryKey key;
    if (!inToken.IsNull() && Succeeded(RegistryKey::Open(RegistryRoot::User, PathOfSubKey(inSubKey),
                                                         RegistryAccess::ReadWrite, key))) {
        key.DeleteStringValueIf(kLastToken, ToUTF16(inToken.view()));
    }
}

bool IsZOEnabled() {
    Memory& memory = TheMemory();
    {
        ScopedLock lock(memory.mutex, "IsZOEnabled");
        if (memory.isZOEnabledValid) {
            return memory.isZOEnabled;
        }
    }
    RegistryKey key;
    UString text;
    if (!OpenForIsEnabled(key) || !Succeeded(key.GetStringValue(kRegistryHasLoggedInValue, text))) {
        return false;
    }
    ScopedLock lock(memory.mutex, "IsZOEnabled");
    memory.isZOEnabled = text == kTrue;
    memory.isZOEnabledValid = true;
    return memory.isZOEnabled;
}

void ResetIsZOEnabled() {
    Memory& memory = TheMemory();
    ScopedLock lock(memory.mutex, "ResetIsZOEnabled");
    memory.isZOEnabled = false;
    memory.isZOEnabledValid = false;
}

}  // namespace Registry
}  // namespace ZOCL
