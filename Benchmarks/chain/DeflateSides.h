// The packing of upload bodies: ours, and zlib with its stream used again for each body.
#pragma once

#include <zlib.h>

#include <cstddef>
#include <string>
#include <vector>

#include "ostnet/Response.h"

namespace bench {

using Body = boost::shared_ptr<ostnet::RecycledMemory const>;

/// A JSON list of asset records of about so many bytes, as a bulk upload carries it.
std::string MakeAssetJSON(std::size_t inSize);
/// The text cut into bodies of a size.
std::vector<Body> CutIntoBodies(const std::string& inText, std::size_t inSize);

/// Packs all bodies as the upload layer does; returns the size of what came out.
std::size_t PackOurs(const std::vector<Body>& inBodies);

/// zlib's gzip at its default level, into a buffer that is used again as well.
class ZlibSide {
public:
    ZlibSide();
    ~ZlibSide();
    ZlibSide(const ZlibSide&) = delete;
    ZlibSide& operator=(const ZlibSide&) = delete;
    std::size_t Pack(const std::vector<Body>& inBodies);

private:
    z_stream mStream{};
    std::vector<unsigned char> mBuffer;
};

}  // namespace bench
