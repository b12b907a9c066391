// The hub's own certificates, on OpenSSL. The authority's key is thrown away after the server certificate has
// been signed with it, so nobody can ever make another certificate that a client of this hub would trust.
#include "Http/Tls.h"

#include <fcntl.h>
#include <openssl/evp.h>
#include <openssl/pem.h>
#include <openssl/rand.h>
#include <openssl/x509v3.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <stdexcept>

namespace zohub {

namespace {

namespace fs = std::filesystem;

using Key = std::unique_ptr<EVP_PKEY, decltype(&EVP_PKEY_free)>;
using Certificate = std::unique_ptr<X509, decltype(&X509_free)>;
using File = std::unique_ptr<FILE, int (*)(FILE*)>;

constexpr long kYears = 5;
constexpr long kValidSeconds = kYears * 365 * 86400;
constexpr long kRenewSeconds = 30 * 86400;

[[noreturn]] void Fail(std::string const& inWhat) {
    throw std::runtime_error("the TLS certificate could not be prepared: " + inWhat);
}

Key MakeKey() {
    Key key(EVP_PKEY_Q_keygen(nullptr, nullptr, "EC", static_cast<char const*>("P-256")), EVP_PKEY_free);
    if (!key)
        Fail("no key");
    return key;
}

void AddExtension(X509* inCertificate, X509* inIssuer, int inKind, std::string const& inValue) {
    X509V3_CTX context;
    X509V3_set_ctx_nodb(&context);
    X509V3_set_ctx(&context, inIssuer, inCertificate, nullptr, nullptr, 0);
    X509_EXTENSION* const extension = X509V3_EXT_conf_nid(nullptr, &context, inKind, inValue.c_str());
    if (!extension)
        Fail("extension " + inValue);
    X509_add_ext(inCertificate, extension, -1);
    X509_EXTENSION_free(extension);
}

Certificate MakeUnsigned(std::string const& inCommonName, EVP_PKEY* inKey, X509* inIssuer) {
    Certificate certificate(X509_new(), X509_free);
    X509* const raw = certificate.get();
    X509_set_version(raw, X509_VERSION_3);
    std::uint64_t serial = 0;
    RAND_bytes(reinterpret_cast<unsigned char*>(&serial), sizeof serial);
    ASN1_INTEGER_set_uint64(X509_get_serialNumber(raw), serial >> 1);
    X509_gmtime_adj(X509_getm_notBefore(raw), -86400);
    X509_gmtime_adj(X509_getm_notAfter(raw), kValidSeconds);
    X509_set_pubkey(raw, inKey);
    X509_NAME* const name = X509_get_subject_name(raw);
    X509_NAME_add_entry_by_txt(name, "CN", MBSTRING_UTF8,
                               reinterpret_cast<unsigned char const*>(inCommonName.c_str()), -1, -1, 0);
    X509_set_issuer_name(raw, inIssuer ? X509_get_subject_name(inIssuer) : name);
    return certificate;
}

std::string AlternativeNames() {
    std::string names = "DNS:localhost,IP:127.0.0.1,IP:::1";
    char host[256] = {};
    bool const known = gethostname(host, sizeof host - 1) == 0;
    std::string const text = host;
    bool const usable =
        known && !text.empty() && text.size() <= 63 && text != "localhost" &&
        text.find_first_not_of("abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789-.") ==
            std::string::npos;
    return usable ? names + ",DNS:" + text : names;
}

void WritePem(fs::path const& inPath, int inMode, std::function<int(FILE*)> const& inWrite) {
    fs::path const aside = inPath.string() + ".new";
    int const descriptor = open(aside.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_NOFOLLOW, inMode);
    if (descriptor < 0)
        Fail("cannot write " + aside.string());
    File file(fdopen(descriptor, "w"), fclose);
    bool const written =
        file && inWrite(file.get()) == 1 && fflush(file.get()) == 0 && fsync(descriptor) == 0;
    file.reset();
    if (!written)
        Fail("cannot write " + aside.string());
    fs::rename(aside, inPath);
}

bool IsStillGood(fs::path const& inCertificate) {
    File const file(fopen(inCertificate.c_str(), "r"), fclose);
    if (!file)
        return false;
    Certificate const certificate(PEM_read_X509(file.get(), nullptr, nullptr, nullptr), X509_free);
    if (!certificate)
        return false;
    int days = 0;
    int seconds = 0;
    ASN1_TIME_diff(&days, &seconds, nullptr, X509_get0_notAfter(certificate.get()));
    return days * 86400L + seconds > kRenewSeconds;
}

void MakeCertificates(fs::path const& inDirectory) {
    Key const authorityKey = MakeKey();
    Certificate const authority = MakeUnsigned("zohub local authority", authorityKey.get(), nullptr);
    AddExtension(authority.get(), authority.get(), NID_basic_constraints, "critical,CA:TRUE,pathlen:0");
    AddExtension(authority.get(), authority.get(), NID_key_usage, "critical,keyCertSign,cRLSign");
    AddExtension(authority.get(), authority.get(), NID_subject_key_identifier, "hash");
    if (X509_sign(authority.get(), authorityKey.get(), EVP_sha256()) == 0)
        Fail("cannot sign the authority");

    Key const serverKey = MakeKey();
    Certificate const server = MakeUnsigned("zohub", serverKey.get(), authority.get());
    AddExtension(server.get(), authority.get(), NID_basic_constraints, "critical,CA:FALSE");
    AddExtension(server.get(), authority.get(), NID_key_usage, "critical,digitalSignature");
    AddExtension(server.get(), authority.get(), NID_ext_key_usage, "serverAuth");
    AddExtension(server.get(), authority.get(), NID_subject_alt_name, AlternativeNames());
    AddExtension(server.get(), authority.get(), NID_subject_key_identifier, "hash");
    AddExtension(server.get(), authority.get(), NID_authority_key_identifier, "keyid");
    if (X509_sign(server.get(), authorityKey.get(), EVP_sha256()) == 0)
        Fail("cannot sign the server's certificate");

    WritePem(inDirectory / "server.key", 0600, [&](FILE* inFile) {
        return PEM_write_PrivateKey(inFile, serverKey.get(), nullptr, nullptr, 0, nullptr, nullptr);
    });
    WritePem(inDirectory / "ca.pem", 0644,
             [&](FILE* inFile) { return PEM_write_X509(inFile, authority.get()); });
    // Last, since its presence says that the set is whole.
    WritePem(inDirectory / "server.pem", 0644,
             [&](FILE* inFile) { return PEM_write_X509(inFile, server.get()); });
}

}  // namespace

std::string CaFilePath(std::string const& inDataDirectory) {
    return (fs::path(inDataDirectory) / "tls" / "ca.pem").string();
}

std::shared_ptr<boost::asio::ssl::context> PrepareTls(std::string const& inDataDirectory) {
    fs::path const directory = fs::path(inDataDirectory) / "tls";
    fs::create_directories(directory);
    chmod(directory.c_str(), S_IRWXU);
    if (!IsStillGood(directory / "server.pem"))
        MakeCertificates(directory);
    using boost::asio::ssl::context;
    auto tls = std::make_shared<context>(context::tls_server);
    tls->set_options(context::default_workarounds | context::no_sslv2 | context::no_sslv3 |
                     context::no_tlsv1 | context::no_tlsv1_1);
    tls->use_certificate_chain_file((directory / "server.pem").string());
    tls->use_private_key_file((directory / "server.key").string(), context::pem);
    return tls;
}

}  // namespace zohub
