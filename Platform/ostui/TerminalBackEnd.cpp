// One question a line; while it waits, the main thread's queue goes on.
#include "ostui/TerminalBackEnd.h"

#include <poll.h>
#include <termios.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>

#include "ostcore/threads/MainThread.h"
#include "ostcore/utility/StringConversion.h"

namespace ostui {
namespace {

/// How long the queue of the main thread may wait for its turn.
constexpr std::uint32_t kTurnMilliseconds = 20;
constexpr std::size_t kLongestLine = 4096;

/// Turns the echo off for a scope.
class EchoOff {
public:
    EchoOff(int inTerminal, bool inIsWanted) : mTerminal(inTerminal) {
        mChanged = inIsWanted && ::tcgetattr(mTerminal, &mBefore) == 0;
        if (mChanged) {
            termios quiet = mBefore;
            quiet.c_lflag &= ~static_cast<tcflag_t>(ECHO | ECHOE | ECHOK | ECHONL);
            ::tcsetattr(mTerminal, TCSAFLUSH, &quiet);
        }
    }
    ~EchoOff() {
        if (mChanged) {
            ::tcsetattr(mTerminal, TCSADRAIN, &mBefore);
        }
    }
    EchoOff(const EchoOff&) = delete;
    EchoOff& operator=(const EchoOff&) = delete;

private:
    const int mTerminal;
    termios mBefore{};
    bool mChanged = false;
};

/// What a server says must not steer the terminal.
U8String WithoutControls(const U8String& inText) {
    U8String text = inText;
    for (char& character : text) {
        const auto byte = static_cast<unsigned char>(character);
        if ((byte < 0x20 && character != '\n' && character != '\t') || byte == 0x7F) {
            character = ' ';
        }
    }
    return text;
}

class TerminalBackEnd final : public BackEnd {
public:
    explicit TerminalBackEnd(const TerminalSettings& inSettings)
        : mSettings(inSettings),
          mIsTerminal(::isatty(inSettings.input) == 1 && ::isatty(inSettings.output) == 1) {}

    void RunModal(Dialog& ioDialog) override {
        Show(ioDialog);
        if (ioDialog.ClosesByItself()) {
            WaitFor(ioDialog);
        } else {
            Ask(ioDialog);
        }
    }

    void OnControlChanged(Dialog& ioDialog, const Control& inControl) override {
        if (!mIsTerminal || !ioDialog.ClosesByItself()) {
            return;
        }
        if (inControl.type == ControlType::kProgressBar && inControl.total > 0) {
            Write("\r" + std::to_string(std::uint64_t{inControl.value} * 100 / inControl.total) + " % ");
        } else if (inControl.type == ControlType::kStaticText) {
            Write(WithoutControls(inControl.text) + "\n");
        }
    }

private:
    enum class Line { kRead, kEnd, kClosed };

    void Show(const Dialog& inDialog) {
        for (const Control& control : inDialog.GetControls()) {
            if (control.type == ControlType::kStaticText && control.isVisible) {
                Write(WithoutControls(control.text) + "\n");
            }
        }
    }

    void WaitFor(Dialog& ioDialog) {
        Write(Choices(ioDialog));
        bool mayRead = mIsTerminal;
        bool isDismissed = false;
        while (!ioDialog.IsClosed()) {
            if (IsInterrupted() && !isDismissed) {
                isDismissed = true;
                ioDialog.Dismiss();
            }
            std::string line;
            const Line outcome = mayRead && !isDismissed ? ReadLine(ioDialog, line) : Line::kClosed;
            if (outcome == Line::kRead) {
                PressByText(ioDialog, line);
            } else if (outcome == Line::kEnd) {
                mayRead = false;
            } else if (!ioDialog.IsClosed()) {
                ostcore::threads::WaitAndPumpMainThread(kTurnMilliseconds);
            }
        }
        Write("\n");
    }

    void Ask(Dialog& ioDialog) {
        while (!ioDialog.IsClosed()) {
            if (!mIsTerminal || IsInterrupted() || !AskOnce(ioDialog)) {
                ioDialog.Dismiss();
            }
        }
    }

    /// False when the user does not answer any more.
    bool AskOnce(Dialog& ioDialog) {
        const std::vector<Control> controls = ioDialog.GetControls();
        for (const Control& control : controls) {
            if (control.isVisible && control.isEnabled && !AskControl(ioDialog, control)) {
                return ioDialog.IsClosed();
            }
        }
        const U8String choices = Choices(ioDialog);
        if (choices.empty()) {
            return false;
        }
        Write(choices);
        std::string line;
        if (ReadLine(ioDialog, line) != Line::kRead) {
            return ioDialog.IsClosed();
        }
        PressByText(ioDialog, line);
        return true;
    }

    bool AskControl(Dialog& ioDialog, const Control& inControl) {
        const bool isPassword = inControl.type == ControlType::kPasswordEdit;
        std::string line;
        if (isPassword || inControl.type == ControlType::kTextEdit) {
            const U8String held =
                isPassword || inControl.text.empty() ? U8String() : " [" + inControl.text + "]";
            // Before the question: what is typed the moment it shows is neither seen nor lost.
            const EchoOff echoOff(mSettings.input, isPassword);
            Write(WithoutControls(inControl.label + held) + ": ");
            if (ReadLine(ioDialog, line) != Line::kRead) {
                return false;
            }
            if (isPassword) {
                Write("\n");
            }
            if (!line.empty()) {
                ioDialog.Enter(inControl.id, std::move(line));
            }
        } else if (inControl.type == ControlType::kList) {
            return AskRow(ioDialog, inControl);
        }
        return true;
    }

    bool AskRow(Dialog& ioDialog, const Control& inList) {
        Write(WithoutControls(inList.label) + "\n");
        for (std::size_t row = 0; row < inList.items.size(); ++row) {
            Write("  " + std::to_string(row + 1) + "  " + WithoutControls(inList.items[row]) + "\n");
        }
        Write("Number (nothing for none): ");
        std::string line;
        if (ReadLine(ioDialog, line) != Line::kRead) {
            return false;
        }
        ioDialog.Select(inList.id, std::atoi(line.c_str()) - 1);
        return true;
    }

    static bool IsUsableButton(const Control& inControl) {
        return inControl.type == ControlType::kButton && inControl.isVisible && inControl.isEnabled;
    }

    /// "[1] Yes  [2] No: ", empty when there is no button or nobody to press it.
    U8String Choices(const Dialog& inDialog) const {
        U8String text;
        int number = 0;
        for (const Control& control : inDialog.GetControls()) {
            if (IsUsableButton(control)) {
                text += "[" + std::to_string(++number) + "] " + WithoutControls(control.text) + "  ";
            }
        }
        return text.empty() || !mIsTerminal ? U8String() : text + "> ";
    }

    /// By number or text; an empty line is the default button. Anything else presses nothing.
    static void PressByText(Dialog& ioDialog, const std::string& inLine) {
        int number = 0;
        std::string pressed = inLine.empty() ? ioDialog.GetDefaultButton() : std::string();
        for (const Control& control : ioDialog.GetControls()) {
            if (IsUsableButton(control) && (inLine == std::to_string(++number) ||
                                            ostcore::utility::EqualsIgnoreCaseASCII(inLine, control.text))) {
                pressed = control.id;
            }
        }
        ioDialog.Press(pressed);
    }

    /// Pumps while it waits. kClosed: the dialog was closed, or the user wants to stop.
    Line ReadLine(const Dialog& inDialog, std::string& outLine) {
        outLine.clear();
        while (outLine.size() < kLongestLine) {
            if (inDialog.IsClosed() || IsInterrupted()) {
                return Line::kClosed;
            }
            pollfd watched{mSettings.input, POLLIN, 0};
            if (::poll(&watched, 1, 0) <= 0) {
                ostcore::threads::WaitAndPumpMainThread(kTurnMilliseconds);
                continue;
            }
            char byte = 0;
            const ssize_t count = ::read(mSettings.input, &byte, 1);
            if (count < 0 && (errno == EINTR || errno == EAGAIN)) {
                continue;
            }
            if (count <= 0) {
                return Line::kEnd;
            }
            if (byte == '\n') {
                return Line::kRead;
            }
            outLine += byte;
        }
        return Line::kEnd;
    }

    bool IsInterrupted() const { return mSettings.isInterrupted && mSettings.isInterrupted(); }

    void Write(const U8String& inText) const {
        for (std::size_t written = 0; mIsTerminal && written < inText.size();) {
            const ssize_t count = ::write(mSettings.output, inText.data() + written, inText.size() - written);
            if (count < 0 && errno != EINTR) {
                return;
            }
            written += count > 0 ? static_cast<std::size_t>(count) : 0;
        }
    }

    const TerminalSettings mSettings;
    const bool mIsTerminal;
};

}  // namespace

shared_ptr<BackEnd> CreateTerminalBackEnd(const TerminalSettings& inSettings) {
    return boost::make_shared<TerminalBackEnd>(inSettings);
}

}  // namespace ostui
