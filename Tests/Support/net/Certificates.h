// Certificates for test servers, made at run time.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "net/RawServer.h"

namespace zotest {
namespace net {

/// An authority of the test's own, with its certificate in a file that a client can be told to trust. The
/// file goes with the authority.
class CertificateAuthority {
public:
    CertificateAuthority();
    ~CertificateAuthority();
    CertificateAuthority(const CertificateAuthority&) = delete;
    CertificateAuthority& operator=(const CertificateAuthority&) = delete;

    const std::string& File() const noexcept { return mFile; }
    /// Vouches for a host name or an IP address; valid from an hour ago until so many seconds from now,
    /// which can lie in the past.
    ServerIdentity Issue(const std::string& inHost, long inSecondsLeft = 3600) const;

private:
    struct State;
    const std::unique_ptr<State> mState;
    std::string mFile;
};

}  // namespace net
}  // namespace zotest
