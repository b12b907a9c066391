#include "DeflateSides.h"

#include <random>

#include "Loops.h"
#include "ostnet/http/Compression.h"

namespace bench {
namespace {

constexpr int kGzipWindow = 15 + 16;
constexpr int kMemoryLevel = 8;

}  // namespace

std::string MakeAssetJSON(std::size_t inSize) {
    std::mt19937_64 random(20260314);
    const char* const kinds[] = {"clip", "sequence", "bin", "still", "title"};
    const auto identifier = [&random] { return ostnet::Guid(random(), random()).ToString(); };
    std::string text = "{\"assets\":[";
    for (int number = 0; text.size() < inSize; ++number) {
        text += number == 0 ? "{" : ",{";
        text += "\"assetId\":\"" + identifier() + "\",\"name\":\"Harbour " + std::to_string(random() % 9000) +
                " take " + std::to_string(number) + "\",\"type\":\"" + kinds[random() % 5] +
                "\",\"created\":\"2026-03-" + std::to_string(10 + random() % 20) +
                "T14:05:09.000Z\",\"duration\":{\"ticks\":" + std::to_string(random() % 254016000000000) +
                "},\"links\":[{\"rel\":\"self\",\"href\":\"/content/zo/data/asset/" + identifier() +
                "\"},{\"rel\":\"enclosures\",\"href\":\"/content/zo/data/enclosures/" + identifier() +
                "\"}]}";
    }
    return text + "]}";
}

std::vector<Body> CutIntoBodies(const std::string& inText, std::size_t inSize) {
    std::vector<Body> bodies;
    for (std::size_t at = 0; at + inSize <= inText.size(); at += inSize) {
        bodies.push_back(
            ostnet::RecycledMemory::CreateFromBytes(std::string_view(inText).substr(at, inSize)));
    }
    return bodies;
}

std::size_t PackOurs(const std::vector<Body>& inBodies) {
    std::size_t size = 0;
    for (const Body& body : inBodies) {
        size += ostnet::http::CompressPayload(body)->size();
    }
    return size;
}

ZlibSide::ZlibSide() {
    Demand(deflateInit2(&mStream, Z_DEFAULT_COMPRESSION, Z_DEFLATED, kGzipWindow, kMemoryLevel,
                        Z_DEFAULT_STRATEGY) == Z_OK,
           "zlib cannot be set up");
}

ZlibSide::~ZlibSide() {
    deflateEnd(&mStream);
}

std::size_t ZlibSide::Pack(const std::vector<Body>& inBodies) {
    std::size_t size = 0;
    for (const Body& body : inBodies) {
        deflateReset(&mStream);
        mBuffer.resize(std::max<std::size_t>(mBuffer.size(), deflateBound(&mStream, body->size())));
        mStream.next_in = reinterpret_cast<unsigned char*>(const_cast<char*>(body->data()));
        mStream.avail_in = static_cast<uInt>(body->size());
        mStream.next_out = mBuffer.data();
        mStream.avail_out = static_cast<uInt>(mBuffer.size());
        Demand(deflate(&mStream, Z_FINISH) == Z_STREAM_END, "zlib did not pack a body");
        size += mStream.total_out;
    }
    return size;
}

}  // namespace bench
