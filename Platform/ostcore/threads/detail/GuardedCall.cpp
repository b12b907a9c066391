// Calls a function of unknown origin so that its exception ends here, in a trace.
#include "ostcore/threads/detail/GuardedCall.h"

#include <exception>

#include "ostcore/debug/Trace.h"

namespace ostcore {
namespace threads {
namespace {

void TraceException(const char* inWhat, const char* inReason) noexcept {
    try {
        if (debug::TraceEnabled("ZOCL", debug::kTraceLevel_Error)) {
            debug::Trace("ZOCL", debug::kTraceLevel_Error,
                         debug::StructuredText("An exception left a background function and was dropped")
                             .Add("ran on", inWhat)
                             .Add("reason", inReason));
        }
    } catch (...) {
        // There is nowhere left to tell it.
    }
}

}  // namespace

void CallGuarded(const function<void()>& inFunction, const char* inWhat) noexcept {
    try {
        inFunction();
    } catch (const std::exception& exception) {
        TraceException(inWhat, exception.what());
    } catch (...) {
        TraceException(inWhat, "unknown");
    }
}

}  // namespace threads
}  // namespace ostcore
