// The two documents that a connect begins with: what a server says of itself and where its services are.
#pragma once

#include <vector>

#include "Links.h"
#include "ZOClient/Types.h"

namespace ZOCL {

struct ServiceDocument {
    struct Description {
        ImmutableString id;
        ImmutableString name;
        ImmutableString description;
        ImmutableString version;
        ImmutableString syslogAddress;
        std::uint32_t syslogPort = 514;
        std::vector<std::uint32_t> renderProtocolVersions;
    };
    Description server;
    /// Both 0 when the document has no "properties".
    std::uint32_t majorVersion = 0;
    std::uint32_t minorVersion = 0;
    Links links;
};

/// Reads a document. False, with a trace that tells why and outDocument unchanged, when the payload is
/// missing or is not such a document. Never throws.
bool ParseServiceDocument(const shared_ptr<RecycledMemory const>& inPayload, ServiceDocument& outDocument);

}  // namespace ZOCL
