// Calls a function of unknown origin so that its exception ends here, in a trace.
#pragma once

#include "ostcore/Types.h"

namespace ostcore {
namespace threads {

/// Calls the function; an exception is traced at level 5 with the name of what was run, and goes no further.
void CallGuarded(const function<void()>& inFunction, const char* inWhat) noexcept;

}  // namespace threads
}  // namespace ostcore
