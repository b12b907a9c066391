// Hashes, random values and identifiers: what content is addressed by and tokens are made of.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

namespace zohub {

/// Lower-case hexadecimal SHA-256 of the bytes.
std::string Sha256Hex(std::string_view inBytes);

/// SHA-256 over bytes that arrive in pieces.
class Sha256 {
public:
    Sha256();
    ~Sha256();
    void Update(std::string_view inBytes);
    std::string FinishHex();

private:
    struct State;
    std::unique_ptr<State> mState;
};

/// Cryptographically random bytes as lower-case hexadecimal text.
std::string RandomHex(std::size_t inByteCount);

/// A fresh random identifier of letters and digits; 11 of them are 65 bits, 22 are 130. Lists repeat
/// identifiers often, so they are short.
std::string NewKey(std::size_t inLength);

/// The identifier that belongs to a text: the same text gives the same one always.
std::string KeyFromText(std::string_view inText, std::size_t inLength);

inline constexpr std::size_t kShortKey = 11;
inline constexpr std::size_t kLongKey = 22;

/// A fresh random GUID in its lower-case text form.
std::string NewGuid();

/// The GUID that belongs to a text: the same text gives the same GUID always.
std::string GuidFromText(std::string_view inText);

/// Whether the text is a lower-case hexadecimal SHA-256.
bool IsDigest(std::string_view inText);

/// Compares without telling by its duration where the two differ.
bool EqualInConstantTime(std::string_view inLeft, std::string_view inRight);

}  // namespace zohub
