// Starts other programs, without a shell.
#pragma once

#include <sys/types.h>

#include <string>
#include <vector>

namespace zo {

enum class ChildKind {
    /// Leaves this session and outlives this process.
    Background,
    /// Stays with the terminal.
    Foreground
};

/// Standard input is /dev/null, both outputs go to the end of the log file (mode 0600). Returns the process
/// identifier; throws a Failure when the program cannot be started.
pid_t StartChild(const std::string& inProgram, const std::vector<std::string>& inArguments,
                 const std::string& inLogPath, ChildKind inKind);
/// The exit status as a shell tells it: 128 and the signal for a killed one.
int WaitForChild(pid_t inChild);

/// When a process was started, in ticks since boot; 0 when there is no such process.
unsigned long long ProcessStartTime(pid_t inProcess);

/// A descriptor that is readable when the process has ended; -1 when there is none. The caller closes it.
int OpenProcess(pid_t inProcess);

}  // namespace zo
