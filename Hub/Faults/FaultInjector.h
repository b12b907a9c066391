// Decides, request by request, which fault of a script it meets.
#pragma once

#include <functional>
#include <mutex>
#include <vector>

#include "Faults/FaultScript.h"

namespace zohub {

/// Thread-safe. Each rule counts the requests that it matches, whether or not one of them meets a fault; of
/// the rules that want a request, the first of the script gets it.
class FaultInjector {
public:
    /// What ends the life of the token of a request.
    using ExpireFunction = std::function<void(Request const&)>;
    /// Told of each fault, with its line, action, method and path.
    using TellFunction = std::function<void(std::string const&)>;

    FaultInjector(FaultScript inScript, ExpireFunction inExpire, TellFunction inTell);

    FaultPlan PlanFor(Request const& inRequest);

private:
    double Draw(std::size_t inRule, std::uint64_t inNumber) const;

    FaultScript const mScript;
    ExpireFunction const mExpire;
    TellFunction const mTell;
    std::mutex mMutex;
    std::vector<std::uint64_t> mCounts;  // under mMutex, one for each rule
};

}  // namespace zohub
