// The input of a terminal, read without ever getting stuck in it.
#pragma once

#include "ostcore/Export.h"

namespace ostui {

/// A descriptor to read a terminal by, which does not block: a Ctrl-C discards what was typed, and it may do
/// so between the poll() that has seen a line and the read() that would take it. The terminal is opened anew
/// for this, as the descriptor that the process was given shares its flags with other programs.
///
/// What is no terminal, or cannot be opened by its name, is read by the descriptor that was given, which
/// stays open and must outlive this one. Any thread may read; EAGAIN means that there is nothing after all.
class ZOPLATFORM_EXPORT TerminalInput {
public:
    explicit TerminalInput(int inDescriptor);
    ~TerminalInput();
    TerminalInput(const TerminalInput&) = delete;
    TerminalInput& operator=(const TerminalInput&) = delete;

    int Descriptor() const noexcept { return mOpened >= 0 ? mOpened : mGiven; }

private:
    const int mGiven;
    const int mOpened;
};

}  // namespace ostui
