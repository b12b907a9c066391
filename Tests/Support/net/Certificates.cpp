#include "net/Certificates.h"

#include <arpa/inet.h>
#include <openssl/evp.h>
#include <openssl/pem.h>
#include <openssl/x509v3.h>
#include <unistd.h>

#include <atomic>
#include <fstream>
#include <stdexcept>

namespace zotest {
namespace net {
namespace {

struct FreeOpenSSL {
    void operator()(EVP_PKEY* inKey) const { EVP_PKEY_free(inKey); }
    void operator()(X509* inCertificate) const { X509_free(inCertificate); }
    void operator()(BIO* inBIO) const { BIO_free(inBIO); }
    void operator()(X509_EXTENSION* inExtension) const { X509_EXTENSION_free(inExtension); }
};
template <typename Thing>
using Owned = std::unique_ptr<Thing, FreeOpenSSL>;

constexpr long kAge = 3600;

Owned<EVP_PKEY> MakeKey() {
    Owned<EVP_PKEY> key(EVP_EC_gen("P-256"));
    if (!key) {
        throw std::runtime_error("No key could be made for a test certificate.");
    }
    return key;
}

template <typename Write>
std::string ToPEM(Write inWrite) {
    Owned<BIO> memory(BIO_new(BIO_s_mem()));
    inWrite(memory.get());
    char* bytes = nullptr;
    const long size = BIO_get_mem_data(memory.get(), &bytes);
    return {bytes, static_cast<std::size_t>(size)};
}

void SetName(X509* ioCertificate, const std::string& inName, X509* inIssuer) {
    X509_NAME* name = X509_get_subject_name(ioCertificate);
    const std::basic_string<unsigned char> bytes(inName.begin(), inName.end());
    X509_NAME_add_entry_by_txt(name, "CN", MBSTRING_ASC, bytes.c_str(), -1, -1, 0);
    X509_set_issuer_name(ioCertificate, X509_get_subject_name(inIssuer));
}

void AddExtension(X509* ioCertificate, X509* inIssuer, int inKind, const std::string& inValue) {
    X509V3_CTX context;
    X509V3_set_ctx_nodb(&context);
    X509V3_set_ctx(&context, inIssuer, ioCertificate, nullptr, nullptr, 0);
    Owned<X509_EXTENSION> extension(X509V3_EXT_conf_nid(nullptr, &context, inKind, inValue.c_str()));
    if (!extension) {
        throw std::runtime_error("A test certificate cannot carry " + inValue);
    }
    X509_add_ext(ioCertificate, extension.get(), -1);
}

Owned<X509> MakeCertificate(EVP_PKEY* inKey, long inSecondsLeft) {
    static std::atomic<long> sSerial{1};
    Owned<X509> certificate(X509_new());
    X509_set_version(certificate.get(), 2);
    ASN1_INTEGER_set(X509_get_serialNumber(certificate.get()), sSerial++);
    X509_gmtime_adj(X509_getm_notBefore(certificate.get()), -kAge);
    X509_gmtime_adj(X509_getm_notAfter(certificate.get()), inSecondsLeft);
    X509_set_pubkey(certificate.get(), inKey);
    return certificate;
}

bool IsAddress(const std::string& inHost) {
    unsigned char address[16];
    return inet_pton(AF_INET, inHost.c_str(), address) == 1 ||
           inet_pton(AF_INET6, inHost.c_str(), address) == 1;
}

std::string WriteTemporaryFile(const std::string& inText) {
    char path[] = "/tmp/zo-test-authority-XXXXXX";
    const int file = mkstemp(path);
    if (file < 0) {
        throw std::runtime_error("No temporary file could be made for a test authority.");
    }
    close(file);
    std::ofstream(path) << inText;
    return path;
}

}  // namespace

struct CertificateAuthority::State {
    Owned<EVP_PKEY> key = MakeKey();
    Owned<X509> certificate = MakeCertificate(key.get(), kAge);
};

CertificateAuthority::CertificateAuthority() : mState(std::make_unique<State>()) {
    X509* certificate = mState->certificate.get();
    SetName(certificate, "Test authority", certificate);
    AddExtension(certificate, certificate, NID_basic_constraints, "critical,CA:TRUE");
    AddExtension(certificate, certificate, NID_key_usage, "critical,keyCertSign,cRLSign");
    X509_sign(certificate, mState->key.get(), EVP_sha256());
    mFile = WriteTemporaryFile(ToPEM([certificate](BIO* ioBIO) { PEM_write_bio_X509(ioBIO, certificate); }));
}

CertificateAuthority::~CertificateAuthority() {
    unlink(mFile.c_str());
}

ServerIdentity CertificateAuthority::Issue(const std::string& inHost, long inSecondsLeft) const {
    const auto key = MakeKey();
    const auto certificate = MakeCertificate(key.get(), inSecondsLeft);
    SetName(certificate.get(), "Test server", mState->certificate.get());
    AddExtension(certificate.get(), mState->certificate.get(), NID_subject_alt_name,
                 (IsAddress(inHost) ? "IP:" : "DNS:") + inHost);
    X509_sign(certificate.get(), mState->key.get(), EVP_sha256());
    return {ToPEM([&certificate](BIO* ioBIO) { PEM_write_bio_X509(ioBIO, certificate.get()); }),
            ToPEM([&key](BIO* ioBIO) {
                PEM_write_bio_PrivateKey(ioBIO, key.get(), nullptr, nullptr, 0, nullptr, nullptr);
            })};
}

}  // namespace net
}  // namespace zotest
