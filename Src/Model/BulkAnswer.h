// The answer to a bulk request: identifiers in the order of the form.
#pragma once

#include <vector>

#include "ZOClient/Types.h"

namespace ZOCL {

struct BulkAnswer {
    struct Enclosure {
        ImmutableString id;
        ImmutableString contentID;
    };
    struct Asset {
        ImmutableString id;
        std::vector<Enclosure> enclosures;
        std::vector<ImmutableString> renditions;
    };
    std::vector<Asset> assets;
    /// Of the production.
    std::vector<Enclosure> enclosures;
};

/// False, with a trace, for a body that is no such answer. No body at all is one without identifiers.
bool ReadBulkAnswer(const shared_ptr<ostnet::Response>& inResponse, BulkAnswer& outAnswer);

}  // namespace ZOCL
