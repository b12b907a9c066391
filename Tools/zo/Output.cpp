// Writes results, errors and progress in the form that was asked for.
#include "Output.h"

#include <sys/ioctl.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <cstring>

#include "DisplayWidth.h"

namespace zo {
namespace {

constexpr std::size_t kDefaultWidth = 80;
constexpr std::size_t kNarrowest = 20;
constexpr std::size_t kLabelWidth = 13;

// 0, or the error number of a write that failed.
int WriteAll(int inDescriptor, std::string_view inBytes) {
    while (!inBytes.empty()) {
        const ssize_t written = ::write(inDescriptor, inBytes.data(), inBytes.size());
        if (written < 0) {
            if (errno == EINTR) {
                continue;
            }
            return errno;
        }
        inBytes.remove_prefix(static_cast<std::size_t>(written));
    }
    return 0;
}

bool NoColorIsSet() {
    const char* value = std::getenv("NO_COLOR");
    return value && *value;
}

bool Paints(ColorMode inMode, bool inIsTerminal) {
    if (inMode != ColorMode::Auto) {
        return inMode == ColorMode::Always;
    }
    return inIsTerminal && !NoColorIsSet();
}

std::string Bar(std::uint64_t inDone, std::uint64_t inTotal, std::size_t inColumns) {
    const std::uint64_t full =
        inTotal == 0 ? 0 : std::min<std::uint64_t>(inDone * inColumns / inTotal, inColumns);
    return "[" + std::string(full, '#') + std::string(inColumns - full, '.') + "]";
}

}  // namespace

Output::Output()
    : mInIsTerminal(::isatty(STDIN_FILENO) == 1),
      mOutIsTerminal(::isatty(STDOUT_FILENO) == 1),
      mErrorIsTerminal(::isatty(STDERR_FILENO) == 1) {}

void Output::Configure(const Settings& inSettings) {
    mSettings = inSettings;
    mColorOut = !mSettings.json && Paints(mSettings.color, mOutIsTerminal);
    mColorError = !mSettings.json && Paints(mSettings.color, mErrorIsTerminal);
}

void Output::Record(const Json& inObject) {
    if (mSettings.json) {
        EndProgress();
        WriteOut(inObject.Text() + "\n");
    }
}

void Output::Line(std::string_view inText) {
    if (!mSettings.json) {
        EndProgress();
        WriteOut(std::string(inText) + "\n");
    }
}

void Output::Field(std::string_view inLabel, std::string_view inValue) {
    const std::string padding(kLabelWidth - std::min(kLabelWidth, DisplayWidth(inLabel)), ' ');
    Line(Bold(inLabel) + padding + " " + ForTerminal(inValue));
}

void Output::Say(std::string_view inText) {
    if (!mSettings.quiet) {
        Line(ForTerminal(inText));
    }
}

void Output::Note(std::string_view inText) {
    if (!mSettings.quiet && !mSettings.json) {
        EndProgress();
        WriteError(ForTerminal(inText) + "\n");
    }
}

void Output::Print(const Table& inTable) {
    if (mSettings.json) {
        return;
    }
    bool header = true;
    for (const std::string& line : inTable.Lines(mOutIsTerminal ? TerminalWidth(STDOUT_FILENO) : 0)) {
        Line(header ? Bold(line) : line);
        header = false;
    }
}

void Output::Raw(std::string_view inBytes) {
    EndProgress();
    WriteOut(inBytes);
}

void Output::Error(const Failure& inFailure) {
    EndProgress();
    if (mSettings.json) {
        Json error("error");
        error.Set("verb", mSettings.verb)
            .Set("exitCode", static_cast<int>(inFailure.Code()))
            .Set("error", ExitCodeName(inFailure.Code()))
            .Set("message", std::string(inFailure.what()));
        error.Set("hint", inFailure.Hint())
            .Set("result", inFailure.ResultName())
            .Set("status", inFailure.Status());
        WriteError(error.Text() + "\n");
        return;
    }
    const std::string name = mSettings.verb.empty() ? "zo" : "zo " + mSettings.verb;
    WriteError(Painted(name + ":", "\033[1;31m", mColorError) + " " + ForTerminal(inFailure.what()) + "\n");
    if (!inFailure.Hint().empty()) {
        WriteError("  next: " + ForTerminal(inFailure.Hint()) + "\n");
    }
}

void Output::Progress(std::string_view inItem, std::uint64_t inDone, std::uint64_t inTotal,
                      std::uint64_t inBytes) {
    if (mSettings.quiet) {
        return;
    }
    if (mSettings.json) {
        Json progress("progress");
        progress.Set("verb", mSettings.verb).Set("item", std::string(inItem)).Set("done", inDone);
        progress.Set("total", inTotal).Set("bytes", inBytes);
        WriteError(progress.Text() + "\n");
        return;
    }
    const std::string count = std::to_string(inDone) + "/" + std::to_string(inTotal);
    const std::string item = ForTerminal(inItem);
    if (!mErrorIsTerminal) {
        WriteError(count + " " + item + "\n");
        return;
    }
    const std::string line = Bar(inDone, inTotal, 24) + " " + count + " " + item;
    WriteError("\r\033[K" + Truncate(line, TerminalWidth(STDERR_FILENO) - 1));
    mBarIsShown = true;
}

void Output::EndProgress() {
    if (mBarIsShown) {
        mBarIsShown = false;
        WriteError("\r\033[K");
    }
}

void Output::Flush() {
    if (mWriteError != 0) {
        throw Failure(ExitCode::Failure,
                      std::string("writing to standard output failed: ") + std::strerror(mWriteError),
                      "check where the output goes");
    }
}

void Output::WriteOut(std::string_view inBytes) {
    if (mWriteError == 0) {
        mWriteError = WriteAll(STDOUT_FILENO, inBytes);
    }
}

void Output::WriteError(std::string_view inBytes) {
    // There is nobody left to tell when this fails.
    static_cast<void>(WriteAll(STDERR_FILENO, inBytes));
}

std::string Output::Painted(std::string_view inText, const char* inCode, bool inPaint) {
    return inPaint ? inCode + std::string(inText) + "\033[0m" : std::string(inText);
}

std::size_t Output::TerminalWidth(int inDescriptor) {
    winsize size{};
    if (::ioctl(inDescriptor, TIOCGWINSZ, &size) == 0 && size.ws_col > 0) {
        return std::max<std::size_t>(size.ws_col, kNarrowest);
    }
    const char* columns = std::getenv("COLUMNS");
    const long width = columns ? std::strtol(columns, nullptr, 10) : 0;
    return width > 0 ? std::max<std::size_t>(static_cast<std::size_t>(width), kNarrowest) : kDefaultWidth;
}

}  // namespace zo
