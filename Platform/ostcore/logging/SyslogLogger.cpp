// Sends syslog lines by UDP without ever holding up or failing the caller.
#include "ostcore/logging/SyslogLogger.h"

#include <array>

#include <fcntl.h>
#include <netdb.h>
#include <sys/socket.h>
#include <unistd.h>

#include "ostcore/config/ClientInfo.h"
#include "ostcore/logging/detail/SyslogLine.h"
#include "ostcore/threads/Executor.h"
#include "ostcore/threads/Mutex.h"
#include "ostcore/threads/Scheduler.h"

namespace ostcore {
namespace logging {
namespace {

using threads::Mutex;
using threads::MutexLock;

/// A socket that is bound to one receiver.
class Channel {
public:
    // The address may name a host only where a look-up may block. Null: no such receiver.
    static shared_ptr<Channel> Open(const std::string& inAddress, std::uint16_t inPort, int inFlags) {
        addrinfo hints{};
        hints.ai_family = AF_UNSPEC;
        hints.ai_socktype = SOCK_DGRAM;
        hints.ai_flags = inFlags | AI_NUMERICSERV;
        addrinfo* found = nullptr;
        if (::getaddrinfo(inAddress.c_str(), std::to_string(inPort).c_str(), &hints, &found) != 0) {
            return {};
        }
        const std::unique_ptr<addrinfo, decltype(&::freeaddrinfo)> list(found, &::freeaddrinfo);
        for (const addrinfo* each = found; each; each = each->ai_next) {
            const int descriptor = ::socket(each->ai_family, SOCK_DGRAM | SOCK_NONBLOCK | SOCK_CLOEXEC, 0);
            if (descriptor < 0) {
                continue;
            }
            auto channel = boost::make_shared<Channel>(descriptor);
            if (::connect(descriptor, each->ai_addr, each->ai_addrlen) == 0) {
                return channel;
            }
        }
        return {};
    }

    explicit Channel(int inDescriptor) : mDescriptor(inDescriptor) {}
    ~Channel() { ::close(mDescriptor); }
    Channel(const Channel&) = delete;
    Channel& operator=(const Channel&) = delete;

    // A line that the system does not take at once is lost.
    void Send(const std::string& inLine) const {
        (void)!::send(mDescriptor, inLine.data(), inLine.size(), MSG_DONTWAIT | MSG_NOSIGNAL);
    }

private:
    const int mDescriptor;
};

std::string LocalHostName() {
    std::array<char, 256> name{};
    return ::gethostname(name.data(), name.size() - 1) == 0 ? name.data() : "";
}

/// The receiver that was set last; look-ups of former ones come too late by their number.
class Target : public enable_shared_from_this<Target> {
public:
    void Set(const std::string& inAddress, std::uint16_t inPort) ZO_EXCLUDES(mMutex) {
        const shared_ptr<Channel> known =
            inAddress.empty() ? nullptr : Channel::Open(inAddress, inPort, AI_NUMERICHOST);
        const std::uint64_t number = Begin(known);
        if (known || inAddress.empty()) {
            return;
        }
        const auto self = shared_from_this();
        threads::GetIOBoundExecutor()->Post(
            [self, inAddress, inPort, number] { self->Finish(number, Channel::Open(inAddress, inPort, 0)); });
    }

    shared_ptr<Channel> Get() const ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        return mChannel;
    }

private:
    std::uint64_t Begin(shared_ptr<Channel> inChannel) ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        mChannel.swap(inChannel);
        return ++mNumber;
    }

    void Finish(std::uint64_t inNumber, shared_ptr<Channel> inChannel) ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        if (inNumber == mNumber) {
            mChannel.swap(inChannel);
        }
    }

    mutable Mutex mMutex;
    shared_ptr<Channel> mChannel ZO_GUARDED_BY(mMutex);
    std::uint64_t mNumber ZO_GUARDED_BY(mMutex) = 0;
};

class SyslogLogger final : public ISyslogLogger {
public:
    SyslogLogger(bool inIsHeadless, const utility::Guid& inProcessID)
        : mHostName(LocalHostName()), mProcessID(inProcessID.ToString()), mIsHeadless(inIsHeadless) {}

    void SetServer(const std::string& inAddress, std::uint16_t inPort) override {
        try {
            mTarget->Set(inAddress, inPort);
        } catch (...) {
            // Logging is a favour; it does not fail its caller.
        }
    }

    void Log(SyslogSeverity inSeverity, std::string_view inMessage, const SyslogFields& inFields) override {
        try {
            if (const shared_ptr<Channel> channel = mTarget->Get()) {
                const SyslogOrigin origin{mHostName, config::GetClientName(), config::GetClientBuildNumber(),
                                          mProcessID, mIsHeadless};
                const ptime now = threads::GetGlobalScheduler()->UTCNow();
                channel->Send(FormatSyslogLine(origin, now, inSeverity, inMessage, inFields));
            }
        } catch (...) {
            // Logging is a favour; it does not fail its caller.
        }
    }

private:
    const std::string mHostName;
    const std::string mProcessID;
    const bool mIsHeadless;
    const shared_ptr<Target> mTarget = boost::make_shared<Target>();
};

struct StructuredLogger {
    Mutex mutex;
    shared_ptr<ISyslogLogger> logger ZO_GUARDED_BY(mutex);
};

StructuredLogger& TheStructuredLogger() {
    static StructuredLogger* const holder = new StructuredLogger;
    return *holder;
}

}  // namespace

ISyslogLogger::~ISyslogLogger() = default;

shared_ptr<ISyslogLogger> CreateSyslogLogger(bool inIsHeadless, const utility::Guid& inProcessID) {
    return boost::make_shared<SyslogLogger>(inIsHeadless, inProcessID);
}

shared_ptr<ISyslogLogger> CreateSyslogLogger() {
    return CreateSyslogLogger(false, config::GetProcessInstanceID());
}

shared_ptr<ISyslogLogger> GetStructuredLogger() {
    StructuredLogger& holder = TheStructuredLogger();
    MutexLock lock(holder.mutex);
    return holder.logger;
}

void SetStructuredLogger(shared_ptr<ISyslogLogger> inLogger) {
    StructuredLogger& holder = TheStructuredLogger();
    MutexLock lock(holder.mutex);
    holder.logger.swap(inLogger);
}

}  // namespace logging
}  // namespace ostcore
