#include "ostui/TerminalInput.h"

#include <fcntl.h>
#include <unistd.h>

#include <array>
#include <climits>

namespace ostui {
namespace {

int OpenAnew(int inDescriptor) {
    std::array<char, PATH_MAX> name{};
    if (::isatty(inDescriptor) != 1 || ::ttyname_r(inDescriptor, name.data(), name.size()) != 0) {
        return -1;
    }
    return ::open(name.data(), O_RDONLY | O_NOCTTY | O_NONBLOCK | O_CLOEXEC);
}

}  // namespace

TerminalInput::TerminalInput(int inDescriptor) : mGiven(inDescriptor), mOpened(OpenAnew(inDescriptor)) {}

TerminalInput::~TerminalInput() {
    if (mOpened >= 0) {
        ::close(mOpened);
    }
}

}  // namespace ostui
