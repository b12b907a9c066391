// Makes, reads and writes 128-bit identifiers.
#include "ostcore/utility/Guid.h"

#include <cstring>
#include <ostream>
#include <random>
#include <stdexcept>

#include <sys/random.h>

namespace ostcore {
namespace utility {
namespace {

constexpr std::size_t kTextSize = 36;
constexpr char kHexDigits[] = "0123456789abcdef";

constexpr bool IsDashPosition(std::size_t inIndex) {
    return inIndex == 8 || inIndex == 13 || inIndex == 18 || inIndex == 23;
}

int HexValue(char inDigit) noexcept {
    if (inDigit >= '0' && inDigit <= '9') {
        return inDigit - '0';
    }
    if (inDigit >= 'a' && inDigit <= 'f') {
        return inDigit - 'a' + 10;
    }
    if (inDigit >= 'A' && inDigit <= 'F') {
        return inDigit - 'A' + 10;
    }
    return -1;
}

// A few identifiers at a time, since each question to the kernel costs more than an identifier.
void FillRandom(std::uint64_t (&outWords)[2]) {
    thread_local std::uint64_t pool[32];
    thread_local std::size_t left = 0;
    thread_local int owner = 0;
    // A forked child must not hand out what its parent will hand out.
    static std::atomic<int> generation{1};
    static const bool watching = [] {
        return pthread_atfork(nullptr, nullptr, [] { generation.fetch_add(1, std::memory_order_relaxed); }) ==
               0;
    }();
    const int current = generation.load(std::memory_order_relaxed);
    if (left < 2 || owner != current || !watching) {
        if (getrandom(pool, sizeof(pool), 0) != static_cast<ssize_t>(sizeof(pool))) {
            std::random_device device;
            for (std::uint64_t& word : pool) {
                word = (static_cast<std::uint64_t>(device()) << 32) | device();
            }
        }
        left = std::size(pool);
        owner = current;
    }
    outWords[0] = pool[--left];
    outWords[1] = pool[--left];
}

}  // namespace

Guid Guid::CreateUnique() {
    std::uint64_t words[2];
    FillRandom(words);
    constexpr std::uint64_t kVersion4 = 0x4000;
    constexpr std::uint64_t kVariantRFC4122 = std::uint64_t(0x8) << 60;
    return Guid((words[0] & ~std::uint64_t(0xF000)) | kVersion4,
                (words[1] & ~(std::uint64_t(0xC) << 60)) | kVariantRFC4122);
}

bool Guid::Parse(std::string_view inText, Guid& outGuid) {
    if (inText.size() == kTextSize + 2 && inText.front() == '{' && inText.back() == '}') {
        inText = inText.substr(1, kTextSize);
    }
    if (inText.size() != kTextSize) {
        return false;
    }
    std::uint64_t halves[2] = {0, 0};
    int digits = 0;
    for (std::size_t i = 0; i < kTextSize; ++i) {
        if (IsDashPosition(i)) {
            if (inText[i] != '-') {
                return false;
            }
            continue;
        }
        const int value = HexValue(inText[i]);
        if (value < 0) {
            return false;
        }
        std::uint64_t& half = halves[digits++ / 16];
        half = (half << 4) | static_cast<std::uint64_t>(value);
    }
    outGuid = Guid(halves[0], halves[1]);
    return true;
}

std::string Guid::ToString() const {
    std::string text(kTextSize, '-');
    int digit = 0;
    for (std::size_t i = 0; i < kTextSize; ++i) {
        if (IsDashPosition(i)) {
            continue;
        }
        const std::uint64_t half = digit < 16 ? mHigh : mLow;
        text[i] = kHexDigits[(half >> (60 - 4 * (digit % 16))) & 0xF];
        ++digit;
    }
    return text;
}

std::ostream& operator<<(std::ostream& ioStream, const Guid& inGuid) {
    return ioStream << inGuid.ToString();
}

}  // namespace utility
}  // namespace ostcore
