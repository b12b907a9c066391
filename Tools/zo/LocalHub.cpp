// Starts, finds and stops zohub.
#include "LocalHub.h"

#include <fcntl.h>
#include <poll.h>
#include <sys/file.h>
#include <sys/inotify.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <csignal>
#include <cstring>
#include <filesystem>

#include "ChildProcess.h"
#include "Configuration.h"
#include "Failure.h"
#include "Json.h"
#include "ostcore/filesupport/Dir.h"
#include "ostcore/filesupport/File.h"
#include "ostcore/serialization/JSON.h"

namespace zo {
namespace {

namespace fs = std::filesystem;
using ostcore::filesupport::File;
using ostcore::serialization::JSONValue;
using ostcore::serialization::JSONView;

constexpr std::size_t kMaximumRecordBytes = 65536;
constexpr std::size_t kLogTail = 600;
constexpr int kStartSeconds = 30;
constexpr int kStopSeconds = 30;

class Descriptor {
public:
    explicit Descriptor(int inValue) : mValue(inValue) {}
    ~Descriptor() {
        if (mValue >= 0) {
            ::close(mValue);
        }
    }
    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(const Descriptor&) = delete;
    int Get() const noexcept { return mValue; }

private:
    int mValue;
};

std::string TextOf(JSONView inObject, const char* inKey) {
    const JSONView value = inObject.Find(inKey);
    return value.IsString() ? std::string(value.AsString()) : std::string();
}

std::optional<JSONValue> ReadObject(const std::string& inPath) {
    if (!File::Exists(inPath)) {
        return std::nullopt;
    }
    const auto bytes = File::Read(inPath, kMaximumRecordBytes);
    if (!bytes) {
        return std::nullopt;
    }
    try {
        JSONValue value = ostcore::serialization::JSONParse(bytes);
        return value.IsObject() ? std::optional(value) : std::nullopt;
    } catch (const std::exception&) {
        return std::nullopt;
    }
}

HubRecord ReadHub(JSONView inObject) {
    const JSONView pid = inObject.Find("pid");
    return {pid.IsInteger() ? pid.AsInt32() : 0, TextOf(inObject, "httpUrl"), TextOf(inObject, "tlsUrl"),
            TextOf(inObject, "caFile")};
}

// The last lines of a log, without what could do harm on a terminal; the caller's output sees to that.
std::string TailOf(const std::string& inPath) {
    const auto bytes = File::Read(inPath);
    if (!bytes) {
        return {};
    }
    std::string text(bytes->view().substr(bytes->size() > kLogTail ? bytes->size() - kLogTail : 0));
    for (char& character : text) {
        character = character == '\n' ? ' ' : character;
    }
    return text;
}

bool IsProgram(const fs::path& inPath) {
    std::error_code error;
    return fs::is_regular_file(inPath, error) && ::access(inPath.c_str(), X_OK) == 0;
}

}  // namespace

LocalHub::LocalHub(std::string inDataDirectory, Interrupt& inInterrupt)
    : mData(std::move(inDataDirectory)), mInterrupt(inInterrupt) {}

std::string LocalHub::LogPath() const {
    return ostcore::filesupport::Dir(mData).FilePath("zohub.log");
}

std::string LocalHub::RecordPath() const {
    return ostcore::filesupport::Dir(mData).FilePath("zo-hub.json");
}

std::optional<HubRecord> LocalHub::Running() const {
    const std::optional<JSONValue> record = ReadObject(RecordPath());
    if (!record) {
        return std::nullopt;
    }
    const HubRecord hub = ReadHub(*record);
    const JSONView startTime = JSONView(*record).Find("startTime");
    if (hub.pid <= 0 || !startTime.IsInteger() || ProcessStartTime(hub.pid) != startTime.AsUInt64()) {
        return std::nullopt;
    }
    return hub;
}

HubRecord LocalHub::Start(const std::optional<std::string>& inPort,
                          const std::optional<std::string>& inTlsPort) {
    MakeDataDirectory();
    const Descriptor lock(
        ::open((mData + "/zo-hub.lock").c_str(), O_RDWR | O_CREAT | O_CLOEXEC | O_NOFOLLOW, 0600));
    if (lock.Get() < 0 || ::flock(lock.Get(), LOCK_EX | LOCK_NB) != 0) {
        throw Failure(ExitCode::Failure,
                      "starting a hub on " + mData + " failed: another zo is doing just that",
                      "wait a moment and look with 'zo hub status'");
    }
    if (const auto running = Running()) {
        return *running;
    }
    const std::string readyFile = mData + "/zo-ready.json";
    File::Remove(readyFile);
    std::vector<std::string> arguments{"serve", "--data", mData, "--ready-file", readyFile};
    if (inPort) {
        arguments.insert(arguments.end(), {"--port", *inPort});
    }
    const std::optional<std::string> tlsPort = inTlsPort ? inTlsPort : inPort == "0" ? inPort : std::nullopt;
    if (tlsPort) {
        arguments.insert(arguments.end(), {"--tls-port", *tlsPort});
    }
    const pid_t child = StartChild(FindProgram(), arguments, LogPath(), ChildKind::Background);
    try {
        WaitUntilReady(child, readyFile);
    } catch (...) {
        ::kill(child, SIGTERM);
        throw;
    }
    const std::optional<JSONValue> ready = ReadObject(readyFile);
    const HubRecord hub = ready ? ReadHub(*ready) : HubRecord{};
    Json record = Json::Part();
    record.Set("pid", static_cast<int>(child)).Set("startTime", ProcessStartTime(child));
    record.Set("httpUrl", hub.httpURL).Set("tlsUrl", hub.tlsURL).Set("caFile", hub.authorityFile);
    std::string error;
    if (!File::ReplaceAtomically(RecordPath(), record.Text() + "\n", 0600, &error)) {
        ::kill(child, SIGTERM);
        throw Failure(ExitCode::Failure, "remembering the hub failed: " + error, "check " + mData);
    }
    return {child, hub.httpURL, hub.tlsURL, hub.authorityFile};
}

void LocalHub::Stop(const HubRecord& inHub) {
    const Descriptor process(OpenProcess(inHub.pid));
    if (process.Get() >= 0) {
        // By the descriptor, so that no other process that got the number meanwhile is hit.
        if (::syscall(SYS_pidfd_send_signal, process.Get(), SIGTERM, nullptr, 0) != 0 && errno != ESRCH) {
            throw Failure(ExitCode::Failure, "stopping process " + std::to_string(inHub.pid) +
                                                 " failed: " + std::strerror(errno));
        }
        pollfd watched[2] = {{process.Get(), POLLIN, 0}, {mInterrupt.Descriptor(), POLLIN, 0}};
        int ready = 0;
        do {
            ready = ::poll(watched, 2, kStopSeconds * 1000);
        } while (ready < 0 && errno == EINTR);
        if (watched[1].revents != 0) {
            throw Failure(ExitCode::Cancelled, "cancelled");
        }
        if (ready == 0) {
            throw Failure(ExitCode::Failure,
                          "the hub (process " + std::to_string(inHub.pid) + ") has not ended within " +
                              std::to_string(kStopSeconds) + " seconds",
                          "look into " + LogPath());
        }
    }
    File::Remove(RecordPath());
    File::Remove(mData + "/zo-ready.json");
}

void LocalHub::AddUser(const std::string& inUser, const std::string& inPasswordFile) {
    MakeDataDirectory();
    const std::string log = mData + "/zo-user-add.log";
    File::Remove(log);
    const std::string passwordFile = fs::absolute(inPasswordFile).string();
    const pid_t child =
        StartChild(FindProgram(), {"user", "add", inUser, "--data", mData, "--password-file", passwordFile},
                   log, ChildKind::Foreground);
    const int status = WaitForChild(child);
    const std::string said = TailOf(log);
    File::Remove(log);
    if (status != 0) {
        throw Failure(ExitCode::Failure, "adding the user " + inUser + " to the hub failed: " + said,
                      "choose another name or check the password file");
    }
}

std::string LocalHub::FindProgram() {
    if (const auto named = Environment("ZOCLIENT_ZOHUB")) {
        if (IsProgram(*named)) {
            return *named;
        }
        throw Failure(ExitCode::NotFound, "ZOCLIENT_ZOHUB names " + *named + ", which is no program",
                      "correct it, or unset it");
    }
    std::error_code error;
    const fs::path own = fs::read_symlink("/proc/self/exe", error).parent_path();
    std::vector<fs::path> places{own / "zohub", own.parent_path() / "libexec" / "zoclient" / "zohub"};
    const std::string path = Environment("PATH").value_or("");
    for (std::size_t start = 0; start <= path.size();) {
        const std::size_t end = std::min(path.find(':', start), path.size());
        if (end > start) {
            places.push_back(fs::path(path.substr(start, end - start)) / "zohub");
        }
        start = end + 1;
    }
    for (const fs::path& place : places) {
        if (IsProgram(place)) {
            return place.string();
        }
    }
    throw Failure(ExitCode::NotFound, "the program zohub is neither beside zo nor in PATH",
                  "install it, or name it in ZOCLIENT_ZOHUB");
}

void LocalHub::MakeDataDirectory() const {
    std::string error;
    if (!ostcore::filesupport::Dir(mData).CreatePrivate(&error)) {
        throw Failure(ExitCode::Failure, "making the hub's data directory failed: " + error,
                      "choose another with --data");
    }
}

void LocalHub::WaitUntilReady(int inProcess, const std::string& inReadyFile) const {
    const Descriptor process(OpenProcess(inProcess));
    const Descriptor folder(::inotify_init1(IN_CLOEXEC | IN_NONBLOCK));
    if (process.Get() < 0 || folder.Get() < 0 ||
        ::inotify_add_watch(folder.Get(), mData.c_str(), IN_MOVED_TO | IN_CLOSE_WRITE) < 0) {
        throw Failure(ExitCode::Failure,
                      std::string("watching the hub start failed: ") + std::strerror(errno));
    }
    while (!File::Exists(inReadyFile)) {
        pollfd watched[3] = {
            {folder.Get(), POLLIN, 0}, {process.Get(), POLLIN, 0}, {mInterrupt.Descriptor(), POLLIN, 0}};
        const int ready = ::poll(watched, 3, kStartSeconds * 1000);
        if (watched[2].revents != 0) {
            throw Failure(ExitCode::Cancelled, "cancelled");
        }
        if (watched[1].revents != 0) {
            throw Failure(ExitCode::Failure, "the hub ended while it started: " + TailOf(LogPath()),
                          "when a port is taken, give another with --port and --tls-port (0 for any)");
        }
        if (ready == 0) {
            throw Failure(ExitCode::Failure,
                          "the hub does not listen after " + std::to_string(kStartSeconds) + " seconds",
                          "look into " + LogPath());
        }
        std::array<char, 4096> events;
        while (::read(folder.Get(), events.data(), events.size()) > 0) {
        }
    }
}

}  // namespace zo
