// A hub of the benchmark's own, as a process beside it.
#pragma once

#include <sys/types.h>

#include <string>

namespace bench {

/// On a free port, in a directory that goes with it. Knows the users anna and ben, who share a password.
class HubProcess {
public:
    HubProcess();
    ~HubProcess();
    HubProcess(const HubProcess&) = delete;
    HubProcess& operator=(const HubProcess&) = delete;

    const std::string& URL() const { return mURL; }
    const std::string& Directory() const { return mDirectory; }
    const std::string& Password() const { return mPassword; }

private:
    void AddUser(const std::string& inName);

    std::string mDirectory;
    std::string mURL;
    const std::string mPassword = "bench-secret";
    pid_t mProcess = -1;
};

}  // namespace bench
