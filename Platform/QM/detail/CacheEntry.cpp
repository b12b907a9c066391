#include "QM/detail/CacheEntry.h"

#include <libdeflate.h>
#include <openssl/evp.h>

#include <algorithm>
#include <memory>
#include <new>

namespace QM {
namespace detail {
namespace {

constexpr std::string_view kMagic = "ZOCACHE\n";
constexpr std::uint32_t kVersion = 1;
constexpr char kHexadecimal[] = "0123456789abcdef";

constexpr std::size_t kVersionAt = 8;
constexpr std::size_t kPayloadChecksumAt = 12;
constexpr std::size_t kLengthAt = 16;
constexpr std::size_t kKeyAt = 24;
constexpr std::size_t kHeaderChecksumAt = 60;
static_assert(kKeyAt + sizeof(EntryKey) <= kHeaderChecksumAt, "the key does not fit");

void Put(Header& ioHeader, std::size_t inAt, std::uint64_t inValue, std::size_t inBytes) {
    for (std::size_t i = 0; i < inBytes; ++i) {
        ioHeader[inAt + i] = static_cast<unsigned char>(inValue >> (8 * i));
    }
}

std::uint64_t Get(const Header& inHeader, std::size_t inAt, std::size_t inBytes) {
    std::uint64_t value = 0;
    for (std::size_t i = 0; i < inBytes; ++i) {
        value |= static_cast<std::uint64_t>(inHeader[inAt + i]) << (8 * i);
    }
    return value;
}

std::uint32_t Checksum(const void* inBytes, std::size_t inSize) {
    return libdeflate_crc32(0, inBytes, inSize);
}

using Digest = std::array<unsigned char, 32>;

/// The method is looked up once and the state kept: for a key both cost more than the digest.
Digest SHA256Of(std::string_view inText) {
    static const EVP_MD* const sMethod = EVP_MD_fetch(nullptr, "SHA256", nullptr);
    thread_local const std::unique_ptr<EVP_MD_CTX, decltype(&EVP_MD_CTX_free)> sState(EVP_MD_CTX_new(),
                                                                                      &EVP_MD_CTX_free);
    Digest digest{};
    if (!sState || EVP_DigestInit_ex(sState.get(), sMethod, nullptr) != 1 ||
        EVP_DigestUpdate(sState.get(), inText.data(), inText.size()) != 1 ||
        EVP_DigestFinal_ex(sState.get(), digest.data(), nullptr) != 1) {
        throw std::bad_alloc();
    }
    return digest;
}

int DigitOf(char inCharacter) {
    const char* const found = std::find(kHexadecimal, kHexadecimal + 16, inCharacter);
    return static_cast<int>(found - kHexadecimal);
}

bool IsNameCharacter(char inCharacter) {
    return (inCharacter >= 'a' && inCharacter <= 'z') || (inCharacter >= '0' && inCharacter <= '9');
}

}  // namespace

bool SetName(EntryKey& ioKey, std::string_view inName) {
    if (inName.empty() || inName.size() > ioKey.name.size() ||
        !std::all_of(inName.begin(), inName.end(), IsNameCharacter)) {
        return false;
    }
    ioKey.name = {};
    std::copy(inName.begin(), inName.end(), ioKey.name.begin());
    return true;
}

EntryKey MakeEntryKeyWithoutName(std::string_view inKey) {
    EntryKey key;
    const Digest digest = SHA256Of(inKey);
    std::copy_n(digest.begin(), key.digest.size(), key.digest.begin());
    return key;
}

bool MakeEntryKey(std::string_view inKey, std::string_view inName, EntryKey& outKey) {
    if (inKey.empty()) {
        return false;
    }
    outKey = MakeEntryKeyWithoutName(inKey);
    return SetName(outKey, inName);
}

std::string DirectoryNameOf(const EntryKey& inKey) {
    return {kHexadecimal[inKey.digest[0] >> 4], kHexadecimal[inKey.digest[0] & 15]};
}

std::string FileNameOf(const EntryKey& inKey) {
    std::string name;
    name.reserve(2 * inKey.digest.size() + 1 + inKey.name.size());
    for (const unsigned char byte : inKey.digest) {
        name += kHexadecimal[byte >> 4];
        name += kHexadecimal[byte & 15];
    }
    name += '-';
    name += inKey.Name();
    return name;
}

bool ParseFileName(std::string_view inFileName, EntryKey& outKey) {
    const std::size_t digits = 2 * outKey.digest.size();
    if (inFileName.size() <= digits || inFileName[digits] != '-') {
        return false;
    }
    for (std::size_t i = 0; i < outKey.digest.size(); ++i) {
        const int high = DigitOf(inFileName[2 * i]);
        const int low = DigitOf(inFileName[2 * i + 1]);
        if (high > 15 || low > 15) {
            return false;
        }
        outKey.digest[i] = static_cast<unsigned char>(high << 4 | low);
    }
    return SetName(outKey, inFileName.substr(digits + 1));
}

Header MakeHeader(const EntryKey& inKey, std::string_view inPayload) {
    Header header{};
    std::copy(kMagic.begin(), kMagic.end(), header.begin());
    Put(header, kVersionAt, kVersion, 4);
    Put(header, kPayloadChecksumAt, Checksum(inPayload.data(), inPayload.size()), 4);
    Put(header, kLengthAt, inPayload.size(), 8);
    std::memcpy(header.data() + kKeyAt, &inKey, sizeof inKey);
    Put(header, kHeaderChecksumAt, Checksum(header.data(), kHeaderChecksumAt), 4);
    return header;
}

bool ReadHeader(const Header& inHeader, const EntryKey& inKey, std::uint64_t& outLength) {
    if (!std::equal(kMagic.begin(), kMagic.end(), inHeader.begin()) ||
        Get(inHeader, kVersionAt, 4) != kVersion ||
        std::memcmp(inHeader.data() + kKeyAt, &inKey, sizeof inKey) != 0 ||
        Get(inHeader, kHeaderChecksumAt, 4) != Checksum(inHeader.data(), kHeaderChecksumAt)) {
        return false;
    }
    outLength = Get(inHeader, kLengthAt, 8);
    return true;
}

bool IsPayloadOf(const Header& inHeader, std::string_view inPayload) {
    return Get(inHeader, kLengthAt, 8) == inPayload.size() &&
           Get(inHeader, kPayloadChecksumAt, 4) == Checksum(inPayload.data(), inPayload.size());
}

}  // namespace detail
}  // namespace QM
