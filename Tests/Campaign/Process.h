// A child process whose input and output are lines in our hands.
#pragma once

#include <sys/types.h>

#include <chrono>
#include <string>
#include <vector>

namespace campaign {

/// The other side is silent for too long, or gone.
struct ProcessFailure {
    std::string what;
    bool isHang = false;
};

class Process {
public:
    using Milliseconds = std::chrono::milliseconds;

    /// Standard error stays that of this process. Environment entries ("NAME=value") are added to this
    /// process's own.
    Process(const std::string& inName, const std::vector<std::string>& inArguments,
            const std::vector<std::string>& inEnvironment = {});
    /// Kills what is left.
    ~Process();
    Process(const Process&) = delete;
    Process& operator=(const Process&) = delete;

    /// Both throw ProcessFailure.
    void WriteLine(const std::string& inLine);
    std::string ReadLine(Milliseconds inPatience);

    void Signal(int inSignal);
    /// Closes its input and gives its exit code, negative for a signal. Kills it when it takes too long and
    /// throws ProcessFailure.
    int WaitForEnd(Milliseconds inPatience);

private:
    std::string Describe(const char* inWhat) const;

    const std::string mName;
    pid_t mID = -1;
    int mInput = -1;
    int mOutput = -1;
    std::string mBuffer;
};

}  // namespace campaign
