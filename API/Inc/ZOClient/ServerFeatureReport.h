// What a server says of itself before anybody signs in.
#pragma once

#include <cstdint>
#include <set>
#include <vector>

#include "ZOClient/Export.h"
#include "ZOClient/Types.h"

namespace ZOCL {

/// Made from a server's discovery document; immutable once shared.
struct ServerFeatureReport {
    ImmutableString serverID;
    ImmutableString name;
    ImmutableString version;
    /// Whether the document came over TLS.
    bool secure = false;
    /// Empty unless the host has declared its media protocol versions and the first of them is in the
    /// server's list (SetCompatibleMediaProtocolVersions).
    std::vector<std::uint32_t> renderProtocolVersions;
};

/// Gives the report that is held for a server, if there is one, and in any case asks the server anew in the
/// background; ServerFeatureReportUpdatedMessage tells of the answer. The URL is a base URL; with a scheme it
/// is asked over that, without one over plain HTTP and TLS at once.
/// Returns whether outReport was filled in. Threads: any.
ZOCL_EXPORT bool GetServerFeatureReport(const ImmutableString& inServerURL,
                                        shared_ptr<ServerFeatureReport const>& outReport);

/// Reads a JSON document with an array of strings under "whitelist". False, with outNames unchanged, for
/// anything else. Threads: any.
ZOCL_EXPORT bool ParseWhitelistPayload(const shared_ptr<RecycledMemory const>& inPayload,
                                       std::set<ImmutableString>& outNames);

}  // namespace ZOCL
