// How one payload is named and framed on disk.
#pragma once

#include <array>
#include <cstdint>
#include <cstring>
#include <string>
#include <string_view>

#include "ostcore/Export.h"

namespace QM {
namespace detail {

/// A key and a stored name. The key is kept as its digest (SHA-256, the first 20 bytes), so that no text of a
/// server gets into a file name. Without padding, so that it can be compared as bytes.
struct EntryKey {
    std::array<unsigned char, 20> digest{};
    /// Filled up with NUL.
    std::array<char, 12> name{};

    std::string_view Name() const noexcept { return {name.data(), ::strnlen(name.data(), name.size())}; }
    friend bool operator==(const EntryKey& inLeft, const EntryKey& inRight) noexcept {
        return std::memcmp(&inLeft, &inRight, sizeof(EntryKey)) == 0;
    }
};
static_assert(sizeof(EntryKey) == 32, "padding would be compared");

struct EntryKeyHash {
    std::size_t operator()(const EntryKey& inKey) const noexcept {
        std::size_t hash = 0;
        std::memcpy(&hash, inKey.digest.data(), sizeof hash);
        return hash + static_cast<unsigned char>(inKey.name[0]);
    }
};

/// What is known of a stored file: its size, and the time of its last change in seconds since 1970; 0 for
/// unknown.
struct FileState {
    std::uint64_t size = 0;
    std::int64_t stamp = 0;
};

/// False for an empty key and for a name that is none.
ZOPLATFORM_EXPORT bool MakeEntryKey(std::string_view inKey, std::string_view inName, EntryKey& outKey);
/// As MakeEntryKey, for any name.
ZOPLATFORM_EXPORT EntryKey MakeEntryKeyWithoutName(std::string_view inKey);
ZOPLATFORM_EXPORT bool SetName(EntryKey& ioKey, std::string_view inName);

/// "3f": one of 256 directories.
ZOPLATFORM_EXPORT std::string DirectoryNameOf(const EntryKey& inKey);
/// The digest in hexadecimal, "-" and the stored name.
ZOPLATFORM_EXPORT std::string FileNameOf(const EntryKey& inKey);
/// False for a name that FileNameOf does not give.
ZOPLATFORM_EXPORT bool ParseFileName(std::string_view inFileName, EntryKey& outKey);

/// What stands before the payload in a file: magic, version, CRC-32 of the payload, its length, the key, and
/// a CRC-32 over all that. Integers are little-endian.
constexpr std::size_t kHeaderSize = 64;
using Header = std::array<unsigned char, kHeaderSize>;

ZOPLATFORM_EXPORT Header MakeHeader(const EntryKey& inKey, std::string_view inPayload);
/// Whether the header is whole and of this key, with the length that its payload has.
ZOPLATFORM_EXPORT bool ReadHeader(const Header& inHeader, const EntryKey& inKey, std::uint64_t& outLength);
/// Whether it is the payload of the header.
ZOPLATFORM_EXPORT bool IsPayloadOf(const Header& inHeader, std::string_view inPayload);

}  // namespace detail
}  // namespace QM
