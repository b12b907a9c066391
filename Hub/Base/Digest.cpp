// Hashes, random values and identifiers on OpenSSL.
#include "Base/Digest.h"

#include <openssl/crypto.h>
#include <openssl/evp.h>
#include <openssl/rand.h>

#include <algorithm>
#include <stdexcept>
#include <vector>

namespace zohub {

namespace {

std::string ToHex(unsigned char const* inBytes, std::size_t inCount) {
    static char const kDigits[] = "0123456789abcdef";
    std::string text;
    text.reserve(inCount * 2);
    for (std::size_t i = 0; i < inCount; ++i) {
        text += kDigits[inBytes[i] >> 4];
        text += kDigits[inBytes[i] & 15];
    }
    return text;
}

std::string GuidText(std::string const& inHex) {
    return inHex.substr(0, 8) + "-" + inHex.substr(8, 4) + "-" + inHex.substr(12, 4) + "-" +
           inHex.substr(16, 4) + "-" + inHex.substr(20, 12);
}

}  // namespace

std::string NewKey(std::size_t inLength) {
    return KeyFromText(RandomHex(32), inLength);
}

std::string KeyFromText(std::string_view inText, std::size_t inLength) {
    static char const kCharacters[] = "0123456789abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ";
    unsigned char digest[EVP_MAX_MD_SIZE];
    unsigned int size = 0;
    if (EVP_Digest(inText.data(), inText.size(), digest, &size, EVP_sha256(), nullptr) != 1)
        throw std::runtime_error("SHA-256 is not available");
    std::string key;
    for (std::size_t i = 0; i < inLength && i < size; ++i)
        key += kCharacters[digest[i] % 62];
    return key;
}

struct Sha256::State {
    EVP_MD_CTX* context = EVP_MD_CTX_new();
    ~State() { EVP_MD_CTX_free(context); }
};

Sha256::Sha256() : mState(std::make_unique<State>()) {
    if (!mState->context || EVP_DigestInit_ex(mState->context, EVP_sha256(), nullptr) != 1)
        throw std::runtime_error("SHA-256 is not available");
}

Sha256::~Sha256() = default;

void Sha256::Update(std::string_view inBytes) {
    EVP_DigestUpdate(mState->context, inBytes.data(), inBytes.size());
}

std::string Sha256::FinishHex() {
    unsigned char digest[EVP_MAX_MD_SIZE];
    unsigned int size = 0;
    EVP_DigestFinal_ex(mState->context, digest, &size);
    return ToHex(digest, size);
}

std::string Sha256Hex(std::string_view inBytes) {
    unsigned char digest[EVP_MAX_MD_SIZE];
    unsigned int size = 0;
    if (EVP_Digest(inBytes.data(), inBytes.size(), digest, &size, EVP_sha256(), nullptr) != 1)
        throw std::runtime_error("SHA-256 is not available");
    return ToHex(digest, size);
}

std::string RandomHex(std::size_t inByteCount) {
    std::vector<unsigned char> bytes(inByteCount);
    if (RAND_bytes(bytes.data(), static_cast<int>(bytes.size())) != 1)
        throw std::runtime_error("the system's random source failed");
    return ToHex(bytes.data(), bytes.size());
}

std::string NewGuid() {
    std::string hex = RandomHex(16);
    hex[12] = '4';
    hex[16] = "89ab"[(hex[16] <= '9' ? hex[16] - '0' : hex[16] - 'a' + 10) & 3];
    return GuidText(hex);
}

std::string GuidFromText(std::string_view inText) {
    std::string hex = Sha256Hex(inText).substr(0, 32);
    hex[12] = '8';  // RFC 9562, version 8: made from data of the maker's choice
    hex[16] = "89ab"[(hex[16] <= '9' ? hex[16] - '0' : hex[16] - 'a' + 10) & 3];
    return GuidText(hex);
}

bool IsDigest(std::string_view inText) {
    return inText.size() == 64 && std::all_of(inText.begin(), inText.end(), [](char c) {
               return (c >= '0' && c <= '9') || (c >= 'a' && c <= 'f');
           });
}

bool EqualInConstantTime(std::string_view inLeft, std::string_view inRight) {
    return inLeft.size() == inRight.size() &&
           CRYPTO_memcmp(inLeft.data(), inRight.data(), inLeft.size()) == 0;
}

}  // namespace zohub
