// The settings that stand in files and the environment, and the order in which they count.
#pragma once

#include <map>
#include <optional>
#include <string>

namespace zo {

/// zo.conf in the configuration directory: lines `key = value`, `#` begins a comment line. The keys are
/// server, user, ca, proxy and no-proxy; an unknown key is a Failure that names the line.
class Configuration {
public:
    static Configuration Load();

    std::optional<std::string> Value(const std::string& inKey) const;

private:
    std::map<std::string, std::string> mValues;
};

/// The value of a variable, nothing when it is not set or empty.
std::optional<std::string> Environment(const char* inName);

/// What the command line says about trust and proxy; nothing where it is silent.
struct TransportFlags {
    std::optional<std::string> authorityFile;
    std::optional<std::string> proxy;
};

/// Decides trust and proxy for the whole process: the flag, then ZOCLIENT_*, then SSL_CERT_FILE and
/// SSL_CERT_DIR (for the proxy: the usual variables), then the authority file of the login, then zo.conf,
/// then the system. There is no setting that trusts everybody.
void ApplyTransport(const TransportFlags& inFlags, const std::string& inLoginAuthorityFile,
                    const Configuration& inConfiguration);

}  // namespace zo
