// The three ways of reading one body that are compared.
#pragma once

#include "ostcore/Types.h"
#include "ostcore/utility/RecycledMemory.h"
#include "PlainStructs.h"

using Body = ostcore::shared_ptr<ostcore::utility::RecycledMemory const>;

/// Enough of what was read to see that all sides read the same.
struct Digest {
    std::size_t assets = 0;
    std::size_t links = 0;
    std::size_t textBytes = 0;
    std::int64_t ticks = 0;
    friend bool operator==(const Digest&, const Digest&) = default;
};
Digest DigestOf(const plain::AssetList& inList);

/// Each reads the body and lets go of the result; the time of both is what is measured.
void RunOurs(const Body& inBody);
void RunNlohmann(const Body& inBody);
void RunOnDemand(const Body& inBody);

Digest DigestOfOurs(const Body& inBody);
Digest DigestOfNlohmann(const Body& inBody);
Digest DigestOfOnDemand(const Body& inBody);

/// The peak of resident memory, beyond what is there at the call, of a process that parses and binds the
/// body and then finds every asset of the list. Negative when it could not be measured.
double MeasurePeakBytes(const Body& inBody);
