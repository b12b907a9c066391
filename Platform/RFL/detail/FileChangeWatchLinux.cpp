// The watch on Linux: inotify for the directory, an event descriptor for the wake-up.
#include <poll.h>
#include <sys/eventfd.h>
#include <sys/inotify.h>
#include <unistd.h>

#include "RFL/detail/FileChangeWatch.h"

namespace RFL {

namespace {

class InotifyWatch final : public FileChangeWatch {
public:
    InotifyWatch()
        : mInotify(::inotify_init1(IN_NONBLOCK | IN_CLOEXEC)),
          mWake(::eventfd(0, EFD_NONBLOCK | EFD_CLOEXEC)) {}
    ~InotifyWatch() override {
        CloseDescriptor(mInotify);
        CloseDescriptor(mWake);
    }
    InotifyWatch(const InotifyWatch&) = delete;
    InotifyWatch& operator=(const InotifyWatch&) = delete;

    bool Start(const std::string& inDirectory) {
        constexpr std::uint32_t kChanges = IN_MODIFY | IN_CREATE | IN_MOVED_TO | IN_DELETE;
        return mInotify >= 0 && mWake >= 0 &&
               ::inotify_add_watch(mInotify, inDirectory.c_str(), kChanges) >= 0;
    }

    Event Wait(std::chrono::milliseconds inTimeout) override {
        pollfd descriptors[] = {{mWake, POLLIN, 0}, {mInotify, POLLIN, 0}};
        ::poll(descriptors, 2, static_cast<int>(inTimeout.count()));
        const bool isChanged = Drain(mInotify);
        if (Drain(mWake)) {
            return Event::Woken;
        }
        return isChanged ? Event::Changed : Event::TimedOut;
    }

    void Wake() override {
        const std::uint64_t one = 1;
        // A counter that is full wakes as well.
        [[maybe_unused]] const ssize_t written = ::write(mWake, &one, sizeof one);
    }

private:
    static void CloseDescriptor(int inDescriptor) {
        if (inDescriptor >= 0) {
            ::close(inDescriptor);
        }
    }
    /// Takes what is there; what the events say does not matter.
    static bool Drain(int inDescriptor) {
        alignas(inotify_event) char buffer[4096];
        bool isAny = false;
        while (::read(inDescriptor, buffer, sizeof buffer) > 0) {
            isAny = true;
        }
        return isAny;
    }

    const int mInotify;
    const int mWake;
};

}  // namespace

std::unique_ptr<FileChangeWatch> FileChangeWatch::Create(const std::string& inDirectory) {
    auto watch = std::make_unique<InotifyWatch>();
    return watch->Start(inDirectory) ? std::move(watch) : nullptr;
}

}  // namespace RFL
