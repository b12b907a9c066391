// How a verb gives up: one exception that carries the exit code and what the user is told.
#pragma once

#include <memory>
#include <stdexcept>
#include <string>

#include "ExitCodes.h"

namespace zo {

/// What to do after a change whose answer did not come; empty for all other ends.
std::string HintAfterLostAnswer(int inResult, const boost::shared_ptr<ostnet::Response>& inResponse);

/// Ends the verb. The message says what was tried and on what, the hint what to do next. Copies share what it
/// says, so that copying one in flight cannot throw.
class Failure : public std::runtime_error {
public:
    Failure(ExitCode inCode, const std::string& inMessage, std::string inHint = {})
        : Failure(inCode, inMessage, Details{std::move(inHint), {}, 0}) {}

    ExitCode Code() const noexcept { return mCode; }
    const std::string& Hint() const noexcept { return mDetails->hint; }
    /// The library's name of the result, empty when no request was involved.
    const std::string& ResultName() const noexcept { return mDetails->resultName; }
    /// The HTTP status, 0 when there was none.
    int Status() const noexcept { return mDetails->status; }

    /// A request that ended badly. The hint is chosen by the exit code unless one is given.
    static Failure OfRequest(const std::string& inWhatWasTried, int inResult,
                             const boost::shared_ptr<ostnet::Response>& inResponse, std::string inHint = {});

private:
    struct Details {
        std::string hint;
        std::string resultName;
        int status = 0;
    };
    Failure(ExitCode inCode, const std::string& inMessage, Details inDetails)
        : std::runtime_error(inMessage),
          mCode(inCode),
          mDetails(std::make_shared<const Details>(std::move(inDetails))) {}

    ExitCode mCode;
    std::shared_ptr<const Details> mDetails;
};

}  // namespace zo
