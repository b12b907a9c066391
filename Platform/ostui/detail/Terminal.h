// A terminal as a place for lines: what is written, what is read, and a status line at the bottom.
#pragma once

#include <termios.h>

#include <cstddef>
#include <string>

#include "ostui/TerminalBackEnd.h"
#include "ostui/TerminalInput.h"

namespace ostui {
namespace detail {

/// Main thread only. Nothing is written and nothing read unless both ends are terminals.
class Terminal {
public:
    explicit Terminal(const TerminalSettings& inSettings);

    bool IsInteractive() const noexcept { return mIsInteractive; }
    /// True once the user wants to stop.
    bool IsInterrupted() const;
    /// 0 when it does not say.
    std::size_t Width() const;

    /// Whole lines, made safe; what is asked, or the status, goes on below them.
    void Say(const U8String& inText);
    /// A question without its answer. It is asked again below what is said meanwhile.
    void Prompt(const U8String& inText);
    /// A line that the next status overwrites.
    void ShowStatus(const U8String& inText);
    /// Goes on below the line of a question, or in the place of a status, and forgets it.
    void EndLine();
    /// Takes a question back that is not to be answered any more.
    void TakeBackPrompt();

    enum class Line { kRead, kEnd, kOver };
    /// Waits for a line and pumps the main thread's queue meanwhile. kOver: inIsOver became true, or the user
    /// wants to stop. kEnd: there will be no more lines.
    Line ReadLine(const function<bool()>& inIsOver, std::string& outLine);

    /// What is typed is not shown, for a scope; the line ends with it.
    class Silence {
    public:
        explicit Silence(Terminal& ioTerminal);
        ~Silence();
        Silence(const Silence&) = delete;
        Silence& operator=(const Silence&) = delete;

    private:
        Terminal& mTerminal;
        termios mBefore{};
        const bool mIsChanged;
    };

private:
    void Write(const U8String& inText) const;
    void EraseLine();

    const TerminalSettings mSettings;
    const TerminalInput mInput;
    const bool mIsInteractive;
    /// What stands on the last line, and whether it is a status.
    U8String mLine;
    bool mIsStatus = false;
};

}  // namespace detail
}  // namespace ostui
