// What the host decides about the network: trust, proxy, bounds and deadlines.
#pragma once

#include <cstdint>
#include <string>

#include "ostcore/Export.h"
#include "ostcore/Types.h"
#include "ostnet/http/Compression.h"

namespace ostnet {

/// Bounds and deadlines of one exchange. The debug database key of each stands beside it.
struct NetworkLimits {
    /// Largest body as it comes over the wire, in bytes: "ostnet.MaximumBodySize".
    std::uint64_t maximumBodySize = 512ull << 20;
    /// "ostnet.MaximumInflatedSize" (bytes) and "ostnet.MaximumInflateRatio".
    http::InflateLimits inflate;
    /// Largest head of an answer, interim ones and trailers included: bytes and lines.
    std::uint32_t maximumHeadSize = 256u << 10;
    std::uint32_t maximumHeadLines = 1000;
    /// Milliseconds until a connection must stand, TLS included: "ostnet.ConnectTimeout".
    std::uint32_t connectTimeout = 30000;
    /// Milliseconds from the end of the request to the head of the answer; an interim answer such as 102
    /// starts them anew: "ostnet.ResponseTimeout".
    std::uint32_t responseTimeout = 180000;
    /// A body that moves fewer than lowSpeedBytes in each span of lowSpeedTime milliseconds is cut off:
    /// "ostnet.LowSpeedBytes", "ostnet.LowSpeedTime".
    std::uint32_t lowSpeedBytes = 1024;
    std::uint32_t lowSpeedTime = 30000;
    /// Requests on the wire at one time, and connections that are kept; requests beyond them wait in their
    /// order. Taken when the processor is made: "ostnet.MaximumConnections".
    std::uint32_t maximumConnections = 128;
};

/// What a processor goes by. The verification of certificates cannot be turned off.
struct NetworkSettings {
    NetworkLimits limits;
    /// PEM bundle of the authorities that are trusted, and a hashed directory of them. When both are empty
    /// the system's authorities are trusted.
    std::string certificateAuthorityFile;
    std::string certificateAuthorityDirectory;
    /// Proxy URL. When it is empty the usual variables decide: http_proxy (in lower case only, since a
    /// server's gateway interface sets the other one), https_proxy, HTTPS_PROXY, all_proxy, ALL_PROXY.
    std::string proxy;
    /// Hosts that are reached without `proxy`, parted by commas; "*" is all. With an empty `proxy`, the
    /// variables no_proxy and NO_PROXY decide.
    std::string noProxy;
    std::string userAgent;

    /// What the environment and the debug database say now: ZOCLIENT_CA_FILE, else SSL_CERT_FILE and
    /// SSL_CERT_DIR, else the system's authorities; ZOCLIENT_PROXY with ZOCLIENT_NO_PROXY.
    ZOPLATFORM_EXPORT static NetworkSettings FromEnvironment();
};

/// Trusts the authorities of this PEM file, and no others, in every request of this process that starts from
/// now on. An empty path goes back to the environment. A file that cannot be read fails each TLS request.
ZOPLATFORM_EXPORT void SetCertificateAuthorityFile(const std::string& inPath);
/// Sends the requests that start from now on through a proxy. An empty URL goes back to the environment.
ZOPLATFORM_EXPORT void SetProxy(const std::string& inURL, const std::string& inNoProxy);
/// Replaces the bounds and deadlines of the requests that start from now on.
ZOPLATFORM_EXPORT void SetNetworkLimits(const NetworkLimits& inLimits);
/// The settings of this process: the environment's, as read at the first call, under what was set.
ZOPLATFORM_EXPORT shared_ptr<NetworkSettings const> GetNetworkSettings();

}  // namespace ostnet
