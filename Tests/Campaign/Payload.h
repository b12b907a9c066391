// What the users of the campaign put into enclosures, and how contents are compared.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

namespace campaign {

/// So many bytes that no other name brings.
inline std::string PayloadOf(const std::string& inName, std::size_t inSize) {
    std::string payload;
    payload.reserve(inSize + inName.size() + 16);
    for (std::size_t line = 0; payload.size() < inSize; ++line) {
        payload += inName + " " + std::to_string(line) + "\n";
    }
    payload.resize(inSize);
    return payload;
}

/// Size and FNV-1a of the bytes, as text.
inline std::string DigestOf(std::string_view inBytes) {
    std::uint64_t hash = 0xcbf29ce484222325ull;
    for (const char byte : inBytes) {
        hash = (hash ^ static_cast<unsigned char>(byte)) * 0x100000001b3ull;
    }
    return std::to_string(inBytes.size()) + ":" + std::to_string(hash);
}

}  // namespace campaign
