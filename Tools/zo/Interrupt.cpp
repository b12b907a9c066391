// Waits for signals with signalfd, so that no code ever runs in a handler.
#include "Interrupt.h"

#include <poll.h>
#include <sys/eventfd.h>
#include <sys/signalfd.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <cstdint>
#include <system_error>

#include "ExitCodes.h"
#include "ostcore/threads/MainThread.h"

namespace zo {
namespace {

sigset_t EndingSignals() {
    sigset_t set;
    sigemptyset(&set);
    sigaddset(&set, SIGINT);
    sigaddset(&set, SIGTERM);
    sigaddset(&set, SIGHUP);
    return set;
}

void Raise(int inEventDescriptor) {
    const std::uint64_t one = 1;
    while (::write(inEventDescriptor, &one, sizeof one) < 0 && errno == EINTR) {
    }
}

}  // namespace

Interrupt::Interrupt() {
    std::signal(SIGPIPE, SIG_IGN);
    const sigset_t set = EndingSignals();
    pthread_sigmask(SIG_BLOCK, &set, nullptr);
    mSignalDescriptor = ::signalfd(-1, &set, SFD_CLOEXEC);
    mRequestedDescriptor = ::eventfd(0, EFD_CLOEXEC);
    mStopDescriptor = ::eventfd(0, EFD_CLOEXEC);
    if (mSignalDescriptor < 0 || mRequestedDescriptor < 0 || mStopDescriptor < 0) {
        throw std::system_error(errno, std::generic_category(), "cannot watch for signals");
    }
    mThread = std::thread([this] { Watch(); });
}

Interrupt::~Interrupt() {
    Raise(mStopDescriptor);
    mThread.join();
    ::close(mSignalDescriptor);
    ::close(mRequestedDescriptor);
    ::close(mStopDescriptor);
}

void Interrupt::RestoreSignals() {
    const sigset_t set = EndingSignals();
    pthread_sigmask(SIG_UNBLOCK, &set, nullptr);
    std::signal(SIGPIPE, SIG_DFL);
}

void Interrupt::Watch() {
    while (true) {
        pollfd watched[2] = {{mSignalDescriptor, POLLIN, 0}, {mStopDescriptor, POLLIN, 0}};
        if (::poll(watched, 2, -1) < 0) {
            continue;
        }
        if (watched[1].revents != 0) {
            return;
        }
        signalfd_siginfo info;
        if (::read(mSignalDescriptor, &info, sizeof info) != static_cast<ssize_t>(sizeof info)) {
            continue;
        }
        if (mRequested.exchange(true)) {
            ::_exit(static_cast<int>(ExitCode::Cancelled));
        }
        Raise(mRequestedDescriptor);
        ostcore::threads::AsyncCallFromMainThread([] {});
    }
}

}  // namespace zo
