// A connected socket of a test server, plain or with TLS.
#pragma once

#include <memory>
#include <string>
#include <string_view>

namespace zotest {
namespace net {

class Stream {
public:
    virtual ~Stream() = default;
    /// Bytes read; 0 or less when there will be no more.
    virtual long Read(char* outBytes, std::size_t inSize) = 0;
    virtual bool Write(std::string_view inBytes) = 0;
    /// Makes the end a reset.
    virtual void Reset() = 0;
};

std::unique_ptr<Stream> MakePlainStream(int inSocket);

/// Certificate, key and what clients offer; shared by the streams of one server.
class TLSContext {
public:
    TLSContext(const std::string& inCertificate, const std::string& inKey);
    ~TLSContext();
    /// Null when the handshake fails.
    std::unique_ptr<Stream> Accept(int inSocket);
    /// The protocols of the last client's offer, each behind its length.
    std::string LastOffer() const;

    struct State;

private:
    const std::unique_ptr<State> mState;
};

}  // namespace net
}  // namespace zotest
