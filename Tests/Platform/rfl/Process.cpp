#include "Process.h"

#include <fcntl.h>
#include <signal.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <stdexcept>

extern char** environ;

Process::Process(const std::vector<std::string>& inArguments) {
    int ends[2];
    if (::pipe2(ends, O_CLOEXEC) != 0) {
        throw std::runtime_error("no pipe");
    }
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_adddup2(&actions, ends[1], STDOUT_FILENO);
    std::vector<std::string> arguments{"/proc/self/exe"};
    arguments.insert(arguments.end(), inArguments.begin(), inArguments.end());
    std::vector<char*> pointers;
    for (std::string& argument : arguments) {
        pointers.push_back(argument.data());
    }
    pointers.push_back(nullptr);
    const int failure =
        ::posix_spawn(&mProcess, "/proc/self/exe", &actions, nullptr, pointers.data(), environ);
    posix_spawn_file_actions_destroy(&actions);
    ::close(ends[1]);
    mOutput = ends[0];
    if (failure != 0) {
        throw std::runtime_error("the process did not start");
    }
}

Process::~Process() {
    if (mProcess > 0) {
        Signal(SIGKILL);
        Wait();
    }
    ::close(mOutput);
}

bool Process::ReadLine(std::string& outLine) {
    for (;;) {
        const std::size_t end = mBuffer.find('\n');
        if (end != std::string::npos) {
            outLine = mBuffer.substr(0, end);
            mBuffer.erase(0, end + 1);
            return true;
        }
        char bytes[512];
        const ssize_t size = ::read(mOutput, bytes, sizeof bytes);
        if (size <= 0) {
            return false;
        }
        mBuffer.append(bytes, static_cast<std::size_t>(size));
    }
}

void Process::Signal(int inSignal) {
    ::kill(mProcess, inSignal);
}

int Process::Wait() {
    int status = 0;
    while (::waitpid(mProcess, &status, 0) < 0 && errno == EINTR) {
    }
    mProcess = -1;
    return WIFSIGNALED(status) ? 128 + WTERMSIG(status) : WEXITSTATUS(status);
}
