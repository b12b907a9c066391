// fork and exec, and what /proc and pidfd tell about processes.
#include "ChildProcess.h"

#include <fcntl.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <fstream>
#include <sstream>

#include "Failure.h"
#include "Interrupt.h"

namespace zo {
namespace {

// In the child, between fork and exec: system calls only.
[[noreturn]] void BecomeProgram(char* const* inArguments, int inLog, int inErrorPipe, ChildKind inKind) {
    if (inKind == ChildKind::Background) {
        ::setsid();
    }
    const int null = ::open("/dev/null", O_RDONLY);
    ::dup2(null, STDIN_FILENO);
    ::dup2(inLog, STDOUT_FILENO);
    ::dup2(inLog, STDERR_FILENO);
    Interrupt::RestoreSignals();
    ::execv(inArguments[0], inArguments);
    const int error = errno;
    if (::write(inErrorPipe, &error, sizeof error) < 0) {
        ::_exit(126);
    }
    ::_exit(127);
}

}  // namespace

pid_t StartChild(const std::string& inProgram, const std::vector<std::string>& inArguments,
                 const std::string& inLogPath, ChildKind inKind) {
    std::vector<std::string> words{inProgram};
    words.insert(words.end(), inArguments.begin(), inArguments.end());
    std::vector<char*> pointers;
    for (std::string& word : words) {
        pointers.push_back(word.data());
    }
    pointers.push_back(nullptr);

    const int log = ::open(inLogPath.c_str(), O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC | O_NOFOLLOW, 0600);
    int pipe[2] = {-1, -1};
    if (log < 0 || ::pipe2(pipe, O_CLOEXEC) != 0) {
        throw Failure(ExitCode::Failure, "opening the log " + inLogPath + " failed: " + std::strerror(errno),
                      "check the permissions of its folder");
    }
    const pid_t child = ::fork();
    if (child == 0) {
        BecomeProgram(pointers.data(), log, pipe[1], inKind);
    }
    const int forkError = errno;
    ::close(log);
    ::close(pipe[1]);
    int error = 0;
    const bool failed = ::read(pipe[0], &error, sizeof error) == static_cast<ssize_t>(sizeof error);
    ::close(pipe[0]);
    if (child < 0 || failed) {
        if (child > 0) {
            WaitForChild(child);
        }
        throw Failure(ExitCode::Failure,
                      "starting " + inProgram + " failed: " + std::strerror(child < 0 ? forkError : error),
                      "check that the program is installed and may be run");
    }
    return child;
}

int WaitForChild(pid_t inChild) {
    int status = 0;
    while (::waitpid(inChild, &status, 0) < 0) {
        if (errno != EINTR) {
            return 127;
        }
    }
    return WIFSIGNALED(status) ? 128 + WTERMSIG(status) : WEXITSTATUS(status);
}

unsigned long long ProcessStartTime(pid_t inProcess) {
    std::ifstream file("/proc/" + std::to_string(inProcess) + "/stat");
    std::string line;
    std::getline(file, line);
    // The name stands in brackets and may hold anything; the start time is the 20th field behind it.
    const std::size_t nameEnd = line.rfind(')');
    if (nameEnd == std::string::npos) {
        return 0;
    }
    std::istringstream fields(line.substr(nameEnd + 1));
    std::string state;
    fields >> state;
    if (state == "Z" || state == "X") {
        return 0;
    }
    std::string field;
    for (int index = 0; index < 18; ++index) {
        fields >> field;
    }
    unsigned long long startTime = 0;
    fields >> startTime;
    return startTime;
}

int OpenProcess(pid_t inProcess) {
    return static_cast<int>(::syscall(SYS_pidfd_open, inProcess, 0));
}

}  // namespace zo
