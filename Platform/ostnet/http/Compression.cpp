#include "ostnet/http/Compression.h"

#include <libdeflate.h>

#include <memory>

#include "ostcore/utility/StringConversion.h"
#include "ostnet/HeaderConstants.h"

namespace ostnet {
namespace http {
namespace {

constexpr int kCompressionLevel = 5;
constexpr std::size_t kSmallestMember = 18;
constexpr std::size_t kSmallestOutput = 4096;

struct FreeDecompressor {
    void operator()(libdeflate_decompressor* inDecompressor) const {
        libdeflate_free_decompressor(inDecompressor);
    }
};
struct FreeCompressor {
    void operator()(libdeflate_compressor* inCompressor) const { libdeflate_free_compressor(inCompressor); }
};

libdeflate_decompressor& ThreadDecompressor() {
    thread_local std::unique_ptr<libdeflate_decompressor, FreeDecompressor> sDecompressor(
        libdeflate_alloc_decompressor());
    if (!sDecompressor) {
        throw std::bad_alloc();
    }
    return *sDecompressor;
}

libdeflate_compressor& ThreadCompressor() {
    thread_local std::unique_ptr<libdeflate_compressor, FreeCompressor> sCompressor(
        libdeflate_alloc_compressor(kCompressionLevel));
    if (!sCompressor) {
        throw std::bad_alloc();
    }
    return *sCompressor;
}

/// The size that the last member states, modulo 2^32: the whole size of most honest streams.
std::uint64_t StatedSize(std::string_view inPacked) noexcept {
    std::uint64_t size = 0;
    for (std::size_t i = 0; i < 4; ++i) {
        size |= static_cast<std::uint64_t>(static_cast<unsigned char>(inPacked[inPacked.size() - 4 + i]))
                << (8 * i);
    }
    return size;
}

/// Unpacks every member into the buffer, which keeps its size; outSize is what was written.
libdeflate_result InflateMembers(std::string_view inPacked, RecycledMemory& ioBuffer, std::size_t& outSize) {
    auto& decompressor = ThreadDecompressor();
    std::size_t written = 0;
    while (!inPacked.empty()) {
        std::size_t read = 0, produced = 0;
        const auto result = libdeflate_gzip_decompress_ex(&decompressor, inPacked.data(), inPacked.size(),
                                                          ioBuffer.data() + written,
                                                          ioBuffer.size() - written, &read, &produced);
        if (result != LIBDEFLATE_SUCCESS) {
            return result;
        }
        inPacked.remove_prefix(read);
        written += produced;
    }
    outSize = written;
    return LIBDEFLATE_SUCCESS;
}

ImmutableString Encoding(const Headers& inHeaders, bool& outSeveral) {
    outSeveral = inHeaders.count(kHEADER_CONTENT_ENCODING) > 1;
    return GetHeader(inHeaders, kHEADER_CONTENT_ENCODING);
}

}  // namespace

std::uint64_t InflateLimits::MaximumSizeFor(std::uint64_t inPackedSize) const noexcept {
    const std::uint64_t ratio = std::max<std::uint64_t>(maximumRatio, 1);
    const std::uint64_t byRatio = inPackedSize > maximumSize / ratio ? maximumSize : inPackedSize * ratio;
    return std::min(maximumSize, std::max(byRatio, kRatioFreeSize));
}

shared_ptr<RecycledMemory const> CompressPayload(const shared_ptr<RecycledMemory const>& inPayload) {
    auto& compressor = ThreadCompressor();
    const std::string_view bytes = inPayload ? inPayload->view() : std::string_view();
    const auto packed = RecycledMemory::Create(libdeflate_gzip_compress_bound(&compressor, bytes.size()));
    const std::size_t size =
        libdeflate_gzip_compress(&compressor, bytes.data(), bytes.size(), packed->data(), packed->size());
    if (size < packed->size() / 2) {
        return RecycledMemory::CreateFromBytes(
            {packed->data(), size});  // the bound may be far too much to keep
    }
    packed->Resize(size);
    return packed;
}

shared_ptr<RecycledMemory const> CompressPayloadAndUpdateHeaders(
    const shared_ptr<RecycledMemory const>& inPayload, Headers& ioHeaders) {
    auto packed = CompressPayload(inPayload);
    ioHeaders.erase(kHEADER_CONTENT_ENCODING);
    ioHeaders.emplace(kHEADER_CONTENT_ENCODING, ImmutableString("gzip"));
    return packed;
}

InflateOutcome InflateGzip(const shared_ptr<RecycledMemory const>& inPayload, const InflateLimits& inLimits,
                           shared_ptr<RecycledMemory const>& outPayload) {
    if (!inPayload || inPayload->size() < kSmallestMember) {
        return InflateOutcome::kDamaged;
    }
    const std::string_view packed = inPayload->view();
    const std::uint64_t maximum = inLimits.MaximumSizeFor(packed.size());
    const std::uint64_t stated = StatedSize(packed);
    if (stated > maximum) {
        return InflateOutcome::kTooLarge;
    }
    // A stream whose statement is too small is unpacked anew into a larger block; the smaller one is
    // released first, so that never more than the limit is held.
    std::uint64_t capacity = std::min(maximum, std::max<std::uint64_t>(stated, kSmallestOutput));
    for (;;) {
        auto buffer = RecycledMemory::Create(static_cast<std::size_t>(capacity));
        std::size_t size = 0;
        const auto result = InflateMembers(packed, *buffer, size);
        if (result == LIBDEFLATE_SUCCESS) {
            buffer->Resize(size);
            outPayload = buffer;
            return InflateOutcome::kInflated;
        }
        if (result != LIBDEFLATE_INSUFFICIENT_SPACE) {
            return InflateOutcome::kDamaged;
        }
        if (capacity == maximum) {
            return InflateOutcome::kTooLarge;
        }
        capacity = std::min(maximum, capacity * 4);
    }
}

shared_ptr<RecycledMemory const> DecompressPayload(const shared_ptr<RecycledMemory const>& inPayload,
                                                   const InflateLimits& inLimits) {
    shared_ptr<RecycledMemory const> payload;
    InflateGzip(inPayload, inLimits, payload);
    return payload;
}

bool DecompressPayload(const shared_ptr<RecycledMemory const>& inPayload, const Headers& inHeaders,
                       shared_ptr<RecycledMemory const>& outPayload, const InflateLimits& inLimits) {
    if (IsPlainEncoded(inHeaders)) {
        outPayload = inPayload;
        return true;
    }
    return IsGzipEncoded(inHeaders) &&
           InflateGzip(inPayload, inLimits, outPayload) == InflateOutcome::kInflated;
}

bool IsGzipEncoded(const Headers& inHeaders) {
    bool several = false;
    const ImmutableString encoding = Encoding(inHeaders, several);
    return !several && (ostcore::utility::EqualsIgnoreCaseASCII(encoding, "gzip") ||
                        ostcore::utility::EqualsIgnoreCaseASCII(encoding, "x-gzip"));
}

bool IsPlainEncoded(const Headers& inHeaders) {
    bool several = false;
    const ImmutableString encoding = Encoding(inHeaders, several);
    return !several && (encoding.empty() || ostcore::utility::EqualsIgnoreCaseASCII(encoding, "identity"));
}

}  // namespace http
}  // namespace ostnet
