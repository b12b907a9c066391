#include "net/Stream.h"

#include <openssl/err.h>
#include <openssl/pem.h>
#include <openssl/ssl.h>
#include <sys/socket.h>
#include <unistd.h>

#include <mutex>
#include <stdexcept>
#include <string>

namespace zotest {
namespace net {
namespace {

class PlainStream : public Stream {
public:
    explicit PlainStream(int inSocket) : mSocket(inSocket) {}
    ~PlainStream() override {
        if (mSocket >= 0) {
            close(mSocket);
        }
    }
    long Read(char* outBytes, std::size_t inSize) override { return recv(mSocket, outBytes, inSize, 0); }
    bool Write(std::string_view inBytes) override {
        while (!inBytes.empty()) {
            const ssize_t sent = send(mSocket, inBytes.data(), inBytes.size(), MSG_NOSIGNAL);
            if (sent <= 0) {
                return false;
            }
            inBytes.remove_prefix(static_cast<std::size_t>(sent));
        }
        return true;
    }
    void Reset() override {
        const linger atOnce{1, 0};
        setsockopt(mSocket, SOL_SOCKET, SO_LINGER, &atOnce, sizeof atOnce);
    }

private:
    const int mSocket;
};

struct FreeSSL {
    void operator()(SSL* inSSL) const { SSL_free(inSSL); }
};

class TLSStream : public PlainStream {
public:
    TLSStream(int inSocket, std::unique_ptr<SSL, FreeSSL> inSSL)
        : PlainStream(inSocket), mSSL(std::move(inSSL)) {}
    ~TLSStream() override {
        if (!mIsReset) {
            SSL_shutdown(mSSL.get());
        }
    }
    long Read(char* outBytes, std::size_t inSize) override {
        return SSL_read(mSSL.get(), outBytes, static_cast<int>(inSize));
    }
    bool Write(std::string_view inBytes) override {
        return inBytes.empty() || SSL_write(mSSL.get(), inBytes.data(), static_cast<int>(inBytes.size())) > 0;
    }
    void Reset() override {
        mIsReset = true;
        PlainStream::Reset();
    }

private:
    const std::unique_ptr<SSL, FreeSSL> mSSL;
    bool mIsReset = false;
};

struct FreeBIO {
    void operator()(BIO* inBIO) const { BIO_free(inBIO); }
};
std::unique_ptr<BIO, FreeBIO> ReadingBIO(const std::string& inText) {
    return std::unique_ptr<BIO, FreeBIO>(BIO_new_mem_buf(inText.data(), static_cast<int>(inText.size())));
}

}  // namespace

std::unique_ptr<Stream> MakePlainStream(int inSocket) {
    return std::make_unique<PlainStream>(inSocket);
}

struct TLSContext::State {
    SSL_CTX* context = nullptr;
    mutable std::mutex mutex;
    std::string lastOffer;
};

TLSContext::TLSContext(const std::string& inCertificate, const std::string& inKey)
    : mState(std::make_unique<State>()) {
    mState->context = SSL_CTX_new(TLS_server_method());
    X509* certificate = PEM_read_bio_X509(ReadingBIO(inCertificate).get(), nullptr, nullptr, nullptr);
    EVP_PKEY* key = PEM_read_bio_PrivateKey(ReadingBIO(inKey).get(), nullptr, nullptr, nullptr);
    const bool isUsable = mState->context && certificate && key &&
                          SSL_CTX_use_certificate(mState->context, certificate) == 1 &&
                          SSL_CTX_use_PrivateKey(mState->context, key) == 1;
    X509_free(certificate);
    EVP_PKEY_free(key);
    if (!isUsable) {
        SSL_CTX_free(mState->context);
        throw std::runtime_error("The test server cannot use its certificate.");
    }
    SSL_CTX_set_alpn_select_cb(
        mState->context,
        [](SSL*, const unsigned char**, unsigned char*, const unsigned char* inOffer, unsigned inSize,
           void* inState) {
            auto& state = *static_cast<State*>(inState);
            const void* offer = inOffer;
            std::lock_guard<std::mutex> lock(state.mutex);
            state.lastOffer.assign(static_cast<const char*>(offer), inSize);
            return SSL_TLSEXT_ERR_NOACK;
        },
        mState.get());
}

TLSContext::~TLSContext() {
    SSL_CTX_free(mState->context);
}

std::unique_ptr<Stream> TLSContext::Accept(int inSocket) {
    std::unique_ptr<SSL, FreeSSL> ssl(SSL_new(mState->context));
    SSL_set_fd(ssl.get(), inSocket);
    if (SSL_accept(ssl.get()) != 1) {
        ERR_clear_error();
        return nullptr;
    }
    return std::make_unique<TLSStream>(inSocket, std::move(ssl));
}

std::string TLSContext::LastOffer() const {
    std::lock_guard<std::mutex> lock(mState->mutex);
    return mState->lastOffer;
}

}  // namespace net
}  // namespace zotest
