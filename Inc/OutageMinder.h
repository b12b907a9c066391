// How the progress windows of the frame floor learn of an outage, and offer the way out of it, without
// knowing the connection floor.
#pragma once

namespace ZOCL {

/// Declared low, implemented by the connection floor, set once in the composition root at Initialize. All is
/// about the logged-in server; without one nothing is down and nothing happens. Main thread; hold no lock.
class OutageMinder {
public:
    virtual ~OutageMinder() = default;
    virtual bool IsNetworkDown() = 0;
    /// The user gives up: ends all retries and the session, and tells the host
    /// (ZOTerminateConnectionMessage). False, without effect, when nothing is down.
    virtual bool SignOut() = 0;
    /// The last progress window has gone; an outage that goes on needs a window of its own now.
    virtual void OnProgressWindowsGone() = 0;
};

/// Lives as long as the process.
OutageMinder* GetOutageMinder();

}  // namespace ZOCL
