// Reads zo.conf and hands trust and proxy to the network layer.
#include "Configuration.h"

#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstdlib>
#include <cstring>

#include "Failure.h"
#include "ostcore/config/StateDirectories.h"
#include "ostcore/filesupport/File.h"
#include "ostnet/NetworkSettings.h"

namespace zo {
namespace {

constexpr std::size_t kMaximumConfigurationBytes = std::size_t(1) << 16;
constexpr std::array<const char*, 5> kKeys{"server", "user", "ca", "proxy", "no-proxy"};

std::string Trimmed(const std::string& inText) {
    const std::size_t first = inText.find_first_not_of(" \t\r");
    if (first == std::string::npos) {
        return {};
    }
    return inText.substr(first, inText.find_last_not_of(" \t\r") - first + 1);
}

bool IsKnown(const std::string& inKey) {
    for (const char* key : kKeys) {
        if (inKey == key) {
            return true;
        }
    }
    return false;
}

template <std::size_t N>
bool IsAnySet(const std::array<const char*, N>& inNames) {
    for (const char* name : inNames) {
        if (Environment(name)) {
            return true;
        }
    }
    return false;
}

void CheckReadable(const std::string& inPath, const std::string& inOrigin) {
    if (::access(inPath.c_str(), R_OK) != 0) {
        throw Failure(
            ExitCode::Tls,
            "reading the authority file " + inPath + " (" + inOrigin + ") failed: " + std::strerror(errno),
            "name a PEM file that can be read");
    }
}

void Trust(const std::string& inPath, const std::string& inOrigin) {
    CheckReadable(inPath, inOrigin);
    ostnet::SetCertificateAuthorityFile(inPath);
}

void ApplyTrust(const TransportFlags& inFlags, const std::string& inLoginAuthorityFile,
                const Configuration& inConfiguration) {
    if (inFlags.authorityFile) {
        return Trust(*inFlags.authorityFile, "--ca");
    }
    if (IsAnySet(std::array{"ZOCLIENT_CA_FILE", "SSL_CERT_FILE", "SSL_CERT_DIR"})) {
        return;
    }
    if (!inLoginAuthorityFile.empty()) {
        return Trust(inLoginAuthorityFile, "--ca of the login");
    }
    if (const auto configured = inConfiguration.Value("ca")) {
        Trust(*configured, "ca in zo.conf");
    }
}

void ApplyProxy(const TransportFlags& inFlags, const Configuration& inConfiguration) {
    if (inFlags.proxy) {
        if (inFlags.proxy->empty()) {
            throw Failure(ExitCode::Usage, "--proxy needs a URL",
                          "to reach a hub directly, name it in NO_PROXY");
        }
        return ostnet::SetProxy(*inFlags.proxy, "");
    }
    if (IsAnySet(std::array{"ZOCLIENT_PROXY", "http_proxy", "https_proxy", "HTTPS_PROXY", "all_proxy",
                            "ALL_PROXY"})) {
        return;
    }
    if (const auto configured = inConfiguration.Value("proxy")) {
        ostnet::SetProxy(*configured, inConfiguration.Value("no-proxy").value_or(""));
    }
}

}  // namespace

Configuration Configuration::Load() {
    Configuration configuration;
    const std::string path = ostcore::config::GetConfigDirectory().FilePath("zo.conf");
    if (!ostcore::filesupport::File::Exists(path)) {
        return configuration;
    }
    std::string error;
    const auto bytes = ostcore::filesupport::File::Read(path, kMaximumConfigurationBytes, &error);
    if (!bytes) {
        throw Failure(ExitCode::Failure, "reading the configuration failed: " + error, "check " + path);
    }
    const std::string text(bytes->view());
    std::size_t number = 0;
    for (std::size_t start = 0; start < text.size();) {
        const std::size_t end = std::min(text.find('\n', start), text.size());
        const std::string line = Trimmed(text.substr(start, end - start));
        start = end + 1;
        ++number;
        if (line.empty() || line[0] == '#') {
            continue;
        }
        const std::size_t equals = line.find('=');
        const std::string key = Trimmed(line.substr(0, equals));
        if (equals == std::string::npos || !IsKnown(key)) {
            throw Failure(ExitCode::Usage, path + ", line " + std::to_string(number) + " is no setting of zo",
                          "a line is 'key = value' with the key server, user, ca, proxy or no-proxy");
        }
        configuration.mValues[key] = Trimmed(line.substr(equals + 1));
    }
    return configuration;
}

std::optional<std::string> Configuration::Value(const std::string& inKey) const {
    const auto found = mValues.find(inKey);
    return found == mValues.end() || found->second.empty() ? std::nullopt : std::optional(found->second);
}

std::optional<std::string> Environment(const char* inName) {
    const char* value = std::getenv(inName);
    return value && *value ? std::optional<std::string>(value) : std::nullopt;
}

void ApplyTransport(const TransportFlags& inFlags, const std::string& inLoginAuthorityFile,
                    const Configuration& inConfiguration) {
    ApplyTrust(inFlags, inLoginAuthorityFile, inConfiguration);
    ApplyProxy(inFlags, inConfiguration);
}

}  // namespace zo
