#include "ostnet/NetworkSettings.h"

#include <cstdlib>

#include "ostcore/config/ClientInfo.h"
#include "ostcore/debug/DebugDatabase.h"
#include "ostcore/threads/Mutex.h"
#include "ostnet/http/detail/HeaderRules.h"

namespace ostnet {
namespace {

using ostcore::debug::DebugDatabase;
using ostcore::threads::Mutex;
using ostcore::threads::MutexLock;

std::string Environment(const char* inName) {
    const char* value = std::getenv(inName);
    return value ? value : "";
}

template <typename Number>
void ReadLimit(const char* inKey, Number& ioValue) {
    constexpr std::uint32_t kAbsent = 0;
    const std::uint32_t value = DebugDatabase::GetUInt32(inKey, kAbsent);
    if (value != kAbsent) {
        ioValue = value;
    }
}

NetworkLimits LimitsFromDebugDatabase() {
    NetworkLimits limits;
    ReadLimit("ostnet.MaximumBodySize", limits.maximumBodySize);
    ReadLimit("ostnet.MaximumInflatedSize", limits.inflate.maximumSize);
    ReadLimit("ostnet.MaximumInflateRatio", limits.inflate.maximumRatio);
    ReadLimit("ostnet.ConnectTimeout", limits.connectTimeout);
    ReadLimit("ostnet.ResponseTimeout", limits.responseTimeout);
    ReadLimit("ostnet.LowSpeedBytes", limits.lowSpeedBytes);
    ReadLimit("ostnet.LowSpeedTime", limits.lowSpeedTime);
    ReadLimit("ostnet.MaximumConnections", limits.maximumConnections);
    return limits;
}

/// The settings of the process: never destroyed, since requests may start until its very end.
struct ProcessSettings {
    Mutex mutex;
    shared_ptr<NetworkSettings const> current ZO_GUARDED_BY(mutex);

    shared_ptr<NetworkSettings const> Get() {
        MutexLock lock(mutex);
        if (!current) {
            current = make_shared<NetworkSettings>(NetworkSettings::FromEnvironment());
        }
        return current;
    }
    /// Settings are immutable once they are shared: a change makes a new record.
    template <typename Change>
    void Alter(Change inChange) {
        const auto changed = make_shared<NetworkSettings>(*Get());
        inChange(*changed);
        MutexLock lock(mutex);
        current = changed;
    }
};

ProcessSettings& Process() {
    static auto* const sSettings = new ProcessSettings;
    return *sSettings;
}

}  // namespace

NetworkSettings NetworkSettings::FromEnvironment() {
    NetworkSettings settings;
    settings.limits = LimitsFromDebugDatabase();
    settings.certificateAuthorityFile = Environment("ZOCLIENT_CA_FILE");
    if (settings.certificateAuthorityFile.empty()) {
        settings.certificateAuthorityFile = Environment("SSL_CERT_FILE");
        settings.certificateAuthorityDirectory = Environment("SSL_CERT_DIR");
    }
    settings.proxy = Environment("ZOCLIENT_PROXY");
    settings.noProxy = Environment("ZOCLIENT_NO_PROXY");
    const std::string agent =
        ostcore::config::GetClientName() + "/" + ostcore::config::GetClientBuildNumber();
    settings.userAgent = http::IsSafeHeaderValue(agent) ? agent : "ZOClient";
    return settings;
}

void SetCertificateAuthorityFile(const std::string& inPath) {
    Process().Alter([&inPath](NetworkSettings& ioSettings) {
        const NetworkSettings former =
            inPath.empty() ? NetworkSettings::FromEnvironment() : NetworkSettings();
        ioSettings.certificateAuthorityFile = inPath.empty() ? former.certificateAuthorityFile : inPath;
        ioSettings.certificateAuthorityDirectory = former.certificateAuthorityDirectory;
    });
}

void SetProxy(const std::string& inURL, const std::string& inNoProxy) {
    Process().Alter([&inURL, &inNoProxy](NetworkSettings& ioSettings) {
        const NetworkSettings former = NetworkSettings::FromEnvironment();
        ioSettings.proxy = inURL.empty() ? former.proxy : inURL;
        ioSettings.noProxy = inURL.empty() ? former.noProxy : inNoProxy;
    });
}

void SetNetworkLimits(const NetworkLimits& inLimits) {
    Process().Alter([&inLimits](NetworkSettings& ioSettings) { ioSettings.limits = inLimits; });
}

shared_ptr<NetworkSettings const> GetNetworkSettings() {
    return Process().Get();
}

}  // namespace ostnet
