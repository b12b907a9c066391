// The threads behind the executors: a fixed set for computing, an elastic one for work that blocks, single
// loops.
#pragma once

#include "ostcore/Types.h"

namespace ostcore {
namespace threads {

/// Runs a function on a set of as many threads as the machine has cores. False when there is no thread.
bool RunOnCPUThreads(function<void()> inFunction);

/// Runs a function on a set of threads that grows while all are busy, up to a bound, and shrinks after some
/// seconds of idleness. False when there is no thread and none can be made.
bool RunOnIOThreads(function<void()> inFunction);

/// Makes one thread; the function that is returned runs what it is given on that thread, in order. The thread
/// ends when the last copy of that function is gone and all is done. Empty when no thread can be made.
function<bool(function<void()>)> MakeThreadLoop();

}  // namespace threads
}  // namespace ostcore
