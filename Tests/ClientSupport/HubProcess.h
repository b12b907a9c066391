// A hub that runs as a process of its own, for tests over real sockets.
#pragma once

#include <fcntl.h>
#include <signal.h>
#include <stdlib.h>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "ZOClient/Types.h"

namespace ZOCL {

/// The child ends with the thread that calls this, so that a test that is aborted leaves nothing behind.
inline pid_t Spawn(const std::vector<std::string>& inArguments, int inOutput) {
    std::vector<char*> words;
    for (const std::string& argument : inArguments) {
        words.push_back(const_cast<char*>(argument.c_str()));
    }
    words.push_back(nullptr);
    const pid_t child = fork();
    if (child == 0) {
        prctl(PR_SET_PDEATHSIG, SIGKILL);
        dup2(inOutput, STDOUT_FILENO);
        execv(words[0], words.data());
        _exit(127);
    }
    return child;
}

/// A hub with the user anna, and more when asked, on a free port, in a directory that goes with it; payloads
/// that this process keeps go there too. The password of a user is the name followed by "s-secret".
class RunningHub {
public:
    RunningHub() {
        std::string pattern = (std::filesystem::temp_directory_path() / "zoclient-hub-XXXXXX").string();
        mDirectory = mkdtemp(pattern.data());
        setenv("ZOCLIENT_CACHE_HOME", (mDirectory + "/cache").c_str(), 1);
        AddUser("anna");
        Start();
    }
    ~RunningHub() {
        End(SIGTERM);
        std::error_code ignored;
        std::filesystem::remove_all(mDirectory, ignored);
    }
    RunningHub(const RunningHub&) = delete;
    RunningHub& operator=(const RunningHub&) = delete;

    void AddUser(const std::string& inName) {
        std::ofstream(mDirectory + "/password") << inName << "s-secret\n";
        // Hashing is slow on purpose; the tests sign in often.
        const pid_t adding = Spawn({ZO_HUB_PROGRAM, "user", "add", inName, "--data", mDirectory + "/data",
                                    "--password-cost", "10", "--password-file", mDirectory + "/password"},
                                   STDERR_FILENO);
        int status = -1;
        waitpid(adding, &status, 0);
        EXPECT_EQ(status, 0) << "the user could not be added";
    }
    /// Again on the same data, on another port.
    void Start() {
        int ends[2] = {-1, -1};
        EXPECT_EQ(pipe2(ends, O_CLOEXEC), 0);
        mProcess = Spawn({ZO_HUB_PROGRAM, "serve", "--data", mDirectory + "/data", "--port", "0", "--no-tls"},
                         ends[1]);
        close(ends[1]);
        mURL = ReadURL(ends[0]);
        close(ends[0]);
    }
    void End(int inSignal) {
        if (mProcess > 0) {
            kill(mProcess, inSignal);
            waitpid(mProcess, nullptr, 0);
            mProcess = -1;
        }
    }

    /// Stops it and lets it go on.
    void Signal(int inSignal) const { kill(mProcess, inSignal); }

    ImmutableString URL() const { return ImmutableString(mURL); }
    const std::string& Directory() const { return mDirectory; }

private:
    /// Waits for the line that tells the URL, or for the end of the process.
    static std::string ReadURL(int inPipe) {
        std::string text;
        char character = 0;
        while (read(inPipe, &character, 1) == 1 && character != '\n') {
            text += character;
        }
        const std::size_t start = text.find("http://");
        EXPECT_NE(start, std::string::npos) << text;
        return start == std::string::npos ? std::string() : text.substr(start);
    }
    std::string mDirectory;
    std::string mURL;
    pid_t mProcess = -1;
};

}  // namespace ZOCL
