// How a verb gives up: one exception that carries the exit code and what the user is told.
#pragma once

#include <stdexcept>
#include <string>

#include "ExitCodes.h"

namespace zo {

/// Ends the verb. The message says what was tried and on what, the hint what to do next.
class Failure : public std::runtime_error {
public:
    Failure(ExitCode inCode, const std::string& inMessage, std::string inHint = {})
        : std::runtime_error(inMessage), mCode(inCode), mHint(std::move(inHint)) {}

    ExitCode Code() const noexcept { return mCode; }
    const std::string& Hint() const noexcept { return mHint; }
    /// The library's name of the result, empty when no request was involved.
    const std::string& ResultName() const noexcept { return mResultName; }
    /// The HTTP status, 0 when there was none.
    int Status() const noexcept { return mStatus; }

    /// A request that ended badly. The hint is chosen by the exit code unless one is given.
    static Failure OfRequest(const std::string& inWhatWasTried, int inResult,
                             const boost::shared_ptr<ostnet::Response>& inResponse, std::string inHint = {});

private:
    ExitCode mCode;
    std::string mHint;
    std::string mResultName;
    int mStatus = 0;
};

}  // namespace zo
