// Passwords as salted scrypt hashes, on OpenSSL.
#include "Base/Password.h"

#include <openssl/crypto.h>
#include <openssl/evp.h>

#include <charconv>
#include <cstdint>
#include <optional>
#include <stdexcept>
#include <vector>

#include "Base/Digest.h"
#include "Base/Text.h"

namespace zohub {

namespace {

constexpr std::uint64_t kBlockSize = 8;
constexpr std::uint64_t kParallel = 1;
constexpr std::uint64_t kMaxMemory = 128ull << 20;
constexpr std::size_t kHashBytes = 32;

std::string Derive(std::string_view inPassword, std::string_view inSalt, std::uint64_t inCost,
                   std::uint64_t inBlockSize, std::uint64_t inParallel) {
    std::vector<unsigned char> key(kHashBytes);
    int const done = EVP_PBE_scrypt(inPassword.data(), inPassword.size(),
                                    reinterpret_cast<unsigned char const*>(inSalt.data()), inSalt.size(),
                                    inCost, inBlockSize, inParallel, kMaxMemory, key.data(), key.size());
    if (done != 1)
        throw std::runtime_error("the password hash could not be computed");
    std::string const hash = Sha256Hex({reinterpret_cast<char const*>(key.data()), key.size()});
    OPENSSL_cleanse(key.data(), key.size());
    return hash;
}

std::optional<std::uint64_t> NumberOf(std::string_view inText) {
    std::uint64_t value = 0;
    auto const [end, error] = std::from_chars(inText.data(), inText.data() + inText.size(), value);
    if (error != std::errc() || end != inText.data() + inText.size())
        return std::nullopt;
    return value;
}

}  // namespace

std::string HashPassword(std::string_view inPassword, unsigned inCost) {
    std::string const salt = RandomHex(16);
    std::uint64_t const cost = std::uint64_t{1} << inCost;
    return "scrypt$" + std::to_string(cost) + "$" + std::to_string(kBlockSize) + "$" +
           std::to_string(kParallel) + "$" + salt + "$" +
           Derive(inPassword, salt, cost, kBlockSize, kParallel);
}

bool PasswordMatches(std::string_view inPassword, std::string const& inHash) {
    auto const parts = Split(inHash, '$');
    if (parts.size() != 6 || parts[0] != "scrypt")
        return false;
    auto const cost = NumberOf(parts[1]);
    auto const blockSize = NumberOf(parts[2]);
    auto const parallel = NumberOf(parts[3]);
    if (!cost || !blockSize || !parallel)
        return false;
    return EqualInConstantTime(Derive(inPassword, parts[4], *cost, *blockSize, *parallel), parts[5]);
}

void SpendPasswordTime(std::string_view inPassword) {
    Derive(inPassword, "0123456789abcdef0123456789abcdef", 1 << kUsualPasswordCost, kBlockSize, kParallel);
}

}  // namespace zohub
