// How the connection floor ends the polls of the floor above it without knowing them.
#pragma once

namespace ZOCL {

/// Declared low, implemented by the resources floor, set once in the composition root at Initialize.
class PollCancellation {
public:
    virtual ~PollCancellation() = default;
    /// Ends all polls without waiting for what runs. Threads: any; hold no lock.
    virtual void CancelAllOutstandingPolls() = 0;
};

/// Lives as long as the process.
PollCancellation* GetPollCancellation();

}  // namespace ZOCL
