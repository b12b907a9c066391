// Children on pipes.
#include "Process.h"

#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <spawn.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <stdexcept>

extern char** environ;

namespace campaign {

namespace {

using Clock = std::chrono::steady_clock;

std::vector<char*> Pointers(std::vector<std::string>& ioTexts) {
    std::vector<char*> pointers;
    for (std::string& text : ioTexts) {
        pointers.push_back(text.data());
    }
    pointers.push_back(nullptr);
    return pointers;
}

std::vector<std::string> EnvironmentWith(const std::vector<std::string>& inAdded) {
    std::vector<std::string> all = inAdded;
    for (char** entry = environ; *entry; ++entry) {
        all.emplace_back(*entry);
    }
    return all;
}

}  // namespace

Process::Process(const std::string& inName, const std::vector<std::string>& inArguments,
                 const std::vector<std::string>& inEnvironment)
    : mName(inName) {
    int input[2] = {-1, -1};
    int output[2] = {-1, -1};
    if (pipe2(input, O_CLOEXEC) != 0 || pipe2(output, O_CLOEXEC) != 0) {
        throw std::runtime_error("no pipes for " + inName);
    }
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_adddup2(&actions, input[0], STDIN_FILENO);
    posix_spawn_file_actions_adddup2(&actions, output[1], STDOUT_FILENO);
    posix_spawn_file_actions_addclosefrom_np(&actions, STDERR_FILENO + 1);
    std::vector<std::string> arguments = inArguments;
    std::vector<std::string> environment = EnvironmentWith(inEnvironment);
    const int failed = posix_spawn(&mID, arguments[0].c_str(), &actions, nullptr, Pointers(arguments).data(),
                                   Pointers(environment).data());
    posix_spawn_file_actions_destroy(&actions);
    close(input[0]);
    close(output[1]);
    mInput = input[1];
    mOutput = output[0];
    if (failed != 0) {
        close(mInput);
        close(mOutput);
        throw std::runtime_error("cannot start " + inArguments[0]);
    }
}

Process::~Process() {
    if (mID > 0) {
        kill(mID, SIGKILL);
        waitpid(mID, nullptr, 0);
    }
    if (mInput >= 0) {
        close(mInput);
    }
    close(mOutput);
}

std::string Process::Describe(const char* inWhat) const {
    return mName + " " + inWhat;
}

void Process::WriteLine(const std::string& inLine) {
    const std::string line = inLine + "\n";
    for (std::size_t written = 0; written < line.size();) {
        const ssize_t count = write(mInput, line.data() + written, line.size() - written);
        if (count <= 0) {
            throw ProcessFailure{Describe("does not listen any more")};
        }
        written += static_cast<std::size_t>(count);
    }
}

std::string Process::ReadLine(Milliseconds inPatience) {
    const Clock::time_point end = Clock::now() + inPatience;
    std::size_t found = mBuffer.find('\n');
    while (found == std::string::npos) {
        const auto left = std::chrono::duration_cast<Milliseconds>(end - Clock::now()).count();
        pollfd ready{mOutput, POLLIN, 0};
        if (left <= 0 || poll(&ready, 1, static_cast<int>(left)) == 0) {
            throw ProcessFailure{Describe("has been silent for too long"), true};
        }
        char bytes[4096];
        const ssize_t count = read(mOutput, bytes, sizeof bytes);
        if (count <= 0) {
            throw ProcessFailure{Describe("has gone")};
        }
        mBuffer.append(bytes, static_cast<std::size_t>(count));
        found = mBuffer.find('\n');
    }
    std::string line = mBuffer.substr(0, found);
    mBuffer.erase(0, found + 1);
    return line;
}

void Process::Signal(int inSignal) {
    kill(mID, inSignal);
}

int Process::WaitForEnd(Milliseconds inPatience) {
    close(mInput);
    mInput = -1;
    const int descriptor = static_cast<int>(syscall(SYS_pidfd_open, mID, 0));
    if (descriptor < 0) {
        throw ProcessFailure{Describe("cannot be waited for")};
    }
    pollfd ended{descriptor, POLLIN, 0};
    const bool hasEnded = poll(&ended, 1, static_cast<int>(inPatience.count())) == 1;
    close(descriptor);
    if (!hasEnded) {
        throw ProcessFailure{Describe("does not end"), true};
    }
    int status = 0;
    waitpid(mID, &status, 0);
    mID = -1;
    return WIFEXITED(status) ? WEXITSTATUS(status) : -WTERMSIG(status);
}

}  // namespace campaign
