// Maps result codes and responses of the client library to the exit codes of zo.
#include "ExitCodes.h"

#include <algorithm>
#include <array>

namespace zo {
namespace {

// Failures of TLS itself, in the transport engine's numbering (libcurl-errors(3)): handshake, own
// certificate, cipher, peer's certificate, no TLS, unreadable authority file, issuer, pin, stapled status.
constexpr std::array<int, 9> kTlsTransportErrors{35, 58, 59, 60, 64, 77, 83, 90, 91};

bool IsTlsFailure(const boost::shared_ptr<ostnet::Response>& inResponse) {
    if (!inResponse || inResponse->status > 0) {
        return false;
    }
    return ostnet::Response::IsBadSSLCACert(inResponse) ||
           std::find(kTlsTransportErrors.begin(), kTlsTransportErrors.end(), inResponse->curlError) !=
               kTlsTransportErrors.end();
}

ExitCode FromStatus(int inStatus) {
    switch (inStatus) {
        case 401:
            return ExitCode::NotAuthenticated;
        case 403:
            return ExitCode::NotPermitted;
        case 404:
        case 410:
            return ExitCode::NotFound;
        case 409:
            return ExitCode::Behind;
        case 412:
            return ExitCode::SessionChanged;
        case 408:
        case 429:
        case 502:
        case 503:
        case 504:
            return ExitCode::Network;
        default:
            return ExitCode::Failure;
    }
}

}  // namespace

const std::vector<ExitCodeText>& AllExitCodes() {
    static const std::vector<ExitCodeText> table{
        {ExitCode::Ok, "ok", "Everything was done."},
        {ExitCode::Failure, "failure", "It failed for a reason that has no code of its own."},
        {ExitCode::Usage, "usage", "The command line is wrong; nothing was done."},
        {ExitCode::ConflictsRemain, "conflicts-remain", "Conflicts remain and have to be resolved."},
        {ExitCode::Behind, "behind", "The hub has a newer commit (HTTP 409)."},
        {ExitCode::SessionChanged, "session-changed",
         "What was changed had been changed by others (HTTP 412)."},
        {ExitCode::NotAuthenticated, "not-authenticated", "Nobody is signed in, or the login has expired."},
        {ExitCode::NotPermitted, "not-permitted", "The user may not do this."},
        {ExitCode::NotFound, "not-found", "What was named does not exist."},
        {ExitCode::Network, "network", "The hub could not be reached or is busy; it may be tried again."},
        {ExitCode::Tls, "tls", "A trusted, encrypted connection could not be made."},
        {ExitCode::PartlyDone, "partly-done", "Some of it was done and some failed."},
        {ExitCode::Cancelled, "cancelled", "It was cancelled, by Ctrl-C, a signal or an answer."},
    };
    return table;
}

const char* ExitCodeName(ExitCode inCode) {
    for (const ExitCodeText& row : AllExitCodes()) {
        if (row.code == inCode) {
            return row.name;
        }
    }
    return "failure";
}

ExitCode ExitCodeFor(int inResult, const boost::shared_ptr<ostnet::Response>& inResponse) {
    if (inResult >= 0) {
        return ExitCode::Ok;
    }
    if (ZOCL::ResultSucceededOrCanceled(inResult)) {
        return ExitCode::Cancelled;
    }
    if (IsTlsFailure(inResponse)) {
        return ExitCode::Tls;
    }
    if (ostnet::Response::IsNetworkConnectivityError(inResponse)) {
        return ExitCode::Network;
    }
    // The HTTP families carry their status in the low 16 bits; a status outside the table survives only in
    // the response.
    const int family = static_cast<int>(static_cast<unsigned>(inResult) >> 16);
    const int low = inResult & 0xFFFF;
    if (family == 0xA045 && low >= 300) {
        return FromStatus(low);
    }
    return inResponse ? FromStatus(inResponse->status) : ExitCode::Failure;
}

}  // namespace zo
