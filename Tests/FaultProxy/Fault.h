// What can happen to one request on its way between client and hub, and the schedules that say what happens
// to which.
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <map>
#include <string>

namespace faultproxy {

enum class FaultKind {
    kNone,
    /// The request's connection is reset and new ones are refused for some time.
    kRefuse,
    /// All connections are reset and new ones are refused for some time.
    kOutage,
    kResetBeforeRequest,
    /// The hub gets a part of the head or the body, then both sides are reset.
    kResetInRequestHead,
    kResetInRequestBody,
    /// The hub does the work; of its answer the client gets nothing, a part of the head, a part of the body,
    /// or all.
    kResetBeforeAnswer,
    kResetInAnswerHead,
    kResetInAnswerBody,
    kResetAfterAnswer,
    /// The answer ends too early in good order.
    kTruncate,
    /// A part of the answer, silence for some time, and the end of the connection.
    kStall,
    /// The request waits before it goes on to the hub; the answer waits before it goes on to the client.
    kDelayRequest,
    kDelayAnswer,
    /// The answer comes whole, in small pieces.
    kTrickle,
    /// An answer of the proxy's own in the place of the hub's, without the hub's work or after it.
    kStatusWithoutWork,
    kStatusAfterWork,
    /// Bytes that are no HTTP, without the hub's work or after it.
    kGarbageWithoutWork,
    kGarbageAfterWork,
    /// The answer, and the same once more behind it.
    kDuplicate,
    /// The answer before this one on the connection in the place of this one. No client can tell.
    kSwap,
    /// The connection is closed when the answer is through and the client thinks it may use it again.
    kCloseIdle
};

const char* NameOf(FaultKind inKind);

struct Fault {
    FaultKind kind = FaultKind::kNone;
    /// How long it takes, for those that take time.
    std::uint32_t milliseconds = 0;
    /// Where a cut falls: thousandths of the part that is cut, below 1000.
    std::uint32_t share = 500;
    /// Of an answer of the proxy's own.
    int status = 503;

    std::string Describe() const;
};

/// What a schedule may go by. The target has no query: nothing here is a secret.
struct RequestLine {
    std::string method;
    std::string path;
};

/// Says what happens to a request, by its number since the schedule began, from 0. Called by one thread at a
/// time.
using Schedule = std::function<Fault(std::size_t inNumber, const RequestLine& inRequest)>;

/// Random numbers that are the same everywhere for the same seed.
class Dice {
public:
    explicit Dice(std::uint64_t inSeed) : mState(inSeed) {}
    std::uint64_t Next();
    /// From 0 to below the bound, which is not 0.
    std::uint32_t Below(std::uint32_t inBound) { return static_cast<std::uint32_t>(Next() % inBound); }

private:
    std::uint64_t mState;
};

struct RandomScheduleLimits {
    std::uint32_t maximumFaults = 8;
    /// How many requests lie between two faults, on the average.
    std::uint32_t meanGap = 8;
    std::uint32_t maximumMilliseconds = 150;
    bool withSwaps = false;
    bool withGarbage = true;
};

/// A finite number of faults whose kinds and places follow from the seed alone.
std::map<std::size_t, Fault> RandomFaults(std::uint64_t inSeed, const RandomScheduleLimits& inLimits);
/// These faults, with none for requests that the predicate spares.
Schedule ScheduleOf(std::map<std::size_t, Fault> inFaults,
                    std::function<bool(const RequestLine&)> inSpares = nullptr);

}  // namespace faultproxy
