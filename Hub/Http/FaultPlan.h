// What shall go wrong with one request, when somebody has asked for it.
#pragma once

#include <chrono>
#include <functional>
#include <optional>
#include <string>

#include "Http/Message.h"

namespace zohub {

struct FaultPlan {
    /// How the answer leaves.
    enum class Ending { Whole, Drop, Reset, Truncate, Stall, Trickle, Garbage };

    /// The connection is reset and the request not looked at.
    bool isRefused = false;
    std::chrono::milliseconds delay{0};  ///< before the work
    /// Called on a worker before the work.
    std::function<void(Request const&)> beforeWork;
    std::optional<Response> insteadOfWork;
    std::optional<Response> insteadOfAnswer;  ///< the work is done all the same

    Ending ending = Ending::Whole;
    std::optional<std::size_t> cutAt;    ///< bytes of the body before the cut; half of it when not set
    std::chrono::milliseconds pause{0};  ///< of a stall in all, of a trickle after each piece
    std::size_t piece = 0;               ///< of a trickle, in bytes
};

/// Called once for each request that could be read, on any thread of the network side.
using FaultFunction = std::function<FaultPlan(Request const&)>;

}  // namespace zohub
