// Words for the failures of requests.
#include "Failure.h"

namespace zo {
namespace {

const char* HintFor(ExitCode inCode) {
    switch (inCode) {
        case ExitCode::NotAuthenticated:
            return "run 'zo login' to sign in again";
        case ExitCode::NotPermitted:
            return "ask the owner for access, or sign in as another user with 'zo login'";
        case ExitCode::NotFound:
            return "check the name; 'zo productions' and 'zo assets' list what there is";
        case ExitCode::Behind:
            return "run 'zo open --latest' and try again";
        case ExitCode::SessionChanged:
            return "load it anew and try again";
        case ExitCode::Network:
            return "check that the hub runs and the address is right ('zo hub status' for a local one), then "
                   "try "
                   "again";
        case ExitCode::Tls:
            return "check the address, or name the authority that signed the hub's certificate with --ca "
                   "FILE";
        default:
            return "";
    }
}

// The reason in words that belong to the exit code; the library's meaning for everything else.
std::string ReasonFor(ExitCode inCode, int inResult, const boost::shared_ptr<ostnet::Response>& inResponse) {
    switch (inCode) {
        case ExitCode::Tls:
            return ostnet::Response::IsBadSSLCACert(inResponse) ? "the hub's certificate is not trusted"
                                                                : "no encrypted connection could be made";
        case ExitCode::NotAuthenticated:
            return "the login is missing, wrong or has expired";
        case ExitCode::Network:
            return inResponse && inResponse->status > 0 ? "the hub is busy" : "the hub could not be reached";
        default:
            break;
    }
    if (inResponse && inResponse->status > 0 && inResult == ZOCL::kResultFailure) {
        return "the hub answered with HTTP status " + std::to_string(inResponse->status);
    }
    return ZOCL::GetResultMeaning(inResult);
}

}  // namespace

std::string HintAfterLostAnswer(int inResult, const boost::shared_ptr<ostnet::Response>& inResponse) {
    return ExitCodeFor(inResult, inResponse) == ExitCode::Network
               ? "it may have arrived all the same: look with 'zo history' once the hub is back, before it "
                 "is "
                 "done again"
               : "";
}

Failure Failure::OfRequest(const std::string& inWhatWasTried, int inResult,
                           const boost::shared_ptr<ostnet::Response>& inResponse, std::string inHint) {
    const ExitCode code = ExitCodeFor(inResult, inResponse);
    if (code == ExitCode::Cancelled) {
        return Failure(code, inWhatWasTried + ": cancelled");
    }
    const std::string name = ZOCL::GetResultName(inResult);
    return Failure(code, inWhatWasTried + ": " + ReasonFor(code, inResult, inResponse) + " (" + name + ")",
                   Details{inHint.empty() ? HintFor(code) : std::move(inHint), name,
                           inResponse && inResponse->status > 0 ? inResponse->status : 0});
}

}  // namespace zo
