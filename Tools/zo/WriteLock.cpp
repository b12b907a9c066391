// A lock file in the state directory, one for each user at each hub.
#include "WriteLock.h"

#include <fcntl.h>
#include <poll.h>
#include <sys/file.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

#include "Failure.h"
#include "RFL/Messaging.h"

namespace zo {
namespace {

constexpr int kTurnMilliseconds = 100;

std::string LockName(const Target& inTarget) {
    const std::string whose = inTarget.server + "\n" + inTarget.user;
    char name[32];
    std::snprintf(name, sizeof name, "write-%016llx",
                  static_cast<unsigned long long>(RFL::HashMessageTypeNameToMessageID(whose)));
    return name;
}

}  // namespace

WriteLock::WriteLock(Context& ioContext) {
    const std::string path = ioContext.Remembered().LockPath(LockName(ioContext.ConnectedTarget()));
    mDescriptor = ::open(path.c_str(), O_RDWR | O_CREAT | O_CLOEXEC | O_NOFOLLOW, 0600);
    bool isTold = false;
    while (mDescriptor < 0 || ::flock(mDescriptor, LOCK_EX | LOCK_NB) < 0) {
        if (mDescriptor < 0 || (errno != EWOULDBLOCK && errno != EINTR)) {
            throw Failure(ExitCode::Failure, "locking " + path + " failed: " + std::strerror(errno),
                          "check the permissions of the state directory");
        }
        if (!isTold) {
            ioContext.Out().Note("waiting for another zo that is writing");
            isTold = true;
        }
        pollfd interrupt{ioContext.Signals().Descriptor(), POLLIN, 0};
        ::poll(&interrupt, 1, kTurnMilliseconds);
        if (ioContext.Signals().IsRequested()) {
            ::close(mDescriptor);
            throw Failure(ExitCode::Cancelled, "cancelled");
        }
    }
}

WriteLock::~WriteLock() {
    ::close(mDescriptor);
}

}  // namespace zo
