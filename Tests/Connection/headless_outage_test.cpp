// A headless process whose hub falls silent or dies: it bears 15 seconds of it and then ends, in real time
// and as a process of its own; one whose hub comes back within that time goes on.
#include <poll.h>

#include <chrono>

#include <gtest/gtest.h>

#include "HubProcess.h"

namespace ZOCL {
namespace {

using Clock = std::chrono::steady_clock;

class HeadlessOutage : public testing::Test {
protected:
    ~HeadlessOutage() override {
        if (mProcess > 0) {
            kill(mProcess, SIGKILL);
            waitpid(mProcess, nullptr, 0);
        }
        close(mOutput);
        close(mErrors);
    }
    /// Returns when it is signed in.
    void StartProgram() {
        setenv("ZOCLIENT_CONFIG_HOME", (hub.Directory() + "/config").c_str(), 1);
        int output[2] = {-1, -1};
        int errors[2] = {-1, -1};
        ASSERT_EQ(pipe2(output, O_CLOEXEC), 0);
        ASSERT_EQ(pipe2(errors, O_CLOEXEC), 0);
        mProcess = fork();
        if (mProcess == 0) {
            dup2(output[1], STDOUT_FILENO);
            dup2(errors[1], STDERR_FILENO);
            execl(ZO_HEADLESS_PROGRAM, ZO_HEADLESS_PROGRAM, hub.URL().str().c_str(), nullptr);
            _exit(127);
        }
        close(output[1]);
        close(errors[1]);
        mOutput = output[0];
        mErrors = errors[0];
        char word[6] = "";
        ASSERT_EQ(read(mOutput, word, 5), 5);
        ASSERT_STREQ(word, "ready");
    }
    /// Reads what it says on standard error, which ends with the process; false when it has not by then.
    bool EndsBy(Clock::time_point inTime) {
        for (;;) {
            const auto left =
                std::chrono::duration_cast<std::chrono::milliseconds>(inTime - Clock::now()).count();
            pollfd watched{mErrors, POLLIN, 0};
            if (left <= 0 || poll(&watched, 1, static_cast<int>(left)) == 0) {
                return false;
            }
            char buffer[4096];
            const ssize_t count = read(mErrors, buffer, sizeof buffer);
            if (count <= 0) {
                return true;
            }
            said.append(buffer, static_cast<std::size_t>(count));
        }
    }
    int ExitStatus() {
        int status = -1;
        waitpid(mProcess, &status, 0);
        mProcess = -1;
        return WIFEXITED(status) ? WEXITSTATUS(status) : -WTERMSIG(status);
    }
    void ExpectEndFrom(Clock::time_point inStart) {
        EXPECT_FALSE(EndsBy(inStart + std::chrono::seconds(14))) << said;
        ASSERT_TRUE(EndsBy(inStart + std::chrono::seconds(120))) << said;
        EXPECT_EQ(ExitStatus(), EXIT_FAILURE);
        EXPECT_NE(said.find("Exiting process: Failed to receive a valid network response for more than 15 "
                            "seconds."),
                  std::string::npos)
            << said;
    }

    RunningHub hub;
    std::string said;

private:
    pid_t mProcess = -1;
    int mOutput = -1;
    int mErrors = -1;
};

TEST_F(HeadlessOutage, OfAHubThatDiesEndsTheProcess) {
    StartProgram();
    const auto start = Clock::now();
    hub.End(SIGKILL);
    ExpectEndFrom(start);
}

TEST_F(HeadlessOutage, OfAHubThatFallsSilentEndsTheProcessUnlessItWakes) {
    StartProgram();
    hub.Signal(SIGSTOP);
    EXPECT_FALSE(EndsBy(Clock::now() + std::chrono::seconds(8))) << said;
    hub.Signal(SIGCONT);
    // The next outage begins from nothing.
    EXPECT_FALSE(EndsBy(Clock::now() + std::chrono::seconds(4))) << said;
    const auto start = Clock::now();
    hub.Signal(SIGSTOP);
    ExpectEndFrom(start);
    hub.Signal(SIGCONT);
}

}  // namespace
}  // namespace ZOCL
