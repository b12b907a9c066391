// The input of a terminal whose user changes their mind.
#include <fcntl.h>
#include <termios.h>

#include <future>

#include <gtest/gtest.h>

#include "ostui/TerminalInput.h"
#include "UserTerminal.h"

namespace ostui {
namespace {

bool IsReadable(int inDescriptor) {
    pollfd watched{inDescriptor, POLLIN, 0};
    return poll(&watched, 1, 60000) == 1;
}

TEST(TerminalInput, WhatIsDiscardedBeforeItIsReadIsNotWaitedFor) {
    UserTerminal terminal;
    const TerminalInput input(terminal.Program());
    terminal.Type("typed\n");
    ASSERT_TRUE(IsReadable(input.Descriptor()));
    // As a Ctrl-C does.
    ASSERT_EQ(tcflush(terminal.Program(), TCIFLUSH), 0);
    auto reading = std::async(std::launch::async, [&] {
        char byte = 0;
        errno = 0;
        const ssize_t count = read(input.Descriptor(), &byte, 1);
        return std::make_pair(count, errno);
    });
    if (reading.wait_for(std::chrono::seconds(20)) != std::future_status::ready) {
        terminal.Type("\n");
    }
    EXPECT_EQ(reading.get(), std::make_pair(ssize_t(-1), EAGAIN));

    terminal.Type("again\n");
    ASSERT_TRUE(IsReadable(input.Descriptor()));
    char line[16];
    EXPECT_EQ(read(input.Descriptor(), line, sizeof line), 6);
    EXPECT_EQ(fcntl(terminal.Program(), F_GETFL) & O_NONBLOCK, 0) << "other programs read it, too";
    terminal.HangUp();
    ASSERT_TRUE(IsReadable(input.Descriptor()));
    errno = 0;
    EXPECT_LE(read(input.Descriptor(), line, sizeof line), 0);
    EXPECT_NE(errno, EAGAIN) << "its end is an end";
}

TEST(TerminalInput, WhatIsNoTerminalIsReadAsItIs) {
    int pipe[2];
    ASSERT_EQ(pipe2(pipe, O_CLOEXEC), 0);
    { EXPECT_EQ(TerminalInput(pipe[0]).Descriptor(), pipe[0]); }
    EXPECT_EQ(write(pipe[1], "x", 1), 1);
    char byte = 0;
    EXPECT_EQ(read(pipe[0], &byte, 1), 1) << "it stays open";
    close(pipe[0]);
    close(pipe[1]);
    EXPECT_EQ(TerminalInput(-1).Descriptor(), -1);
}

}  // namespace
}  // namespace ostui
