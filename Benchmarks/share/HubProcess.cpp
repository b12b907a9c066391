#include "HubProcess.h"

#include <fcntl.h>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <csignal>
#include <filesystem>
#include <fstream>
#include <stdexcept>
#include <vector>

namespace bench {
namespace {

pid_t Spawn(std::vector<std::string> inWords, int inOutput) {
    std::vector<char*> arguments;
    for (std::string& word : inWords) {
        arguments.push_back(word.data());
    }
    arguments.push_back(nullptr);
    const pid_t process = fork();
    if (process == 0) {
        // A benchmark that gives up leaves no hub behind, which would hold its output open.
        prctl(PR_SET_PDEATHSIG, SIGKILL);
        dup2(inOutput, STDOUT_FILENO);
        execv(arguments[0], arguments.data());
        _exit(127);
    }
    if (process < 0) {
        throw std::runtime_error("The hub cannot be started from " + inWords[0] + ".");
    }
    return process;
}

}  // namespace

HubProcess::HubProcess() {
    std::string pattern = (std::filesystem::temp_directory_path() / "zo-bench-XXXXXX").string();
    mDirectory = mkdtemp(pattern.data());
    AddUser("anna");
    AddUser("ben");
    std::array<int, 2> pipe{};
    if (pipe2(pipe.data(), O_CLOEXEC) != 0) {
        throw std::runtime_error("No pipe can be had for the hub's output.");
    }
    mProcess =
        Spawn({ZO_HUB_PROGRAM, "serve", "--data", mDirectory + "/data", "--port", "0", "--no-tls"}, pipe[1]);
    close(pipe[1]);
    std::string line;
    char character = 0;
    while (read(pipe[0], &character, 1) == 1 && character != '\n') {
        line += character;
    }
    close(pipe[0]);
    const auto start = line.find("http://");
    if (start == std::string::npos) {
        throw std::runtime_error("The hub did not say where it listens.");
    }
    mURL = line.substr(start);
}

HubProcess::~HubProcess() {
    kill(mProcess, SIGTERM);
    waitpid(mProcess, nullptr, 0);
    std::error_code ignored;
    std::filesystem::remove_all(mDirectory, ignored);
}

// Administrators, so that each may work on the other's production.
void HubProcess::AddUser(const std::string& inName) {
    const std::string file = mDirectory + "/password";
    std::ofstream(file) << mPassword << "\n";
    const pid_t process = Spawn({ZO_HUB_PROGRAM, "user", "add", inName, "--data", mDirectory + "/data",
                                 "--password-file", file, "--admin"},
                                STDERR_FILENO);
    int status = -1;
    waitpid(process, &status, 0);
    std::filesystem::remove(file);
    if (status != 0) {
        throw std::runtime_error("The hub does not take the user " + inName + ".");
    }
}

}  // namespace bench
