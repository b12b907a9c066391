// Names of faults and the dice that choose them.
#include "Fault.h"

#include <utility>

namespace faultproxy {

namespace {

struct Kind {
    FaultKind kind;
    const char* name;
    bool takesTime;
    bool hasPlace;
    bool hasStatus;
    /// How often dice choose it, relative to the others.
    std::uint32_t weight;
};

constexpr Kind kKinds[] = {
    {FaultKind::kNone, "none", false, false, false, 0},
    {FaultKind::kRefuse, "refuse", true, false, false, 2},
    {FaultKind::kOutage, "outage", true, false, false, 2},
    {FaultKind::kResetBeforeRequest, "reset-before-request", false, false, false, 3},
    {FaultKind::kResetInRequestHead, "reset-in-request-head", false, true, false, 2},
    {FaultKind::kResetInRequestBody, "reset-in-request-body", false, true, false, 3},
    {FaultKind::kResetBeforeAnswer, "reset-before-answer", false, false, false, 5},
    {FaultKind::kResetInAnswerHead, "reset-in-answer-head", false, true, false, 3},
    {FaultKind::kResetInAnswerBody, "reset-in-answer-body", false, true, false, 4},
    {FaultKind::kResetAfterAnswer, "reset-after-answer", false, false, false, 2},
    {FaultKind::kTruncate, "truncate", false, true, false, 3},
    {FaultKind::kStall, "stall", true, true, false, 2},
    {FaultKind::kDelayRequest, "delay-request", true, false, false, 1},
    {FaultKind::kDelayAnswer, "delay-answer", true, false, false, 1},
    {FaultKind::kTrickle, "trickle", true, false, false, 2},
    {FaultKind::kStatusWithoutWork, "status-without-work", false, false, true, 4},
    {FaultKind::kStatusAfterWork, "status-after-work", false, false, true, 4},
    {FaultKind::kGarbageWithoutWork, "garbage-without-work", false, false, false, 2},
    {FaultKind::kGarbageAfterWork, "garbage-after-work", false, false, false, 2},
    {FaultKind::kDuplicate, "duplicate", false, false, false, 2},
    {FaultKind::kSwap, "swap", false, false, false, 0},
    {FaultKind::kCloseIdle, "close-idle", false, false, false, 2},
};

constexpr std::uint32_t kSwapWeight = 2;
// 401 stands for a token that has died; it is only ever true of a request that was not done.
constexpr int kStatusesWithoutWork[] = {500, 502, 503, 503, 504, 401, 401};
constexpr int kStatusesAfterWork[] = {500, 502, 503, 504};

const Kind& KindOf(FaultKind inKind) {
    for (const Kind& kind : kKinds) {
        if (kind.kind == inKind) {
            return kind;
        }
    }
    return kKinds[0];
}

std::uint32_t WeightOf(const Kind& inKind, const RandomScheduleLimits& inLimits) {
    switch (inKind.kind) {
        case FaultKind::kSwap:
            return inLimits.withSwaps ? kSwapWeight : 0;
        case FaultKind::kGarbageWithoutWork:
        case FaultKind::kGarbageAfterWork:
            return inLimits.withGarbage ? inKind.weight : 0;
        default:
            return inKind.weight;
    }
}

FaultKind DrawKind(Dice& ioDice, const RandomScheduleLimits& inLimits) {
    std::uint32_t total = 0;
    for (const Kind& kind : kKinds) {
        total += WeightOf(kind, inLimits);
    }
    std::uint32_t drawn = ioDice.Below(total);
    for (const Kind& kind : kKinds) {
        const std::uint32_t weight = WeightOf(kind, inLimits);
        if (drawn < weight) {
            return kind.kind;
        }
        drawn -= weight;
    }
    return FaultKind::kNone;
}

template <std::size_t Size>
int DrawOne(Dice& ioDice, const int (&inFrom)[Size]) {
    return inFrom[ioDice.Below(Size)];
}

Fault DrawFault(Dice& ioDice, const RandomScheduleLimits& inLimits) {
    Fault fault;
    fault.kind = DrawKind(ioDice, inLimits);
    fault.milliseconds = 1 + ioDice.Below(inLimits.maximumMilliseconds);
    fault.share = ioDice.Below(1000);
    fault.status = fault.kind == FaultKind::kStatusAfterWork ? DrawOne(ioDice, kStatusesAfterWork)
                                                             : DrawOne(ioDice, kStatusesWithoutWork);
    return fault;
}

}  // namespace

const char* NameOf(FaultKind inKind) {
    return KindOf(inKind).name;
}

std::string Fault::Describe() const {
    const Kind& table = KindOf(kind);
    std::string text = table.name;
    if (table.hasStatus) {
        text += " " + std::to_string(status);
    }
    if (table.hasPlace) {
        text += " at " + std::to_string(share) + "/1000";
    }
    if (table.takesTime) {
        text += " " + std::to_string(milliseconds) + " ms";
    }
    return text;
}

// SplitMix64.
std::uint64_t Dice::Next() {
    mState += 0x9e3779b97f4a7c15ull;
    std::uint64_t mixed = mState;
    mixed = (mixed ^ (mixed >> 30)) * 0xbf58476d1ce4e5b9ull;
    mixed = (mixed ^ (mixed >> 27)) * 0x94d049bb133111ebull;
    return mixed ^ (mixed >> 31);
}

std::map<std::size_t, Fault> RandomFaults(std::uint64_t inSeed, const RandomScheduleLimits& inLimits) {
    Dice dice(inSeed);
    const std::uint32_t count = 1 + dice.Below(inLimits.maximumFaults);
    std::map<std::size_t, Fault> faults;
    std::size_t place = 0;
    for (std::uint32_t i = 0; i < count; ++i) {
        // Now and then they come one on the heels of the other, as when a network is down for a while.
        const bool isClose = dice.Below(4) == 0;
        place += 1 + (isClose ? 0 : dice.Below(2 * inLimits.meanGap));
        faults[place] = DrawFault(dice, inLimits);
    }
    return faults;
}

Schedule ScheduleOf(std::map<std::size_t, Fault> inFaults, std::function<bool(const RequestLine&)> inSpares) {
    return [faults = std::move(inFaults), spares = std::move(inSpares)](std::size_t inNumber,
                                                                        const RequestLine& inRequest) {
        const auto found = faults.find(inNumber);
        const bool isSpared = found == faults.end() || (spares && spares(inRequest));
        return isSpared ? Fault() : found->second;
    };
}

}  // namespace faultproxy
