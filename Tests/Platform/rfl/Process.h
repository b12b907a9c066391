// Runs this program as another process.
#pragma once

#include <sys/types.h>
#include <string>
#include <vector>

/// A process that is killed when its object ends. Its standard output is read line by line.
class Process {
public:
    explicit Process(const std::vector<std::string>& inArguments);
    ~Process();
    Process(const Process&) = delete;
    Process& operator=(const Process&) = delete;

    /// Waits for a whole line; false at the end of the output.
    bool ReadLine(std::string& outLine);
    void Signal(int inSignal);
    /// The exit code, or 128 and the signal.
    int Wait();

private:
    pid_t mProcess = -1;
    int mOutput = -1;
    std::string mBuffer;
};
