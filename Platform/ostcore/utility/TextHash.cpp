// Draws the seed of the hash of texts.
#include "ostcore/utility/TextHash.h"

#include <random>

namespace ostcore {
namespace utility {

std::uint64_t TextHashSeed() {
    static const std::uint64_t seed = [] {
        std::random_device device;
        return (static_cast<std::uint64_t>(device()) << 32) | device();
    }();
    return seed;
}

}  // namespace utility
}  // namespace ostcore
