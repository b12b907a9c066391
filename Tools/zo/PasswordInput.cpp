// Reads one line, from wherever it comes, without ever waiting past an interrupt.
#include "PasswordInput.h"

#include <fcntl.h>
#include <poll.h>
#include <termios.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

#include "Failure.h"
#include "ostui/TerminalInput.h"

namespace zo {
namespace {

constexpr std::size_t kMaximumPassword = 4096;

class Descriptor {
public:
    explicit Descriptor(int inValue) : mValue(inValue) {}
    ~Descriptor() {
        if (mValue >= 0) {
            ::close(mValue);
        }
    }
    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(const Descriptor&) = delete;
    int Get() const noexcept { return mValue; }

private:
    int mValue;
};

class EchoOff {
public:
    EchoOff() : mChanged(::tcgetattr(STDIN_FILENO, &mBefore) == 0) {
        if (!mChanged) {
            throw Failure(ExitCode::Failure, "turning the terminal's echo off failed", "use --password-file");
        }
        termios quiet = mBefore;
        quiet.c_lflag &= ~static_cast<tcflag_t>(ECHO | ECHOE | ECHOK | ECHONL);
        ::tcsetattr(STDIN_FILENO, TCSAFLUSH, &quiet);
    }
    ~EchoOff() { ::tcsetattr(STDIN_FILENO, TCSAFLUSH, &mBefore); }
    EchoOff(const EchoOff&) = delete;
    EchoOff& operator=(const EchoOff&) = delete;

private:
    termios mBefore{};
    bool mChanged;
};

void WaitUntilReadable(int inDescriptor, const Interrupt& inInterrupt) {
    while (true) {
        pollfd watched[2] = {{inDescriptor, POLLIN, 0}, {inInterrupt.Descriptor(), POLLIN, 0}};
        if (::poll(watched, 2, -1) < 0) {
            continue;
        }
        if (watched[1].revents != 0) {
            throw Failure(ExitCode::Cancelled, "cancelled");
        }
        return;
    }
}

// One byte at a time, so that what follows the line stays where it is.
std::string ReadLine(int inDescriptor, const std::string& inWhere, const Interrupt* inInterrupt) {
    std::string line;
    while (line.size() <= kMaximumPassword) {
        if (inInterrupt) {
            WaitUntilReadable(inDescriptor, *inInterrupt);
        }
        char byte = 0;
        const ssize_t count = ::read(inDescriptor, &byte, 1);
        if (count < 0 && (errno == EINTR || errno == EAGAIN)) {
            continue;
        }
        if (count < 0) {
            throw Failure(ExitCode::Failure, "reading " + inWhere + " failed: " + std::strerror(errno));
        }
        if (count == 0 || byte == '\n') {
            if (!line.empty() && line.back() == '\r') {
                line.pop_back();
            }
            return line;
        }
        line += byte;
    }
    throw Failure(ExitCode::Usage, "the first line of " + inWhere + " is too long",
                  "a password has at most 4096 bytes");
}

std::string RefuseEmpty(std::string inPassword, const std::string& inWhere) {
    if (inPassword.empty()) {
        throw Failure(ExitCode::Usage, "there is no password in the first line of " + inWhere);
    }
    return inPassword;
}

void Show(const std::string& inText) {
    // Without a terminal that can be written to, the answer can still be typed.
    if (::write(STDERR_FILENO, inText.data(), inText.size()) < 0) {
        return;
    }
}

}  // namespace

std::string PasswordFromFile(const std::string& inPath) {
    const Descriptor file(::open(inPath.c_str(), O_RDONLY | O_CLOEXEC));
    if (file.Get() < 0) {
        throw Failure(ExitCode::Usage,
                      "opening the password file " + inPath + " failed: " + std::strerror(errno),
                      "name a file that can be read");
    }
    return RefuseEmpty(ReadLine(file.Get(), inPath, nullptr), inPath);
}

std::string PasswordFromStandardInput(const Interrupt& inInterrupt) {
    const ostui::TerminalInput input(STDIN_FILENO);
    return RefuseEmpty(ReadLine(input.Descriptor(), "standard input", &inInterrupt), "standard input");
}

std::string AskOnTerminal(const std::string& inQuestion, const Interrupt& inInterrupt) {
    const ostui::TerminalInput terminal(STDIN_FILENO);
    Show(inQuestion);
    return ReadLine(terminal.Descriptor(), "the terminal", &inInterrupt);
}

std::string AskPassword(const std::string& inQuestion, const Interrupt& inInterrupt) {
    const ostui::TerminalInput terminal(STDIN_FILENO);
    const EchoOff echoOff;
    Show(inQuestion);
    std::string password;
    try {
        password = ReadLine(terminal.Descriptor(), "the terminal", &inInterrupt);
    } catch (...) {
        Show("\n");
        throw;
    }
    Show("\n");
    return RefuseEmpty(std::move(password), "the answer");
}

}  // namespace zo
