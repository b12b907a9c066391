// The exit codes of zo, which scripts rely on and which never change, and the one place that chooses them.
#pragma once

#include <string>
#include <vector>

#include "ZOClient/ResultCodes.h"

namespace zo {

enum class ExitCode : int {
    Ok = 0,
    Failure = 1,
    Usage = 2,
    ConflictsRemain = 3,
    Behind = 4,
    SessionChanged = 5,
    NotAuthenticated = 6,
    NotPermitted = 7,
    NotFound = 8,
    Network = 9,
    Tls = 10,
    PartlyDone = 11,
    Cancelled = 130
};

struct ExitCodeText {
    ExitCode code;
    /// The stable name in JSON errors.
    const char* name;
    const char* meaning;
};

/// Every exit code with its name and meaning, in numeric order.
const std::vector<ExitCodeText>& AllExitCodes();
const char* ExitCodeName(ExitCode inCode);

/// How a request ended, as an exit code. A null response leaves the decision to the result code.
ExitCode ExitCodeFor(int inResult, const boost::shared_ptr<ostnet::Response>& inResponse);

}  // namespace zo
