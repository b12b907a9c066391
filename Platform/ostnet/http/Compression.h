// Packing and unpacking of payloads by gzip, with bounds that do not depend on what the bytes claim.
#pragma once

#include <cstdint>

#include "ostnet/Response.h"

namespace ostnet {
namespace http {

/// How far a packed payload may grow.
struct InflateLimits {
    /// Largest inflated size in bytes.
    std::uint64_t maximumSize = 512ull << 20;
    /// Largest inflated size as a multiple of the packed one; sizes up to kRatioFreeSize are not judged by
    /// it.
    std::uint32_t maximumRatio = 256;

    static constexpr std::uint64_t kRatioFreeSize = 4ull << 20;

    /// The largest inflated size of a packed payload of inPackedSize bytes.
    ZOPLATFORM_EXPORT std::uint64_t MaximumSizeFor(std::uint64_t inPackedSize) const noexcept;
};

enum class InflateOutcome {
    kInflated,
    /// The bytes are no gzip stream, are cut, or fail their check sum.
    kDamaged,
    /// The inflated size exceeds the limits.
    kTooLarge,
};

/// Packs a payload in the gzip format (RFC 1952). A null or empty payload gives an empty gzip member.
/// Threads: any. Throws std::bad_alloc.
ZOPLATFORM_EXPORT shared_ptr<RecycledMemory const> CompressPayload(
    const shared_ptr<RecycledMemory const>& inPayload);

/// CompressPayload, and sets `Content-Encoding: gzip` in ioHeaders.
ZOPLATFORM_EXPORT shared_ptr<RecycledMemory const> CompressPayloadAndUpdateHeaders(
    const shared_ptr<RecycledMemory const>& inPayload, Headers& ioHeaders);

/// Unpacks all members of a gzip stream into outPayload. The sizes that the stream states are used as a hint
/// and never trusted; no more than the limits allow is ever held. Without success outPayload is unchanged.
/// Threads: any. Throws std::bad_alloc.
ZOPLATFORM_EXPORT InflateOutcome InflateGzip(const shared_ptr<RecycledMemory const>& inPayload,
                                             const InflateLimits& inLimits,
                                             shared_ptr<RecycledMemory const>& outPayload);

/// Unpacks a payload; null when it is damaged or larger than the limits allow.
ZOPLATFORM_EXPORT shared_ptr<RecycledMemory const> DecompressPayload(
    const shared_ptr<RecycledMemory const>& inPayload, const InflateLimits& inLimits = InflateLimits());

/// Unpacks a payload when inHeaders say that it is packed, and passes it through when they say that it is
/// not. False for a damaged or too large payload and for an encoding other than gzip and identity.
ZOPLATFORM_EXPORT bool DecompressPayload(const shared_ptr<RecycledMemory const>& inPayload,
                                         const Headers& inHeaders,
                                         shared_ptr<RecycledMemory const>& outPayload,
                                         const InflateLimits& inLimits = InflateLimits());

/// True when the headers state the gzip encoding, alone.
ZOPLATFORM_EXPORT bool IsGzipEncoded(const Headers& inHeaders);
/// True when the headers state no encoding, or identity.
ZOPLATFORM_EXPORT bool IsPlainEncoded(const Headers& inHeaders);

}  // namespace http
}  // namespace ostnet
