// Reads and writes the lines of a terminal.
#include "ostui/detail/Terminal.h"

#include <poll.h>
#include <sys/ioctl.h>
#include <unistd.h>

#include <cerrno>

#include "ostcore/threads/MainThread.h"
#include "ostui/detail/TerminalText.h"

namespace ostui {
namespace detail {
namespace {

/// How long the queue of the main thread may wait for its turn.
constexpr std::uint32_t kTurnMilliseconds = 20;
constexpr std::size_t kLongestLine = 4096;

}  // namespace

Terminal::Terminal(const TerminalSettings& inSettings)
    : mSettings(inSettings),
      mInput(inSettings.input),
      mIsInteractive(::isatty(inSettings.input) == 1 && ::isatty(inSettings.output) == 1) {}

bool Terminal::IsInterrupted() const {
    return mSettings.isInterrupted && mSettings.isInterrupted();
}

std::size_t Terminal::Width() const {
    winsize size{};
    return mIsInteractive && ::ioctl(mSettings.output, TIOCGWINSZ, &size) == 0 ? size.ws_col : 0;
}

void Terminal::Say(const U8String& inText) {
    const U8String line = mLine;
    const bool isStatus = mIsStatus;
    EndLine();
    Write(SafeText(inText) + "\n");
    if (isStatus) {
        ShowStatus(line);
    } else if (!line.empty()) {
        Prompt(line);
    }
}

void Terminal::Prompt(const U8String& inText) {
    EndLine();
    mLine = SafeLine(inText);
    mIsStatus = false;
    Write(mLine);
}

void Terminal::ShowStatus(const U8String& inText) {
    const std::size_t width = Width();
    const U8String status = width > 1 ? Truncate(SafeLine(inText), width - 1) : SafeLine(inText);
    const std::size_t former = mIsStatus ? DisplayWidth(mLine) : 0;
    if (!mIsStatus) {
        EndLine();
    }
    if (status == mLine) {
        return;
    }
    Write("\r" + (DisplayWidth(status) < former ? PadTo({}, former) + "\r" : U8String()) + status);
    mLine = status;
    mIsStatus = true;
}

void Terminal::EndLine() {
    if (mIsStatus) {
        EraseLine();
    } else if (!mLine.empty()) {
        Write("\n");
    }
    mLine.clear();
    mIsStatus = false;
}

void Terminal::TakeBackPrompt() {
    const std::size_t width = Width();
    // One that goes over several lines stays.
    if (width == 0 || DisplayWidth(mLine) < width) {
        EraseLine();
        mLine.clear();
    }
    EndLine();
}

void Terminal::EraseLine() {
    if (!mLine.empty()) {
        Write("\r" + U8String(DisplayWidth(mLine), ' ') + "\r");
    }
}

Terminal::Line Terminal::ReadLine(const function<bool()>& inIsOver, std::string& outLine) {
    outLine.clear();
    while (mIsInteractive && outLine.size() < kLongestLine) {
        if (inIsOver() || IsInterrupted()) {
            return Line::kOver;
        }
        pollfd watched{mInput.Descriptor(), POLLIN, 0};
        if (::poll(&watched, 1, 0) <= 0) {
            ostcore::threads::WaitAndPumpMainThread(kTurnMilliseconds);
            continue;
        }
        char byte = 0;
        const ssize_t count = ::read(mInput.Descriptor(), &byte, 1);
        if (count < 0 && (errno == EINTR || errno == EAGAIN)) {
            continue;
        }
        if (count <= 0) {
            return Line::kEnd;
        }
        if (byte == '\n') {
            // The echo of the enter key has ended the line on the screen.
            mLine.clear();
            mIsStatus = false;
            return Line::kRead;
        }
        outLine += byte;
    }
    return Line::kEnd;
}

void Terminal::Write(const U8String& inText) const {
    for (std::size_t written = 0; mIsInteractive && written < inText.size();) {
        const ssize_t count = ::write(mSettings.output, inText.data() + written, inText.size() - written);
        if (count < 0 && errno != EINTR) {
            return;
        }
        written += count > 0 ? static_cast<std::size_t>(count) : 0;
    }
}

Terminal::Silence::Silence(Terminal& ioTerminal)
    : mTerminal(ioTerminal), mIsChanged(::tcgetattr(ioTerminal.mSettings.input, &mBefore) == 0) {
    if (mIsChanged) {
        termios quiet = mBefore;
        quiet.c_lflag &= ~static_cast<tcflag_t>(ECHO | ECHOE | ECHOK | ECHONL);
        ::tcsetattr(mTerminal.mSettings.input, TCSAFLUSH, &quiet);
    }
}

Terminal::Silence::~Silence() {
    if (mIsChanged) {
        ::tcsetattr(mTerminal.mSettings.input, TCSADRAIN, &mBefore);
        mTerminal.Write("\n");
        mTerminal.mLine.clear();
    }
}

}  // namespace detail
}  // namespace ostui
