// The machine's wall clock as this process sees it, which a test can set as an administrator would.
#pragma once

namespace faults {

/// Moves the wall clock by so many seconds from where it truly stands; the monotonic clock does not notice.
/// Holds for the whole process, system libraries included.
void MoveWallClock(long inSeconds);

}  // namespace faults
