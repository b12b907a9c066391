// Packing and bounded unpacking on zlib.
#include "Base/Gzip.h"

#include <zlib.h>

#include <memory>
#include <stdexcept>
#include <vector>

#include "Base/Error.h"

namespace zohub {

namespace {

constexpr std::size_t kStep = 64 * 1024;
constexpr std::size_t kFastAbove = 1 << 20;
constexpr int kGzipWindow = 15 + 16;
constexpr int kAnyWindow = 15 + 32;

Bytef* InputOf(std::string_view inText) {
    return const_cast<Bytef*>(reinterpret_cast<Bytef const*>(inText.data()));
}

}  // namespace

std::string GzipPack(std::string_view inText) {
    z_stream stream{};
    int const level = inText.size() > kFastAbove ? 1 : 6;
    if (deflateInit2(&stream, level, Z_DEFLATED, kGzipWindow, 8, Z_DEFAULT_STRATEGY) != Z_OK)
        throw std::runtime_error("zlib did not start");
    std::unique_ptr<z_stream, int (*)(z_stream*)> const guard(&stream, deflateEnd);
    std::string packed(deflateBound(&stream, static_cast<uLong>(inText.size())), '\0');
    stream.next_in = InputOf(inText);
    stream.avail_in = static_cast<uInt>(inText.size());
    stream.next_out = reinterpret_cast<Bytef*>(packed.data());
    stream.avail_out = static_cast<uInt>(packed.size());
    if (deflate(&stream, Z_FINISH) != Z_STREAM_END)
        throw std::runtime_error("zlib could not pack an answer");
    packed.resize(stream.total_out);
    return packed;
}

std::string Unpack(std::string_view inPacked, UnpackLimits const& inLimits) {
    z_stream stream{};
    if (inflateInit2(&stream, kAnyWindow) != Z_OK)
        throw std::runtime_error("zlib did not start");
    std::unique_ptr<z_stream, int (*)(z_stream*)> const guard(&stream, inflateEnd);
    stream.next_in = InputOf(inPacked);
    stream.avail_in = static_cast<uInt>(inPacked.size());

    std::string text;
    std::vector<char> step(kStep);
    while (true) {
        stream.next_out = reinterpret_cast<Bytef*>(step.data());
        stream.avail_out = static_cast<uInt>(step.size());
        int const result = inflate(&stream, Z_NO_FLUSH);
        std::size_t const made = step.size() - stream.avail_out;
        text.append(step.data(), made);
        bool const tooLarge = text.size() > inLimits.maxSize;
        bool const tooDense =
            text.size() > inLimits.freeSize && text.size() / (stream.total_in + 1) > inLimits.maxRatio;
        if (tooLarge || tooDense)
            throw Failure(413, "unpacked-too-large",
                          "The unpacked body is larger than this server accepts; send it in smaller parts.");
        if (result == Z_STREAM_END)
            break;
        if (result != Z_OK || (made == 0 && stream.avail_in == 0))
            throw Failure(400, "body-not-unpackable", "The compressed body is damaged or cut short.");
    }
    if (stream.avail_in != 0)
        throw Failure(400, "body-not-unpackable", "The compressed body has bytes behind its end.");
    return text;
}

}  // namespace zohub
