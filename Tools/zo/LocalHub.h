// A hub of one's own on this machine: started in the background, found again, and stopped.
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "Interrupt.h"

namespace zo {

struct HubRecord {
    int pid = 0;
    std::string httpURL;
    std::string tlsURL;
    /// The authority that signed the hub's certificate; empty without TLS.
    std::string authorityFile;
};

/// Keeps a record beside the hub's data: process, start time and addresses. A process that merely has the
/// number of a former hub is told apart by its start time.
class LocalHub {
public:
    LocalHub(std::string inDataDirectory, Interrupt& inInterrupt);

    const std::string& DataDirectory() const noexcept { return mData; }
    std::string LogPath() const;

    /// The hub that runs on this data; nothing when none does.
    std::optional<HubRecord> Running() const;
    /// Starts zohub and waits until it listens. Throws a Failure with the end of its log when it does not.
    HubRecord Start(const std::optional<std::string>& inPort, const std::optional<std::string>& inTlsPort);
    /// Asks the hub to end and waits for that.
    void Stop(const HubRecord& inHub);
    /// Runs `zohub user add`; the password goes by the name of its file.
    void AddUser(const std::string& inUser, const std::string& inPasswordFile);

    /// Where zohub is. Throws a Failure (not found) that lists where it was looked for.
    static std::string FindProgram();

private:
    std::string RecordPath() const;
    void MakeDataDirectory() const;
    void WaitUntilReady(int inProcess, const std::string& inReadyFile) const;

    std::string mData;
    Interrupt& mInterrupt;
};

}  // namespace zo
